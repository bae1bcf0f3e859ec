#include "PluginLoader.h"

#include <dlfcn.h>

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
    return ProgramDirectory() + kPluginFileName;
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
