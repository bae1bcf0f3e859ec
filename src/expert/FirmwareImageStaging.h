// Placing the host's firmware image in the staging file that the update tool reads.
#pragma once

#include <cstdint>
#include <string>

#include "uxsys/IUnknown.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Places the image of `imageSource` at `stagingPath`. A source that offers the image-file
// interface is hard-linked from its file (E_FAIL when the path request or the link fails).
// Otherwise its bytes are written to the staging file, replacing its content: E_POINTER for a
// null source or null bytes, UX_E_FIRMWARE_STATUS_UNEXPECTED when the byte count differs from
// `announcedSize`, E_FAIL when the file cannot be written. The staging file must be a regular
// file with no other name; a symbolic link there is never followed.
HRESULT StageFirmwareImage(IUnknown* imageSource, const std::string& stagingPath,
                           uint32_t announcedSize) noexcept;

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
