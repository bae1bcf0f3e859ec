// kestcfg firmware on a demo controller: the image reaches the update tool, the progress is
// followed to the end, and the final state decides the exit code. One update runs per
// controller, and the tool goes on when kestcfg is interrupted or killed.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/file.h>
#include <unistd.h>

#include "common/TempSysroot.h"
#include "kestcfg/KestcfgRunner.h"

namespace {

using kestcfg_test::FinishProgram;
using kestcfg_test::FlattenJsonLines;
using kestcfg_test::PollUntil;
using kestcfg_test::RunKestcfg;
using kestcfg_test::RunningProgram;
using kestcfg_test::RunResult;
using kestcfg_test::StartKestcfg;

constexpr char kImage[] = "demo firmware\n";
constexpr char kToolPath[] = "/usr/local/korvane/bin/fwupdate";

class KestcfgFirmwareTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_EQ(0, RunKestcfg({"sim", "init", sysroot.Root()}).exitCode);
        sysroot.WriteFile("/images/firmware.bin", kImage);
    }

    RunResult Install(const std::vector<std::string>& options, const std::string& item) {
        std::vector<std::string> arguments = {"--sysroot", sysroot.Root()};
        arguments.insert(arguments.end(), options.begin(), options.end());
        arguments.insert(arguments.end(),
                         {"firmware", item, sysroot.PathOf("/images/firmware.bin")});
        return RunKestcfg(arguments);
    }

    // The arguments of kestcfg firmware for eth0 and the image file `image`.
    std::vector<std::string> FirmwareArguments(const std::string& image) const {
        return {"--sysroot", sysroot.Root(), "firmware", "eth0", sysroot.PathOf(image)};
    }

    // A stand-in tool that records the staging file's checksum when it starts and again when
    // the test releases it, then exits 0. Unreleased, it gives up after two minutes or more, so
    // that a failing test cannot hang.
    void InstallWaitingTool() const {
        sysroot.MakeDirectory("/tool");
        sysroot.WriteScript(kToolPath, "root='" + sysroot.Root() +
                                           "'\n"
                                           "cksum < \"$1\" > \"$root/tool/sum.start\"\n"
                                           ": > \"$root/tool/started\"\n"
                                           "n=0\n"
                                           "while [ ! -e \"$root/tool/release\" ]; do\n"
                                           "    [ $((n += 1)) -gt 6000 ] && exit 1\n"
                                           "    sleep 0.02\n"
                                           "done\n"
                                           "cksum < \"$1\" > \"$root/tool/sum.end\"\n"
                                           ": > \"$root/tool/finished\"\n");
    }

    bool ToolHas(const char* mark) const { return sysroot.Exists(std::string("/tool/") + mark); }
    void ReleaseTool() const { sysroot.WriteFile("/tool/release", ""); }

    // Whether some process holds the controller's firmware update lock.
    bool UpdateLockHeld() const {
        const int file = open(sysroot.PathOf("/var/run/firmware_update/update.lock").c_str(),
                              O_RDONLY | O_CLOEXEC);
        const bool held = file >= 0 && flock(file, LOCK_SH | LOCK_NB) != 0;
        if (file >= 0) {
            close(file);
        }
        return held;
    }

    kest::test::TempSysroot sysroot;
};

