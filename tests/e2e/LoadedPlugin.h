// The built plug-in, loaded with dlopen for the duration of a test, and its factory.
#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>

#include "uxsys/Interfaces.h"

class LoadedPlugin {
  public:
    LoadedPlugin() : handle_(dlopen(KEST_PLUGIN_PATH, RTLD_NOW | RTLD_LOCAL)) {
        if (handle_ == nullptr) {
            ADD_FAILURE() << "cannot load " << KEST_PLUGIN_PATH << ": " << dlerror();
            return;
        }
        factory_ = reinterpret_cast<PFN_createKestSysApiChassisExpert>(
            dlsym(handle_, KEST_EXPERT_FACTORY_SYMBOL));
        if (factory_ == nullptr) {
            ADD_FAILURE() << "no factory in " << KEST_PLUGIN_PATH;
        }
    }
    ~LoadedPlugin() {
        if (handle_ != nullptr) {
            dlclose(handle_);
        }
    }
    LoadedPlugin(const LoadedPlugin&) = delete;
    LoadedPlugin& operator=(const LoadedPlugin&) = delete;

    // The exported factory (null when loading failed).
    PFN_createKestSysApiChassisExpert Factory() const { return factory_; }

    // A new expert with the one reference the factory hands out.
    IuxSysExpert3* CreateExpert() const {
        IuxSysExpert3* expert = nullptr;
        EXPECT_EQ(S_OK, factory_(&expert));
        EXPECT_NE(nullptr, expert);
        return expert;
    }

  private:
    void* handle_;
    PFN_createKestSysApiChassisExpert factory_ = nullptr;
};
