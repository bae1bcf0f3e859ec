// Changes that undo themselves unless confirmed: confirm, expiry, the watcher (a second kestcfg)
// outliving the kestcfg that started it, one pending change at a time, and a failing rollback.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

constexpr char kPending[] = "/run/kest/pending-rollback.json";
constexpr char kLastRollback[] = "/run/kest/last-rollback.json";
constexpr char kInterfaceUp[] = "SetNetworkInterfaceState\t0\teth0\t1";

class KestcfgConfirmTest : public DemoControllerTest {
  protected:
    void SetUp() override {
        DemoControllerTest::SetUp();
        if (!KestcfgStartsItself()) {
            GTEST_SKIP() << "an emulated kestcfg cannot start the watcher";
        }
    }

    // The process ids of watchers of this controller.
    std::vector<pid_t> Watchers() const {
        std::vector<pid_t> pids;
        for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
            std::string line = ReadWhole(entry.path().string() + "/cmdline");
            std::replace(line.begin(), line.end(), '\0', ' ');
            if (line.find(sysroot_.Root() + " rollback --watch") != std::string::npos) {
                pids.push_back(atoi(entry.path().filename().c_str()));
            }
        }
        return pids;
    }

    std::string PendingJson() const { return FlattenJson(RunKestcfg({"pending", "--json"}).out); }
    bool RolledBack() const { return sysroot_.Exists(kLastRollback) && !sysroot_.Exists(kPending); }
};

// The change is made through a pipe, as a remote shell reads it, which waits until every holder
// of the pipe has closed it: the watcher holds none.
TEST_F(KestcfgConfirmTest, ConfirmedInTimeTheChangeStaysAndOnlyOneChangeIsPending) {
    const RunResult set =
        RunProgram({"/bin/bash", "-c", "set -o pipefail; \"$0\" \"$@\" 2>&1 | cat", KESTCFG_PATH,
                    "set", "eth0", "ip-address=192.168.10.41", "--confirm-within", "60"});
    ASSERT_EQ(0, set.exitCode) << set.out;
    EXPECT_NE(std::string::npos, set.out.find("Run 'kestcfg confirm' before ")) << set.out;
    struct stat status {};
    ASSERT_EQ(0, stat(sysroot_.PathOf(kPending).c_str(), &status));
    EXPECT_EQ(0600u, status.st_mode & 0777);
    ASSERT_TRUE(PollUntil([&] { return Watchers().size() == 1; }));
    const std::string descriptors = "/proc/" + std::to_string(Watchers()[0]) + "/fd";
    for (const auto& entry : std::filesystem::directory_iterator(descriptors)) {
        const std::string target = std::filesystem::read_symlink(entry.path());
        EXPECT_EQ(std::string::npos, target.find("pipe:")) << entry.path();
        if (atoi(entry.path().filename().c_str()) <= 2) {
            EXPECT_EQ("/dev/null", target) << entry.path();
        }
    }

    const RunResult second =
        RunKestcfg({"set", "eth0", "polling-interval=200", "--confirm-within", "60"});
    EXPECT_EQ(4, second.exitCode) << second.err;
    EXPECT_NE(std::string::npos, second.err.find("confirm it first (kestcfg confirm)"));
    const RunResult plain = RunKestcfg({"set", "eth0", "polling-interval=300"});
    EXPECT_EQ(0, plain.exitCode) << plain.err;
    EXPECT_NE(std::string::npos, plain.err.find("eth0 has a pending change")) << plain.err;

    const RunResult table = RunKestcfg({"pending"});
    EXPECT_EQ(0u, table.out.find("A change is pending until ")) << table.out;
    EXPECT_NE(std::string::npos, table.out.find("  eth0: ip-address = 192.168.10.20\n"));
    const std::string json = PendingJson();
    EXPECT_NE(std::string::npos, json.find("pending/watcher=true\n")) << json;
    EXPECT_NE(std::string::npos, json.find("pending/restores/eth0/ip-address=\"192.168.10.20\""));

    const RunResult confirmed = RunKestcfg({"confirm"});
    EXPECT_EQ(0, confirmed.exitCode) << confirmed.err;
    EXPECT_FALSE(sysroot_.Exists(kPending));
    EXPECT_TRUE(Watchers().empty());
    EXPECT_NE(std::string::npos, State().find("192.168.10.41"));
    EXPECT_EQ("No change is pending.\n", RunKestcfg({"pending"}).out);
    EXPECT_EQ(3, RunKestcfg({"confirm"}).exitCode);
}

struct ExpiryCase {
    const char* name;
    std::vector<std::string> arguments;  // with {FILE} for the settings file
    const char* restored;                // in the state file after the rollback
    bool restartsInterface;
    int signal;  // 0, or sent to the starting kestcfg's process group once the watcher runs
};

