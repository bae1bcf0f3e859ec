#include "vq/dsc/IPAddress.h"

#include <net/if.h>

#include <cstring>
#include <vector>

#include <gtest/gtest.h>

#include "support/Exceptions.h"

namespace {

using vq::dsc::osdep::IPAddress;
using vq::dsc::osdep::IPFamily;

struct ParseCase {
    const char* text;
    bool accepted;
    IPFamily family;
    std::vector<uint8_t> bytes;  // all 16 bytes; the rest are zero
    uint32_t zone;
};

std::vector<uint8_t> Bytes(std::initializer_list<uint8_t> prefix) {
    std::vector<uint8_t> bytes(prefix);
    bytes.resize(16);
    return bytes;
}

const std::vector<uint8_t> kLoopback6 = Bytes({0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 1});
const std::vector<uint8_t> kLinkLocal1 =
    Bytes({0xFE, 0x80, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 1});

class IPAddressParseTest : public ::testing::TestWithParam<ParseCase> {};

TEST_P(IPAddressParseTest, ParsesOrLeavesUnset) {
    const ParseCase& c = GetParam();
    IPAddress address(Bytes({9, 9, 9, 9}).data(), 4, IPFamily::IPv4);
    EXPECT_EQ(address.TryParse(std::string(c.text)), c.accepted);
    EXPECT_EQ(address.family, c.family);
    EXPECT_EQ(std::vector<uint8_t>(address.bytes, address.bytes + 16), c.bytes);
    EXPECT_EQ(address.zoneIndex, c.zone);
    if (!c.accepted) {
        EXPECT_TRUE(address.IsUnset());
        EXPECT_THROW(address.Parse(std::string(c.text)), vq::dsc::exception::InvalidArgument);
    }
}

const std::vector<uint8_t> kZero = Bytes({});
constexpr IPFamily kV4 = IPFamily::IPv4;
constexpr IPFamily kV6 = IPFamily::IPv6;
constexpr IPFamily kNone = IPFamily::Unset;

INSTANTIATE_TEST_SUITE_P(
    IPv4, IPAddressParseTest,
    ::testing::Values(
        ParseCase{"192.168.1.10", true, kV4, Bytes({0xC0, 0xA8, 0x01, 0x0A}), 0},
        ParseCase{"0.0.0.0", true, kV4, kZero, 0},
        ParseCase{"255.255.255.255", true, kV4, Bytes({255, 255, 255, 255}), 0},
        ParseCase{"1.2.3.-1", true, kV4, Bytes({1, 2, 3, 0xFF}), 0},
        ParseCase{"1.2.3.-255", true, kV4, Bytes({1, 2, 3, 1}), 0},
        ParseCase{"+1.2.3.004", true, kV4, Bytes({1, 2, 3, 4}), 0},
        ParseCase{"1.2.3", false, kNone, kZero, 0}, ParseCase{"1.2.3.4.5", false, kNone, kZero, 0},
        ParseCase{"1.2.3.256", false, kNone, kZero, 0},
        ParseCase{"1.2.3.-256", false, kNone, kZero, 0},
        ParseCase{"1.2.3.4.", false, kNone, kZero, 0}, ParseCase{"1..3.4", false, kNone, kZero, 0},
        ParseCase{"1.2.3.-", false, kNone, kZero, 0}, ParseCase{"1.2.3. 4", false, kNone, kZero, 0},
        ParseCase{"1.2.3.4 ", false, kNone, kZero, 0},
        ParseCase{"1.2.3.0x4", false, kNone, kZero, 0},
        ParseCase{"1.2.3.99999999999999999999", false, kNone, kZero, 0}));

INSTANTIATE_TEST_SUITE_P(
    IPv6AndOthers, IPAddressParseTest,
    ::testing::Values(ParseCase{"", true, kNone, kZero, 0},
                      ParseCase{"::1", true, kV6, kLoopback6, 0},
                      ParseCase{"fe80::1%1", true, kV6, kLinkLocal1, 1},
                      ParseCase{"fe80::1%4294967295", true, kV6, kLinkLocal1, 4294967295u},
                      ParseCase{"::ffff:1.2.3.4", true, kV6,
                                Bytes({0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xFF, 0xFF, 1, 2, 3, 4}), 0},
                      ParseCase{"fe80::1%", false, kNone, kZero, 0},
                      ParseCase{"fe80::1%4294967296", false, kNone, kZero, 0},
                      ParseCase{"fe80::1%no-such-adapter", false, kNone, kZero, 0},
                      ParseCase{"1:2:3:4:5:6:7:8:9", false, kNone, kZero, 0},
                      ParseCase{"1::2::3", false, kNone, kZero, 0},
                      ParseCase{"1.2.3.4:80", false, kNone, kZero, 0},
                      ParseCase{"junk", false, kNone, kZero, 0},
                      ParseCase{"12345", false, kNone, kZero, 0}));

TEST(IPAddressTest, ZoneMayNameAnAdapter) {
    const uint32_t loopbackIndex = if_nametoindex("lo");
    if (loopbackIndex == 0) {
        GTEST_SKIP() << "no loopback adapter";
    }
    IPAddress address;
    ASSERT_TRUE(address.TryParse(std::wstring(L"fe80::1%lo")));
    EXPECT_EQ(address.zoneIndex, loopbackIndex);
}

TEST(IPAddressTest, FromBytesRequiresTheFamilysLength) {
    const std::vector<uint8_t> bytes = Bytes({10, 0, 0, 1});
    IPAddress ipv4(bytes.data(), 4, IPFamily::IPv4);
    EXPECT_EQ(ipv4.ToString(), "10.0.0.1");
    EXPECT_EQ(IPAddress(kLinkLocal1.data(), 16, IPFamily::IPv6).ToString(), "fe80::1");
    const std::pair<size_t, IPFamily> refused[] = {{16, IPFamily::IPv4},
                                                   {3, IPFamily::IPv4},
                                                   {4, IPFamily::IPv6},
                                                   {4, IPFamily::Unset},
                                                   {4, static_cast<IPFamily>(3)}};
    for (const auto& [count, family] : refused) {
        EXPECT_THROW(IPAddress(bytes.data(), count, family), vq::dsc::exception::InvalidArgument);
    }
}

TEST(IPAddressTest, TextFormRoundTrips) {
    for (const char* text : {"192.168.1.10", "fe80::1%1", "2001:db8::8:800:200c:417a", ""}) {
        IPAddress address;
        address.Parse(std::string(text));
        EXPECT_EQ(address.ToString(), text);
        IPAddress wide;
        wide.Parse(std::wstring(text, text + std::strlen(text)));
        EXPECT_EQ(wide, address) << text;
    }
}

TEST(IPAddressTest, EqualityComparesFamilyZoneAndBytes) {
    IPAddress a, b;
    a.Parse(std::string("fe80::1%1"));
    b.Parse(std::string("fe80::1%2"));
    EXPECT_NE(a, b);
    b.Parse(std::string("fe80::1%1"));
    EXPECT_EQ(a, b);
    IPAddress unset, zeroV4;
    zeroV4.Parse(std::string("0.0.0.0"));
    EXPECT_NE(unset, zeroV4);
}

}  // namespace
