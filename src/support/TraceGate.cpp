#include "support/TraceGate.h"

namespace kest::detail {
std::atomic<uint32_t> traceMask{0};
namespace {
std::atomic<TraceLineWriter> traceWriter{nullptr};

void WriteRecord(const char* text, bool withStamp) {
    TraceLineWriter writer = traceWriter.load(std::memory_order_acquire);
    if (writer == nullptr) {
        return;
    }
    try {
        writer(' ', text, withStamp);
    } catch (...) {
        // A failing trace writer must not change the status of the traced operation.
    }
}
}  // namespace
}  // namespace kest::detail

void SetTraceGate(uint32_t mask, TraceLineWriter writer) {
    kest::detail::traceWriter.store(writer, std::memory_order_release);
    kest::detail::traceMask.store(mask, std::memory_order_relaxed);
}

void TraceIfEnabled(const char* text, uint32_t bits) {
    if (IsTraceEnabled(bits)) {
        kest::detail::WriteRecord(text, true);
    }
}

void TraceLineIfEnabled(const char* text, uint32_t bits) {
    if (IsTraceEnabled(bits)) {
        kest::detail::WriteRecord(text, false);
    }
}

void TraceStatus(const char* text, HRESULT status) {
    if (!IsTraceEnabled(kTraceErrors)) {
        return;
    }
    try {
        std::string line(text);
        line += '(';
        line += std::to_string(status);
        line += ')';
        kest::detail::WriteRecord(line.c_str(), true);
    } catch (...) {
        // Out of memory while tracing: the record is dropped, the status stands.
    }
}
