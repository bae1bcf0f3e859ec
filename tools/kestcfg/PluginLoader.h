// Loading the plug-in with dlopen and creating its expert through the exported factory.
#pragma once

#include <string>

#include "InterfaceRef.h"
#include "uxsys/Expert.h"

// The plug-in file name looked for next to the program.
inline constexpr char kPluginFileName[] = "libvqkestSysApiChassisExpert.so";

// The simulated controller library's file name: the real library's soname.
inline constexpr char kSimulatorFileName[] = "libvqtargetcfg.so.1";
// The state file that marks a sysroot holding a simulated controller.
inline constexpr char kSimulatedStateFile[] = "/var/lib/vqtargetcfg/state.ini";

// The plug-in next to the running program (a build tree), else where the installation puts it
// relative to the program.
std::string DefaultPluginPath();

// The simulated controller library of an installation, loaded globally before the plug-in so
// that it stands in for the real controller library (both have one soname), but only when asked
// for or when the sysroot holds a simulated controller. The installed plug-in has no search path
// to it, so it never replaces the real library otherwise.
class SimulatorLibrary {
  public:
    // Loads the library when `asked` or the sysroot is simulated. Throws a failure when it is
    // asked for but not installed, or cannot be loaded.
    explicit SimulatorLibrary(bool asked);
    ~SimulatorLibrary();
    SimulatorLibrary(const SimulatorLibrary&) = delete;
    SimulatorLibrary& operator=(const SimulatorLibrary&) = delete;

  private:
    void* handle_ = nullptr;
};

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
