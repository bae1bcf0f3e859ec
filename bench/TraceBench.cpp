// The tracer: the cost of a trace call whose bit is off, and lines written to the log file beside
// spdlog's file logger flushed after every line and beside fprintf with fflush. Every writer
// appends the same text to its own file in the run's temporary directory.
#include <benchmark/benchmark.h>
#include <spdlog/sinks/basic_file_sink.h>
#include <spdlog/spdlog.h>

#include <cstdio>
#include <memory>
#include <string>

#include "BenchFiles.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "trace/Tracer.h"

namespace {

constexpr char kText[] = "CuxNetConfigExpert::GetPropertiesOfItem()";
// The mask the benchmarks trace with: errors and INI cache records on, entry records off.
constexpr uint32_t kMask = kTraceErrors | kTraceIniCache;

// Starts the tracer once, writing to its log file in the run's directory.
void StartFileTracing() {
    static const bool started = [] {
        InitializeTracing(kMask, kTraceToLogFile,
                          vq::dsc::WideFromNarrow(kest::bench::ScratchDirectory()), 0);
        return true;
    }();
    benchmark::DoNotOptimize(started);
}

void Trace_DisabledBit(benchmark::State& state) {
    StartFileTracing();
    for (auto _ : state) {
        TraceIfEnabled(kText, kTraceEntry);
    }
}
BENCHMARK(Trace_DisabledBit);

// One line, the text only.
void Trace_LineToFile(benchmark::State& state) {
    StartFileTracing();
    for (auto _ : state) {
        TraceLine(' ', kText, false);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(Trace_LineToFile);

// One enabled trace call: the text line and the thread/time line.
void Trace_RecordToFile(benchmark::State& state) {
    StartFileTracing();
    for (auto _ : state) {
        TraceIfEnabled(kText, kTraceErrors);
    }
    state.SetItemsProcessed(2 * state.iterations());
}
BENCHMARK(Trace_RecordToFile);

void Spdlog_LineToFile(benchmark::State& state) {
    static const std::shared_ptr<spdlog::logger> logger = [] {
        auto created =
            spdlog::basic_logger_mt("bench", kest::bench::ScratchDirectory() + "/spdlog.log");
        created->flush_on(spdlog::level::trace);
        return created;
    }();
    for (auto _ : state) {
        logger->info(kText);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(Spdlog_LineToFile);

struct FileCloser {
    void operator()(FILE* file) const { std::fclose(file); }
};

void Fprintf_LineToFile(benchmark::State& state) {
    static const std::unique_ptr<FILE, FileCloser> file(
        std::fopen((kest::bench::ScratchDirectory() + "/fprintf.log").c_str(), "a"));
    if (!file) {
        state.SkipWithError("cannot open the log file");
        return;
    }
    for (auto _ : state) {
        std::fprintf(file.get(), "%s\n", kText);
        std::fflush(file.get());
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(Fprintf_LineToFile);

}  // namespace
