#include "hostkit/Plugin.h"

#include <dlfcn.h>

#include <stdexcept>

#include "hostkit/HostText.h"

namespace kest::hostkit {
namespace {

std::string LoaderError() {
    const char* reason = dlerror();
    return reason != nullptr ? reason : "unknown reason";
}

}  // namespace

Plugin::Plugin(const std::string& path) : path_(path) {
    handle_ = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle_ == nullptr) {
        throw std::runtime_error("cannot load the plug-in " + path + ": " + LoaderError());
    }
    dlerror();
    factory_ = reinterpret_cast<PFN_createKestSysApiChassisExpert>(
        dlsym(handle_, KEST_EXPERT_FACTORY_SYMBOL));
    if (factory_ == nullptr) {
        const std::string reason = LoaderError();
        dlclose(handle_);
        throw std::runtime_error("the plug-in " + path + " has no function " +
                                 KEST_EXPERT_FACTORY_SYMBOL + ": " + reason);
    }
}

Plugin::~Plugin() {
    dlclose(handle_);
}

InterfaceRef<IuxSysExpert3> Plugin::CreateExpert() const {
    IuxSysExpert3* expert = nullptr;
    const HRESULT status = factory_(&expert);
    if (status < 0 || expert == nullptr) {
        throw std::runtime_error(std::string(KEST_EXPERT_FACTORY_SYMBOL) + " of " + path_ +
                                 " failed with status " + StatusText(status));
    }
    return InterfaceRef<IuxSysExpert3>(expert);
}

GlobalLibrary::GlobalLibrary(const std::string& path, const std::string& what)
    : handle_(dlopen(path.c_str(), RTLD_NOW | RTLD_GLOBAL)) {
    if (handle_ == nullptr) {
        throw std::runtime_error("cannot load " + what + " " + path + ": " + LoaderError());
    }
}

GlobalLibrary::~GlobalLibrary() {
    dlclose(handle_);
}

}  // namespace kest::hostkit
