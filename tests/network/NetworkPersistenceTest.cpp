// Persisting the Ethernet adapter's changes, read back from the simulated library's call log:
// which settings are written, in which order and with which arguments, and what is handed to
// the deferred restart.
#include <gmock/gmock.h>

#include <map>
#include <tuple>

#include "NetworkTestSupport.h"
#include "network/InterfaceSettings.h"

using namespace kest::network;

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr char kZeroAddresses[] = "\t0.0.0.0\t0.0.0.0\t0.0.0.0\t0.0.0.0";

struct PersistResult {
    HRESULT status = S_OK;
    int32_t persistFlag = 0;
    CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler;
    bool adapterDisabled = false;
};

class PersistenceTest : public NetworkTest {
  protected:
    // Reads the adapter's properties (from `state`) into a bag, as a host editing them does,
    // then writes `changes` over them and persists.
    PersistResult Persist(const std::string& state, const std::string& changes) {
        WriteState(state);
        handler_ = MakeHandler();
        bag_ = CreatePropertyBag();
        EXPECT_EQ(S_OK, handler_->GetItemProperties(bag_.Get()));
        bag_->ClearAllModified();
        WriteRows(bag_.Get(), changes);
        ClearCallLog();
        return PersistAgain();
    }

    PersistResult PersistAgain() {
        PersistResult result;
        try {
            result.status = handler_->PersistPropertyChanges(
                bag_.Get(), result.persistFlag, result.deviceHandler, result.adapterDisabled);
        } catch (long status) {
            result.status = static_cast<HRESULT>(status);
        }
        return result;
    }

    CountedPtr<EthernetItemHandler> handler_;
    CountedPtr<IuxSysPropertyBag4> bag_;
};

TEST_F(PersistenceTest, NothingModifiedCallsNothing) {
    const PersistResult result = Persist(AdapterState(), "");
    EXPECT_EQ(S_OK, result.status);
    PersistResult network;
    EXPECT_EQ(S_FALSE,
              handler_->NetworkItemHandler::PersistPropertyChanges(
                  bag_.Get(), network.persistFlag, network.deviceHandler, network.adapterDisabled));
    EXPECT_FALSE(result.deviceHandler);
    EXPECT_THAT(CallLog(), IsEmpty());
}

TEST_F(PersistenceTest, MakingTheAdapterPrimaryWritesOnlyThePrimaryRole) {
    const PersistResult result = Persist(AdapterState("", 1), "primary=1");
    EXPECT_EQ(S_OK, result.status);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetPrimaryDeviceByIndex\t0\t0"));
    EXPECT_EQ(2u, ULongOf(bag_.Get(), NetworkTag::kAdapterMode));
    ASSERT_TRUE(result.deviceHandler);
    EXPECT_EQ(0u, result.deviceHandler->GetDeviceIndex());
    EXPECT_FALSE(result.adapterDisabled);
    EXPECT_EQ(0, result.persistFlag);
}

TEST_F(PersistenceTest, MediaModeAloneIsSetWithoutTouchingPolling) {
    const PersistResult result = Persist(AdapterState(), "media=8");
    EXPECT_EQ(S_OK, result.status);
    EXPECT_TRUE(result.deviceHandler);
    // The checks of validation come first, then the change test and the write.
    EXPECT_THAT(
        CallLog(),
        ElementsAre("GetPrimaryDeviceIndex\t0", "GetDeviceSupportedTCPIPRequestModesByIndex\t0\t0",
                    "GetPrimaryDeviceIndex\t0", "GetPrimaryDeviceIndex\t0",
                    "GetDeviceModeByIndex\t0\t0", "GetDeviceTCPIPRequestModeByIndex\t0\t0",
                    "GetCurrentDeviceSettings\t0\t0", "GetDeviceModeByIndex\t0\t0",
                    "SetDeviceSettings\t0\t0\t8\t0\t0"));
}

TEST_F(PersistenceTest, AdapterModeChangesStoreZeroAddresses) {
    PersistResult result = Persist(AdapterState(), "mode=8 id=5 flag=1");
    EXPECT_EQ(1, result.persistFlag);
    EXPECT_FALSE(result.adapterDisabled);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetEtherCATSettings\t0\t0\t5\t1",
                                            std::string("SetDeviceIPConfigByIndex\t0\t0\t0\t0\t8") +
                                                kZeroAddresses));

    result = Persist(AdapterState(), "mode=1");
    EXPECT_EQ(0, result.persistFlag);
    EXPECT_TRUE(result.adapterDisabled);
    EXPECT_THAT(CallLog("Set"), ElementsAre(std::string("SetDeviceIPConfigByIndex\t0\t0\t0\t0\t1") +
                                            kZeroAddresses));
}

TEST_F(PersistenceTest, NewStaticAddressStoresTheWholeConfiguration) {
    // Another adapter may leave its DNS server empty: it is stored as 0.0.0.0.
    EXPECT_EQ(S_OK, Persist(AdapterState("", 1), "ip=192.168.1.20 dns=").status);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.20"
                                            "\t255.255.255.0\t192.168.1.1\t0.0.0.0"));
    // An adapter without an address yet takes the new one as well.
    EXPECT_EQ(S_OK, Persist(AdapterState("IPAddress ="), "ip=192.168.1.3 mask=255.255.0.0").status);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.3"
                                            "\t255.255.0.0\t192.168.1.1\t192.168.1.2"));
}

