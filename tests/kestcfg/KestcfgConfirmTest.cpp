// Changes that undo themselves unless confirmed: confirm, expiry, the watcher (a second kestcfg)
// outliving the kestcfg that started it, one pending change at a time, and a failing rollback.
#include <dirent.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
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
        DIR* proc = opendir("/proc");
        while (dirent* entry = proc != nullptr ? readdir(proc) : nullptr) {
            const pid_t pid = atoi(entry->d_name);
            std::string line =
                pid > 0 ? ReadWhole("/proc/" + std::to_string(pid) + "/cmdline") : "";
            std::replace(line.begin(), line.end(), '\0', ' ');
            if (line.find(sysroot_.Root() + " rollback --watch") != std::string::npos) {
                pids.push_back(pid);
            }
        }
        if (proc != nullptr) {
            closedir(proc);
        }
        return pids;
    }

    std::string PendingJson() const { return FlattenJson(RunKestcfg({"pending", "--json"}).out); }
    bool RolledBack() const { return sysroot_.Exists(kLastRollback) && !sysroot_.Exists(kPending); }
};

TEST_F(KestcfgConfirmTest, ConfirmedInTimeTheChangeStaysAndOnlyOneChangeIsPending) {
    const RunResult set =
        RunKestcfg({"set", "eth0", "ip-address=192.168.10.41", "--confirm-within", "60"});
    ASSERT_EQ(0, set.exitCode) << set.err;
    EXPECT_NE(std::string::npos, set.out.find("Run 'kestcfg confirm' before ")) << set.out;
    struct stat status {};
    ASSERT_EQ(0, stat(sysroot_.PathOf(kPending).c_str(), &status));
    EXPECT_EQ(0600u, status.st_mode & 0777);
    ASSERT_TRUE(PollUntil([&] { return Watchers().size() == 1; }));

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
};

class KestcfgExpiryTest : public KestcfgConfirmTest,
                          public testing::WithParamInterface<ExpiryCase> {};

TEST_P(KestcfgExpiryTest, UnconfirmedTheSavedSettingsReturnOnce) {
    sysroot_.WriteFile("/settings.json",
                       R"({"items": {"VQ KEST Chassis": {"host-name": "kest-b"}}})");
    std::vector<std::string> arguments = GetParam().arguments;
    std::replace(arguments.begin(), arguments.end(), std::string("{FILE}"),
                 sysroot_.PathOf("/settings.json"));
    arguments.insert(arguments.end(), {"--confirm-within", "1"});
    const RunResult changed = RunKestcfg(arguments);
    ASSERT_EQ(0, changed.exitCode) << changed.err;
    const size_t restarts = CountOf(Calls(), kInterfaceUp);
    ASSERT_TRUE(PollUntil([&] { return RolledBack(); }));
    ASSERT_TRUE(PollUntil([&] { return Watchers().empty(); }));
    EXPECT_NE(std::string::npos, State().find(GetParam().restored)) << State();
    EXPECT_EQ(restarts + (GetParam().restartsInterface ? 1 : 0), CountOf(Calls(), kInterfaceUp));
    EXPECT_NE(std::string::npos, PendingJson().find("lastRollback/result=\"restored\""));
    EXPECT_EQ(0u, RunKestcfg({"pending"}).out.find("Last rollback: "));
    const RunResult late = RunKestcfg({"confirm"});
    EXPECT_EQ(3, late.exitCode);
    EXPECT_NE(std::string::npos, late.err.find("rolled back")) << late.err;
}

INSTANTIATE_TEST_SUITE_P(
    Commands, KestcfgExpiryTest,
    testing::Values(ExpiryCase{"SetAddress",
                               {"set", "eth0", "ip-address=192.168.10.43"},
                               "192.168.10.20",
                               true},
                    ExpiryCase{"ApplyHostName", {"apply", "{FILE}"}, "HostName=kest-demo", false}),
    [](const testing::TestParamInfo<ExpiryCase>& entry) { return std::string(entry.param.name); });

class KestcfgWatcherSurvivesTest : public KestcfgConfirmTest,
                                   public testing::WithParamInterface<int> {};

// The signal goes to the starting kestcfg's process group, as a dropped session or a kill does.
TEST_P(KestcfgWatcherSurvivesTest, TheStarterEndingByASignal) {
    RunningProgram starter = StartProgram(
        Kestcfg({"set", "eth0", "ip-address=192.168.10.44", "--confirm-within", "2"}), true);
    ASSERT_TRUE(PollUntil([&] { return !Watchers().empty(); }));
    kill(GetParam() == SIGKILL ? starter.pid : -starter.pid, GetParam());
    FinishProgram(starter);
    ASSERT_TRUE(PollUntil([&] { return RolledBack(); }));
    EXPECT_NE(std::string::npos, State().find("192.168.10.20")) << State();
    EXPECT_NE(std::string::npos, State().find("InterfaceUp=1")) << State();
}

INSTANTIATE_TEST_SUITE_P(Signals, KestcfgWatcherSurvivesTest, testing::Values(SIGHUP, SIGKILL),
                         [](const testing::TestParamInfo<int>& entry) {
                             return std::string(sigabbrev_np(entry.param));
                         });

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

// A remote shell waits until every holder of the command's output has closed it.
TEST_F(KestcfgConfirmTest, ACallerReadingThroughAPipeIsNotKeptWaiting) {
    int pipeEnds[2];
    ASSERT_EQ(0, pipe(pipeEnds));
    const pid_t child = fork();
    if (child == 0) {
        dup2(pipeEnds[1], 1);
        dup2(pipeEnds[1], 2);
        close(pipeEnds[0]);
        close(pipeEnds[1]);
        execl(KESTCFG_PATH, KESTCFG_PATH, "set", "eth0", "polling-interval=250", "--confirm-within",
              "60", static_cast<char*>(nullptr));
        _exit(127);
    }
    close(pipeEnds[1]);
    std::string output;
    char block[256];
    for (ssize_t count; (count = read(pipeEnds[0], block, sizeof block)) > 0;) {
        output.append(block, static_cast<size_t>(count));
    }
    close(pipeEnds[0]);
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_EQ(0, WEXITSTATUS(status)) << output;
    const std::vector<pid_t> watchers = Watchers();
    ASSERT_EQ(1u, watchers.size()) << output;
    const std::string descriptors = "/proc/" + std::to_string(watchers[0]) + "/fd";
    DIR* directory = opendir(descriptors.c_str());
    ASSERT_NE(nullptr, directory);
    while (dirent* entry = readdir(directory)) {
        char target[4096] = {};
        readlinkat(dirfd(directory), entry->d_name, target, sizeof target - 1);
        EXPECT_EQ(std::string::npos, std::string(target).find("pipe:")) << entry->d_name;
        if (atoi(entry->d_name) <= 2 && entry->d_name[0] != '.') {
            EXPECT_STREQ("/dev/null", target) << entry->d_name;
        }
    }
    closedir(directory);
    EXPECT_EQ(0, RunKestcfg({"confirm"}).exitCode);
}

}  // namespace

}  // namespace kest::test::cfg
