// The Ethernet adapter's catalogue as read from the simulated controller: rows per adapter mode,
// request-mode defaults, library failures, refresh requests, traces and item matching.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"
#include "network/NetworkTags.h"
#include "uxsys/StatusCodes.h"

namespace network_test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
namespace tag = NetworkTag;

constexpr uint32_t kMissing = 0xDEADBEEF;

class PropertiesTest : public NetworkTest {
  protected:
    // The adapter's properties after GetItemProperties on the given state.
    CountedPtr<IuxSysPropertyBag4> Properties(const std::string& state) {
        WriteState(state);
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        EXPECT_EQ(S_OK, MakeHandler()->GetItemProperties(bag.Get()));
        return bag;
    }

    // The tags a refresh for `requested` writes into a new bag.
    std::vector<uint32_t> RefreshedTags(std::vector<uint32_t> requested) {
        WriteState(AdapterState());
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        EXPECT_EQ(S_OK, MakeHandler()->RefreshProperties(static_cast<uint32_t>(requested.size()),
                                                         requested.data(), bag.Get()));
        std::vector<uint32_t> tags;
        CountedPtr<IuxSysEnumPropertyTag> enumerator;
        bag->GetTagEnumerator(enumerator.Receive());
        uint32_t next = 0;
        while (enumerator && enumerator->Next(1, &next, nullptr) == S_OK) {
            tags.push_back(next);
        }
        return tags;
    }
};

TEST_F(PropertiesTest, TcpIpAdapterReportsTheWholeCatalogue) {
    CountedPtr<IuxSysPropertyBag4> bag = Properties(AdapterState());
    int32_t flag = 0;
    EXPECT_EQ(S_OK, bag->GetBool(tag::kConstantTrue, &flag));
    EXPECT_EQ(1, flag);
    int32_t one = 0;
    EXPECT_EQ(S_OK, bag->GetLong(tag::kConstantOne, &one));
    EXPECT_EQ(1, one);
    EXPECT_EQ(5u, ULongOf(bag.Get(), tag::kConstantFive));
    EXPECT_EQ(L"eth0", TextOf(bag.Get(), tag::kItemName));
    EXPECT_EQ(L"00:80:2F:12:34:56", TextOf(bag.Get(), tag::kMacAddress));
    EXPECT_EQ(S_OK, bag->GetBool(tag::kPrimaryAdapter, &flag));
    EXPECT_EQ(1, flag);
    EXPECT_EQ(0x3u, ULongOf(bag.Get(), tag::kSupportedRequestModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kRequestMode));
    EXPECT_EQ(L"192.168.1.10", TextOf(bag.Get(), tag::kIPAddress));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kAddressCount));
    EXPECT_EQ(L"255.255.255.0", TextOf(bag.Get(), tag::kSubnetMask));
    EXPECT_EQ(L"192.168.1.1", TextOf(bag.Get(), tag::kGateway));
    EXPECT_EQ(L"192.168.1.2", TextOf(bag.Get(), tag::kDnsServer));
    EXPECT_EQ(0x7Fu, ULongOf(bag.Get(), tag::kSupportedMediaModes));
    EXPECT_EQ(4u, ULongOf(bag.Get(), tag::kCurrentMediaMode));
    EXPECT_EQ(4u, ULongOf(bag.Get(), tag::kPreferredMediaMode));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kEthernetConstantOne));
    EXPECT_EQ(2u, ULongOf(bag.Get(), tag::kAdapterMode));
    EXPECT_EQ(0x0Bu, ULongOf(bag.Get(), tag::kSupportedAdapterModes));
    EXPECT_EQ(0x3u, ULongOf(bag.Get(), tag::kSupportedPollingModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kPollingMode));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kPollingInterval));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kEtherCATMasterId));
}

TEST_F(PropertiesTest, PollingAdapterReportsItsInterval) {
    CountedPtr<IuxSysPropertyBag4> bag =
        Properties(AdapterState("PollingMode = 2\nPollingInterval = 250\n"));
    EXPECT_EQ(2u, ULongOf(bag.Get(), tag::kPollingMode));
    EXPECT_EQ(250u, ULongOf(bag.Get(), tag::kPollingInterval));
}

