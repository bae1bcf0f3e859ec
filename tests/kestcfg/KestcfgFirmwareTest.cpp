// kestcfg firmware on a demo controller: the image reaches the update tool, the progress is
// followed to the end, and the final state decides the exit code. One update runs per
// controller, and the tool goes on when kestcfg is interrupted or killed.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

constexpr char kImage[] = "demo firmware\n";
constexpr char kToolPath[] = "/usr/local/korvane/bin/fwupdate";

class KestcfgFirmwareTest : public DemoControllerTest {
  protected:
    void SetUp() override {
        DemoControllerTest::SetUp();
        sysroot_.WriteFile("/images/firmware.bin", kImage);
    }

    // kestcfg firmware for `item` and the image `image` of the sysroot.
    std::vector<std::string> Firmware(const std::string& item = "eth0",
                                      const std::string& image = "/images/firmware.bin") const {
        return Kestcfg({"firmware", item, sysroot_.PathOf(image)});
    }

    // A stand-in tool that records the staging file's checksum when it starts and again when
    // the test releases it, then exits 0. Unreleased, it gives up after two minutes or more, so
    // that a failing test cannot hang.
    void InstallWaitingTool() const {
        sysroot_.MakeDirectory("/tool");
        sysroot_.WriteScript(kToolPath, "root='" + sysroot_.Root() + "'\n" +
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

    bool ToolHas(const char* mark) const { return sysroot_.Exists(std::string("/tool/") + mark); }
    void ReleaseTool() const { sysroot_.WriteFile("/tool/release", ""); }
};

TEST_F(KestcfgFirmwareTest, InstallsTheImageWithTheDemoToolAndShowsProgress) {
    const RunResult result = RunProgram(Firmware());
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(0u, result.out.find("firmware update {")) << result.out;
    EXPECT_NE(std::string::npos, result.out.find("} of eth0: installed\n")) << result.out;
    EXPECT_NE(std::string::npos, result.out.find("Restart the controller")) << result.out;
    // Not a terminal: plain progress lines, no bar and no carriage returns.
    EXPECT_NE(std::string::npos, result.err.find("kestcfg: 5% running\n")) << result.err;
    EXPECT_EQ(std::string::npos, result.err.find('\r'));
    EXPECT_EQ(sysroot_.PathOf("/var/volatile/tmp/kestsysxp.fwupdate.cfg") + " 3\n",
              sysroot_.ReadFile("/var/log/fwupdate.log"));
    EXPECT_EQ(kImage, sysroot_.ReadFile("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
}

TEST_F(KestcfgFirmwareTest, ReportsAFailingToolAsJsonAndExitsWithFailure) {
    sysroot_.WriteScript(kToolPath, "exit 1\n");
    const RunResult result = RunKestcfg(
        {"--json", "firmware", "VQ KEST Chassis", sysroot_.PathOf("/images/firmware.bin")});
    EXPECT_EQ(3, result.exitCode);
    const std::string flat = FlattenJson(result.out);
    EXPECT_NE(std::string::npos, flat.find("item=\"VQ KEST Chassis\"\n")) << flat;
    EXPECT_NE(std::string::npos, flat.find("state=\"failed\"\npercent=-1\n")) << flat;
    EXPECT_FALSE(sysroot_.Exists("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
}

TEST_F(KestcfgFirmwareTest, UnusableImagesAreRefusedWithTheirPathBeforeAnythingStarts) {
    RunResult result = RunProgram(Firmware("eth9"));
    EXPECT_EQ(3, result.exitCode);
    EXPECT_NE(std::string::npos, result.err.find("there is no item eth9")) << result.err;
    sysroot_.WriteFile("/images/empty.bin", "");
    ASSERT_EQ(0, mkfifo(sysroot_.PathOf("/images/fifo").c_str(), 0600));
    const std::vector<std::pair<std::string, std::string>> images = {
        {sysroot_.PathOf("/images/missing.bin"), ": No such file or directory"},
        {sysroot_.PathOf("/images"), " is a directory, not a regular file"},
        {sysroot_.PathOf("/images/fifo"), " is a FIFO, not a regular file"},
        {sysroot_.PathOf("/images/empty.bin"), " is empty"},
        {"/dev/zero", " is a device, not a regular file"},
    };
    for (const auto& [image, problem] : images) {
        SCOPED_TRACE(image);
        result = RunKestcfg({"firmware", "eth0", image, "--json"});
        EXPECT_EQ(2, result.exitCode);
        EXPECT_NE(std::string::npos, result.err.find(image + problem)) << result.err;
        EXPECT_NE(std::string::npos, FlattenJson(result.out).find("error/exitStatus=2\n"));
    }
    EXPECT_FALSE(sysroot_.Exists("/var/log/fwupdate.log"));
}

TEST_F(KestcfgFirmwareTest, FirmwareStatusShowsTheLockHolderAndTheStage) {
    const RunResult idle = RunKestcfg({"firmware-status"});
    EXPECT_EQ(0, idle.exitCode) << idle.err;
    EXPECT_EQ("No firmware update is running.\nStatus file: none\n", idle.out);

    // An update whose kestcfg is gone: the lock is held by the tool, which keeps the stage.
    sysroot_.WriteFile("/var/run/firmware_update/status", "3\n");
    sysroot_.WriteFile("/var/run/firmware_update/update.lock", "4242\n");
    const int lock =
        open(sysroot_.PathOf("/var/run/firmware_update/update.lock").c_str(), O_RDONLY);
    ASSERT_EQ(0, flock(lock, LOCK_EX | LOCK_NB));
    const RunResult running = RunKestcfg({"firmware-status"});
    EXPECT_EQ(
        "A firmware update is running (started by process 4242).\n"
        "Status file: 3, stage 3 of 5\n",
        running.out);
    EXPECT_EQ("running=true\npid=4242\nstatusCode=\"3\"\nstage=\"stage 3 of 5\"\n",
              FlattenJson(RunKestcfg({"firmware-status", "--json"}).out));
    close(lock);
    EXPECT_EQ(0u, RunKestcfg({"firmware-status"}).out.find("No firmware update is running."));
}

// The orphaned tool of a killed kestcfg keeps other updates out until it ends.
TEST_F(KestcfgFirmwareTest, OneUpdateAtATimeAlsoAfterItsKestcfgIsKilled) {
    InstallWaitingTool();
    sysroot_.WriteFile("/images/second.bin", "another image\n");
    RunningProgram first = StartProgram(Firmware(), true);
    ASSERT_TRUE(PollUntil([&] { return ToolHas("started"); }));
    const RunResult second = RunProgram(Firmware("eth0", "/images/second.bin"));
    EXPECT_EQ(4, second.exitCode) << second.err;
    EXPECT_NE(std::string::npos, second.err.find("another firmware update")) << second.err;
    ASSERT_EQ(0, kill(first.pid, SIGKILL));
    FinishProgram(first);
    EXPECT_EQ(4, RunProgram(Firmware("eth0", "/images/second.bin")).exitCode);
    EXPECT_EQ(0u, RunKestcfg({"firmware-status"}).out.find("A firmware update is running"));
    ReleaseTool();
    ASSERT_TRUE(PollUntil([&] {
        return ToolHas("finished") &&
               RunKestcfg({"firmware-status"}).out.rfind("No firmware update is running.", 0) == 0;
    }));
    EXPECT_EQ(sysroot_.ReadFile("/tool/sum.start"), sysroot_.ReadFile("/tool/sum.end"));
    EXPECT_EQ(kImage, sysroot_.ReadFile("/var/volatile/tmp/kestsysxp.fwupdate.cfg"));
    EXPECT_EQ(0, RunProgram(Firmware()).exitCode);
}

class KestcfgFirmwareInterruptTest : public KestcfgFirmwareTest,
                                     public testing::WithParamInterface<int> {};

// Signals to kestcfg's whole process group, as a terminal sends them: the first Ctrl-C is
// answered, the next signal ends kestcfg, and the tool finishes in its own session.
TEST_P(KestcfgFirmwareInterruptTest, TheToolFinishesItsStages) {
    InstallWaitingTool();
    RunningProgram running = StartProgram(Firmware(), true);
    ASSERT_TRUE(PollUntil([&] { return ToolHas("started"); }));
    ASSERT_EQ(0, kill(-running.pid, SIGINT));
    ASSERT_TRUE(PollUntil(
        [&] { return running.ErrorSoFar().find("cannot be cancelled") != std::string::npos; }));
    ASSERT_EQ(0, kill(-running.pid, GetParam()));
    const RunResult result = FinishProgram(running);
    EXPECT_EQ(128 + GetParam(), result.exitCode) << result.err;
    ReleaseTool();
    EXPECT_TRUE(PollUntil([&] { return ToolHas("finished"); }));
    EXPECT_EQ(sysroot_.ReadFile("/tool/sum.start"), sysroot_.ReadFile("/tool/sum.end"));
}

INSTANTIATE_TEST_SUITE_P(SecondSignal, KestcfgFirmwareInterruptTest,
                         testing::Values(SIGINT, SIGHUP, SIGTERM),
                         [](const testing::TestParamInfo<int>& entry) {
                             return std::string(sigabbrev_np(entry.param));
                         });

}  // namespace

}  // namespace kest::test::cfg
