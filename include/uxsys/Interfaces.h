// Everything a host compiles against: base types, status codes, host-string helpers and every
// component interface with its identifier.
#pragma once

#include "uxsys/Enumerators.h"
#include "uxsys/Expert.h"
#include "uxsys/HostString.h"
#include "uxsys/IUnknown.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/StatusCodes.h"
#include "uxsys/Types.h"
