// The target-configuration library (libvqtargetcfg.so.1): the controller's devices, system
// settings and network settings.
#pragma once

#include "vq/targetcfg/DeviceHandler.h"
#include "vq/targetcfg/Network.h"
#include "vq/targetcfg/System.h"
#include "vq/targetcfg/Types.h"
