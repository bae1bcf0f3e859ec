// Persisting the Ethernet adapter's changes, read back from the simulated library's call log:
// which settings are written, in which order and with which arguments, and what is handed to
// the deferred restart.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"
#include "network/NetworkTags.h"
#include "uxsys/StatusCodes.h"

namespace network_test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
namespace tag = NetworkTag;

// What a persist handed back.
struct PersistResult {
    HRESULT status = S_OK;
    int32_t persistFlag = 0;
    CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler;
    bool adapterDisabled = false;
};

class PersistenceTest : public NetworkTest {
  protected:
    // Writes `state`, then reads the adapter's properties into a bag without modified tags, as
    // a host that edits the current properties does.
    void StartFrom(const std::string& state) {
        WriteState(state);
        handler_ = MakeHandler();
        bag_ = CreatePropertyBag();
        ASSERT_EQ(S_OK, handler_->GetItemProperties(bag_.Get()));
        bag_->ClearAllModified();
        ClearCallLog();
    }

    PersistResult Persist() {
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
    StartFrom(AdapterState());
    PersistResult network;
    EXPECT_EQ(S_FALSE,
              handler_->NetworkItemHandler::PersistPropertyChanges(
                  bag_.Get(), network.persistFlag, network.deviceHandler, network.adapterDisabled));
    const PersistResult ethernet = Persist();
    EXPECT_EQ(S_OK, ethernet.status);
    EXPECT_FALSE(ethernet.deviceHandler);
    EXPECT_THAT(CallLog(), IsEmpty());
}

TEST_F(PersistenceTest, MakingTheAdapterPrimaryWritesOnlyThePrimaryRole) {
    StartFrom(AdapterState("", 1));
    ASSERT_EQ(S_OK, bag_->SetBool(tag::kPrimaryAdapter, 1));

    const PersistResult result = Persist();

    EXPECT_EQ(S_OK, result.status);
    EXPECT_THAT(SetterLog(), ElementsAre("SetPrimaryDeviceByIndex\t0\t0"));
    EXPECT_EQ(2u, ULongOf(bag_.Get(), tag::kAdapterMode));
    ASSERT_TRUE(result.deviceHandler);
    EXPECT_EQ(0u, result.deviceHandler->GetDeviceIndex());
    EXPECT_FALSE(result.adapterDisabled);
    EXPECT_EQ(0, result.persistFlag);
}

TEST_F(PersistenceTest, MediaModeAloneIsSetWithoutTouchingPolling) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kPreferredMediaMode, 8));

    const PersistResult result = Persist();

    EXPECT_EQ(S_OK, result.status);
    EXPECT_THAT(CallLog(),
                ElementsAre("GetPrimaryDeviceIndex\t0", "GetPrimaryDeviceIndex\t0",
                            "GetDeviceModeByIndex\t0\t0", "GetDeviceTCPIPRequestModeByIndex\t0\t0",
                            "GetCurrentDeviceSettings\t0\t0", "GetDeviceModeByIndex\t0\t0",
                            "SetDeviceSettings\t0\t0\t8\t0\t0"));
    EXPECT_TRUE(result.deviceHandler);
}

TEST_F(PersistenceTest, SwitchingToEtherCATAsksForARestartAndClearsTheAddresses) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kAdapterMode, 8));
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kEtherCATMasterId, 5));
    ASSERT_EQ(S_OK, bag_->SetBool(tag::kEtherCATFlag, 1));

    const PersistResult result = Persist();

    EXPECT_EQ(S_OK, result.status);
    EXPECT_EQ(1, result.persistFlag);
    EXPECT_FALSE(result.adapterDisabled);
    EXPECT_THAT(SetterLog(), ElementsAre("SetEtherCATSettings\t0\t0\t5\t1",
                                         "SetDeviceIPConfigByIndex\t0\t0\t0\t0\t8\t0.0.0.0\t0.0.0.0"
                                         "\t0.0.0.0\t0.0.0.0"));
}

