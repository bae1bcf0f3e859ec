// The Ethernet adapter's catalogue as read from the simulated controller: rows per adapter mode,
// request-mode defaults, library failures, refresh requests, traces and item matching.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"
#include "common/BagListing.h"

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Not;

// The rows every item has, then the network constants.
constexpr char kIdentity[] =
    "101c000=l1;101d000=seth0;101f000=sEthernet Adapter eth0;102a000=l1000;1037000=u150000;"
    "1038000=b1;1039000=l1;103a000=u5;";

class PropertiesTest : public NetworkTest {
  protected:
    // The catalogue of the adapter in the state with `overrides`, or only the rows a refresh of
    // `requested` writes.
    std::string Properties(const std::string& overrides, std::vector<uint32_t> requested = {}) {
        WriteState(AdapterState(overrides));
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        EXPECT_EQ(S_OK, requested.empty() ? MakeHandler()->GetItemProperties(bag.Get())
                                          : MakeHandler()->RefreshProperties(
                                                static_cast<uint32_t>(requested.size()),
                                                requested.data(), bag.Get()));
        return Listing(bag.Get());
    }
};

TEST_F(PropertiesTest, CatalogueFollowsTheAdapterMode) {
    EXPECT_EQ(kIdentity + std::string("d102000=u2;d103000=ub;d104000=s00:80:2F:12:34:56;d105000=u1;"
                                      "d106000=u3;d107000=s192.168.1.10;d108000=u1;"
                                      "d109000=s255.255.255.0;d10a000=s192.168.1.1;"
                                      "d10b000=s192.168.1.2;d10f000=u4;d110000=u7f;d111000=u4;"
                                      "d119000=u3;d11a000=u1;d126000=b1;d12c000=u1;"),
              Properties(""));
    // Only mode 2 has media rows and polling settings; mode 0x20 still has addresses.
    EXPECT_EQ(
        kIdentity + std::string("d102000=u20;d103000=ub;d104000=s00:80:2F:12:34:56;d105000=u1;"
                                "d106000=u3;d107000=s192.168.1.10;d108000=u1;"
                                "d109000=s255.255.255.0;d10a000=s192.168.1.1;"
                                "d10b000=s192.168.1.2;d119000=u1;d11a000=u1;d126000=b1;"
                                "d12c000=u1;"),
        Properties("Mode = 0x20\nPollingMode = 2"));
    EXPECT_THAT(Properties("PollingMode = 2\nPollingInterval = 250"),
                HasSubstr("d11a000=u2;d11b000=ufa;"));
    // EtherCAT without a master ID: empty addresses, request mode from the supported mask.
    EXPECT_EQ(
        kIdentity + std::string("d102000=u8;d103000=ub;d104000=s00:80:2F:12:34:56;d105000=u2;"
                                "d106000=u3;d107000=s;d109000=s;d10a000=s;d10b000=s;d119000=u1;"
                                "d11a000=u1;d126000=b1;d12c000=u1;"),
        Properties("Mode = 8"));
    EXPECT_THAT(Properties("Mode = 8\nEtherCATMasterID = 3\nEtherCATFlag = 1"),
                HasSubstr("d118000=u3;d119000=u1;d11a000=u1;d126000=b1;d12c000=u1;d155000=b1;"));
}

TEST_F(PropertiesTest, DefaultsForRequestModesMissingAddressesAndFailedQueries) {
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 3"), HasSubstr("d105000=u2;"));
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 1"), HasSubstr("d105000=u1;"));
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 4"), HasSubstr("d105000=u0;"));
    EXPECT_THAT(Properties("IPAddress ="),
                HasSubstr("d107000=s0.0.0.0;d108000=u1;d109000=s0.0.0.0;"));
    const std::string rows = Properties(
        "PollingMode = 2\n[Faults]\nGetCurrentDeviceSettings = -375501\n"
        "GetSupportedDeviceSettings = -375501\nGetPreferredMediaMode = -1");
    EXPECT_THAT(rows, HasSubstr("d10f000=u1;d110000=u1;d111000=u1;d119000=u1;d11a000=u1;"));
    EXPECT_THAT(rows, Not(HasSubstr("d11b000")));
    // A failing call whose status is tested ends the catalogue after the rows before it.
    WriteState(AdapterState("[Faults]\nGetDeviceModeByIndex = -375563"));
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    EXPECT_EQ(E_INVALIDARG, StatusOf([&] { return MakeHandler()->GetItemProperties(bag.Get()); }));
    EXPECT_EQ(kIdentity + std::string("d104000=s00:80:2F:12:34:56;d126000=b1;"),
              Listing(bag.Get()));
}

