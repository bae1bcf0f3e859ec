// Validating the Ethernet adapter's changes: address, mask, gateway and DNS rules, request,
// EtherCAT, media and polling rules, and the primary-adapter shortcut.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;

constexpr wchar_t kAddress[] =
    L"The specified IP address and subnet mask combination is invalid. The right-most bits of the "
    L"IP address must not be all 0 or all 1.";
constexpr wchar_t kGateway[] =
    L"The specified gateway and subnet mask combination is invalid. The right-most bits of the "
    L"gateway must not be all 0 or all 1.";
constexpr wchar_t kSubnet[] = L"The IP address and gateway must be on the same subnet.";
constexpr wchar_t kRequestMode[] = L"IP address request mode is not supported";
constexpr wchar_t kMasterId[] = L"EtherCAT Master ID must be between 0 and 255.";
constexpr wchar_t kPolling[] = L"Polling interval must be between 1 and 10000 ms.";

// A static configuration of the primary adapter that passes every rule.
constexpr char kStaticPrimary[] =
    "primary=1 mode=2 modes=0x0B req=1 ip=192.168.1.10 mask=255.255.255.0 gw=192.168.1.1 "
    "dns=192.168.1.2 pollmodes=3 ";

struct Case {
    const char* name;
    const char* changes;  // rows written over kStaticPrimary
    HRESULT status;
    const wchar_t* message = nullptr;
    const char* state = "";        // adapter state overrides
    const char* traces = nullptr;  // error traces, one a line; null: not checked
};

class ValidationTable : public NetworkTest, public ::testing::WithParamInterface<Case> {};

TEST_P(ValidationTable, GivesTheRuleStatusAndMessage) {
    WriteState(AdapterState(GetParam().state));
    CountedPtr<IuxSysPropertyBag4> bag = MakeBag(std::string(kStaticPrimary) + GetParam().changes);
    PropertyTagSet validated;
    CvqBStrHolder message;
    CaptureTraces(kTraceErrors);
    EXPECT_EQ(GetParam().status, StatusOf([&] {
                  return MakeHandler()->ValidatePropertyChanges(bag.Get(), validated,
                                                                message.Receive());
              }));
    EXPECT_EQ(GetParam().message == nullptr ? L"<none>" : GetParam().message,
              message.Get() == nullptr ? L"<none>" : std::wstring(message.Get()));
    std::string traces;
    for (const std::string& trace : Traces()) {
        traces += trace + "\n";
    }
    EXPECT_EQ(GetParam().traces ? GetParam().traces : traces, traces);
}

