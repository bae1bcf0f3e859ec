// Free space of the file system that holds the trace log, as the tracer measures it before it
// writes: kest::GetFreeDiskSpace unless a test has put a stand-in in its place.
// Thread safety: the measurement may be replaced while other threads trace (it is kept atomic).
#pragma once

#include "support/FreeDiskSpace.h"

namespace kest::trace {

// Measures the file system holding a path, with the contract of kest::GetFreeDiskSpace.
using FreeSpaceMeasure = int32_t (*)(const char* path, uint64_t* totalBytes, uint64_t* freeBytes);

// The measurement the tracer uses: kest::GetFreeDiskSpace unless replaced (by tests,
// which cannot shrink a real file system). Null restores kest::GetFreeDiskSpace.
FreeSpaceMeasure CurrentFreeSpaceMeasure();
void SetFreeSpaceMeasure(FreeSpaceMeasure replacement);

}  // namespace kest::trace
