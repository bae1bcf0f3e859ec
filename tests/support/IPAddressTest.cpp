#include "vq/dsc/IPAddress.h"

#include <net/if.h>

#include <cstring>
#include <string>

#include <gtest/gtest.h>

#include "support/Exceptions.h"

namespace kest::test::support {

namespace {

using vq::dsc::exception::InvalidArgument;
using vq::dsc::osdep::IPAddress;
using vq::dsc::osdep::IPFamily;

// Each accepted text with its display form; a refused text leaves the unset value.
TEST(IPAddressTest, ParsesOrLeavesUnset) {
    const std::pair<const char*, const char*> accepted[] = {
        {"192.168.1.10", "192.168.1.10"},
        {"0.0.0.0", "0.0.0.0"},
        {"1.2.3.-1", "1.2.3.255"},
        {"1.2.3.-255", "1.2.3.1"},
        {"+1.2.3.004", "1.2.3.4"},
        {"", ""},
        {"::1", "::1"},
        {"fe80::1%1", "fe80::1%1"},
        {"fe80::1%4294967295", "fe80::1%4294967295"},
        {"::ffff:1.2.3.4", "::ffff:1.2.3.4"},
        {"2001:DB8::8:800:200C:417A", "2001:db8::8:800:200c:417a"}};
    for (const auto& [text, shown] : accepted) {
        IPAddress address;
        address.Parse(std::string("9.9.9.9"));
        EXPECT_TRUE(address.TryParse(std::string(text))) << text;
        EXPECT_EQ(address.ToString(), shown);
        const IPFamily family = std::strchr(shown, ':') != nullptr ? IPFamily::IPv6
                                : *shown != '\0'                   ? IPFamily::IPv4
                                                                   : IPFamily::Unset;
        EXPECT_EQ(address.family, family) << text;
    }
    for (const char* text :
         {"1.2.3", "1.2.3.4.5", "1.2.3.256", "1.2.3.-256", "1.2.3.4.", "1..3.4", "1.2.3.-",
          "1.2.3. 4", "1.2.3.4 ", "1.2.3.0x4", "1.2.3.99999999999999999999", "fe80::1%",
          "fe80::1%4294967296", "fe80::1%no-such-adapter", "1:2:3:4:5:6:7:8:9", "1::2::3",
          "1.2.3.4:80", "junk", "12345"}) {
        IPAddress address;
        address.Parse(std::string("9.9.9.9"));
        EXPECT_FALSE(address.TryParse(std::string(text))) << text;
        EXPECT_EQ(address, IPAddress()) << text;
        EXPECT_THROW(address.Parse(std::string(text)), InvalidArgument) << text;
    }
}

// The bytes of IPv4 texts are checked by the address fuzz target against a parser of its own.
TEST(IPAddressTest, ZoneNamesAnAdapter) {
    IPAddress address;
    address.Parse(std::wstring(L"192.168.1.10"));
    EXPECT_EQ(address.zoneIndex, 0u);

    const uint32_t loopbackIndex = if_nametoindex("lo");
    if (loopbackIndex != 0) {
        ASSERT_TRUE(address.TryParse(std::wstring(L"fe80::1%lo")));
        EXPECT_EQ(address.zoneIndex, loopbackIndex);
    }
}

TEST(IPAddressTest, FromBytesRequiresTheFamilysLength) {
    const uint8_t bytes[16] = {10, 0, 0, 1};
    EXPECT_EQ(IPAddress(bytes, 4, IPFamily::IPv4).ToString(), "10.0.0.1");
    EXPECT_EQ(IPAddress(bytes, 16, IPFamily::IPv6).ToString(), "a00:1::");
    const std::pair<size_t, IPFamily> refused[] = {{16, IPFamily::IPv4},
                                                   {3, IPFamily::IPv4},
                                                   {4, IPFamily::IPv6},
                                                   {4, IPFamily::Unset},
                                                   {4, static_cast<IPFamily>(3)}};
    for (const auto& [count, family] : refused) {
        EXPECT_THROW(IPAddress(bytes, count, family), InvalidArgument);
    }
}

TEST(IPAddressTest, EqualityComparesFamilyZoneAndBytes) {
    IPAddress a, b, zeroV4;
    a.Parse(std::string("fe80::1%1"));
    b.Parse(std::string("fe80::1%2"));
    zeroV4.Parse(std::string("0.0.0.0"));
    EXPECT_NE(a, b);
    EXPECT_NE(IPAddress(), zeroV4);
    b.Parse(std::string("fe80::1%1"));
    EXPECT_EQ(a, b);
}

}  // namespace

}  // namespace kest::test::support
