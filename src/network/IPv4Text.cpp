#include "network/IPv4Text.h"

#include <arpa/inet.h>

#include "support/TextConversion.h"

namespace {

// Longest dotted-decimal text, "255.255.255.255".
constexpr size_t kMaximumTextLength = 15;
constexpr uint32_t kLastOctetMask = 0xFF;

}  // namespace

uint32_t ParseIPv4(const std::wstring& text) {
    const std::string narrow = vq::dsc::NarrowFromWide(text);
    return ntohl(inet_addr(narrow.c_str()));
}

bool IsValidIPv4Text(const std::wstring& text, bool allowZero, bool allowLoopback, bool allowAny) {
    if (text.size() > kMaximumTextLength) {
        return false;
    }
    const uint32_t address = ParseIPv4(text);
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
