// The tracer: writes trace records to a per-process log file, standard output and standard
// error, each chosen by an output bit, serialised across threads and processes by a lock shared
// through a lock file. Callers test the trace mask (TraceGate.h) before they build a line.
// Thread safety: every function may be called from any thread at once; InitializeTracing and
// ShutdownTracing are serialised, and records are written one at a time under the trace lock.
#pragma once

#include <cstdint>
#include <string>

// Output bits.
constexpr uint32_t kTraceToLogFile = 0x01;
constexpr uint32_t kTraceToStandardOutput = 0x02;
constexpr uint32_t kTraceToStandardError = 0x04;

// Sets the mask, the outputs and the low-disk threshold in bytes (0: no check); every call does.
// The first call names the log file "<YYYYMMDD_HHMMSS>-uxTracer-<pid in 8 hex digits>.log" and
// creates the trace lock; with the log-file output and a non-empty directory the log path is
// fixed once, the first time it can be: a later call changes outputs, not the path. A directory
// or path longer than 255 bytes leaves file output off. Installs TraceLine behind
// TraceIfEnabled and TraceStatus. A trace lock file that cannot be used leaves tracing without
// the cross-process lock; it never fails or hangs the call.
void InitializeTracing(uint32_t mask, uint32_t outputs, const std::wstring& directory,
                       uint32_t lowDiskThreshold);

// Writes one record under the trace lock: "<kind> <text>" (cut to 2047 characters) and, with
// `withStamp`, "  Thread = 0x<thread>, Time = <YYYYMMDD HHMMSS.mmm>". Does nothing before
// InitializeTracing or after ShutdownTracing.
void TraceLine(char kind, const char* text, bool withStamp);

// The trace mask set by the last InitializeTracing (0 before).
uint32_t GetTraceMask();

// Closes the log file and drops the trace lock, removing its lock file; mask, outputs, threshold,
// log path and a stopped log stay as they are, and the next InitializeTracing traces to the same
// path again.
void ShutdownTracing();
