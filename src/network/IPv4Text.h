// IPv4 address texts as the C library's inet_addr reads them: classic dotted notation, including
// its short ("10.1") and octal or hexadecimal forms. Values are in host byte order, the first
// octet in the top eight bits.
#pragma once

#include <cstdint>
#include <string>

#include "vq/dsc/IPAddress.h"

// The host-order value of 255.255.255.255, which is also what an unparsable text gives.
constexpr uint32_t kIPv4Broadcast = 0xFFFFFFFF;
constexpr uint32_t kIPv4Loopback = 0x7F000001;

// True when `text` (at most 15 characters) parses to a usable address: 0.0.0.0 only with
// `allowZero`, 127.0.0.1 only with `allowLoopback`, never 255.255.255.255 or an unparsable text;
// without `allowAny` the last octet must also be neither 0 nor 255.
bool IsValidIPv4Text(const std::wstring& text, bool allowZero, bool allowLoopback, bool allowAny);

// The host-order value of `text` as inet_addr parses it (kIPv4Broadcast when it does not parse).
uint32_t ParseIPv4(const std::wstring& text);

// The IPv4 address 0.0.0.0 (an address of family IPv4, unlike the unset address).
vq::dsc::osdep::IPAddress ZeroIPv4Address();
