// Measures what the plug-in adds to a host's resident memory: the resident set before dlopen,
// after loading the plug-in (with the simulated controller library it links) and after the
// factory and Initialize, in a temporary sysroot. Prints one JSON object, sizes in KiB.
#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <string>

#include "PluginHost.h"

namespace {

// The resident set of this process in KiB, from the kernel's summary of its mappings.
long ResidentKiB() {
    std::ifstream rollup("/proc/self/smaps_rollup");
    for (std::string line; std::getline(rollup, line);) {
        long kib = 0;
        if (std::sscanf(line.c_str(), "Rss: %ld kB", &kib) == 1) {
            return kib;
        }
    }
    std::ifstream statm("/proc/self/statm");
    long sizePages = 0;
    long residentPages = 0;
    if (!(statm >> sizePages >> residentPages)) {
        throw std::runtime_error("cannot read the resident set size");
    }
    return residentPages * (sysconf(_SC_PAGESIZE) / 1024);
}

}  // namespace

int main() {
    try {
        kest::test::TempSysroot sysroot;
        kest_bench::WriteControllerSysroot(sysroot);
        const long before = ResidentKiB();
        long afterInitialize = 0;
        long afterProperties = 0;
        {
            kest_bench::LoadedExpert loaded;
            afterInitialize = ResidentKiB();
            for (const wchar_t* item :
                 {kest_bench::kSystemItemName, kest_bench::kEthernetItemName}) {
                IuxSysPropertyBag* properties = nullptr;
                if (loaded.Expert().GetPropertiesOfItem(item, &properties) != S_OK) {
                    throw std::runtime_error("GetPropertiesOfItem failed");
                }
                properties->Release();
            }
            afterProperties = ResidentKiB();
        }
        std::printf(
            "{\"before_kib\": %ld, \"after_initialize_kib\": %ld, \"after_properties_kib\": %ld}\n",
            before, afterInitialize, afterProperties);
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "kest_resident_memory: %s\n", failure.what());
        return 1;
    }
}
