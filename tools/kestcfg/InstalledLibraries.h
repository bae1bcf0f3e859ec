// Where kestcfg finds the plug-in and the simulated controller library of its installation.
#pragma once

#include <optional>
#include <string>

#include "hostkit/Plugin.h"

namespace kest::cfg {

// The simulated controller library's file name: the real library's soname.
inline constexpr char kSimulatorFileName[] = "libvqtargetcfg.so.1";

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

  private:
    std::optional<kest::hostkit::GlobalLibrary> library_;
};

}  // namespace kest::cfg
