// A host of the plug-in for benchmarks: a temporary sysroot that describes one controller (the
// system item and the Ethernet adapter eth0) to the simulated library, as the in-memory library
// double describes it, and the plug-in loaded with dlopen, its expert created by the factory and
// initialised.
#pragma once

#include "common/TempSysroot.h"
#include "hostkit/Plugin.h"
#include "uxsys/Interfaces.h"

namespace kest::bench {

constexpr wchar_t kSystemItemName[] = L"VQ KEST Chassis";
constexpr wchar_t kEthernetItemName[] = L"eth0";

// Writes the controller's state, the firmware version, the time-zone table, zone files and the
// shared settings directory into `sysroot`.
void WriteControllerSysroot(const kest::test::TempSysroot& sysroot);

// The loaded plug-in and one initialised expert; everything is given back on destruction.
// Construction throws std::runtime_error with the reason when a step fails.
class LoadedExpert {
  public:
    LoadedExpert();
    ~LoadedExpert();
    LoadedExpert(const LoadedExpert&) = delete;
    LoadedExpert& operator=(const LoadedExpert&) = delete;

    IuxSysExpert3& Expert() const { return *expert_.Get(); }

  private:
    kest::hostkit::Plugin plugin_{KEST_PLUGIN_PATH};
    kest::hostkit::InterfaceRef<IuxSysExpert3> expert_;
};

}  // namespace kest::bench
