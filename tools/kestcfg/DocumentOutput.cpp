#include "DocumentOutput.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <iostream>

DocumentOutput::DocumentOutput(bool keep) {
    if (!keep) {
        return;
    }
    std::cout.flush();
    descriptor_ = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3);
    if (descriptor_ >= 0) {
        dup2(STDERR_FILENO, STDOUT_FILENO);
    }
}

DocumentOutput::~DocumentOutput() {
    if (descriptor_ >= 0) {
        close(descriptor_);
    }
}

void DocumentOutput::Write(const std::string& text) {
    if (descriptor_ < 0) {
        std::cout << text << std::flush;
        return;
    }
    size_t done = 0;
    while (done < text.size()) {
        const ssize_t written = ::write(descriptor_, text.data() + done, text.size() - done);
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            return;
        }
        done += static_cast<size_t>(written);
    }
}
