// The firmware-update tool's status file: its first non-blank character is the tool's progress
// code, which turns into a percentage, a state change and a status for the host.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "expert/FirmwareUpdateState.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// What one reading of the status file tells the host.
struct FirmwareProgress {
    std::optional<int32_t> percent;               // nothing: the percentage is not reported
    std::optional<FirmwareUpdateState> newState;  // nothing: the state stays as it is
    HRESULT status = S_OK;
};

// Reads the progress code from `statusFile`: "0" to "4" give 5 to 50 percent; "5" gives 60 and
// the finishing state; "a" fails with E_FAIL, "d" and "t" with UX_E_FIRMWARE_STATUS_FAILED, and
// any other character or an empty file with UX_E_FIRMWARE_STATUS_UNEXPECTED, each failing the
// update. A file that is missing or cannot be opened reads as "0"; a read error gives 50 percent.
FirmwareProgress ReadFirmwareProgress(const std::string& statusFile);

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