TEST_F(PropertiesTest, Mode20HasAddressesButNoMediaOrPollingRows) {
    CountedPtr<IuxSysPropertyBag4> bag =
        Properties(AdapterState("Mode = 0x20\nPollingMode = 2\nSupportedPollingModes = 6\n"));
    EXPECT_EQ(L"192.168.1.10", TextOf(bag.Get(), tag::kIPAddress));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kSupportedMediaModes));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kCurrentMediaMode));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kPreferredMediaMode));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kSupportedPollingModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kPollingMode));
}

TEST_F(PropertiesTest, EtherCATAdapterWithoutMasterIdHasEmptyAddresses) {
    CountedPtr<IuxSysPropertyBag4> bag = Properties(AdapterState("Mode = 8\n"));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kEtherCATMasterId));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kEtherCATFlag));
    for (uint32_t address : {tag::kIPAddress, tag::kSubnetMask, tag::kGateway, tag::kDnsServer}) {
        EXPECT_EQ(L"", TextOf(bag.Get(), address));
    }
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kAddressCount));
    EXPECT_EQ(2u, ULongOf(bag.Get(), tag::kRequestMode));
    EXPECT_EQ(8u, ULongOf(bag.Get(), tag::kAdapterMode));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kSupportedPollingModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kPollingMode));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kPollingInterval));
}

TEST_F(PropertiesTest, EtherCATAdapterReportsMasterIdAndFlag) {
    CountedPtr<IuxSysPropertyBag4> bag =
        Properties(AdapterState("Mode = 8\nEtherCATMasterID = 3\nEtherCATFlag = 1\n"));
    EXPECT_EQ(3u, ULongOf(bag.Get(), tag::kEtherCATMasterId));
    int32_t flag = 0;
    EXPECT_EQ(S_OK, bag->GetBool(tag::kEtherCATFlag, &flag));
    EXPECT_EQ(1, flag);
}

TEST_F(PropertiesTest, RequestModeOfAnAdapterOutsideTcpIpFollowsTheSupportedMask) {
    const std::pair<const char*, uint32_t> cases[] = {{"0x3", 2}, {"0x1", 1}, {"0x4", 0}};
    for (const auto& testCase : cases) {
        CountedPtr<IuxSysPropertyBag4> bag = Properties(AdapterState(
            std::string("Mode = 1\nSupportedRequestModes = ") + testCase.first + "\n"));
        EXPECT_EQ(testCase.second, ULongOf(bag.Get(), tag::kRequestMode)) << testCase.first;
    }
}

TEST_F(PropertiesTest, AdapterWithoutAddressReportsZeroAddresses) {
    CountedPtr<IuxSysPropertyBag4> bag = Properties(AdapterState("IPAddress =\n"));
    EXPECT_EQ(L"0.0.0.0", TextOf(bag.Get(), tag::kIPAddress));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kAddressCount));
    EXPECT_EQ(L"0.0.0.0", TextOf(bag.Get(), tag::kSubnetMask));
    EXPECT_EQ(L"192.168.1.1", TextOf(bag.Get(), tag::kGateway));
}

TEST_F(PropertiesTest, FailedMediaAndPollingQueriesReportOne) {
    CountedPtr<IuxSysPropertyBag4> bag = Properties(
        AdapterState("PollingMode = 2\n[Faults]\nGetCurrentDeviceSettings = -375501\n"
                     "GetSupportedDeviceSettings = -375501\nGetPreferredMediaMode = -1\n"));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kSupportedMediaModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kCurrentMediaMode));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kPreferredMediaMode));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kSupportedPollingModes));
    EXPECT_EQ(1u, ULongOf(bag.Get(), tag::kPollingMode));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kPollingInterval));
}

TEST_F(PropertiesTest, FailedTestedCallAbortsKeepingEarlierRows) {
    WriteState(AdapterState("[Faults]\nGetDeviceModeByIndex = -375563\n"));
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    EXPECT_THROW(
        {
            try {
                MakeHandler()->GetItemProperties(bag.Get());
            } catch (long status) {
                EXPECT_EQ(E_INVALIDARG, status);
                throw;
            }
        },
        long);
    EXPECT_EQ(L"00:80:2F:12:34:56", TextOf(bag.Get(), tag::kMacAddress));
    EXPECT_EQ(kMissing, ULongOf(bag.Get(), tag::kRequestMode));
}

