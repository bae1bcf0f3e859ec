#include "InstalledLibraries.h"

#include <stdlib.h>
#include <unistd.h>

#include "ExitCodes.h"
#include "ProgramLocation.h"
#include "hostkit/DemoController.h"

namespace kest::cfg {

using kest::hostkit::kPluginFileName;

std::string DefaultPluginPath() {
    std::string besideProgram = ProgramDirectory() + kPluginFileName;
    if (access(besideProgram.c_str(), F_OK) == 0) {
        return besideProgram;
    }
    return ProgramDirectory() + KESTCFG_PLUGIN_DIR_FROM_PROGRAM "/" + kPluginFileName;
}

SimulatorLibrary::SimulatorLibrary(bool asked) {
    const std::string path =
        ProgramDirectory() + KESTCFG_SIMULATOR_DIR_FROM_PROGRAM "/" + kSimulatorFileName;
    const char* root = getenv("KEST_SYSROOT");
    const bool simulatedSysroot =
        root != nullptr &&
        access((std::string(root) + kest::hostkit::kControllerStatePath).c_str(), F_OK) == 0;
    if (access(path.c_str(), F_OK) != 0) {
        if (asked) {
            throw Failure("--simulator: the simulated controller library is not installed at " +
                          path);
        }
        return;
    }
    if (!asked && !simulatedSysroot) {
        return;
    }
    library_.emplace(path, "the simulated controller library");
}

}  // namespace kest::cfg
