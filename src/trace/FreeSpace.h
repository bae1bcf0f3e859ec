// Free space of the file system that holds the trace log, as the tracer measures it before it
// writes: kest::MeasureFileSystemSpace unless a test has put a stand-in in its place.
// Thread safety: the measurement may be replaced while other threads trace (it is kept atomic).
#pragma once

#include "support/FileSystemSpace.h"

namespace kest_trace {

// Measures the file system holding a directory; nothing when it cannot be measured.
using FreeSpaceMeasure = std::optional<kest::FileSystemSpace> (*)(const std::string& directory);

// The measurement the tracer uses: kest::MeasureFileSystemSpace unless replaced (by tests,
// which cannot shrink a real file system). Null restores kest::MeasureFileSystemSpace.
FreeSpaceMeasure CurrentFreeSpaceMeasure();
void SetFreeSpaceMeasure(FreeSpaceMeasure replacement);

}  // namespace kest_trace
