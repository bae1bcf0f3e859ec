// kestcfg firmware on a demo controller: the image reaches the update tool, the progress is
// followed to the end, and the final state decides the exit code.
#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "kestcfg/KestcfgRunner.h"

namespace {

using kestcfg_test::FlattenJson;
using kestcfg_test::RunKestcfg;
using kestcfg_test::RunResult;

constexpr char kImage[] = "demo firmware\n";

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
    const std::string flat = FlattenJson(result.out);
    EXPECT_NE(std::string::npos, flat.find("item=\"VQ KEST Chassis\"\n")) << flat;
    EXPECT_NE(std::string::npos, flat.find("state=\"failed\"\npercent=-1\n")) << flat;
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
