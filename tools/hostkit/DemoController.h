// A demo controller on disk: the files the simulated controller library, the plug-in and their
// external tools find under a sysroot, describing a chassis with one Ethernet adapter.
#pragma once

#include <string>
#include <vector>

namespace kest::hostkit {

// The simulated controller's state, which the library reads at every call, and the log of the
// calls it answered, as system paths below a sysroot.
inline constexpr char kControllerStatePath[] = "/var/lib/vqtargetcfg/state.ini";
inline constexpr char kControllerCallLogPath[] = "/var/lib/vqtargetcfg/calls.log";

// Creates the demo controller under `root`, creating the directory (mode 0700) when missing,
// and returns the system paths of the files written; `timeZoneTable` is the file copied in as
// the table of time zones. Throws std::runtime_error when `root` is not a new directory or an
// empty one of the caller that neither group nor others may write, or when a file cannot be
// written. `root` must be absolute.
std::vector<std::string> CreateDemoController(const std::string& root,
                                              const std::string& timeZoneTable);

// Writes `state` as the simulated controller's state under the sysroot `root`, creating the
// directories on the way. Throws std::runtime_error when it cannot be written.
void WriteControllerState(const std::string& root, const std::string& state);

}  // namespace kest::hostkit
