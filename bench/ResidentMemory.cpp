// Measures what the plug-in adds to a host's resident memory: the resident set before dlopen,
// after loading the plug-in (with the simulated controller library it links) and after the
// factory and Initialize, in a temporary sysroot. Prints one JSON object, sizes in KiB.
#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <string>

#include "PluginHost.h"

namespace {

struct Resident {
    long totalKiB = 0;
    long anonymousKiB = 0;  // heap, stacks and written data pages; the rest maps files
};

// The resident set of this process, from the kernel's summary of its mappings.
Resident MeasureResident() {
    std::ifstream rollup("/proc/self/smaps_rollup");
    Resident resident;
    bool found = false;
    for (std::string line; std::getline(rollup, line);) {
        found = std::sscanf(line.c_str(), "Rss: %ld kB", &resident.totalKiB) == 1 || found;
        std::sscanf(line.c_str(), "Anonymous: %ld kB", &resident.anonymousKiB);
    }
    if (!found) {
        throw std::runtime_error("cannot read /proc/self/smaps_rollup");
    }
    return resident;
}

}  // namespace

int main() {
    try {
        kest::test::TempSysroot sysroot;
        kest::bench::WriteControllerSysroot(sysroot);
        const Resident before = MeasureResident();
        Resident afterInitialize;
        Resident afterProperties;
        {
            kest::bench::LoadedExpert loaded;
            afterInitialize = MeasureResident();
            for (const wchar_t* item :
                 {kest::bench::kSystemItemName, kest::bench::kEthernetItemName}) {
                kest::hostkit::InterfaceRef<IuxSysPropertyBag> properties;
                if (loaded.Expert().GetPropertiesOfItem(item, properties.Receive()) != S_OK) {
                    throw std::runtime_error("GetPropertiesOfItem failed");
                }
            }
            afterProperties = MeasureResident();
        }
        std::printf(
            "{\"before_kib\": %ld, \"after_initialize_kib\": %ld, \"after_properties_kib\": %ld, "
            "\"anonymous_added_by_initialize_kib\": %ld}\n",
            before.totalKiB, afterInitialize.totalKiB, afterProperties.totalKiB,
            afterInitialize.anonymousKiB - before.anonymousKiB);
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "kest_resident_memory: %s\n", failure.what());
        return 1;
    }
}
