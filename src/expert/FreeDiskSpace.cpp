#include "expert/FreeDiskSpace.h"

#include <sys/statvfs.h>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

int32_t GetFreeDiskSpace(const char* path, uint64_t* totalBytes, uint64_t* freeBytes) {
    if (path == nullptr || (totalBytes == nullptr && freeBytes == nullptr)) {
        return -1;
    }
    struct statvfs statistics {};
    if (statvfs(path, &statistics) != 0) {
        return -1;
    }
    // The block counts are in units of the fundamental block size.
    const uint64_t blockSize = statistics.f_frsize;
    if (totalBytes != nullptr) {
        *totalBytes = blockSize * static_cast<uint64_t>(statistics.f_blocks);
    }
    if (freeBytes != nullptr) {
        *freeBytes = blockSize * static_cast<uint64_t>(statistics.f_bfree);
    }
    return 0;
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