TEST_F(PersistenceTest, FailuresAreTracedAndReturnedAfterEarlierWrites) {
    CaptureTraces(kTraceErrors);
    EXPECT_EQ(UX_E_GATEWAY_INVALID, Persist(AdapterState(), "gw=gateway").status);
    EXPECT_THAT(CallLog("Set"), IsEmpty());
    bool changed = true;
    EXPECT_EQ(E_FAIL, HaveInterfaceSettingsChanged(0, bag_.Get(), changed));
    EXPECT_THAT(Traces(),
                ElementsAre("ValidateGatewayDNSHelper() failed",
                            "NetworkItemHandler::ValidatePropertyChanges() failed +",
                            "NetworkItemHandler::PersistPropertyChanges() failed +",
                            "NetworkItemHandler::HaveInterfaceSettingsChanged() failed +"));

    EXPECT_EQ(E_INVALIDARG, Persist(AdapterState("[Faults]\nSetDeviceIPConfigByIndex = -375563", 1),
                                    "primary=1 req=2")
                                .status);
    EXPECT_THAT(
        CallLog("Set"),
        ElementsAre("SetPrimaryDeviceByIndex\t0\t0",
                    std::string("SetDeviceIPConfigByIndex\t-375563\t0\t0\t2\t2") + kZeroAddresses));
}

TEST_F(PersistenceTest, SettingsThatWouldNotBeWrittenAreNoChange) {
    // A false flag on the primary adapter never removes its role.
    PersistResult result = Persist(AdapterState(), "primary=0");
    EXPECT_EQ(S_OK, result.status);
    EXPECT_FALSE(result.deviceHandler);
    EXPECT_THAT(CallLog("Set"), IsEmpty());

    // Another adapter's empty gateway and DNS server are stored as 0.0.0.0, so against a stored
    // 0.0.0.0 they change nothing, however often they are persisted.
    const std::string unset = "Gateway = 0.0.0.0\nDNSServer = 0.0.0.0";
    for (int persist = 0; persist < 2; ++persist) {
        result = Persist(AdapterState(unset, 1), "gw= dns=");
        EXPECT_EQ(S_OK, result.status);
        EXPECT_FALSE(result.deviceHandler);
        EXPECT_THAT(CallLog("Set"), IsEmpty());
    }
    // Any real change still stores the empty ones as 0.0.0.0 and restarts the interface.
    result = Persist(AdapterState(unset, 1), "gw= dns= ip=192.168.1.11");
    EXPECT_TRUE(result.deviceHandler);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.11"
                                            "\t255.255.255.0\t0.0.0.0\t0.0.0.0"));
}

// Address texts that inet_addr reads as another address than the one they would be stored as
// (short, octal and hexadecimal forms, leading zeros) are refused in every address field with
// that field's status, by validation and by a persist that comes without it.
class AmbiguousAddressTable
    : public PersistenceTest,
      public ::testing::WithParamInterface<std::tuple<const char*, const char*>> {};

TEST_P(AmbiguousAddressTable, IsTheFieldsInvalidAddressEverywhere) {
    const auto [field, text] = GetParam();
    const std::map<std::string, HRESULT> statuses = {{"ip", UX_E_IP_ADDRESS_INVALID},
                                                     {"mask", UX_E_SUBNET_MASK_INVALID},
                                                     {"gw", UX_E_GATEWAY_INVALID},
                                                     {"dns", UX_E_DNS_ADDRESS_INVALID}};
    const PersistResult result =
        Persist(AdapterState(), std::string("ip=192.168.10.21 gw=192.168.10.1 dns=192.168.10.2 ") +
                                    field + "=" + text);
    EXPECT_EQ(statuses.at(field), result.status);
    EXPECT_FALSE(result.deviceHandler);
    EXPECT_THAT(CallLog("Set"), IsEmpty());

    PropertyTagSet validated;
    CvqBStrHolder message;
    HRESULT validation = S_OK;
    try {
        validation = handler_->ValidatePropertyChanges(bag_.Get(), validated, message.Receive());
    } catch (long thrown) {
        validation = static_cast<HRESULT>(thrown);
    }
    EXPECT_EQ(statuses.at(field), validation);
    EXPECT_EQ(nullptr, message.Get());
}

INSTANTIATE_TEST_SUITE_P(
    Forms, AmbiguousAddressTable,
    ::testing::Combine(::testing::Values("ip", "mask", "gw", "dns"),
                       ::testing::Values("192.168.10.0255", "192.168.012.1", "192.168.2570",
                                         "0xC0.168.10.21", "192.168.010.020", "255.255.0377.0",
                                         "255.0xFFFF00", "0300.168.10.21")),
    [](const ::testing::TestParamInfo<std::tuple<const char*, const char*>>& testCase) {
        return std::get<0>(testCase.param) + std::to_string(testCase.index % 8);
    });

TEST_F(PersistenceTest, OtherTagsChangeNothingAndPollingIsSetAlone) {
    const PersistResult result = Persist(AdapterState(), "mac=00:00:00:00:00:01");
    EXPECT_EQ(S_OK, result.status);
    EXPECT_FALSE(result.deviceHandler);
    EXPECT_THAT(CallLog("Set"), IsEmpty());

    Persist(AdapterState(), "interval=500");
    WriteRows(bag_.Get(), "polling=2");
    PersistAgain();
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceSettings\t0\t0\t0\t1\t0",
                                            "SetDeviceSettings\t0\t0\t0\t2\t500"));
}

}  // namespace
}  // namespace kest::test::network
