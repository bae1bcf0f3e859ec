#include "ControllerTurn.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <string>

#include "ExitCodes.h"

namespace kest::cfg {

namespace {

constexpr char kRunDirectory[] = "/run/kest";
constexpr char kLockFileName[] = "kestcfg.lock";

// The run directory under KEST_SYSROOT (which main has made absolute), created when missing.
std::string RunDirectory() {
    const char* root = getenv("KEST_SYSROOT");
    const std::string base = root != nullptr && root[0] == '/' ? root : "";
    std::string directory = base + kRunDirectory;
    for (size_t slash = base.size() + 1; slash != std::string::npos;) {
        slash = directory.find('/', slash + 1);
        mkdir(directory.substr(0, slash).c_str(), 0755);
    }
    return directory;
}

int FlockRetryingInterrupts(int descriptor, int operation) {
    int result;
    do {
        result = flock(descriptor, operation);
    } while (result != 0 && errno == EINTR);
    return result;
}

}  // namespace

ControllerTurn::ControllerTurn(bool noWait, std::ostream& err) {
    const std::string path = RunDirectory() + "/" + kLockFileName;
    descriptor_.Reset(open(
        path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_NOCTTY | O_CLOEXEC | O_NONBLOCK, 0600));
    struct stat status {};
    if (!descriptor_.IsOpen() || fstat(descriptor_.Get(), &status) != 0 ||
        !S_ISREG(status.st_mode)) {
        const std::string reason =
            !descriptor_.IsOpen() ? std::strerror(errno) : "not a regular file";
        End();
        throw Failure("cannot open the lock file " + path + ": " + reason);
    }
    if (FlockRetryingInterrupts(descriptor_.Get(), LOCK_EX | LOCK_NB) == 0) {
        return;
    }
    if (errno == EWOULDBLOCK && noWait) {
        End();
        throw CommandFailure(kExitBusy, "another kestcfg is changing the controller (--no-wait)");
    }
    if (errno == EWOULDBLOCK) {
        err << "kestcfg: waiting for another kestcfg to finish\n" << std::flush;
        if (FlockRetryingInterrupts(descriptor_.Get(), LOCK_EX) == 0) {
            return;
        }
    }
    const std::string reason = std::strerror(errno);
    End();
    throw Failure("cannot lock " + path + ": " + reason);
}

ControllerTurn::~ControllerTurn() {
    End();
}

void ControllerTurn::End() {
    descriptor_.Reset();
}

}  // namespace kest::cfg
