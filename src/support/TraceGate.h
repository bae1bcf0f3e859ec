// The gate between trace callers and the tracer: the process-wide trace mask and the line writer
// the tracer installs. Until a tracer installs itself the mask is 0 and nothing is written.
// Thread safety: every function may be called from any thread at once (the mask and the writer
// are atomic).
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "uxsys/Types.h"

// Trace-mask bits.
constexpr uint32_t kTraceIniCache = 0x01;
constexpr uint32_t kTraceErrors = 0x02;
constexpr uint32_t kTraceEntry = 0x10;
constexpr uint32_t kTraceLibraryCalls = 0x20;

// Writes one trace record: the text line and, when withStamp is set, the thread/time line.
using TraceLineWriter = void (*)(char kind, const char* text, bool withStamp);

namespace kest::detail {
extern std::atomic<uint32_t> traceMask;
}  // namespace kest::detail

// The current trace mask (0 until the tracer is initialised).
inline uint32_t CurrentTraceMask() {
    return kest::detail::traceMask.load(std::memory_order_relaxed);
}

// True when `bits` shares at least one bit with the trace mask.
inline bool IsTraceEnabled(uint32_t bits) {
    return (CurrentTraceMask() & bits) != 0;
}

// Installs the tracer's mask and line writer (the writer may be null: nothing is written).
void SetTraceGate(uint32_t mask, TraceLineWriter writer);

// Writes `text` with a thread/time line when `bits` shares a bit with the mask. Failures of the
// writer are swallowed: tracing never changes the outcome of the traced operation.
void TraceIfEnabled(const char* text, uint32_t bits);
inline void TraceIfEnabled(const std::string& text, uint32_t bits) {
    TraceIfEnabled(text.c_str(), bits);
}

// Under bit 0x02 writes text immediately followed by "(" status in signed decimal ")".
void TraceStatus(const char* text, HRESULT status);

// Writes `text` without the thread/time line when `bits` is enabled (single-line traces).
void TraceLineIfEnabled(const char* text, uint32_t bits);