const HRESULT kCombination = UX_E_ADDRESS_COMBINATION_INVALID;
INSTANTIATE_TEST_SUITE_P(
    Rules, ValidationTable,
    ::testing::Values(
        Case{"StaticPasses", "", S_OK},
        Case{"HostPartAllZero", "ip=192.168.1.0", kCombination, kAddress},
        Case{"HostPartAllOne", "ip=10.0.255.255 mask=255.255.0.0 gw=10.0.0.1", kCombination,
             kAddress},
        Case{"NoGateway", "ip=10.0.0.5 mask=255.0.0.0 gw=0.0.0.0 dns=10.0.0.1", S_OK},
        Case{"GatewayHostPartAllOne", "gw=192.168.1.255", kCombination, kGateway},
        Case{"GatewayElsewhere", "ip=10.0.0.5 gw=10.0.1.1", kCombination, kSubnet},
        Case{"MaskWithGap", "mask=255.0.255.0", UX_E_SUBNET_MASK_INVALID},
        Case{"MaskZero", "mask=0.0.0.0", UX_E_SUBNET_MASK_INVALID},
        Case{"AddressZero", "ip=0.0.0.0", UX_E_IP_ADDRESS_INVALID},
        Case{"AddressLoopback", "ip=127.0.0.1", UX_E_IP_ADDRESS_INVALID},
        Case{"AddressMissing", "-ip", UX_E_IP_ADDRESS_INVALID},
        Case{"AddressTooLong", "ip=192.168.001.0010", UX_E_IP_ADDRESS_INVALID},
        // Texts that inet_addr reads as another address than the one they would be stored as
        // (short, octal and hexadecimal forms, leading zeros) are refused in every field.
        Case{"AddressOctal", "ip=0300.168.10.21", UX_E_IP_ADDRESS_INVALID},
        Case{"MaskHexadecimal", "mask=255.0xFFFF00", UX_E_SUBNET_MASK_INVALID},
        Case{"GatewayShort", "gw=192.168.257", UX_E_GATEWAY_INVALID},
        Case{"DnsLeadingZeros", "dns=192.168.010.020", UX_E_DNS_ADDRESS_INVALID},
        Case{"GatewayLoopback", "gw=127.0.0.1", UX_E_GATEWAY_INVALID},
        Case{"PrimaryWithoutGateway", "gw=", UX_E_GATEWAY_INVALID},
        Case{"OtherWithoutGatewayOrDns", "primary=0 gw= dns=", S_OK},
        Case{"OtherGatewayElsewhere", "primary=0 gw=192.168.2.1", kCombination, kSubnet},
        Case{"DnsLastOctet255", "dns=10.0.0.255", UX_E_DNS_ADDRESS_INVALID, nullptr, "",
             "ValidateGatewayDNSHelper() failed\n"
             "NetworkItemHandler::ValidatePropertyChanges() failed +\n"},
        Case{"DnsLoopback", "dns=127.0.0.1", S_OK}, Case{"DnsZero", "dns=0.0.0.0", S_OK},
        Case{"PrimaryWithoutDns", "dns=", UX_E_DNS_ADDRESS_INVALID},
        Case{"Mode20LikeMode2", "mode=0x20 modes=0x2B ip=0.0.0.0", UX_E_IP_ADDRESS_INVALID},
        Case{"Mode40NoAddressRules", "mode=0x40 modes=0x4B ip=0.0.0.0", S_OK},
        Case{"DynamicSkipsAddresses", "req=2 ip=", S_OK},
        Case{"RequestModeNotOffered", "req=2", UX_E_VALUE_INVALID, kRequestMode,
             "SupportedRequestModes = 1",
             "NetworkItemHandler::ValidateNetworkSettings() failed\n"
             "NetworkItemHandler::ValidatePropertyChanges() failed +\n"},
        Case{"RequestModeUnknown", "req=3", UX_E_VALUE_INVALID},
        Case{"ZeroMaskOffersAll", "req=8", S_OK, nullptr, "SupportedRequestModes = 0"},
        Case{"MasterId256", "mode=8 id=256", UX_E_VALUE_INVALID, kMasterId},
        Case{"MasterId255", "mode=8 id=255 ip=", S_OK},
        Case{"AdapterModeUnsupported", "mode=8 id=0 modes=3", UX_E_VALUE_INVALID},
        Case{"AdapterModeMissing", "-mode", UX_E_PROPERTY_NOT_FOUND},
        Case{"MediaMode3", "media=3", UX_E_VALUE_INVALID}, Case{"MediaMode40", "media=0x40", S_OK},
        Case{"Interval0", "interval=0", UX_E_VALUE_INVALID, kPolling},
        Case{"Interval10001", "interval=10001", UX_E_VALUE_INVALID, kPolling},
        Case{"Interval1", "interval=1", S_OK}, Case{"Interval10000", "interval=10000", S_OK},
        Case{"PollingUnsupported", "polling=2 pollmodes=1", UX_E_VALUE_INVALID},
        Case{"PollingUnknown", "polling=3 pollmodes=0xF", UX_E_VALUE_INVALID}),
    [](const ::testing::TestParamInfo<Case>& testCase) { return testCase.param.name; });

// The network rules accept their tags and the Ethernet rules theirs; making the adapter primary
// is a change of its own, checked alone by the network rules.
TEST_F(NetworkTest, AcceptedChangesListTheNetworkAndEthernetTags) {
    WriteState(AdapterState());
    PropertyTagSet validated;
    EXPECT_EQ(S_OK, MakeHandler()->ValidatePropertyChanges(
                        MakeBag(std::string(kStaticPrimary) + "media=4 mac=x id=5 flag=1").Get(),
                        validated, nullptr));
    EXPECT_THAT(validated, ElementsAre(tags::kAdapterMode, tags::kRequestMode, tags::kIPAddress,
                                       tags::kSubnetMask, tags::kGateway, tags::kDnsServer,
                                       tags::kPreferredMediaMode, tags::kEtherCATMasterId,
                                       tags::kPrimaryAdapter, tags::kEtherCATFlag));

    WriteState(AdapterState("PrimaryDeviceIndex = 1"));
    CountedPtr<IuxSysPropertyBag4> bag = MakeBag(std::string(kStaticPrimary) + "ip=0.0.0.0");
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    PropertyTagSet network;
    PropertyTagSet ethernet;
    EXPECT_EQ(S_OK,
              handler->NetworkItemHandler::ValidatePropertyChanges(bag.Get(), network, nullptr));
    EXPECT_EQ(S_OK, handler->ValidatePropertyChanges(bag.Get(), ethernet, nullptr));
    EXPECT_THAT(network, ElementsAre(tags::kPrimaryAdapter));
    EXPECT_THAT(ethernet, ElementsAre(tags::kAdapterMode, tags::kPrimaryAdapter));
}

}  // namespace
}  // namespace kest::test::network
