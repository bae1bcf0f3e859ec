// Persisting the Ethernet adapter's changes, read back from the simulated library's call log:
// which settings are written, in which order and with which arguments, and what is handed to
// the deferred restart.
#include <gmock/gmock.h>

#include "NetworkTestSupport.h"
#include "network/InterfaceSettings.h"

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;

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
        result.status = StatusOf([&] {
            return handler_->PersistPropertyChanges(bag_.Get(), result.persistFlag,
                                                    result.deviceHandler, result.adapterDisabled);
        });
        return result;
    }

    CountedPtr<EthernetItemHandler> handler_;
    CountedPtr<IuxSysPropertyBag4> bag_;
};

struct PersistCase {
    const char* name;
    const char* state;  // adapter state overrides
    const char* changes;
    HRESULT status;
    const char* outcome;  // persist flag, restart request and adapter mode in the bag after it
    const char* calls;    // the logged calls whose names begin with `prefix`, one a line
    const char* prefix = "Set";
};

#define ZERO_ADDRESSES "\t0.0.0.0\t0.0.0.0\t0.0.0.0\t0.0.0.0"

TEST_F(PersistenceTest, WritesTheChangedSettingsAndAsksForARestart) {
    const char* other = "PrimaryDeviceIndex = 1";  // the adapter is not the primary one
    const char* unset = "PrimaryDeviceIndex = 1\nGateway = 0.0.0.0\nDNSServer = 0.0.0.0";
    const PersistCase cases[] = {
        {"nothing modified", "", "", S_OK, "flag 0, no restart, mode 2", "", ""},
        {"primary role only", other, "primary=1", S_OK, "flag 0, restart 0 up, mode 2",
         "SetPrimaryDeviceByIndex\t0\t0\n"},
        // The checks of validation come first, then the change test and the write.
        {"media mode without polling", "", "media=8", S_OK, "flag 0, restart 0 up, mode 2",
         "GetPrimaryDeviceIndex\t0\nGetDeviceSupportedTCPIPRequestModesByIndex\t0\t0\n"
         "GetPrimaryDeviceIndex\t0\nGetPrimaryDeviceIndex\t0\nGetDeviceModeByIndex\t0\t0\n"
         "GetDeviceTCPIPRequestModeByIndex\t0\t0\nGetCurrentDeviceSettings\t0\t0\n"
         "GetDeviceModeByIndex\t0\t0\nSetDeviceSettings\t0\t0\t8\t0\t0\n",
         ""},
        {"EtherCAT", "", "mode=8 id=5 flag=1", S_OK, "flag 1, restart 0 up, mode 8",
         "SetEtherCATSettings\t0\t0\t5\t1\nSetDeviceIPConfigByIndex\t0\t0\t0\t0\t8" ZERO_ADDRESSES
         "\n"},
        {"disabled", "", "mode=1", S_OK, "flag 0, restart 0 down, mode 1",
         "SetDeviceIPConfigByIndex\t0\t0\t0\t0\t1" ZERO_ADDRESSES "\n"},
        // Another adapter may leave its DNS server empty: it is stored as 0.0.0.0.
        {"new address of another adapter", other, "ip=192.168.1.20 dns=", S_OK,
         "flag 0, restart 0 up, mode 2",
         "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.20\t255.255.255.0\t192.168.1.1"
         "\t0.0.0.0\n"},
        {"first address", "IPAddress =", "ip=192.168.1.3 mask=255.255.0.0", S_OK,
         "flag 0, restart 0 up, mode 2",
         "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.3\t255.255.0.0\t192.168.1.1"
         "\t192.168.1.2\n"},
        {"failing write after the primary role",
         "PrimaryDeviceIndex = 1\n[Faults]\nSetDeviceIPConfigByIndex = -375563", "primary=1 req=2",
         E_INVALIDARG, "flag 0, no restart, mode 2",
         "SetPrimaryDeviceByIndex\t0\t0\n"
         "SetDeviceIPConfigByIndex\t-375563\t0\t0\t2\t2" ZERO_ADDRESSES "\n"},
        // A false flag on the primary adapter never removes its role.
        {"false primary flag", "", "primary=0", S_OK, "flag 0, no restart, mode 2", ""},
        // Another adapter's empty gateway and DNS server are stored as 0.0.0.0: against a stored
        // 0.0.0.0 they change nothing, but any real change stores them so.
        {"empty gateway and DNS as stored", unset, "gw= dns=", S_OK, "flag 0, no restart, mode 2",
         ""},
        {"empty gateway and DNS with a new address", unset, "gw= dns= ip=192.168.1.11", S_OK,
         "flag 0, restart 0 up, mode 2",
         "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.1.11\t255.255.255.0\t0.0.0.0"
         "\t0.0.0.0\n"},
        {"other tags", "", "mac=00:00:00:00:00:01", S_OK, "flag 0, no restart, mode 2", ""},
        // A persist that comes without validation refuses an address that would be stored as
        // another one than inet_addr reads.
        {"ambiguous address", "", "ip=192.168.012.1", UX_E_IP_ADDRESS_INVALID,
         "flag 0, no restart, mode 2", ""},
    };
    for (const PersistCase& c : cases) {
        const PersistResult result = Persist(AdapterState(c.state), c.changes);
        EXPECT_EQ(c.status, result.status) << c.name;
        EXPECT_EQ(c.calls, Calls(c.prefix)) << c.name;
        uint32_t mode = 0;
        bag_->GetULong(tags::kAdapterMode, &mode);
        const std::string restart =
            result.deviceHandler
                ? "restart " + std::to_string(result.deviceHandler->GetDeviceIndex()) +
                      (result.adapterDisabled ? " down" : " up")
                : std::string(result.adapterDisabled ? "down " : "") + "no restart";
        EXPECT_EQ(c.outcome, "flag " + std::to_string(result.persistFlag) + ", " + restart +
                                 ", mode " + std::to_string(mode))
            << c.name;
    }
}

TEST_F(PersistenceTest, NetworkPartAlonePersistsPollingAndReportsNothingModified) {
    Persist(AdapterState(), "");
    PersistResult network;
    EXPECT_EQ(S_FALSE,
              handler_->NetworkItemHandler::PersistPropertyChanges(
                  bag_.Get(), network.persistFlag, network.deviceHandler, network.adapterDisabled));
    // Polling settings are written alone, each persist its own.
    Persist(AdapterState(), "interval=500");
    WriteRows(bag_.Get(), "polling=2");
    PersistAgain();
    EXPECT_EQ("SetDeviceSettings\t0\t0\t0\t1\t0\nSetDeviceSettings\t0\t0\t0\t2\t500\n",
              Calls("Set"));
}

TEST_F(PersistenceTest, FailuresAreTraced) {
    CaptureTraces(kTraceErrors);
    EXPECT_EQ(UX_E_GATEWAY_INVALID, Persist(AdapterState(), "gw=gateway").status);
    EXPECT_EQ("", Calls("Set"));
    bool changed = true;
    EXPECT_EQ(E_FAIL, kest::network::HaveInterfaceSettingsChanged(0, bag_.Get(), changed));
    EXPECT_THAT(Traces(),
                ElementsAre("ValidateGatewayDNSHelper() failed",
                            "NetworkItemHandler::ValidatePropertyChanges() failed +",
                            "NetworkItemHandler::PersistPropertyChanges() failed +",
                            "NetworkItemHandler::HaveInterfaceSettingsChanged() failed +"));
}

}  // namespace
}  // namespace kest::test::network
