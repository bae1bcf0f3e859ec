// Bookkeeping around calls into the target-configuration library: testing a call's status and
// tracing the value it returned.
#pragma once

#include <cstdint>
#include <string>

namespace kest::items {

// Converts a tested call's status; a negative result is thrown as a status (long).
void ThrowIfLibraryCallFailed(int32_t libraryStatus);

// Under trace bit 0x20 writes `label` "(" value ")" with the thread/time line; numbers appear in
// unsigned decimal, text unchanged.
void TraceLibraryCall(const char* label, uint32_t value);
void TraceLibraryCall(const char* label, const std::string& value);

}  // namespace kest::items