TEST_F(PropertiesTest, RefreshRewritesOnlyForItsOwnTags) {
    EXPECT_THAT(RefreshedTags({tag::kMacAddress, tag::kSupportedAdapterModes}), IsEmpty());

    const std::vector<uint32_t> network = RefreshedTags({tag::kGateway | 0x123});
    EXPECT_EQ(15u, network.size());
    EXPECT_EQ(std::count(network.begin(), network.end(), tag::kMacAddress), 1);
    EXPECT_EQ(std::count(network.begin(), network.end(), tag::kAdapterMode), 0);

    EXPECT_THAT(
        RefreshedTags({tag::kPollingMode}),
        ElementsAre(tag::kAdapterMode, tag::kSupportedAdapterModes, tag::kSupportedPollingModes,
                    tag::kPollingMode, tag::kEthernetConstantOne));
    EXPECT_EQ(20u, RefreshedTags({tag::kPollingMode, tag::kPrimaryAdapter}).size());
}

TEST_F(PropertiesTest, LibraryCallsAreTracedUnderTheirBit) {
    CaptureTraces(kTraceLibraryCalls);
    Properties(AdapterState());
    std::vector<std::string> texts;
    for (const TraceRecord& trace : Traces()) {
        EXPECT_TRUE(trace.stamped);
        texts.push_back(trace.text);
    }
    const std::string prefix = "NetworkItemHandler::PopulateProperties - ";
    EXPECT_THAT(texts,
                ElementsAre(prefix + "GetMACAddressByIndex(00:80:2F:12:34:56)",
                            prefix + "GetPrimaryDeviceIndex(0)", prefix + "GetDeviceModeByIndex(2)",
                            prefix + "GetDeviceSupportedTCPIPRequestModesByIndex(3)",
                            prefix + "GetDeviceTCPIPRequestModeByIndex(1)",
                            prefix + "GetIPAddressByIndex(192.168.1.10)",
                            prefix + "GetGatewayAddressByIndex(192.168.1.1)",
                            prefix + "GetDNSServerAddressByIndex(192.168.1.2)",
                            prefix + "GetSupportedDeviceSettings(127)",
                            prefix + "GetCurrentDeviceSettings(4)",
                            "EthernetItemHandler::PopulateProperties - GetDeviceModeByIndex(2)",
                            "EthernetItemHandler::PopulateProperties - "
                            "GetDeviceSupportedModesByIndex(11)",
                            "EthernetItemHandler::PopulateProperties - "
                            "GetSupportedDeviceSettings(3)",
                            "EthernetItemHandler::PopulateProperties - "
                            "GetCurrentDeviceSettings(1)"));

    CaptureTraces(kTraceLibraryCalls);
    Properties(AdapterState("Mode = 1\n"));
    ASSERT_EQ(6u, Traces().size());
    EXPECT_EQ("PopulateTcpRequestMode - GetDeviceSupportedTCPIPRequestModesByIndex(3)",
              Traces()[3].text);
}

TEST_F(PropertiesTest, DescriptionsMatchByNameOrKind) {
    WriteState(AdapterState());
    CountedPtr<EthernetItemHandler> handler = MakeHandler();
    struct {
        const wchar_t* name;
        bool matches;
        bool exact;
    } const cases[] = {{L"eth0", true, true},   {L"ETH0", true, true}, {L"eth1", true, false},
                       {L"ETH1", false, false}, {L"et", false, false}, {L"", false, false}};
    for (const auto& testCase : cases) {
        CountedPtr<IuxSysPropertyBag4> description =
            MakeBag({{tag::kItemName, BagValue::Text(testCase.name)}});
        bool exact = !testCase.exact;
        EXPECT_EQ(testCase.matches, handler->IsMatchingItem(description.Get(), exact));
        EXPECT_EQ(testCase.exact, exact);
    }
    bool exact = false;
    EXPECT_THROW(handler->IsMatchingItem(CreatePropertyBag().Get(), exact), long);
}

TEST_F(PropertiesTest, AdapterIsUpOnlyWhenTheLibrarySaysSo) {
    WriteState(AdapterState());
    EXPECT_TRUE(MakeHandler()->IsAdapterUp());
    WriteState(AdapterState("AdapterUp = 0\n"));
    EXPECT_FALSE(MakeHandler()->IsAdapterUp());
    WriteState(AdapterState("[Faults]\nGetAdapterState = -375501\n"));
    EXPECT_FALSE(MakeHandler()->IsAdapterUp());
}

}  // namespace
}  // namespace network_test
