// Loading the plug-in with dlopen and creating its expert through the exported factory.
#pragma once

#include <string>

#include "InterfaceRef.h"
#include "uxsys/Expert.h"

// The plug-in file name looked for next to the program.
inline constexpr char kPluginFileName[] = "libvqkestSysApiChassisExpert.so";

// The path of the plug-in next to the running program.
std::string DefaultPluginPath();

// One loaded plug-in; unloaded on destruction (release its interfaces first).
class Plugin {
  public:
    // Loads the plug-in at `path` and finds its factory. Throws a failure naming the path and
    // the loader's reason when the file cannot be loaded or lacks the factory.
    explicit Plugin(const std::string& path);
    ~Plugin();
    Plugin(const Plugin&) = delete;
    Plugin& operator=(const Plugin&) = delete;

    // A new expert holding the factory's one reference. Throws a failure with the status when
    // the factory fails.
    InterfaceRef<IuxSysExpert3> CreateExpert() const;

  private:
    std::string path_;
    void* handle_ = nullptr;
    PFN_createKestSysApiChassisExpert factory_ = nullptr;
};