class KestcfgExpiryTest : public KestcfgConfirmTest,
                          public testing::WithParamInterface<ExpiryCase> {};

// A signal to the starter, as a dropped session or a kill sends it, leaves the watcher running.
TEST_P(KestcfgExpiryTest, UnconfirmedTheSavedSettingsReturnOnce) {
    const ExpiryCase& c = GetParam();
    sysroot_.WriteFile("/settings.json",
                       R"({"items": {"VQ KEST Chassis": {"host-name": "kest-b"}}})");
    std::vector<std::string> arguments = c.arguments;
    std::replace(arguments.begin(), arguments.end(), std::string("{FILE}"),
                 sysroot_.PathOf("/settings.json"));
    arguments.insert(arguments.end(), {"--confirm-within", "2"});
    RunningProgram starter = StartProgram(Kestcfg(arguments), true);
    if (c.signal != 0) {
        ASSERT_TRUE(PollUntil([&] { return !Watchers().empty(); }));
        kill(c.signal == SIGKILL ? starter.pid : -starter.pid, c.signal);
    }
    const RunResult changed = FinishProgram(starter);
    EXPECT_TRUE(c.signal != 0 || changed.exitCode == 0) << changed.err;
    const size_t restarts = CountOf(Calls(), kInterfaceUp);
    ASSERT_TRUE(PollUntil([&] { return RolledBack(); }));
    ASSERT_TRUE(PollUntil([&] { return Watchers().empty(); }));
    EXPECT_NE(std::string::npos, State().find(c.restored)) << State();
    EXPECT_TRUE(!c.restartsInterface || State().find("InterfaceUp=1") != std::string::npos);
    if (c.signal == 0) {
        EXPECT_EQ(restarts + (c.restartsInterface ? 1 : 0), CountOf(Calls(), kInterfaceUp));
    }
    EXPECT_NE(std::string::npos, PendingJson().find("lastRollback/result=\"restored\""));
    EXPECT_EQ(0u, RunKestcfg({"pending"}).out.find("Last rollback: "));
    const RunResult late = RunKestcfg({"confirm"});
    EXPECT_EQ(3, late.exitCode);
    EXPECT_NE(std::string::npos, late.err.find("rolled back")) << late.err;
}

const std::vector<std::string> kSetAddress = {"set", "eth0", "ip-address=192.168.10.43"};
INSTANTIATE_TEST_SUITE_P(
    Commands, KestcfgExpiryTest,
    testing::Values(ExpiryCase{"SetAddress", kSetAddress, "192.168.10.20", true, 0},
                    ExpiryCase{
                        "ApplyHostName", {"apply", "{FILE}"}, "HostName=kest-demo", false, 0},
                    ExpiryCase{"StarterHungUp", kSetAddress, "192.168.10.20", true, SIGHUP},
                    ExpiryCase{"StarterKilled", kSetAddress, "192.168.10.20", true, SIGKILL}),
    [](const testing::TestParamInfo<ExpiryCase>& entry) { return std::string(entry.param.name); });

// The failing rollback is run at once, so that the fault cannot race the deadline.
TEST_F(KestcfgConfirmTest, ARollbackThatFailsIsRecordedWithItsReasonAndNotRetried) {
    ASSERT_EQ(
        0,
        RunKestcfg({"set", "eth0", "ip-address=192.168.10.45", "--confirm-within", "60"}).exitCode);
    ASSERT_TRUE(PollUntil([&] { return Watchers().size() == 1; }));
    sysroot_.WriteFile(kStatePath, State() + "\n[Faults]\nSetDeviceIPConfigByIndex = -375566\n");
    const RunResult failed = RunKestcfg({"rollback"});
    EXPECT_EQ(3, failed.exitCode) << failed.err;
    EXPECT_NE(std::string::npos, failed.out.find("Rollback: failed (")) << failed.out;
    ASSERT_TRUE(PollUntil([&] { return Watchers().empty(); }));
    const std::string json = PendingJson();
    EXPECT_NE(std::string::npos, json.find("lastRollback/result=\"failed\"")) << json;
    EXPECT_NE(std::string::npos, json.find("E_FAIL")) << json;
    EXPECT_EQ(std::string::npos, json.find("pending/")) << json;
    EXPECT_NE(std::string::npos, State().find("192.168.10.45"));
    EXPECT_EQ(1u, CountOf(Calls(), "192.168.10.20\t")) << Calls();
    EXPECT_EQ(3, RunKestcfg({"rollback"}).exitCode);
}

}  // namespace

}  // namespace kest::test::cfg
