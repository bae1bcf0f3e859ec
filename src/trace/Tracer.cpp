#include "trace/Tracer.h"

#include <pthread.h>
#include <unistd.h>

#include <atomic>
#include <cinttypes>
#include <cstdio>
#include <memory>
#include <mutex>

#include "support/AbsTime.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "trace/NamedMutex.h"
#include "trace/TraceLog.h"

namespace {

constexpr size_t kLineBufferSize = 2048;

// The process-wide tracer. The log file name is fixed before the first trace lock exists; the
// log is used only while the trace lock is held.
struct TracerState {
    std::atomic<uint32_t> outputs{0};
    std::atomic<uint32_t> threshold{0};
    std::mutex configuration;  // serialises InitializeTracing and ShutdownTracing
    std::mutex lockSlot;       // guards `lock` itself
    std::shared_ptr<vq::dsc::NamedMutex> lock;
    std::string logFileName;
    kest::trace::TraceLog log;
};

TracerState& State() {
    static TracerState state;
    return state;
}

std::shared_ptr<vq::dsc::NamedMutex> CurrentLock() {
    TracerState& state = State();
    std::lock_guard<std::mutex> guard(state.lockSlot);
    return state.lock;
}

void PublishLock(std::shared_ptr<vq::dsc::NamedMutex> lock) {
    TracerState& state = State();
    std::lock_guard<std::mutex> guard(state.lockSlot);
    state.lock = std::move(lock);
}

std::string LocalTimeText(unsigned fractionDigits) {
    vq::dsc::AbsTimeFormat format;
    format.dateFormat = "%Y%m%d";
    format.timeFormat = "%H%M%S";
    format.fractionDigits = fractionDigits;
    return vq::dsc::NarrowFromWide(vq::dsc::AbsTimeToString(vq::dsc::AbsTime::Now(), format));
}

std::string BuildLogFileName() {
    std::string stamp = LocalTimeText(0);
    if (stamp.size() > 8) {
        stamp[8] = '_';
    }
    char name[kest::trace::kMaxLogPathLength + 1];
    std::snprintf(name, sizeof name, "%s-uxTracer-%08lX.log", stamp.c_str(),
                  static_cast<unsigned long>(getpid()));
    return name;
}

// Writes a line to standard error and standard output, as far as they are chosen outputs.
void WriteToStandardStreams(uint32_t outputs, const char* line) {
    if ((outputs & kTraceToStandardError) != 0) {
        std::fprintf(stderr, "%s\n", line);
    }
    if ((outputs & kTraceToStandardOutput) != 0) {
        std::fprintf(stdout, "%s\n", line);
        std::fflush(stdout);
    }
}

// Writes one line to every chosen output.
void WriteLine(const char* line) {
    TracerState& state = State();
    uint32_t outputs = state.outputs.load(std::memory_order_relaxed);
    if ((outputs & kTraceToLogFile) != 0) {
        line = state.log.Append(line, state.threshold.load(std::memory_order_relaxed));
    }
    WriteToStandardStreams(outputs, line);
}

// Writes two lines to every chosen output. Without a free-space check to run between them, the
// log file receives both with one write: a system call fewer for every record.
void WriteTwoLines(const char* first, const char* second) {
    TracerState& state = State();
    uint32_t outputs = state.outputs.load(std::memory_order_relaxed);
    const bool toLogFile = (outputs & kTraceToLogFile) != 0;
    if (toLogFile && state.threshold.load(std::memory_order_relaxed) != 0) {
        WriteLine(first);
        WriteLine(second);
        return;
    }
    if (toLogFile) {
        state.log.AppendTwoLines(first, second);
    }
    WriteToStandardStreams(outputs, first);
    WriteToStandardStreams(outputs, second);
}

}  // namespace

void InitializeTracing(uint32_t mask, uint32_t outputs, const std::wstring& directory,
                       uint32_t lowDiskThreshold) {
    TracerState& state = State();
    std::lock_guard<std::mutex> configuration(state.configuration);
    SetTraceGate(mask, &TraceLine);
    state.outputs.store(outputs, std::memory_order_relaxed);
    state.threshold.store(lowDiskThreshold, std::memory_order_relaxed);
    std::shared_ptr<vq::dsc::NamedMutex> lock = CurrentLock();
    if (!lock) {
        if (state.logFileName.empty()) {
            state.logFileName = BuildLogFileName();
        }
        lock = std::make_shared<vq::dsc::NamedMutex>(state.logFileName);
        PublishLock(lock);
    }
    if ((outputs & kTraceToLogFile) != 0 && !directory.empty()) {
        vq::dsc::ScopedNamedLock guard(*lock);
        if (!state.log.HasLocation()) {
            state.log.SetLocation(vq::dsc::NarrowFromWide(directory), state.logFileName);
        }
    }
}

void TraceLine(char kind, const char* text, bool withStamp) {
    std::shared_ptr<vq::dsc::NamedMutex> lock = CurrentLock();
    if (!lock) {
        return;
    }
    vq::dsc::ScopedNamedLock guard(*lock);
    if (CurrentLock() != lock) {
        return;  // shut down while this thread waited for the lock
    }
    char line[kLineBufferSize];
    std::snprintf(line, sizeof line, "%c %s", kind, text != nullptr ? text : "");
    if (!withStamp) {
        WriteLine(line);
        return;
    }
    std::string time;
    try {
        time = LocalTimeText(3);
    } catch (...) {
        WriteLine(line);  // the text line goes out even when the time cannot be told
        throw;
    }
    char stamp[kLineBufferSize];
    std::snprintf(stamp, sizeof stamp, "  Thread = 0x%lX, Time = %s",
                  static_cast<unsigned long>(pthread_self()), time.c_str());
    WriteTwoLines(line, stamp);
}

uint32_t GetTraceMask() {
    return CurrentTraceMask();
}

void ShutdownTracing() {
    TracerState& state = State();
    std::lock_guard<std::mutex> configuration(state.configuration);
    std::shared_ptr<vq::dsc::NamedMutex> lock = CurrentLock();
    if (!lock) {
        return;
    }
    {
        vq::dsc::ScopedNamedLock guard(*lock);
        state.log.Close();
    }
    PublishLock(nullptr);
}
