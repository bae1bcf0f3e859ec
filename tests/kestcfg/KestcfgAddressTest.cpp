// kestcfg changing the adapter's static address and mask together on a demo controller: the
// accepted pair is stored, shown by the next read and followed by the interface restart before
// kestcfg ends; a pair that does not fit the gateway is refused with the plug-in's message.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "kestcfg/DemoControllerTest.h"
#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

class KestcfgAddressTest : public kest::test::cfg::DemoControllerTest {
  protected:
    // The logged library calls that change the controller, without their times.
    std::vector<std::string> ControllerChanges() const {
        std::vector<std::string> calls;
        std::istringstream log(sysroot_.ReadFile(kCallLog));
        for (std::string line; std::getline(log, line);) {
            const std::string call = line.substr(line.find('\t') + 1);
            if (call.compare(0, 3, "Set") == 0) {
                calls.push_back(call);
            }
        }
        return calls;
    }
};

TEST_F(KestcfgAddressTest, AddressAndMaskAreStoredAndTheInterfaceRestartsBeforeKestcfgEnds) {
    const RunResult result =
        RunKestcfg({"set", "eth0", "ip-address=192.168.10.30", "subnet-mask=255.255.0.0"});
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ("eth0: ip-address set to 192.168.10.30\neth0: subnet-mask set to 255.255.0.0\n",
              result.out);
    const std::string state = State();
    EXPECT_NE(std::string::npos, state.find("IPAddress=192.168.10.30\nSubnetMask=255.255.0.0\n"))
        << state;
    const std::vector<std::string> expected = {
        "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.10.30\t255.255.0.0\t192.168.10.1\t"
        "192.168.10.1",
        "SetNetworkInterfaceState\t0\teth0\t0",
        "SetNetworkInterfaceState\t0\teth0\t1",
    };
    const std::vector<std::string> calls = ControllerChanges();
    ASSERT_LE(expected.size(), calls.size());
    EXPECT_EQ(expected, std::vector<std::string>(calls.begin(), calls.begin() + 3));

    const RunResult shown = RunKestcfg({"get", "eth0"});
    ASSERT_EQ(0, shown.exitCode) << shown.err;
    for (const char* row : {"ip-address                  text      192.168.10.30\n",
                            "subnet-mask                 text      255.255.0.0\n"}) {
        EXPECT_NE(std::string::npos, shown.out.find(row)) << shown.out;
    }
}

TEST_F(KestcfgAddressTest, PairsThatDoNotFitTheGatewayAreRefusedWithTheirMessage) {
    const std::string before = State();
    const struct {
        const char* address;
        const char* mask;
        const char* message;
    } cases[] = {
        {"192.168.10.0", "255.255.255.0",
         "UX_E_ADDRESS_COMBINATION_INVALID (0x80040380): The specified IP address and subnet "
         "mask combination is invalid. The right-most bits of the IP address must not be all 0 "
         "or all 1."},
        {"10.0.0.5", "255.255.255.0",
         "UX_E_ADDRESS_COMBINATION_INVALID (0x80040380): The IP address and gateway must be on "
         "the same subnet."},
    };
    for (const auto& entry : cases) {
        SCOPED_TRACE(entry.address);
        const RunResult result =
            RunKestcfg({"set", "eth0", std::string("ip-address=") + entry.address,
                        std::string("subnet-mask=") + entry.mask});
        EXPECT_EQ(1, result.exitCode);
        EXPECT_NE(std::string::npos,
                  result.err.find(std::string("eth0 rejected the change with ") + entry.message))
            << result.err;
    }
    EXPECT_EQ(before, State());
    EXPECT_TRUE(ControllerChanges().empty());
}

}  // namespace

}  // namespace kest::test::cfg
