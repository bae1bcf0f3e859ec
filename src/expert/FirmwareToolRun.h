// One run of the firmware-update tool on a staged image.
#pragma once

#include <string>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Runs `tool` with the arguments `stagingPath` and "3" and an empty environment, and waits for
// it to end. True only when it exited with status 0; a tool that cannot be started (or, under a
// sysroot, that others could have changed), that exits with another status or that is ended by
// a signal gives false.
bool RunFirmwareTool(const std::string& tool, const std::string& stagingPath);

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
