// The INI engine beside inih and SimpleIni: loading the same files of 1 KB, 100 KB and 10 MB,
// key look-ups on a loaded document, and the INI cache's look-up of an unchanged cached file
// beside its floor: the one stat() of the file that every look-up makes to see edits.
//
// Every load builds a document that answers look-ups and is destroyed again: IniText_Create,
// IniText_Load, IniText_Destroy; a fresh CSimpleIniA and LoadFile; inih's ini_parse with a
// handler that keeps every value in a std::map under "section=key", as inih's own INIReader does.
#include <SimpleIni.h>
#include <benchmark/benchmark.h>
#include <ini.h>
#include <sys/stat.h>

#include <map>
#include <string>

#include "BenchFiles.h"
#include "config/IniFileManager.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"
#include "uxsys/StatusCodes.h"

namespace {

using kest::bench::IniFileOfSize;

constexpr int64_t kSmall = 1024;
constexpr int64_t kMedium = 100 * 1024;
constexpr int64_t kLarge = 10 * 1024 * 1024;

void ApplySizes(benchmark::internal::Benchmark* benchmark) {
    benchmark->Arg(kSmall)->Arg(kMedium)->Unit(benchmark::kMicrosecond);
}

// A large load takes a tenth of a second or more: the longer run gives every repetition enough
// iterations that its first one, which grows the heap page by page, does not decide the result.
void ApplyLargeSize(benchmark::internal::Benchmark* benchmark) {
    benchmark->Arg(kLarge)->MinTime(1.0)->Unit(benchmark::kMicrosecond);
}

size_t SizeArgument(const benchmark::State& state) {
    return static_cast<size_t>(state.range(0));
}

void CountBytes(benchmark::State& state) {
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * state.range(0));
}

void IniText_Load(benchmark::State& state) {
    const std::string& path = IniFileOfSize(SizeArgument(state)).path;
    for (auto _ : state) {
        IniTextPtr ini(IniText_Create());
        if (IniText_Load(ini.get(), path.c_str()) != 0) {
            state.SkipWithError("IniText_Load failed");
            break;
        }
    }
    CountBytes(state);
}
BENCHMARK(IniText_Load)->Apply(ApplySizes);
BENCHMARK(IniText_Load)->Apply(ApplyLargeSize);

int KeepValue(void* user, const char* section, const char* name, const char* value) {
    auto& values = *static_cast<std::map<std::string, std::string>*>(user);
    values[std::string(section) + '=' + name] = value;
    return 1;
}

void Inih_Load(benchmark::State& state) {
    const std::string& path = IniFileOfSize(SizeArgument(state)).path;
    for (auto _ : state) {
        std::map<std::string, std::string> values;
        if (ini_parse(path.c_str(), KeepValue, &values) != 0) {
            state.SkipWithError("ini_parse failed");
            break;
        }
        benchmark::DoNotOptimize(values);
    }
    CountBytes(state);
}
BENCHMARK(Inih_Load)->Apply(ApplySizes);
BENCHMARK(Inih_Load)->Apply(ApplyLargeSize);

void SimpleIni_Load(benchmark::State& state) {
    const std::string& path = IniFileOfSize(SizeArgument(state)).path;
    for (auto _ : state) {
        CSimpleIniA ini;
        if (ini.LoadFile(path.c_str()) != SI_OK) {
            state.SkipWithError("CSimpleIniA::LoadFile failed");
            break;
        }
    }
    CountBytes(state);
}
BENCHMARK(SimpleIni_Load)->Apply(ApplySizes);
BENCHMARK(SimpleIni_Load)->Apply(ApplyLargeSize);

// One look-up per iteration, cycling through keys spread over the medium file.
void IniText_Lookup(benchmark::State& state) {
    const kest::bench::IniFile& file = IniFileOfSize(kMedium);
    IniTextPtr ini(IniText_Create());
    IniText_Load(ini.get(), file.path.c_str());
    size_t next = 0;
    for (auto _ : state) {
        const auto& key = file.lookupKeys[next++ % file.lookupKeys.size()];
        const char* value = nullptr;
        if (IniText_GetString(ini.get(), key.first.c_str(), key.second.c_str(), &value) !=
            kIniFound) {
            state.SkipWithError("key not found");
            break;
        }
        benchmark::DoNotOptimize(value);
    }
}
BENCHMARK(IniText_Lookup);

void SimpleIni_Lookup(benchmark::State& state) {
    const kest::bench::IniFile& file = IniFileOfSize(kMedium);
    CSimpleIniA ini;
    ini.LoadFile(file.path.c_str());
    size_t next = 0;
    for (auto _ : state) {
        const auto& key = file.lookupKeys[next++ % file.lookupKeys.size()];
        const char* value = ini.GetValue(key.first.c_str(), key.second.c_str());
        if (value == nullptr) {
            state.SkipWithError("key not found");
            break;
        }
        benchmark::DoNotOptimize(value);
    }
}
BENCHMARK(SimpleIni_Lookup);

// The cache's look-up in the shipped time-zone table, which stays unchanged: the hot path of
// every time-zone read.
void GetStringFromIni_Cached(benchmark::State& state) {
    const std::string path = KEST_TIMEZONE_TABLE_PATH;
    const std::string section = "OlsonToLegacy";
    const std::string key = "Europe/Berlin";
    // Held for the whole run, so the document stays cached between runs of the benchmark.
    static const std::shared_ptr<IniFileManager> cache = IniFileManager::GetInstance();
    std::string value;
    for (auto _ : state) {
        if (cache->GetStringFromIni(path, section, key, value) != S_OK) {
            state.SkipWithError("GetStringFromIni failed");
            break;
        }
        benchmark::DoNotOptimize(value);
    }
}
BENCHMARK(GetStringFromIni_Cached);

// The floor of a cached look-up: examining the file's modification time once.
void Stat_TimeZoneTable(benchmark::State& state) {
    struct stat status;
    for (auto _ : state) {
        if (stat(KEST_TIMEZONE_TABLE_PATH, &status) != 0) {
            state.SkipWithError("stat failed");
            break;
        }
        benchmark::DoNotOptimize(status);
    }
}
BENCHMARK(Stat_TimeZoneTable);

}  // namespace
