// Persisting the Ethernet adapter's changes, read back from the simulated library's call log:
// which settings are written, in which order and with which arguments, and what is handed to
// the deferred restart.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"

namespace network_test {
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
    EXPECT_THAT(CallLog(),
                ElementsAre("GetPrimaryDeviceIndex\t0", "GetPrimaryDeviceIndex\t0",
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
    EXPECT_EQ(S_OK, Persist(AdapterState(), "ip=192.168.1.20 dns=").status);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.20"
                                            "\t255.255.255.0\t192.168.1.1\t0.0.0.0"));
    // An adapter without an address yet takes the new one as well.
    EXPECT_EQ(S_OK, Persist(AdapterState("IPAddress ="), "ip=10.0.0.3 mask=255.0.0.0").status);
    EXPECT_THAT(CallLog("Set"), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t10.0.0.3"
                                            "\t255.0.0.0\t192.168.1.1\t192.168.1.2"));
}

TEST_F(PersistenceTest, FailuresAreTracedAndReturnedAfterEarlierWrites) {
    CaptureTraces(kTraceErrors);
    EXPECT_EQ(E_FAIL, Persist(AdapterState(), "gw=gateway").status);
    EXPECT_THAT(CallLog("Set"), IsEmpty());
    EXPECT_THAT(Traces(), ElementsAre("NetworkItemHandler::HaveInterfaceSettingsChanged() failed +",
                                      "NetworkItemHandler::PersistPropertyChanges() failed +"));

    EXPECT_EQ(E_INVALIDARG, Persist(AdapterState("[Faults]\nSetDeviceIPConfigByIndex = -375563", 1),
                                    "primary=1 req=2")
                                .status);
    EXPECT_THAT(
        CallLog("Set"),
        ElementsAre("SetPrimaryDeviceByIndex\t0\t0",
                    std::string("SetDeviceIPConfigByIndex\t-375563\t0\t0\t2\t2") + kZeroAddresses));
}

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
}  // namespace network_test
