#include "support/FreeDiskSpace.h"

#include <sys/statvfs.h>

#include <cerrno>

namespace kest {

int32_t GetFreeDiskSpace(const char* path, uint64_t* totalBytes, uint64_t* freeBytes) {
    if (path == nullptr || (totalBytes == nullptr && freeBytes == nullptr)) {
        return -1;
    }
    struct statvfs status {};
    int result;
    do {
        result = statvfs(path, &status);
    } while (result != 0 && errno == EINTR);
    if (result != 0) {
        return -1;
    }
    // The block counts are in units of the fundamental block (fragment) size.
    const uint64_t blockSize = status.f_frsize;
    if (totalBytes != nullptr) {
        *totalBytes = blockSize * static_cast<uint64_t>(status.f_blocks);
    }
    if (freeBytes != nullptr) {
        *freeBytes = blockSize * static_cast<uint64_t>(status.f_bfree);
    }
    return 0;
}

}  // namespace kest
