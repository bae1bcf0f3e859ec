// Several kestcfg processes changing one demo controller: they take turns through the kestcfg
// lock, --no-wait gives up at once, and a set interrupted while the interface restarts brings
// the interface up again before it ends with 128 + the signal's number.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/file.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

constexpr char kChassis[] = "VQ KEST Chassis";
constexpr char kLockPath[] = "/run/kest/kestcfg.lock";

struct Change {
    const char* item;
    const char* assignment;
    const char* stored;  // "Key=value" as the controller's state holds it afterwards
};

class KestcfgTurnsTest : public DemoControllerTest {
  protected:
    // Whether the controller's state holds the line "Key=value" (blanks around "=" allowed).
    bool StateHas(const std::string& keyAndValue) const {
        const std::string state = State();
        const size_t equals = keyAndValue.find('=');
        const std::string key = keyAndValue.substr(0, equals);
        const std::string value = keyAndValue.substr(equals + 1);
        return state.find("\n" + key + "=" + value + "\n") != std::string::npos ||
               state.find("\n" + key + " = " + value + "\n") != std::string::npos;
    }
};

TEST_F(KestcfgTurnsTest, ParallelSetsOfDistinctPropertiesAllSucceedAndAllStay) {
    // Every change sets a new value: one lost update shows as an old value.
    const std::vector<std::vector<Change>> rounds = {
        {{kChassis, "host-name=kest-a", "HostName=kest-a"},
         {kChassis, "comment=first round", "UserComment=first round"},
         {kChassis, "locale=de", "LanguageName=German"},
         {kChassis, "time-zone=Europe/Paris", "TimeZone=Europe/Paris"},
         {"eth0", "ip-address=192.168.10.31", "IPAddress=192.168.10.31"},
         {"eth0", "subnet-mask=255.255.0.0", "SubnetMask=255.255.0.0"},
         {"eth0", "gateway=192.168.10.2", "Gateway=192.168.10.2"},
         {"eth0", "dns-server=192.168.10.3", "DNSServer=192.168.10.3"},
         {"eth0", "polling-interval=250", "PollingInterval=250"},
         {"eth0", "preferred-media-mode=2", "PreferredMediaMode=2"}},
        {{kChassis, "host-name=kest-b", "HostName=kest-b"},
         {kChassis, "comment=second round", "UserComment=second round"},
         {kChassis, "locale=fr", "LanguageName=French"},
         {"eth0", "ip-address=192.168.10.32", "IPAddress=192.168.10.32"},
         {"eth0", "gateway=192.168.10.4", "Gateway=192.168.10.4"},
         {"eth0", "polling-interval=500", "PollingInterval=500"}},
    };
    for (const std::vector<Change>& round : rounds) {
        std::vector<RunningProgram> running;
        for (const Change& change : round) {
            running.push_back(StartProgram(Kestcfg({"set", change.item, change.assignment})));
        }
        for (size_t i = 0; i < running.size(); ++i) {
            const RunResult result = FinishProgram(running[i]);
            EXPECT_EQ(0, result.exitCode) << round[i].assignment << "\n" << result.err;
        }
        for (const Change& change : round) {
            EXPECT_TRUE(StateHas(change.stored)) << change.stored << "\n" << State();
        }
        EXPECT_TRUE(StateHas("InterfaceUp=1")) << State();
    }
}

TEST_F(KestcfgTurnsTest, AnotherKestcfgWaitsForItsTurnOrGivesUpWithNoWait) {
    // The test holds the lock as a running kestcfg would.
    sysroot_.MakeDirectory("/run/kest");
    const int lock = open(sysroot_.PathOf(kLockPath).c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    ASSERT_LE(0, lock);
    ASSERT_EQ(0, flock(lock, LOCK_EX));

    const RunResult refused = RunKestcfg({"--no-wait", "set", "eth0", "polling-interval=300"});
    EXPECT_EQ(4, refused.exitCode) << refused.err;
    EXPECT_NE(std::string::npos, refused.err.find("another kestcfg")) << refused.err;
    EXPECT_TRUE(StateHas("PollingInterval=100")) << State();

    RunningProgram waiting = StartProgram(Kestcfg({"set", "eth0", "polling-interval=300"}));
    ASSERT_TRUE(PollUntil([&] {
        return waiting.ErrorSoFar().find("waiting for another kestcfg") != std::string::npos;
    }));
    EXPECT_TRUE(StateHas("PollingInterval=100")) << State();
    close(lock);
    const RunResult waited = FinishProgram(waiting);
    EXPECT_EQ(0, waited.exitCode) << waited.err;
    EXPECT_EQ(1u, CountOf(waited.err, "waiting for another kestcfg")) << waited.err;
    EXPECT_TRUE(StateHas("PollingInterval=300")) << State();
}

class KestcfgInterruptedSetTest : public KestcfgTurnsTest,
                                  public testing::WithParamInterface<int> {};

TEST_P(KestcfgInterruptedSetTest, BringsTheInterfaceUpAgainAndKeepsTheNewSettings) {
    RunningProgram running = StartProgram(Kestcfg({"set", "eth0", "ip-address=192.168.10.40"}));
    ASSERT_TRUE(PollUntil([&] {
        return Calls().find("\tSetNetworkInterfaceState\t0\teth0\t0\n") != std::string::npos;
    }));
    ASSERT_EQ(0, kill(running.pid, GetParam()));
    const RunResult result = FinishProgram(running);
    EXPECT_EQ(128 + GetParam(), result.exitCode) << result.err;
    EXPECT_NE(std::string::npos, result.err.find("finishing the interface restart")) << result.err;
    EXPECT_TRUE(StateHas("InterfaceUp=1")) << State();
    EXPECT_TRUE(StateHas("IPAddress=192.168.10.40")) << State();
}

INSTANTIATE_TEST_SUITE_P(Signals, KestcfgInterruptedSetTest,
                         testing::Values(SIGINT, SIGTERM, SIGHUP),
                         [](const testing::TestParamInfo<int>& entry) {
                             return std::string(sigabbrev_np(entry.param));
                         });

}  // namespace

}  // namespace kest::test::cfg
