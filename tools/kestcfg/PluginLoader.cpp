#include "PluginLoader.h"

#include <dlfcn.h>
#include <stdlib.h>
#include <unistd.h>

#include "ExitCodes.h"
#include "HostText.h"
#include "ProgramLocation.h"

namespace {

std::string LoaderError() {
    const char* reason = dlerror();
    return reason != nullptr ? reason : "unknown reason";
}

}  // namespace

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
        root != nullptr && access((std::string(root) + kSimulatedStateFile).c_str(), F_OK) == 0;
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
    handle_ = dlopen(path.c_str(), RTLD_NOW | RTLD_GLOBAL);
    if (handle_ == nullptr) {
        throw Failure("cannot load the simulated controller library " + path + ": " +
                      LoaderError());
    }
}

SimulatorLibrary::~SimulatorLibrary() {
    if (handle_ != nullptr) {
        dlclose(handle_);
    }
}

Plugin::Plugin(const std::string& path) : path_(path) {
    handle_ = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle_ == nullptr) {
        throw Failure("cannot load the plug-in " + path + ": " + LoaderError());
    }
    dlerror();
    factory_ = reinterpret_cast<PFN_createKestSysApiChassisExpert>(
        dlsym(handle_, KEST_EXPERT_FACTORY_SYMBOL));
    if (factory_ == nullptr) {
        const std::string reason = LoaderError();
        dlclose(handle_);
        throw Failure("the plug-in " + path + " has no function " + KEST_EXPERT_FACTORY_SYMBOL +
                      ": " + reason);
    }
}

Plugin::~Plugin() {
    dlclose(handle_);
}

InterfaceRef<IuxSysExpert3> Plugin::CreateExpert() const {
    IuxSysExpert3* expert = nullptr;
    const HRESULT status = factory_(&expert);
    if (status < 0 || expert == nullptr) {
        throw Failure(std::string(KEST_EXPERT_FACTORY_SYMBOL) + " of " + path_ +
                      " failed with status " + StatusText(status));
    }
    return InterfaceRef<IuxSysExpert3>(expert);
}
