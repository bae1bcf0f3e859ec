// The states of a firmware update as the host sees them in GetFirmwareUpdateStatus.
#pragma once

#include <cstdint>

#include "uxsys/Expert.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

enum class FirmwareUpdateState : int32_t {
    kIdle = UX_FIRMWARE_STATE_IDLE,            // nothing announced yet
    kPrepared = UX_FIRMWARE_STATE_PREPARED,    // identifier handed out, image not yet received
    kRunning = UX_FIRMWARE_STATE_RUNNING,      // the tool runs; progress from its status file
    kFinishing = UX_FIRMWARE_STATE_FINISHING,  // the status file reached its last stage
    kInstalled = UX_FIRMWARE_STATE_INSTALLED,  // the tool ended with exit status 0
    kFailed = UX_FIRMWARE_STATE_FAILED,
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
