// Address texts: IPAddress parsing of narrow and wide text (never of a text with a zero character
// in it), the display text of every parsed address parsing back to the same address, and the IPv4
// text checks of the network items (which must be monotonic in their permissions, agree with plain
// dotted decimal, and accept only texts that are stored as the address they were checked as).
//
// Input: byte 0 selects the permissions of the IPv4 check (bits 0-2) and whether the rest is
// read as 32-bit wide characters (bit 3) instead of one character per byte.
#include <arpa/inet.h>

#include <cstdint>
#include <cstring>
#include <string>

#include "FuzzCheck.h"
#include "network/IPv4Text.h"
#include "vq/dsc/IPAddress.h"

using namespace kest::network;

namespace {

using vq::dsc::osdep::IPAddress;
using vq::dsc::osdep::IPFamily;

// The address of `text` when it is four dot-separated decimal numbers 0-255 without signs or
// leading zeros, the form every IPv4 parser reads the same way (and the only one inet_pton reads).
bool PlainDottedDecimal(const std::wstring& text, uint32_t* address) {
    std::string narrow;
    for (wchar_t c : text) {
        if (c <= 0 || c >= 0x80) {
            return false;
        }
        narrow += static_cast<char>(c);
    }
    in_addr parsed{};
    if (inet_pton(AF_INET, narrow.c_str(), &parsed) != 1) {
        return false;
    }
    *address = ntohl(parsed.s_addr);
    return true;
}

void CheckAddressRoundTrip(const IPAddress& parsed) {
    IPAddress again;
    FUZZ_CHECK(again.TryParse(parsed.ToString()));
    FUZZ_CHECK(again == parsed);
}

void CheckIPv4Text(const std::wstring& text, uint8_t permissions) {
    const bool allowZero = (permissions & 1) != 0;
    const bool allowLoopback = (permissions & 2) != 0;
    const bool allowAny = (permissions & 4) != 0;
    const bool valid = IsValidIPv4Text(text, allowZero, allowLoopback, allowAny);
    FUZZ_CHECK(!valid || IsValidIPv4Text(text, true, true, true));
    FUZZ_CHECK(IsValidIPv4Text(text, false, false, false) <= valid);
    const uint32_t parsed = ParseIPv4(text);
    if (IsValidIPv4Text(text, true, true, true)) {
        IPAddress stored;
        FUZZ_CHECK(stored.TryParse(text) && stored.family == IPFamily::IPv4);
        FUZZ_CHECK((uint32_t{stored.bytes[0]} << 24 | uint32_t{stored.bytes[1]} << 16 |
                    uint32_t{stored.bytes[2]} << 8 | stored.bytes[3]) == parsed);
    }
    uint32_t plain = 0;
    if (PlainDottedDecimal(text, &plain)) {
        FUZZ_CHECK(parsed == plain);
        const uint32_t last = plain & 0xFF;
        const bool expected = plain == 0                ? allowZero
                              : plain == kIPv4Loopback  ? allowLoopback
                              : plain == kIPv4Broadcast ? false
                                                        : allowAny || (last != 0 && last != 255);
        FUZZ_CHECK(valid == expected);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 1) {
        return 0;
    }
    const uint8_t permissions = data[0] & 0x07;
    const bool wideUnits = (data[0] & 0x08) != 0;
    const char* rest = reinterpret_cast<const char*>(data) + 1;
    const size_t restSize = size - 1;

    std::wstring wide;
    if (wideUnits) {
        for (size_t i = 0; i + 4 <= restSize; i += 4) {
            uint32_t unit = 0;
            std::memcpy(&unit, rest + i, sizeof unit);
            wide += static_cast<wchar_t>(unit);
        }
    } else {
        const std::string narrow(rest, restSize);
        for (unsigned char c : narrow) {
            wide += static_cast<wchar_t>(c);
        }
        IPAddress address;
        if (address.TryParse(narrow)) {
            FUZZ_CHECK(narrow.find('\0') == std::string::npos);
            CheckAddressRoundTrip(address);
        } else {
            FUZZ_CHECK(address.IsUnset());
        }
    }

    IPAddress fromWide;
    if (fromWide.TryParse(wide)) {
        FUZZ_CHECK(wide.find(L'\0') == std::wstring::npos);
        CheckAddressRoundTrip(fromWide);
    } else {
        FUZZ_CHECK(fromWide.IsUnset());
    }
    CheckIPv4Text(wide, permissions);
    return 0;
}
