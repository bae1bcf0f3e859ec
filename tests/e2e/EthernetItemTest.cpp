// The Ethernet adapter eth0 as a host drives it through the loaded plug-in: a new static address
// that is written at once while the interface restarts on its own thread after the answer, and
// persists that write nothing.
#include <gmock/gmock.h>
#include <time.h>

#include <cstdlib>
#include <sstream>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;

constexpr uint32_t kIPAddressTag = 0x0D107000;
constexpr uint32_t kSubnetMaskTag = 0x0D109000;
constexpr uint32_t kGatewayTag = 0x0D10A000;
constexpr uint32_t kPrimaryAdapterTag = 0x0D126000;
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

    // The status of validating the bag for eth0, and the message (empty when none came).
    std::pair<HRESULT, std::wstring> Validate() {
        InterfaceRef<IuxSysEnumPropertyTag> validated;
        CvqBStr message = nullptr;
        const HRESULT status =
            expert->ValidatePropertyChanges(kEth0, bag.Get(), validated.Receive(), &message);
        return {status, TakeWideHostString(message)};
    }

    // The logged calls that change the controller, each after its time and a blank.
    std::vector<std::pair<double, std::string>> ControllerChanges() const {
        std::vector<std::pair<double, std::string>> calls;
        std::istringstream log(sysroot.ReadFile(kControllerCallLogPath));
        for (std::string line; std::getline(log, line);) {
            const std::string call = line.substr(line.find('\t') + 1);
            if (call.compare(0, 3, "Set") == 0) {
                calls.emplace_back(std::strtod(line.c_str(), nullptr), call);
            }
        }
        return calls;
    }

    InterfaceRef<IuxSysPropertyBag2> bag;
};

TEST_F(EthernetItemTest, NewAddressIsWrittenAtOnceAndTheInterfaceRestartsAfterTheAnswer) {
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"10.0.0.5"));
    ASSERT_EQ(S_OK, bag->SetString(kSubnetMaskTag, L"255.255.0.0"));
    ASSERT_EQ(S_OK, bag->SetString(kGatewayTag, L"10.0.0.1"));
    ASSERT_EQ(S_OK, Validate().first);

    const double calledMs = MonotonicMs();
    int32_t restart = -1;
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    const double returnedMs = MonotonicMs();
    EXPECT_EQ(0, restart);
    ASSERT_EQ(1u, ControllerChanges().size());
    EXPECT_EQ(
        "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t10.0.0.5\t255.255.0.0\t10.0.0.1\t192.168.1.2",
        ControllerChanges()[0].second);

    // Releasing the expert waits for the restart that is still running.
    expert.Reset();
    const auto calls = ControllerChanges();
    ASSERT_EQ(4u, calls.size());
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t0", calls[1].second);
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t1", calls[2].second);
    EXPECT_EQ("SetDeviceSettings\t0\t0\t4\t0\t0", calls[3].second);
    // The log keeps three decimals, so a logged time may lie up to 1 µs before the call.
    EXPECT_GE(calls[1].first + 0.001, returnedMs);
    EXPECT_GE(calls[1].first, calledMs + 100);
    EXPECT_GE(calls[2].first, calls[1].first + 900);
}

TEST_F(EthernetItemTest, PersistsThatWriteNothingLeaveTheLinkAlone) {
    // A false primary flag on the primary adapter, then an address read otherwise than stored.
    ASSERT_EQ(S_OK, bag->SetBool(kPrimaryAdapterTag, 0));
    int32_t restart = -1;
    EXPECT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    ASSERT_EQ(S_OK, bag->SetString(kGatewayTag, L"192.168.1.0255"));
    EXPECT_EQ(UX_E_GATEWAY_INVALID, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    EXPECT_EQ(std::make_pair(UX_E_GATEWAY_INVALID, std::wstring()), Validate());

    // Releasing the expert waits for any restart that was started.
    expert.Reset();
    EXPECT_TRUE(ControllerChanges().empty());
}

TEST_F(EthernetItemTest, PersistingAgainWaitsForTheRunningRestart) {
    int32_t restart = -1;
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"192.168.1.20"));
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"192.168.1.30"));
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));

    std::vector<std::string> calls;
    for (const auto& call : ControllerChanges()) {
        calls.push_back(call.second);
    }
    // The second address comes after the first restart ended; the second restart runs on.
    EXPECT_THAT(calls, ElementsAre(HasSubstr("\t192.168.1.20\t"), HasSubstr("eth0\t0"),
                                   HasSubstr("eth0\t1"), HasSubstr("SetDeviceSettings"),
                                   HasSubstr("\t192.168.1.30\t")));
}

}  // namespace
}  // namespace kest::test::e2e
