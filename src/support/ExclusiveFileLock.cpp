#include "support/ExclusiveFileLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr mode_t kLockFileMode = S_IRUSR | S_IWUSR;

}  // namespace

ExclusiveFileLock::ExclusiveFileLock(const std::string& path) {
    int descriptor;
    do {
        descriptor =
            open(path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC,
                 kLockFileMode);
    } while (descriptor < 0 && errno == EINTR);
    if (descriptor < 0) {
        throw PosixError();
    }
    descriptor_.Reset(descriptor);
    struct stat status;
    int result = fstat(descriptor, &status);
    if (result == 0 && !S_ISREG(status.st_mode)) {
        errno = EINVAL;
        result = -1;
    }
    while (result == 0 && flock(descriptor, LOCK_EX) != 0) {
        if (errno != EINTR) {
            result = -1;
        }
    }
    if (result != 0) {
        throw PosixError();
    }
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
