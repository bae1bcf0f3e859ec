#include "DocumentOutput.h"

#include <fcntl.h>
#include <unistd.h>

#include <iostream>

#include "support/WholeTransfer.h"

namespace kest::cfg {

DocumentOutput::DocumentOutput(bool keep) {
    if (!keep) {
        return;
    }
    std::cout.flush();
    descriptor_.Reset(fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3));
    if (descriptor_.IsOpen()) {
        dup2(STDERR_FILENO, STDOUT_FILENO);
    }
}

void DocumentOutput::Write(const std::string& text) {
    if (!descriptor_.IsOpen()) {
        std::cout << text << std::flush;
        return;
    }
    // A reader that went away costs only the document.
    static_cast<void>(kest::WriteWhole(descriptor_.Get(), text));
}

}  // namespace kest::cfg
