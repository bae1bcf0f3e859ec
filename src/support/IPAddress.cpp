#include "vq/dsc/IPAddress.h"

#include <arpa/inet.h>
#include <net/if.h>

#include <cstring>
#include <vector>

#include "support/Exceptions.h"
#include "support/TextConversion.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr size_t kIPv4Length = 4;
constexpr size_t kIPv6Length = 16;

bool IsDigit(char c) {
    return c >= '0' && c <= '9';
}

// Strict decimal conversion of one dotted part: optional sign, at least one digit, nothing else,
// value 0 to 255. A leading minus gives the byte 256 minus the value.
bool ParseByte(const std::string& text, uint8_t& byte) {
    size_t position = 0;
    const bool negative = !text.empty() && text[0] == '-';
    if (!text.empty() && (text[0] == '-' || text[0] == '+')) {
        position = 1;
    }
    if (position == text.size()) {
        return false;
    }
    unsigned value = 0;
    for (; position < text.size(); ++position) {
        if (!IsDigit(text[position])) {
            return false;
        }
        value = value * 10 + static_cast<unsigned>(text[position] - '0');
        if (value > 255) {
            return false;
        }
    }
    byte = static_cast<uint8_t>(negative ? 256 - value : value);
    return true;
}

std::vector<std::string> SplitAtDots(const std::string& text) {
    std::vector<std::string> parts;
    size_t start = 0;
    while (true) {
        const size_t dot = text.find('.', start);
        parts.push_back(text.substr(start, dot - start));
        if (dot == std::string::npos) {
            return parts;
        }
        start = dot + 1;
    }
}

bool ParseIPv4(const std::string& text, uint8_t (&bytes)[16]) {
    const std::vector<std::string> parts = SplitAtDots(text);
    if (parts.size() != kIPv4Length) {
        return false;
    }
    for (size_t i = 0; i < kIPv4Length; ++i) {
        if (!ParseByte(parts[i], bytes[i])) {
            return false;
        }
    }
    return true;
}

// A zone is an interface name, or a decimal index when no interface has that name.
bool ParseZone(const std::string& zone, uint32_t& index) {
    if (zone.empty()) {
        return false;
    }
    index = if_nametoindex(zone.c_str());
    if (index != 0) {
        return true;
    }
    uint64_t value = 0;
    for (char c : zone) {
        if (!IsDigit(c)) {
            return false;
        }
        value = value * 10 + static_cast<uint64_t>(c - '0');
        if (value > UINT32_MAX) {
            return false;
        }
    }
    index = static_cast<uint32_t>(value);
    return true;
}

bool ParseIPv6(const std::string& text, uint8_t (&bytes)[16], uint32_t& zoneIndex) {
    const size_t percent = text.find('%');
    const std::string address = text.substr(0, percent);
    if (percent != std::string::npos && !ParseZone(text.substr(percent + 1), zoneIndex)) {
        return false;
    }
    return inet_pton(AF_INET6, address.c_str(), bytes) == 1;
}

}  // namespace

IPAddress::IPAddress(const uint8_t* address, size_t count, IPFamily addressFamily) {
    const bool fits = (addressFamily == IPFamily::IPv4 && count == kIPv4Length) ||
                      (addressFamily == IPFamily::IPv6 && count == kIPv6Length);
    if (!fits || address == nullptr) {
        throw exception::InvalidArgument();
    }
    std::memcpy(bytes, address, count);
    family = addressFamily;
}

void IPAddress::Clear() {
    *this = IPAddress();
}

bool IPAddress::TryParse(const std::string& text) {
    Clear();
    if (text.empty()) {
        return true;
    }
    // The C library parsers stop at a zero character and would ignore whatever follows it.
    if (text.find('\0') != std::string::npos) {
        return false;
    }
    // Each attempt fills its own value, so a failed one leaves nothing behind.
    IPAddress ipv6;
    if (text.find(':') != std::string::npos && ParseIPv6(text, ipv6.bytes, ipv6.zoneIndex)) {
        ipv6.family = IPFamily::IPv6;
        *this = ipv6;
        return true;
    }
    IPAddress ipv4;
    if (text.find('.') != std::string::npos && ParseIPv4(text, ipv4.bytes)) {
        ipv4.family = IPFamily::IPv4;
        *this = ipv4;
        return true;
    }
    return false;
}

bool IPAddress::TryParse(const std::wstring& text) {
    return TryParse(NarrowFromWide(text));
}

void IPAddress::Parse(const std::string& text) {
    if (!TryParse(text)) {
        throw exception::InvalidArgument();
    }
}

void IPAddress::Parse(const std::wstring& text) {
    Parse(NarrowFromWide(text));
}

std::string IPAddress::ToString() const {
    char text[INET6_ADDRSTRLEN] = {};
    switch (family) {
        case IPFamily::IPv4:
            inet_ntop(AF_INET, bytes, text, sizeof(text));
            return text;
        case IPFamily::IPv6:
            inet_ntop(AF_INET6, bytes, text, sizeof(text));
            return zoneIndex == 0 ? std::string(text)
                                  : std::string(text) + "%" + std::to_string(zoneIndex);
        case IPFamily::Unset:
            break;
    }
    return std::string();
}

bool operator==(const IPAddress& left, const IPAddress& right) {
    return left.family == right.family && left.zoneIndex == right.zoneIndex &&
           std::memcmp(left.bytes, right.bytes, sizeof(left.bytes)) == 0;
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