TEST_F(PropertiesTest, RefreshRewritesOnlyForItsOwnTags) {
    EXPECT_EQ("", Properties("", {tags::kMacAddress, tags::kSupportedAdapterModes}));
    const std::string network = Properties("", {tags::kGateway | 0x123});
    EXPECT_THAT(network, HasSubstr("1038000=b1;1039000=l1;103a000=u5;d104000="));
    EXPECT_THAT(network, Not(HasSubstr("d102000")));
    EXPECT_EQ("d102000=u2;d103000=ub;d119000=u3;d11a000=u1;d12c000=u1;",
              Properties("", {tags::kPollingMode}));
    EXPECT_THAT(Properties("", {tags::kPollingMode, tags::kPrimaryAdapter}),
                HasSubstr("d102000=u2;d103000=ub;d104000="));
}

TEST_F(PropertiesTest, LibraryCallsAreTracedUnderTheirBit) {
    CaptureTraces(kTraceLibraryCalls);
    Properties("");
    const std::string network = "NetworkItemHandler::PopulateProperties - ";
    const std::string ethernet = "EthernetItemHandler::PopulateProperties - ";
    EXPECT_THAT(Traces(), ElementsAre(network + "GetMACAddressByIndex(00:80:2F:12:34:56) +",
                                      network + "GetPrimaryDeviceIndex(0) +",
                                      network + "GetDeviceModeByIndex(2) +",
                                      network + "GetDeviceSupportedTCPIPRequestModesByIndex(3) +",
                                      network + "GetDeviceTCPIPRequestModeByIndex(1) +",
                                      network + "GetIPAddressByIndex(192.168.1.10) +",
                                      network + "GetGatewayAddressByIndex(192.168.1.1) +",
                                      network + "GetDNSServerAddressByIndex(192.168.1.2) +",
                                      network + "GetSupportedDeviceSettings(127) +",
                                      network + "GetCurrentDeviceSettings(4) +",
                                      ethernet + "GetDeviceModeByIndex(2) +",
                                      ethernet + "GetDeviceSupportedModesByIndex(11) +",
                                      ethernet + "GetSupportedDeviceSettings(3) +",
                                      ethernet + "GetCurrentDeviceSettings(1) +"));
    CaptureTraces(kTraceLibraryCalls);
    Properties("Mode = 1");
    EXPECT_EQ("PopulateTcpRequestMode - GetDeviceSupportedTCPIPRequestModesByIndex(3) +",
              Traces().at(3));
}

TEST_F(PropertiesTest, DescriptionsMatchByNameOrKindAndAdapterStateIsRead) {
    WriteState(AdapterState("AdapterUp = 0"));
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    const std::tuple<const char*, bool, bool> cases[] = {{"eth0", true, true},
                                                         {"ETH0", true, true},
                                                         {"eth1", true, false},
                                                         {"ETH1", false, false},
                                                         {"et", false, false}};
    for (const auto& [name, matches, exact] : cases) {
        bool exactMatch = !exact;
        EXPECT_EQ(matches,
                  handler->IsMatchingItem(MakeBag(std::string("name=") + name).Get(), exactMatch));
        EXPECT_EQ(exact, exactMatch) << name;
    }
    bool exactMatch = false;
    EXPECT_THROW(handler->IsMatchingItem(CreatePropertyBag().Get(), exactMatch), long);
    EXPECT_FALSE(handler->IsAdapterUp());
    WriteState(AdapterState());
    EXPECT_TRUE(handler->IsAdapterUp());
}

}  // namespace
}  // namespace kest::test::network
