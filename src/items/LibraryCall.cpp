#include "items/LibraryCall.h"

#include "support/ConvertStatusCode.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"

namespace kest::items {

void ThrowIfLibraryCallFailed(int32_t libraryStatus) {
    StatusHolder status;
    status = ConvertStatusCode(libraryStatus);
}

void TraceLibraryCall(const char* label, uint32_t value) {
    if (IsTraceEnabled(kTraceLibraryCalls)) {
        TraceLibraryCall(label, std::to_string(value));
    }
}

void TraceLibraryCall(const char* label, const std::string& value) {
    if (IsTraceEnabled(kTraceLibraryCalls)) {
        TraceIfEnabled(std::string(label) + "(" + value + ")", kTraceLibraryCalls);
    }
}

}  // namespace kest::items
