// Validation of the Ethernet adapter's changes: the address, mask, gateway and DNS rules, request
// modes, EtherCAT master IDs, media and polling modes, and the primary-adapter shortcut.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"
#include "network/NetworkTags.h"
#include "uxsys/StatusCodes.h"

namespace network_test {
namespace {

using ::testing::ElementsAre;
namespace tag = NetworkTag;

constexpr wchar_t kAddressMessage[] =
    L"The specified IP address and subnet mask combination is invalid. The right-most bits of the "
    L"IP address must not be all 0 or all 1.";
constexpr wchar_t kGatewayMessage[] =
    L"The specified gateway and subnet mask combination is invalid. The right-most bits of the "
    L"gateway must not be all 0 or all 1.";
constexpr wchar_t kSubnetMessage[] = L"The IP address and gateway must be on the same subnet.";
constexpr wchar_t kRequestModeMessage[] = L"IP address request mode is not supported";
constexpr wchar_t kMasterIdMessage[] = L"EtherCAT Master ID must be between 0 and 255.";
constexpr wchar_t kPollingMessage[] = L"Polling interval must be between 1 and 10000 ms.";

// A static configuration of the primary adapter that passes every rule.
BagRows StaticPrimaryRows() {
    return {
        {tag::kPrimaryAdapter, BagValue::Bool(true)},
        {tag::kAdapterMode, BagValue::ULong(2)},
        {tag::kSupportedAdapterModes, BagValue::ULong(0x0B)},
        {tag::kRequestMode, BagValue::ULong(1)},
        {tag::kIPAddress, BagValue::Text(L"192.168.1.10")},
        {tag::kSubnetMask, BagValue::Text(L"255.255.255.0")},
        {tag::kGateway, BagValue::Text(L"192.168.1.1")},
        {tag::kDnsServer, BagValue::Text(L"192.168.1.2")},
        {tag::kSupportedPollingModes, BagValue::ULong(0x3)},
    };
}

struct ValidationCase {
    const char* name;
    BagRows changes;
    HRESULT status;
    const wchar_t* message;  // null: no message
    std::string stateOverrides = "";
};

class ValidationTableTest : public NetworkTest,
                            public ::testing::WithParamInterface<ValidationCase> {};

TEST_P(ValidationTableTest, GivesTheRuleStatusAndMessage) {
    const ValidationCase& testCase = GetParam();
    WriteState(AdapterState(testCase.stateOverrides));
    BagRows rows = StaticPrimaryRows();
    for (const auto& change : testCase.changes) {
        rows.erase(change.first);
        if (change.second.kind != BagValue::Kind::kText || change.second.text != L"<absent>") {
            rows.emplace(change.first, change.second);
        }
    }
    CountedPtr<IuxSysPropertyBag4> bag = MakeBag(rows);
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    PropertyTagSet validated;
    CvqBStrHolder message;

    HRESULT status = S_OK;
    try {
        status = handler->ValidatePropertyChanges(bag.Get(), validated, message.Receive());
    } catch (long thrown) {
        status = static_cast<HRESULT>(thrown);
    }

    EXPECT_EQ(testCase.status, status);
    if (testCase.message == nullptr) {
        EXPECT_EQ(nullptr, message.Get());
    } else {
        ASSERT_NE(nullptr, message.Get());
        EXPECT_EQ(std::wstring(testCase.message), message.Get());
    }
}

std::string CaseName(const ::testing::TestParamInfo<ValidationCase>& testInfo) {
    return testInfo.param.name;
}

BagValue Text(const wchar_t* text) {
    return BagValue::Text(text);
}
BagValue ULong(uint32_t value) {
    return BagValue::ULong(value);
}
const BagValue kAbsent = BagValue::Text(L"<absent>");

INSTANTIATE_TEST_SUITE_P(
    AddressRules, ValidationTableTest,
    ::testing::Values(
        ValidationCase{"StaticConfigurationPasses", {}, S_OK, nullptr},
        ValidationCase{
            "ShortAddressFormPasses", {{tag::kIPAddress, Text(L"192.168.266")}}, S_OK, nullptr},
        ValidationCase{"AddressHostPartAllZero",
                       {{tag::kIPAddress, Text(L"192.168.1.0")}},
                       UX_E_ADDRESS_COMBINATION_INVALID,
                       kAddressMessage},
        ValidationCase{"AddressHostPartAllOne",
                       {{tag::kIPAddress, Text(L"10.0.255.255")},
                        {tag::kSubnetMask, Text(L"255.255.0.0")},
                        {tag::kGateway, Text(L"10.0.0.1")}},
                       UX_E_ADDRESS_COMBINATION_INVALID,
                       kAddressMessage},
        ValidationCase{"NoGatewayWithWideMaskPasses",
                       {{tag::kIPAddress, Text(L"10.0.0.5")},
                        {tag::kSubnetMask, Text(L"255.0.0.0")},
                        {tag::kGateway, Text(L"0.0.0.0")},
                        {tag::kDnsServer, Text(L"10.0.0.1")}},
                       S_OK,
                       nullptr},
        ValidationCase{"GatewayHostPartAllOne",
                       {{tag::kGateway, Text(L"192.168.1.255")}},
                       UX_E_ADDRESS_COMBINATION_INVALID,
                       kGatewayMessage},
        ValidationCase{"GatewayInAnotherSubnet",
                       {{tag::kIPAddress, Text(L"10.0.0.5")}, {tag::kGateway, Text(L"10.0.1.1")}},
                       UX_E_ADDRESS_COMBINATION_INVALID,
                       kSubnetMessage},
        ValidationCase{"MaskWithGap",
                       {{tag::kSubnetMask, Text(L"255.0.255.0")}},
                       UX_E_SUBNET_MASK_INVALID,
                       nullptr},
        ValidationCase{"MaskAllZero",
                       {{tag::kSubnetMask, Text(L"0.0.0.0")}},
                       UX_E_SUBNET_MASK_INVALID,
                       nullptr},
        ValidationCase{"MaskAllOne",
                       {{tag::kSubnetMask, Text(L"255.255.255.255")}},
                       UX_E_SUBNET_MASK_INVALID,
                       nullptr},
        ValidationCase{
            "AddressZero", {{tag::kIPAddress, Text(L"0.0.0.0")}}, UX_E_IP_ADDRESS_INVALID, nullptr},
        ValidationCase{"AddressLoopback",
                       {{tag::kIPAddress, Text(L"127.0.0.1")}},
                       UX_E_IP_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{
            "AddressEmpty", {{tag::kIPAddress, Text(L"")}}, UX_E_IP_ADDRESS_INVALID, nullptr},
        ValidationCase{
            "AddressMissing", {{tag::kIPAddress, kAbsent}}, UX_E_IP_ADDRESS_INVALID, nullptr},
        ValidationCase{"AddressTooLong",
                       {{tag::kIPAddress, Text(L"192.168.001.0010")}},
                       UX_E_IP_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{"AddressNotParsable",
                       {{tag::kIPAddress, Text(L"192.168.1.x")}},
                       UX_E_IP_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{"GatewayLoopback",
                       {{tag::kGateway, Text(L"127.0.0.1")}},
                       UX_E_GATEWAY_INVALID,
                       nullptr},
        ValidationCase{
            "EmptyGatewayOfPrimary", {{tag::kGateway, Text(L"")}}, UX_E_GATEWAY_INVALID, nullptr},
        ValidationCase{"NonPrimaryWithoutGatewayAndDnsPasses",
                       {{tag::kPrimaryAdapter, BagValue::Bool(false)},
                        {tag::kGateway, Text(L"")},
                        {tag::kDnsServer, Text(L"")}},
                       S_OK,
                       nullptr},
        ValidationCase{
            "NonPrimaryChecksAGatewayItHas",
            {{tag::kPrimaryAdapter, BagValue::Bool(false)}, {tag::kGateway, Text(L"192.168.2.1")}},
            UX_E_ADDRESS_COMBINATION_INVALID,
            kSubnetMessage},
        ValidationCase{"PrimaryNeedsAGatewayEvenWithoutTheTag",
                       {{tag::kGateway, kAbsent}},
                       UX_E_PROPERTY_NOT_FOUND,
                       nullptr},
        ValidationCase{"DnsLastOctet255",
                       {{tag::kDnsServer, Text(L"10.0.0.255")}},
                       UX_E_DNS_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{"DnsLastOctetZero",
                       {{tag::kDnsServer, Text(L"10.1.2.0")}},
                       UX_E_DNS_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{"DnsLoopbackPasses", {{tag::kDnsServer, Text(L"127.0.0.1")}}, S_OK, nullptr},
        ValidationCase{"DnsZeroPasses", {{tag::kDnsServer, Text(L"0.0.0.0")}}, S_OK, nullptr},
        ValidationCase{
            "EmptyDnsOfPrimary", {{tag::kDnsServer, Text(L"")}}, UX_E_DNS_ADDRESS_INVALID, nullptr},
        ValidationCase{"Mode20IsCheckedLikeMode2",
                       {{tag::kAdapterMode, ULong(0x20)},
                        {tag::kSupportedAdapterModes, ULong(0x2B)},
                        {tag::kIPAddress, Text(L"0.0.0.0")}},
                       UX_E_IP_ADDRESS_INVALID,
                       nullptr},
        ValidationCase{"Mode40SkipsAddressRules",
                       {{tag::kAdapterMode, ULong(0x40)},
                        {tag::kSupportedAdapterModes, ULong(0x4B)},
                        {tag::kIPAddress, Text(L"0.0.0.0")}},
                       S_OK,
                       nullptr}),
    CaseName);

INSTANTIATE_TEST_SUITE_P(
    ModeRules, ValidationTableTest,
    ::testing::Values(
        ValidationCase{"DynamicRequestModeSkipsAddresses",
                       {{tag::kRequestMode, ULong(2)}, {tag::kIPAddress, Text(L"")}},
                       S_OK,
                       nullptr},
        ValidationCase{"RequestModeNotOffered",
                       {{tag::kRequestMode, ULong(2)}},
                       UX_E_VALUE_INVALID,
                       kRequestModeMessage,
                       "SupportedRequestModes = 0x1\n"},
        ValidationCase{"RequestModeOutsideTheSet",
                       {{tag::kRequestMode, ULong(3)}},
                       UX_E_VALUE_INVALID,
                       nullptr},
        ValidationCase{"ZeroRequestModeMaskAcceptsAll",
                       {{tag::kRequestMode, ULong(8)}},
                       S_OK,
                       nullptr,
                       "SupportedRequestModes = 0\n"},
        ValidationCase{"MasterIdAbove255",
                       {{tag::kAdapterMode, ULong(8)}, {tag::kEtherCATMasterId, ULong(256)}},
                       UX_E_VALUE_INVALID,
                       kMasterIdMessage},
        ValidationCase{"MasterId255Passes",
                       {{tag::kAdapterMode, ULong(8)},
                        {tag::kEtherCATMasterId, ULong(255)},
                        {tag::kIPAddress, Text(L"")}},
                       S_OK,
                       nullptr},
        ValidationCase{"AdapterModeNotSupported",
                       {{tag::kAdapterMode, ULong(8)},
                        {tag::kEtherCATMasterId, ULong(0)},
                        {tag::kSupportedAdapterModes, ULong(0x3)}},
                       UX_E_VALUE_INVALID,
                       nullptr},
        ValidationCase{
            "AdapterModeMissing", {{tag::kAdapterMode, kAbsent}}, UX_E_PROPERTY_NOT_FOUND, nullptr},
        ValidationCase{"MediaModeOutsideTheSet",
                       {{tag::kPreferredMediaMode, ULong(3)}},
                       UX_E_VALUE_INVALID,
                       nullptr},
        ValidationCase{
            "MediaMode40Passes", {{tag::kPreferredMediaMode, ULong(0x40)}}, S_OK, nullptr},
        ValidationCase{"PollingInterval0",
                       {{tag::kPollingInterval, ULong(0)}},
                       UX_E_VALUE_INVALID,
                       kPollingMessage},
        ValidationCase{"PollingInterval10001",
                       {{tag::kPollingInterval, ULong(10001)}},
                       UX_E_VALUE_INVALID,
                       kPollingMessage},
        ValidationCase{
            "PollingInterval1Passes", {{tag::kPollingInterval, ULong(1)}}, S_OK, nullptr},
        ValidationCase{
            "PollingInterval10000Passes", {{tag::kPollingInterval, ULong(10000)}}, S_OK, nullptr},
        ValidationCase{"PollingModeNotSupported",
                       {{tag::kPollingMode, ULong(2)}, {tag::kSupportedPollingModes, ULong(0x1)}},
                       UX_E_VALUE_INVALID,
                       nullptr},
        ValidationCase{"PollingModeOutsideTheSet",
                       {{tag::kPollingMode, ULong(3)}, {tag::kSupportedPollingModes, ULong(0xF)}},
                       UX_E_VALUE_INVALID,
                       nullptr},
        ValidationCase{"PollingMode4Passes",
                       {{tag::kPollingMode, ULong(4)}, {tag::kSupportedPollingModes, ULong(0x4)}},
                       S_OK,
                       nullptr}),
    CaseName);

TEST_F(NetworkTest, AcceptedChangesListTheNetworkAndEthernetTags) {
    WriteState(AdapterState());
    BagRows rows = StaticPrimaryRows();
    rows.emplace(tag::kPreferredMediaMode, BagValue::ULong(4));
    rows.emplace(tag::kPollingMode, BagValue::ULong(2));
    rows.emplace(tag::kMacAddress, BagValue::Text(L"ignored"));
    CountedPtr<IuxSysPropertyBag4> bag = MakeBag(rows);
    PropertyTagSet validated;

    EXPECT_EQ(S_OK, MakeHandler()->ValidatePropertyChanges(bag.Get(), validated, nullptr));

    EXPECT_THAT(validated,
                ElementsAre(tag::kAdapterMode, tag::kRequestMode, tag::kIPAddress, tag::kSubnetMask,
                            tag::kGateway, tag::kDnsServer, tag::kPreferredMediaMode,
                            tag::kPollingMode, tag::kPrimaryAdapter));
}

TEST_F(NetworkTest, MakingTheAdapterPrimaryAcceptsOnlyThatFlag) {
    WriteState(AdapterState("", 1));
    BagRows rows = StaticPrimaryRows();
    rows[tag::kIPAddress] = BagValue::Text(L"0.0.0.0");
    CountedPtr<IuxSysPropertyBag4> bag = MakeBag(rows);
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    PropertyTagSet networkValidated;
    PropertyTagSet ethernetValidated;

    EXPECT_EQ(S_OK, handler->NetworkItemHandler::ValidatePropertyChanges(
                        bag.Get(), networkValidated, nullptr));
    EXPECT_EQ(S_OK, handler->ValidatePropertyChanges(bag.Get(), ethernetValidated, nullptr));

    EXPECT_THAT(networkValidated, ElementsAre(tag::kPrimaryAdapter));
    // The Ethernet rules still run after the shortcut.
    EXPECT_THAT(ethernetValidated, ElementsAre(tag::kAdapterMode, tag::kPrimaryAdapter));
}

TEST_F(NetworkTest, RejectionsWriteTheirTraceLines) {
    WriteState(AdapterState("SupportedRequestModes = 0x1\n"));
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    BagRows rows = StaticPrimaryRows();
    rows[tag::kRequestMode] = BagValue::ULong(2);
    PropertyTagSet validated;
    CaptureTraces(kTraceErrors);

    EXPECT_EQ(UX_E_VALUE_INVALID, handler->NetworkItemHandler::ValidatePropertyChanges(
                                      MakeBag(rows).Get(), validated, nullptr));
    rows = StaticPrimaryRows();
    rows[tag::kDnsServer] = BagValue::Text(L"1.2.3.255");
    EXPECT_EQ(UX_E_DNS_ADDRESS_INVALID, handler->NetworkItemHandler::ValidatePropertyChanges(
                                            MakeBag(rows).Get(), validated, nullptr));

    ASSERT_EQ(4u, Traces().size());
    EXPECT_EQ("NetworkItemHandler::ValidateNetworkSettings() failed", Traces()[0].text);
    EXPECT_FALSE(Traces()[0].stamped);
    EXPECT_EQ("NetworkItemHandler::ValidatePropertyChanges() failed", Traces()[1].text);
    EXPECT_TRUE(Traces()[1].stamped);
    EXPECT_EQ("ValidateGatewayDNSHelper() failed", Traces()[2].text);
    EXPECT_FALSE(Traces()[2].stamped);
    EXPECT_EQ("NetworkItemHandler::ValidatePropertyChanges() failed", Traces()[3].text);
}

TEST_F(NetworkTest, EmptyBagValidatesNothing) {
    WriteState(AdapterState());
    PropertyTagSet validated;
    EXPECT_EQ(S_OK, MakeHandler()->ValidatePropertyChanges(CreatePropertyBag().Get(), validated,
                                                           nullptr));
    EXPECT_TRUE(validated.empty());
    EXPECT_EQ(E_POINTER, MakeHandler()->ValidatePropertyChanges(nullptr, validated, nullptr));
}

}  // namespace
}  // namespace network_test
