// The time-zone database the simulated controller validates zone names against.
#pragma once

#include <string>

namespace kest::sim {

// True when `zoneName` is a relative path of non-empty components other than "." and "..",
// without zero characters, that names a regular file (links followed) in the sysroot's
// "usr/share/zoneinfo", or in the machine's "/usr/share/zoneinfo" when the sysroot has no such
// directory.
bool ZoneFileExists(const std::string& sysroot, const std::string& zoneName);

}  // namespace kest::sim
