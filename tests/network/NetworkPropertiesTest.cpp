// The Ethernet adapter's catalogue as read from the simulated controller: rows per adapter mode,
// request-mode defaults, library failures, refresh requests, traces and item matching.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Not;
namespace tag = NetworkTag;

// Every row of `bag` in tag order as "tag=value;" (tags and numbers in hexadecimal).
std::string Listing(IuxSysPropertyBag* bag) {
    std::ostringstream rows;
    CountedPtr<IuxSysEnumPropertyTag> tags;
    bag->GetTagEnumerator(tags.Receive());
    for (uint32_t next = 0; tags && tags->Next(1, &next, nullptr) == S_OK;) {
        uint32_t type = 0;
        int32_t value = 0;
        bag->GetTagType(next, &type);
        rows << std::hex << next << '=';
        if (type == UX_PROPERTY_TYPE_STRING) {
            const std::wstring text = TextOf(bag, next);
            rows << std::string(text.begin(), text.end());
        } else if (type == UX_PROPERTY_TYPE_ULONG) {
            rows << ULongOf(bag, next);
        } else if (bag->GetLong(next, &value) == S_OK || bag->GetBool(next, &value) == S_OK) {
            rows << value;
        }
        rows << ';';
    }
    return rows.str();
}

// The rows every item has, then the network constants.
constexpr char kIdentity[] =
    "101c000=1;101d000=eth0;101f000=Ethernet Adapter eth0;102a000=3e8;1037000=150000;1038000=1;"
    "1039000=1;103a000=5;";

class PropertiesTest : public NetworkTest {
  protected:
    std::string Properties(const std::string& stateOverrides) {
        WriteState(AdapterState(stateOverrides));
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        EXPECT_EQ(S_OK, MakeHandler()->GetItemProperties(bag.Get()));
        return Listing(bag.Get());
    }

    std::string Refreshed(std::vector<uint32_t> requested) {
        WriteState(AdapterState());
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        EXPECT_EQ(S_OK, MakeHandler()->RefreshProperties(static_cast<uint32_t>(requested.size()),
                                                         requested.data(), bag.Get()));
        return Listing(bag.Get());
    }
};

TEST_F(PropertiesTest, CatalogueFollowsTheAdapterMode) {
    EXPECT_EQ(kIdentity + std::string("d102000=2;d103000=b;d104000=00:80:2F:12:34:56;d105000=1;"
                                      "d106000=3;d107000=192.168.1.10;d108000=1;"
                                      "d109000=255.255.255.0;d10a000=192.168.1.1;"
                                      "d10b000=192.168.1.2;d10f000=4;d110000=7f;d111000=4;"
                                      "d119000=3;d11a000=1;d126000=1;d12c000=1;"),
              Properties(""));
    // Only mode 2 has media rows and polling settings; mode 0x20 still has addresses.
    EXPECT_EQ(kIdentity + std::string("d102000=20;d103000=b;d104000=00:80:2F:12:34:56;d105000=1;"
                                      "d106000=3;d107000=192.168.1.10;d108000=1;"
                                      "d109000=255.255.255.0;d10a000=192.168.1.1;"
                                      "d10b000=192.168.1.2;d119000=1;d11a000=1;d126000=1;"
                                      "d12c000=1;"),
              Properties("Mode = 0x20\nPollingMode = 2"));
    EXPECT_THAT(Properties("PollingMode = 2\nPollingInterval = 250"),
                HasSubstr("d11a000=2;d11b000=fa;"));
    // EtherCAT without a master ID: empty addresses, request mode from the supported mask.
    EXPECT_EQ(kIdentity + std::string("d102000=8;d103000=b;d104000=00:80:2F:12:34:56;d105000=2;"
                                      "d106000=3;d107000=;d109000=;d10a000=;d10b000=;d119000=1;"
                                      "d11a000=1;d126000=1;d12c000=1;"),
              Properties("Mode = 8"));
    EXPECT_THAT(Properties("Mode = 8\nEtherCATMasterID = 3\nEtherCATFlag = 1"),
                HasSubstr("d118000=3;d119000=1;d11a000=1;d126000=1;d12c000=1;d155000=1;"));
}

TEST_F(PropertiesTest, DefaultsForRequestModesMissingAddressesAndFailedQueries) {
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 3"), HasSubstr("d105000=2;"));
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 1"), HasSubstr("d105000=1;"));
    EXPECT_THAT(Properties("Mode = 1\nSupportedRequestModes = 4"), HasSubstr("d105000=0;"));
    EXPECT_THAT(Properties("IPAddress ="), HasSubstr("d107000=0.0.0.0;d108000=1;d109000=0.0.0.0;"));
    const std::string rows = Properties(
        "PollingMode = 2\n[Faults]\nGetCurrentDeviceSettings = -375501\n"
        "GetSupportedDeviceSettings = -375501\nGetPreferredMediaMode = -1");
    EXPECT_THAT(rows, HasSubstr("d10f000=1;d110000=1;d111000=1;d119000=1;d11a000=1;"));
    EXPECT_THAT(rows, Not(HasSubstr("d11b000")));
}

TEST_F(PropertiesTest, FailedTestedCallAbortsKeepingEarlierRows) {
    WriteState(AdapterState("[Faults]\nGetDeviceModeByIndex = -375563"));
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    long status = 0;
    try {
        MakeHandler()->GetItemProperties(bag.Get());
    } catch (long thrown) {
        status = thrown;
    }
    EXPECT_EQ(E_INVALIDARG, status);
    EXPECT_EQ(kIdentity + std::string("d104000=00:80:2F:12:34:56;d126000=1;"), Listing(bag.Get()));
}

TEST_F(PropertiesTest, RefreshRewritesOnlyForItsOwnTags) {
    EXPECT_EQ("", Refreshed({tag::kMacAddress, tag::kSupportedAdapterModes}));
    const std::string network = Refreshed({tag::kGateway | 0x123});
    EXPECT_THAT(network, HasSubstr("1038000=1;1039000=1;103a000=5;d104000="));
    EXPECT_THAT(network, Not(HasSubstr("d102000")));
    EXPECT_EQ("d102000=2;d103000=b;d119000=3;d11a000=1;d12c000=1;", Refreshed({tag::kPollingMode}));
    EXPECT_THAT(Refreshed({tag::kPollingMode, tag::kPrimaryAdapter}),
                HasSubstr("d102000=2;d103000=b;d104000="));
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
