// Placing the host's firmware image in the staging file that the update tool reads.
#pragma once

#include <cstdint>
#include <string>

#include "uxsys/IUnknown.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Places the image of `imageSource` at `stagingPath` through a new temporary file in the same
// directory that is then renamed over it: whatever stood at the staging path before (a planted
// file or link included) is replaced, never written, and a tool still reading an earlier image
// keeps it. A source that offers the image-file interface has its file (symbolic links followed)
// hard-linked to the temporary, or copied when it lies on another file system or the link is
// refused; it must be a regular file. Otherwise its bytes are written to the temporary (mode
// 0600). E_POINTER for a null source or null bytes, UX_E_FIRMWARE_STATUS_UNEXPECTED when the
// byte count differs from `announcedSize`, E_FAIL for any other failure.
HRESULT StageFirmwareImage(IUnknown* imageSource, const std::string& stagingPath,
                           uint32_t announcedSize) noexcept;

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