TEST_F(KestcfgFirmwareTest, InstallsTheImageWithTheDemoToolAndShowsProgress) {
    const RunResult result = Install({}, "eth0");
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(0u, result.out.find("firmware update {")) << result.out;
    EXPECT_NE(std::string::npos, result.out.find("} of eth0: installed\n")) << result.out;
    EXPECT_NE(std::string::npos, result.err.find("% running")) << result.err;
    EXPECT_NE(std::string::npos, result.err.find("]  90% installed\n")) << result.err;
    EXPECT_EQ(sysroot.PathOf("/var/volatile/tmp/kestsysxp.fwupdate.cfg") + " 3\n",
              sysroot.ReadFile("/var/log/fwupdate.log"));
    EXPECT_EQ(kImage, sysroot.ReadFile("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
}

TEST_F(KestcfgFirmwareTest, ReportsAFailingToolAsJsonAndExitsWithFailure) {
    sysroot.WriteScript("/usr/local/korvane/bin/fwupdate", "exit 1\n");
    const RunResult result = Install({"--json"}, "VQ KEST Chassis");
    EXPECT_EQ(3, result.exitCode);
    const std::string flat = FlattenJsonLines(result.out);
    EXPECT_NE(std::string::npos, flat.find("0/item=\"VQ KEST Chassis\"\n")) << flat;
    EXPECT_NE(std::string::npos, flat.find("0/state=\"failed\"\n0/percent=-1\n")) << flat;
    EXPECT_FALSE(sysroot.Exists("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
}

TEST_F(KestcfgFirmwareTest, RefusesAnUnknownItemOrAMissingImage) {
    RunResult result = Install({}, "eth9");
    EXPECT_EQ(3, result.exitCode);
    EXPECT_NE(std::string::npos, result.err.find("there is no item eth9")) << result.err;
    result = RunKestcfg(
        {"--sysroot", sysroot.Root(), "firmware", "eth0", sysroot.PathOf("/images/missing.bin")});
    EXPECT_EQ(3, result.exitCode);
    EXPECT_NE(std::string::npos, result.err.find("cannot open the firmware image")) << result.err;
    EXPECT_FALSE(sysroot.Exists("/var/log/fwupdate.log"));
}

}  // namespace

namespace {

TEST_F(KestcfgFirmwareTest, ASecondUpdateIsRefusedAsBusyWhileTheFirstToolReadsItsImage) {
    InstallWaitingTool();
    sysroot.WriteFile("/images/second.bin", "another image\n");
    RunningProgram first = StartKestcfg(FirmwareArguments("/images/firmware.bin"));
    ASSERT_TRUE(PollUntil([&] { return ToolHas("started"); }));
    const RunResult second = RunKestcfg(FirmwareArguments("/images/second.bin"));
    EXPECT_EQ(4, second.exitCode) << second.err;
    EXPECT_NE(std::string::npos, second.err.find("another firmware update")) << second.err;
    ReleaseTool();
    const RunResult result = FinishProgram(first);
    EXPECT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    EXPECT_EQ(kImage, sysroot.ReadFile("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
}

TEST_F(KestcfgFirmwareTest, AfterKestcfgIsKilledTheOrphanedToolKeepsOtherUpdatesOut) {
    InstallWaitingTool();
    RunningProgram killed = StartKestcfg(FirmwareArguments("/images/firmware.bin"), true);
    ASSERT_TRUE(PollUntil([&] { return ToolHas("started"); }));
    ASSERT_EQ(0, kill(killed.pid, SIGKILL));
    FinishProgram(killed);
    const RunResult refused = RunKestcfg(FirmwareArguments("/images/firmware.bin"));
    EXPECT_EQ(4, refused.exitCode) << refused.err;
    ReleaseTool();
    ASSERT_TRUE(PollUntil([&] { return ToolHas("finished") && !UpdateLockHeld(); }));
    const RunResult accepted = RunKestcfg(FirmwareArguments("/images/firmware.bin"));
    EXPECT_EQ(0, accepted.exitCode) << accepted.err;
}

class KestcfgFirmwareInterruptTest : public KestcfgFirmwareTest,
                                     public testing::WithParamInterface<int> {};

// Signals to kestcfg's whole process group, as a terminal sends them: the first Ctrl-C is
// answered, the next signal ends kestcfg, and the tool finishes in its own session.
TEST_P(KestcfgFirmwareInterruptTest, TheToolFinishesItsStages) {
    InstallWaitingTool();
    RunningProgram running = StartKestcfg(FirmwareArguments("/images/firmware.bin"), true);
    ASSERT_TRUE(PollUntil([&] { return ToolHas("started"); }));
    ASSERT_EQ(0, kill(-running.pid, SIGINT));
    ASSERT_TRUE(PollUntil([&] {
        return kestcfg_test::ErrorOutputSoFar(running).find("cannot be cancelled") !=
               std::string::npos;
    }));
    ASSERT_EQ(0, kill(-running.pid, GetParam()));
    const RunResult result = FinishProgram(running);
    EXPECT_EQ(128 + GetParam(), result.exitCode) << result.err;
    ReleaseTool();
    EXPECT_TRUE(PollUntil([&] { return ToolHas("finished"); }));
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
}

INSTANTIATE_TEST_SUITE_P(SecondSignal, KestcfgFirmwareInterruptTest,
                         testing::Values(SIGINT, SIGHUP, SIGTERM),
                         [](const testing::TestParamInfo<int>& entry) {
                             return std::string(sigabbrev_np(entry.param));
                         });

}  // namespace
