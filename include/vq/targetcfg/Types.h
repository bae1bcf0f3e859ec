// Types and status codes shared by every call of the target-configuration library.
//
// Every call returns a signed 32-bit status: 0 on success, negative on failure. Outputs are
// written only on success (GetIPAddressByIndex's address count is the one exception). Text is
// narrow (the process locale's character set), except the user comment that the library hands out
// as wide text.
#pragma once

#include <cstdint>

#include "vq/dsc/IPAddress.h"
#include "vq/dsc/StringBase.h"
#include "vq/dsc/Vector.h"

// Marks the library's exported functions.
#define VQ_TARGETCFG_API __attribute__((visibility("default")))

namespace vq {
namespace targetcfg {

// Narrow text: vq::dsc::StringBase<char, wchar_t, wchar_t>.
using vq::dsc::NarrowString;
// Wide text: vq::dsc::StringBase<wchar_t, char, wchar_t>.
using vq::dsc::WideString;
using vq::dsc::osdep::IPAddress;

namespace status {

constexpr int32_t kSuccess = 0;
// Memory ran out.
constexpr int32_t kOutOfMemory = -375500;
// The library cannot work: no controller state is reachable (KEST_SYSROOT does not name an
// absolute directory), or the state could not be read or written, or holds a malformed value.
constexpr int32_t kUnexpected = -375501;
// A value is not acceptable: an unknown locale code, a time zone without a zone file.
constexpr int32_t kValueInvalid = -375523;
// An argument names nothing: an unknown device index, interface name or MAC address, or an
// address slot other than 0 when setting an address.
constexpr int32_t kInvalidArgument = -375563;
// The device has no address in the requested slot (callers need not treat it as a failure).
constexpr int32_t kNoAddress = -375566;

}  // namespace status
}  // namespace targetcfg
}  // namespace vq
