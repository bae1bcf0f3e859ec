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
    do {
        descriptor_ =
            open(path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC,
                 kLockFileMode);
    } while (descriptor_ < 0 && errno == EINTR);
    if (descriptor_ < 0) {
        throw PosixError();
    }
    struct stat status;
    int result = fstat(descriptor_, &status);
    if (result == 0 && !S_ISREG(status.st_mode)) {
        errno = EINVAL;
        result = -1;
    }
    while (result == 0 && flock(descriptor_, LOCK_EX) != 0) {
        if (errno != EINTR) {
            result = -1;
        }
    }
    if (result != 0) {
        const int error = errno;
        close(descriptor_);
        throw PosixError(error);
    }
}

ExclusiveFileLock::~ExclusiveFileLock() {
    close(descriptor_);
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
