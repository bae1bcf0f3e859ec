// Conversion of the target-configuration library's status codes into the plug-in's status codes.
#pragma once

#include <cstdint>

#include "uxsys/StatusCodes.h"

// Maps a library status to a status code: 0 to S_OK, the known negative codes to their statuses,
// anything else (positive values included) to E_FAIL with a trace line under bit 0x02.
HRESULT ConvertStatusCode(int32_t libraryStatus);
