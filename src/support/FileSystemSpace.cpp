#include "support/FileSystemSpace.h"

#include <sys/statvfs.h>

#include <cerrno>

namespace kest {

std::optional<FileSystemSpace> MeasureFileSystemSpace(const std::string& path) {
    struct statvfs status {};
    int result;
    do {
        result = statvfs(path.c_str(), &status);
    } while (result != 0 && errno == EINTR);
    if (result != 0) {
        return std::nullopt;
    }
    // The block counts are in units of the fundamental block (fragment) size.
    const uint64_t blockSize = status.f_frsize;
    return FileSystemSpace{blockSize * static_cast<uint64_t>(status.f_blocks),
                           blockSize * static_cast<uint64_t>(status.f_bfree)};
}

}  // namespace kest
