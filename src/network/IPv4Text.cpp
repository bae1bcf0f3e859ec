#include "network/IPv4Text.h"

#include <arpa/inet.h>

#include "support/TextConversion.h"

namespace kest::network {

namespace {

// Longest dotted-decimal text, "255.255.255.255".
constexpr size_t kMaximumTextLength = 15;
constexpr uint32_t kLastOctetMask = 0xFF;

// The host-order value inet_addr gives `narrow`.
uint32_t InetValue(const std::string& narrow) {
    return ntohl(inet_addr(narrow.c_str()));
}

// True when the strict dotted-decimal reading of `narrow`, the one the address is stored with,
// is an IPv4 address of the host-order value `inetValue`.
bool IsStoredAs(const std::string& narrow, uint32_t inetValue) {
    vq::dsc::osdep::IPAddress stored;
    if (!stored.TryParse(narrow) || stored.family != vq::dsc::osdep::IPFamily::IPv4) {
        return false;
    }
    const uint32_t storedValue = uint32_t{stored.bytes[0]} << 24 | uint32_t{stored.bytes[1]} << 16 |
                                 uint32_t{stored.bytes[2]} << 8 | uint32_t{stored.bytes[3]};
    return storedValue == inetValue;
}

}  // namespace

uint32_t ParseIPv4(const std::wstring& text) {
    return InetValue(vq::dsc::NarrowFromWide(text));
}

bool IsValidIPv4Text(const std::wstring& text, bool allowZero, bool allowLoopback, bool allowAny) {
    if (text.size() > kMaximumTextLength) {
        return false;
    }
    const std::string narrow = vq::dsc::NarrowFromWide(text);
    const uint32_t address = InetValue(narrow);
    if (!IsStoredAs(narrow, address)) {
        return false;
    }
    if (address == 0) {
        return allowZero;
    }
    if (address == kIPv4Loopback) {
        return allowLoopback;
    }
    if (address == kIPv4Broadcast) {
        return false;
    }
    if (allowAny) {
        return true;
    }
    const uint32_t lastOctet = address & kLastOctetMask;
    return lastOctet != 0 && lastOctet != kLastOctetMask;
}

vq::dsc::osdep::IPAddress ZeroIPv4Address() {
    const uint8_t zero[4] = {};
    return vq::dsc::osdep::IPAddress(zero, sizeof(zero), vq::dsc::osdep::IPFamily::IPv4);
}

}  // namespace kest::network
