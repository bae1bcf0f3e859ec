// Loading the plug-in with dlopen and creating its experts through the exported factory, and
// loading a controller library globally beforehand so that the plug-in binds to it.
#pragma once

#include <string>

#include "hostkit/InterfaceRef.h"
#include "uxsys/Expert.h"

namespace kest::hostkit {

// The plug-in's file name.
inline constexpr char kPluginFileName[] = "libvqkestSysApiChassisExpert.so";

// One loaded plug-in; unloaded on destruction (release its interfaces first).
class Plugin {
  public:
    // Loads the plug-in at `path` and finds its factory. Throws std::runtime_error naming the
    // path and the loader's reason when the file cannot be loaded or lacks the factory.
    explicit Plugin(const std::string& path);
    ~Plugin();
    Plugin(const Plugin&) = delete;
    Plugin& operator=(const Plugin&) = delete;

    // The exported factory, for callers that check its raw answers.
    PFN_createKestSysApiChassisExpert Factory() const { return factory_; }

    // A new expert holding the factory's one reference. Throws std::runtime_error with the
    // status when the factory fails.
    InterfaceRef<IuxSysExpert3> CreateExpert() const;

  private:
    std::string path_;
    void* handle_ = nullptr;
    PFN_createKestSysApiChassisExpert factory_ = nullptr;
};

// A shared library loaded with RTLD_GLOBAL for the object's lifetime: a plug-in loaded
// afterwards binds to it when it has the soname the plug-in needs.
class GlobalLibrary {
  public:
    // Loads the library at `path`. Throws std::runtime_error "cannot load `what` `path`: reason"
    // when it cannot be loaded.
    GlobalLibrary(const std::string& path, const std::string& what);
    ~GlobalLibrary();
    GlobalLibrary(const GlobalLibrary&) = delete;
    GlobalLibrary& operator=(const GlobalLibrary&) = delete;

  private:
    void* handle_ = nullptr;
};

}  // namespace kest::hostkit
