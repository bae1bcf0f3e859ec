// The size and free space of a file system, as the firmware update measures its staging area.
#pragma once

#include <cstdint>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Byte counts of the file system that holds `path`: block size times total blocks into
// *totalBytes, block size times free blocks (those reserved for the administrator included) into
// *freeBytes; either result may be null. Returns 0, or -1 when `path` is null, both results are
// null or the statistics cannot be read.
int32_t GetFreeDiskSpace(const char* path, uint64_t* totalBytes, uint64_t* freeBytes);

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
