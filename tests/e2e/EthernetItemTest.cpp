// The Ethernet adapter eth0 as a host drives it through the loaded plug-in: a new static address
// is written at once while the interface restarts on its own thread after the answer, and a
// second persist waits for the restart that is still running.
#include <gtest/gtest.h>
#include <time.h>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr uint32_t kIPAddressTag = 0x0D107000;
constexpr wchar_t kEth0[] = L"eth0";

double MonotonicMs() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec) * 1000.0 + static_cast<double>(now.tv_nsec) / 1e6;
}

class EthernetItemTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(std::string(kSystemState) +
                             "[Network]\nPrimaryDeviceIndex = 0\n[Device0]\nType = 1\n"
                             "InterfaceName = eth0\nIndex = 0\nMACAddress = 00:80:2F:12:34:56\n"
                             "Mode = 2\nSupportedModes = 3\nRequestMode = 1\n"
                             "SupportedRequestModes = 3\nIPAddress = 192.168.1.10\n"
                             "SubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
                             "DNSServer = 192.168.1.2\nCurrentMediaMode = 4\n"
                             "PreferredMediaMode = 4\n");
        ExpertHostTest::SetUp();
        InterfaceRef<IuxSysPropertyBag> properties;
        ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(kEth0, properties.Receive()));
        ASSERT_EQ(S_OK, properties->QueryInterface(IID_IuxSysPropertyBag2,
                                                   reinterpret_cast<void**>(bag.Receive())));
        bag->ClearAllModified();
    }

    InterfaceRef<IuxSysPropertyBag2> bag;
};

TEST_F(EthernetItemTest, NewAddressesAreWrittenAtOnceAndEachRestartFollowsTheAnswer) {
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"10.0.0.5"));
    ASSERT_EQ(S_OK, bag->SetString(0x0D109000, L"255.255.0.0"));
    ASSERT_EQ(S_OK, bag->SetString(0x0D10A000, L"10.0.0.1"));
    InterfaceRef<IuxSysEnumPropertyTag> validated;
    ASSERT_EQ(S_OK,
              expert->ValidatePropertyChanges(kEth0, bag.Get(), validated.Receive(), nullptr));

    const double calledMs = MonotonicMs();
    int32_t restart = -1;
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    const double returnedMs = MonotonicMs();
    EXPECT_EQ(0, restart);
    EXPECT_EQ(1u, ControllerCalls("Set").size());
    // The second address comes after the first restart ended; the second restart runs on until
    // the expert is released.
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"10.0.0.6"));
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    expert.Reset();

    std::vector<double> times;
    const std::string address = "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t10.0.0.";
    const std::string rest = "\t255.255.0.0\t10.0.0.1\t192.168.1.2";
    const std::vector<std::string> expected = {address + "5" + rest,
                                               "SetNetworkInterfaceState\t0\teth0\t0",
                                               "SetNetworkInterfaceState\t0\teth0\t1",
                                               "SetDeviceSettings\t0\t0\t4\t0\t0",
                                               address + "6" + rest,
                                               "SetNetworkInterfaceState\t0\teth0\t0",
                                               "SetNetworkInterfaceState\t0\teth0\t1",
                                               "SetDeviceSettings\t0\t0\t4\t0\t0"};
    EXPECT_EQ(expected, ControllerCalls("Set", &times));
    ASSERT_EQ(8u, times.size());
    // The log keeps three decimals, so a logged time may lie up to 1 µs before the call.
    EXPECT_GE(times[1] + 0.001, returnedMs);
    EXPECT_GE(times[1], calledMs + 100);
    EXPECT_GE(times[2], times[1] + 900);
}

}  // namespace
}  // namespace kest::test::e2e
