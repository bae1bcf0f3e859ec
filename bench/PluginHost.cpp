#include "PluginHost.h"

#include <stdexcept>
#include <string>

#include "hostkit/DemoController.h"

namespace kest_bench {

void WriteControllerSysroot(const kest::test::TempSysroot& sysroot) {
    kest::hostkit::CreateDemoController(sysroot.Root(), KEST_TIMEZONE_TABLE_PATH);
    for (const char* zone : {"Europe/Berlin", "America/Chicago", "America/Los_Angeles"}) {
        sysroot.WriteFile(std::string("/usr/share/zoneinfo/") + zone, "TZif");
    }
}

LoadedExpert::LoadedExpert() : expert_(plugin_.CreateExpert()) {
    if (expert_->Initialize() != S_OK) {
        throw std::runtime_error("the expert's Initialize failed");
    }
}

LoadedExpert::~LoadedExpert() {
    expert_->Uninitialize();
}

}  // namespace kest_bench
