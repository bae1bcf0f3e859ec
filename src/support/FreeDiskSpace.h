// The size and free space of a file system, in bytes counted in 64 bits: a product in 32 bits
// overflows on any file system with more than 2 GiB. Safe from any thread.
#pragma once

#include <cstdint>

namespace kest {

// Takes the statistics of the file system that holds `path` (statvfs, repeated after EINTR):
// total = fragment size x all blocks, free = fragment size x free blocks (the administrator's
// reserve included). Either result may be null. Returns 0, or -1 when the path is null, both
// results are null or the statistics cannot be read.
int32_t GetFreeDiskSpace(const char* path, uint64_t* totalBytes, uint64_t* freeBytes);

}  // namespace kest
