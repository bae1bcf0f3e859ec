// Conversion of the exception in flight into a status code at a handler's operation boundary.
#pragma once

#include "uxsys/StatusCodes.h"

// Must be called inside a catch handler. Rethrows the exception in flight and maps it: a thrown
// status (long) to its value, std::bad_alloc to E_OUTOFMEMORY, std::out_of_range and every other
// std::exception (runtime-library exceptions included) to E_FAIL with a trace line under bit
// 0x02. Exceptions of any other type propagate unchanged.
HRESULT CurrentExceptionToStatus();
