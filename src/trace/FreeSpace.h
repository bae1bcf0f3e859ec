// Free space of the file system that holds the trace log, measured in 64 bits.
// Thread safety: the measurement may be replaced while other threads trace (it is kept atomic).
#pragma once

#include <cstdint>
#include <string>

namespace kest_trace {

// Writes the free bytes of the file system holding `directory` (fragment size times free
// blocks); false when it cannot be measured.
using FreeSpaceMeasure = bool (*)(const std::string& directory, uint64_t* freeBytes);

// The statvfs measurement.
bool MeasureFreeSpace(const std::string& directory, uint64_t* freeBytes);

// The measurement the tracer uses: MeasureFreeSpace unless replaced (by tests, which cannot
// shrink a real file system). Null restores MeasureFreeSpace.
FreeSpaceMeasure CurrentFreeSpaceMeasure();
void SetFreeSpaceMeasure(FreeSpaceMeasure replacement);

}  // namespace kest_trace
