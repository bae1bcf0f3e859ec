#include "PluginLoader.h"

#include <dlfcn.h>
#include <limits.h>
#include <unistd.h>

#include "ExitCodes.h"
#include "HostText.h"

namespace {

std::string LoaderError() {
    const char* reason = dlerror();
    return reason != nullptr ? reason : "unknown reason";
}

}  // namespace

std::string DefaultPluginPath() {
    char program[PATH_MAX];
    const ssize_t length = readlink("/proc/self/exe", program, sizeof program - 1);
    if (length <= 0) {
        throw Failure("cannot find the program's own directory; name the plug-in with --plugin");
    }
    const std::string path(program, static_cast<size_t>(length));
    return path.substr(0, path.rfind('/') + 1) + kPluginFileName;
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