TEST_F(PersistenceTest, DisablingTheAdapterReportsIt) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kAdapterMode, 1));

    const PersistResult result = Persist();

    EXPECT_EQ(S_OK, result.status);
    EXPECT_TRUE(result.adapterDisabled);
    EXPECT_EQ(0, result.persistFlag);
    EXPECT_THAT(SetterLog(), ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t0\t1\t0.0.0.0\t0.0.0.0"
                                         "\t0.0.0.0\t0.0.0.0"));
}

TEST_F(PersistenceTest, NewStaticAddressStoresTheWholeConfiguration) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetString(tag::kIPAddress, L"192.168.1.20"));
    ASSERT_EQ(S_OK, bag_->SetString(tag::kDnsServer, L""));

    EXPECT_EQ(S_OK, Persist().status);

    EXPECT_THAT(SetterLog(),
                ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.20\t255.255.255.0"
                            "\t192.168.1.1\t0.0.0.0"));
}

TEST_F(PersistenceTest, StaticAdapterWithoutAnAddressYetTakesTheNewOne) {
    StartFrom(AdapterState("IPAddress =\n"));
    ASSERT_EQ(S_OK, bag_->SetString(tag::kIPAddress, L"192.168.1.30"));
    ASSERT_EQ(S_OK, bag_->SetString(tag::kSubnetMask, L"255.255.0.0"));

    EXPECT_EQ(S_OK, Persist().status);

    EXPECT_THAT(SetterLog(),
                ElementsAre("SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.30\t255.255.0.0"
                            "\t192.168.1.1\t192.168.1.2"));
}

TEST_F(PersistenceTest, GatewayThatIsNoAddressFailsTheChangeTest) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetString(tag::kGateway, L"gateway"));
    CaptureTraces(kTraceErrors);

    EXPECT_EQ(E_FAIL, Persist().status);

    EXPECT_THAT(SetterLog(), IsEmpty());
    ASSERT_EQ(2u, Traces().size());
    EXPECT_EQ("NetworkItemHandler::HaveInterfaceSettingsChanged() failed", Traces()[0].text);
    EXPECT_EQ("NetworkItemHandler::PersistPropertyChanges() failed", Traces()[1].text);
}

TEST_F(PersistenceTest, LibraryFailureIsReturnedAfterEarlierWrites) {
    StartFrom(AdapterState("", 1) + "[Faults]\nSetDeviceIPConfigByIndex = -375563\n");
    ASSERT_EQ(S_OK, bag_->SetBool(tag::kPrimaryAdapter, 1));
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kRequestMode, 2));

    EXPECT_EQ(E_INVALIDARG, Persist().status);

    EXPECT_THAT(SetterLog(), ElementsAre("SetPrimaryDeviceByIndex\t0\t0",
                                         "SetDeviceIPConfigByIndex\t-375563\t0\t0\t2\t2\t0.0.0.0"
                                         "\t0.0.0.0\t0.0.0.0\t0.0.0.0"));
}

TEST_F(PersistenceTest, OtherModifiedTagsChangeNothing) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetString(tag::kMacAddress, L"00:00:00:00:00:01"));

    const PersistResult result = Persist();

    EXPECT_EQ(S_OK, result.status);
    EXPECT_THAT(SetterLog(), IsEmpty());
    EXPECT_FALSE(result.deviceHandler);
}

TEST_F(PersistenceTest, PollingSettingsAreSetWithoutTouchingTheMediaMode) {
    StartFrom(AdapterState());
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kPollingInterval, 500));
    EXPECT_EQ(S_OK, Persist().status);
    ASSERT_EQ(S_OK, bag_->SetULong(tag::kPollingMode, 2));
    EXPECT_EQ(S_OK, Persist().status);

    EXPECT_THAT(SetterLog(), ElementsAre("SetDeviceSettings\t0\t0\t0\t1\t0",
                                         "SetDeviceSettings\t0\t0\t0\t2\t500"));
}

}  // namespace
}  // namespace network_test
