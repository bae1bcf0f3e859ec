// One run of the firmware-update tool on a staged image.
#pragma once

#include <sys/types.h>

#include <functional>
#include <string>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Runs `tool` with the arguments `stagingPath` and "3" and an empty environment, keeping
// `inheritedDescriptor` open in the tool (none when negative), calls `started` with the tool's
// process id once it runs, and waits for it to end. True only when it exited with status 0; a
// tool that cannot be started (or, under a sysroot, that others could have changed), that exits
// with another status or that is ended by a signal gives false.
bool RunFirmwareTool(const std::string& tool, const std::string& stagingPath,
                     int inheritedDescriptor, const std::function<void(pid_t)>& started);

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
