// The plug-in as a host drives it: GetPropertiesOfItem and ValidatePropertyChanges of both items.
// `--library=simulated` (the default) runs it on the simulated controller library;
// `--library=double` loads the in-memory library double first, so that the plug-in binds to it
// through the shared soname and the figures show the plug-in's own cost.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstring>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "PluginHost.h"
#include "hostkit/DemoController.h"
#include "kest/ChassisTags.h"

namespace {

using kest::bench::kEthernetItemName;
using kest::bench::kSystemItemName;
using kest::hostkit::InterfaceRef;

// The item's properties as a changes bag with nothing modified yet.
InterfaceRef<IuxSysPropertyBag2> ChangesOf(IuxSysExpert3& expert, const wchar_t* item) {
    InterfaceRef<IuxSysPropertyBag> properties;
    if (expert.GetPropertiesOfItem(item, properties.Receive()) != S_OK) {
        throw std::runtime_error("GetPropertiesOfItem failed");
    }
    auto changes = kest::hostkit::QueryInterfaceAs<IuxSysPropertyBag2>(properties.Get(),
                                                                       IID_IuxSysPropertyBag2);
    if (!changes) {
        throw std::runtime_error("the bag has no IuxSysPropertyBag2");
    }
    changes->ClearAllModified();
    return changes;
}

// Validates `changes` once; the status, with the enumerator and message given back.
HRESULT Validate(IuxSysExpert3& expert, const wchar_t* item, IuxSysPropertyBag* changes) {
    InterfaceRef<IuxSysEnumPropertyTag> validated;
    CvqBStr message = nullptr;
    const HRESULT status =
        expert.ValidatePropertyChanges(item, changes, validated.Receive(), &message);
    CvqBStrFree(message);
    return status;
}

void GetProperties(benchmark::State& state, IuxSysExpert3* expert, const wchar_t* item) {
    for (auto _ : state) {
        InterfaceRef<IuxSysPropertyBag> properties;
        if (expert->GetPropertiesOfItem(item, properties.Receive()) != S_OK) {
            state.SkipWithError("GetPropertiesOfItem failed");
            break;
        }
    }
}

void ValidateChanges(benchmark::State& state, IuxSysExpert3* expert, const wchar_t* item,
                     IuxSysPropertyBag* changes) {
    for (auto _ : state) {
        if (Validate(*expert, item, changes) != S_OK) {
            state.SkipWithError("ValidatePropertyChanges failed");
            break;
        }
    }
}

// Takes "--library=NAME" out of the arguments; "simulated" when absent.
std::string TakeLibraryChoice(int& argc, char** argv) {
    std::string library = "simulated";
    constexpr char kOption[] = "--library=";
    int kept = 0;
    for (int i = 0; i < argc; ++i) {
        if (std::strncmp(argv[i], kOption, sizeof kOption - 1) == 0) {
            library = argv[i] + sizeof kOption - 1;
        } else {
            argv[kept++] = argv[i];
        }
    }
    argc = kept;
    return library;
}

int Run(int argc, char** argv) {
    const std::string library = TakeLibraryChoice(argc, argv);
    if (library != "simulated" && library != "double") {
        std::fprintf(stderr, "unknown --library=%s (simulated or double)\n", library.c_str());
        return 2;
    }
    // Loaded first and globally, the double is the libvqtargetcfg.so.1 the plug-in binds to.
    std::optional<kest::hostkit::GlobalLibrary> libraryDouble;
    if (library == "double") {
        libraryDouble.emplace(KEST_LIBRARY_DOUBLE_PATH, "the library double");
    }
    kest::test::TempSysroot sysroot;
    kest::bench::WriteControllerSysroot(sysroot);
    kest::bench::LoadedExpert loaded;
    IuxSysExpert3& expert = loaded.Expert();

    const InterfaceRef<IuxSysPropertyBag2> systemChanges = ChangesOf(expert, kSystemItemName);
    systemChanges->SetString(kest::tag::kHostName, L"kest-2");
    systemChanges->SetString(kest::tag::kComment, L"second controller");
    systemChanges->SetString(kest::tag::kLocaleCode, L"de");
    systemChanges->SetString(kest::tag::kOlsonTimeZone, L"America/Chicago");
    const InterfaceRef<IuxSysPropertyBag2> ethernetChanges = ChangesOf(expert, kEthernetItemName);
    ethernetChanges->SetString(kest::tag::kIPAddress, L"192.168.1.20");
    if (Validate(expert, kSystemItemName, systemChanges.Get()) != S_OK ||
        Validate(expert, kEthernetItemName, ethernetChanges.Get()) != S_OK) {
        std::fprintf(stderr, "the benchmark's changes do not validate\n");
        return 1;
    }
    // The simulated library logs every call; the double must not have been bypassed.
    const bool simulatorCalled = sysroot.Exists(kest::hostkit::kControllerCallLogPath);
    if (simulatorCalled != (library == "simulated")) {
        std::fprintf(stderr, "the plug-in is not bound to the %s library\n", library.c_str());
        return 1;
    }

    const std::string suffix = "/" + library;
    benchmark::RegisterBenchmark(("Plugin_GetPropertiesOfItem/system" + suffix).c_str(),
                                 GetProperties, &expert, kSystemItemName);
    benchmark::RegisterBenchmark(("Plugin_GetPropertiesOfItem/eth0" + suffix).c_str(),
                                 GetProperties, &expert, kEthernetItemName);
    benchmark::RegisterBenchmark(("Plugin_ValidatePropertyChanges/system" + suffix).c_str(),
                                 ValidateChanges, &expert, kSystemItemName, systemChanges.Get());
    benchmark::RegisterBenchmark(("Plugin_ValidatePropertyChanges/eth0" + suffix).c_str(),
                                 ValidateChanges, &expert, kEthernetItemName,
                                 ethernetChanges.Get());
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 2;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return Run(argc, argv);
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "kest_bench_plugin: %s\n", failure.what());
        return 1;
    }
}
