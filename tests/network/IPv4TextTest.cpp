// IPv4 texts read the way inet_addr reads them, with the flags that admit 0.0.0.0, loopback and
// any last octet; subnet mask shapes.
#include <gtest/gtest.h>

#include "network/AddressRules.h"
#include "network/IPv4Text.h"

namespace {

struct TextCase {
    const wchar_t* text;
    bool strict;     // no flag set
    bool lenient;    // every flag set
    uint32_t value;  // as parsed
};

TEST(IPv4TextTest, FlagsAdmitZeroLoopbackAndAnyLastOctet) {
    const TextCase cases[] = {
        {L"192.168.1.10", true, true, 0xC0A8010A},
        {L"10.1", true, true, 0x0A000001},          // short form
        {L"0x0A.010.0.1", true, true, 0x0A080001},  // hexadecimal and octal parts
        {L"0.0.0.0", false, true, 0},
        {L"127.0.0.1", false, true, 0x7F000001},
        {L"10.0.0.255", false, true, 0x0A0000FF},
        {L"10.0.0.0", false, true, 0x0A000000},
        {L"255.255.255.255", false, false, 0xFFFFFFFF},
        {L"", false, false, 0xFFFFFFFF},
        {L"1.2.3.4.5", false, false, 0xFFFFFFFF},
        {L"010.000.000.0001", false, false, 0x08000001},  // parses, but is too long
    };
    for (const TextCase& testCase : cases) {
        EXPECT_EQ(testCase.strict, IsValidIPv4Text(testCase.text, false, false, false))
            << testCase.text;
        EXPECT_EQ(testCase.lenient, IsValidIPv4Text(testCase.text, true, true, true))
            << testCase.text;
        EXPECT_EQ(testCase.value, ParseIPv4(testCase.text)) << testCase.text;
    }
    EXPECT_TRUE(IsValidIPv4Text(L"0.0.0.0", true, false, false));
    EXPECT_FALSE(IsValidIPv4Text(L"127.0.0.1", true, false, true));
    EXPECT_TRUE(IsValidIPv4Text(L"127.0.0.1", false, true, false));
}

TEST(AddressRulesTest, MasksMustBeContiguousFromTheTop) {
    EXPECT_TRUE(IsContiguousSubnetMask(0xFFFFFF00));
    EXPECT_TRUE(IsContiguousSubnetMask(0x80000000));
    EXPECT_TRUE(IsContiguousSubnetMask(0xFFFFFFFF));
    EXPECT_FALSE(IsContiguousSubnetMask(0xFF00FF00));
    EXPECT_FALSE(IsContiguousSubnetMask(0x7FFFFFFF));
    EXPECT_FALSE(IsContiguousSubnetMask(0xFFFFFFFD));
}

TEST(AddressRulesTest, AddressIsCheckedBeforeTheGateway) {
    const uint32_t mask = 0xFFFFFF00;
    EXPECT_EQ(AddressPairFault::kNone, CheckAddressAndGateway(0xC0A8010A, mask, 0xC0A80101));
    EXPECT_EQ(AddressPairFault::kNone, CheckAddressAndGateway(0xC0A8010A, mask, 0));
    EXPECT_EQ(AddressPairFault::kAddressHostPart, CheckAddressAndGateway(0xC0A80100, mask, 0));
    EXPECT_EQ(AddressPairFault::kAddressHostPart,
              CheckAddressAndGateway(0xC0A801FF, mask, 0xC0A802FF));
    EXPECT_EQ(AddressPairFault::kGatewayHostPart,
              CheckAddressAndGateway(0xC0A8010A, mask, 0xC0A80200));
    EXPECT_EQ(AddressPairFault::kDifferentSubnets,
              CheckAddressAndGateway(0xC0A8010A, mask, 0xC0A80201));
    // A /31 leaves no usable host part.
    EXPECT_EQ(AddressPairFault::kAddressHostPart,
              CheckAddressAndGateway(0x0A000001, 0xFFFFFFFE, 0));
}

}  // namespace
