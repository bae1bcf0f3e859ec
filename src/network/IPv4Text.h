// IPv4 address texts of the network settings. A text is an address only when the C library's
// inet_addr and the strict dotted-decimal reading that stores it agree on its value, so what is
// validated is what is stored. Values are in host byte order, the first octet in the top eight
// bits.
#pragma once

#include <cstdint>
#include <string>

#include "vq/dsc/IPAddress.h"

namespace kest::network {

// The host-order value of 255.255.255.255, which is also what an unparsable text gives.
constexpr uint32_t kIPv4Broadcast = 0xFFFFFFFF;
constexpr uint32_t kIPv4Loopback = 0x7F000001;

// True when `text` (at most 15 characters) is four decimal parts that inet_addr reads as the same
// address (so no short, octal or hexadecimal forms) and that address is usable: 0.0.0.0 only
// with `allowZero`, 127.0.0.1 only with `allowLoopback`, never 255.255.255.255; without
// `allowAny` the last octet must also be neither 0 nor 255.
bool IsValidIPv4Text(const std::wstring& text, bool allowZero, bool allowLoopback, bool allowAny);

// The host-order value of `text` as inet_addr parses it (kIPv4Broadcast when it does not parse);
// for a text that IsValidIPv4Text accepts, also the value that is stored.
uint32_t ParseIPv4(const std::wstring& text);

// The IPv4 address 0.0.0.0 (an address of family IPv4, unlike the unset address).
vq::dsc::osdep::IPAddress ZeroIPv4Address();

}  // namespace kest::network
