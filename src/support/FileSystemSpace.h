// The size and free space of a file system, in bytes counted in 64 bits: a product in 32 bits
// overflows on any file system with more than 2 GiB. Safe from any thread.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace kest {

struct FileSystemSpace {
    uint64_t totalBytes;  // fragment size times all blocks
    uint64_t freeBytes;   // fragment size times free blocks, the administrator's reserve included
};

// Measures the file system that holds `path` (statvfs, repeated after EINTR); nothing when its
// statistics cannot be read.
std::optional<FileSystemSpace> MeasureFileSystemSpace(const std::string& path);

}  // namespace kest
