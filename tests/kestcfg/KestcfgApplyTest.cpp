// kestcfg export and apply between demo controllers: desired state, checked before anything is
// persisted, and idempotent.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

class KestcfgApplyTest : public DemoControllerTest {
  protected:
    // Runs kestcfg on the second controller.
    RunResult OnSecond(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"--sysroot", second_.Root()});
        return RunKestcfg(arguments);
    }

    void SetUp() override {
        DemoControllerTest::SetUp();
        kest::hostkit::CreateDemoController(second_.Root(),
                                            KESTCFG_SOURCE_DATA_DIR "/timezone.ini");
        // The second sysroot took over KEST_SYSROOT; the tests use the first one by default.
        setenv("KEST_SYSROOT", sysroot_.Root().c_str(), 1);
    }

    kest::test::TempSysroot second_;
};

TEST_F(KestcfgApplyTest, AnExportAppliedToASecondControllerReproducesItsSettingsOnce) {
    ASSERT_EQ(0, RunKestcfg({"set", "chassis", "host-name=line-7", "comment=Bay 7"}).exitCode);
    ASSERT_EQ(
        0, RunKestcfg({"set", "eth0", "polling-interval=70", "ip-address=192.168.10.77"}).exitCode);
    const RunResult exported = RunKestcfg({"export"});
    ASSERT_EQ(0, exported.exitCode) << exported.err;
    EXPECT_EQ(std::string::npos, exported.out.find("current-time"));
    EXPECT_NE(std::string::npos, FlattenJson(exported.out).find("items/eth0/adapter-mode=2\n"));
    sysroot_.WriteFile("/settings.json", exported.out);
    const std::string file = sysroot_.PathOf("/settings.json");

    const std::string untouched = second_.ReadFile(kStatePath);
    const RunResult checked = OnSecond({"apply", "--check", file});
    EXPECT_EQ(0, checked.exitCode) << checked.err;
    EXPECT_NE(std::string::npos, checked.out.find("eth0: polling-interval: 100 -> 70\n"))
        << checked.out;
    EXPECT_NE(std::string::npos, checked.out.find("nothing was changed (--check)"));
    EXPECT_EQ(untouched, second_.ReadFile(kStatePath));

    const RunResult applied = OnSecond({"apply", file});
    EXPECT_EQ(0, applied.exitCode) << applied.err;
    EXPECT_NE(std::string::npos, applied.out.find("VQ KEST Chassis: host-name set to line-7\n"));
    EXPECT_EQ(std::string::npos, applied.out.find("locale")) << "only what differs";
    EXPECT_EQ(std::string::npos, applied.out.find(" -> ")) << "differences only with --diff";
    EXPECT_EQ(exported.out, OnSecond({"export"}).out);

    const size_t settersBefore = CountOf(second_.ReadFile(kCallLog), "\tSet");
    const RunResult again = OnSecond({"--json", "apply", file});
    EXPECT_EQ(0, again.exitCode) << again.err;
    EXPECT_EQ("check=false\n", FlattenJson(again.out)) << "no differences, nothing applied";
    EXPECT_EQ(settersBefore, CountOf(second_.ReadFile(kCallLog), "\tSet"));
}

TEST_F(KestcfgApplyTest, OneRejectedValueInATwoItemFilePersistsNothing) {
    sysroot_.WriteFile("/bad.json",
                       R"({"items": {"chassis": {"comment": "new"},
                                     "eth0": {"polling-mode": "polling", "polling-interval": 0}}})");
    const std::string before = State();
    const size_t settersBefore = CountOf(Calls(), "\tSet");
    const RunResult result = RunKestcfg({"apply", sysroot_.PathOf("/bad.json")});
    EXPECT_EQ(1, result.exitCode);
    EXPECT_NE(std::string::npos,
              result.err.find("eth0 rejected the change with UX_E_VALUE_INVALID (0x8004037F): "
                              "Polling interval must be between 1 and 10000 ms. (property "
                              "polling-interval); nothing was persisted"))
        << result.err;
    EXPECT_EQ(before, State());
    EXPECT_EQ(settersBefore, CountOf(Calls(), "\tSet"));
    const std::string flat =
        FlattenJson(RunKestcfg({"apply", "--json", sysroot_.PathOf("/bad.json")}).out);
    EXPECT_NE(std::string::npos,
              flat.find("rejected/item=\"eth0\"\nrejected/property=\"polling-interval\"\n"))
        << flat;
}

TEST_F(KestcfgApplyTest, FilesThatCannotBeAppliedAreUsageErrorsNamingTheProblem) {
    const std::vector<std::pair<std::string, std::string>> files = {
        {"not json", "is not JSON"},
        {"[]", "holds no \"items\" object"},
        {R"({"items": {"eth9": {}, "eth0": {"mac-address": "x", "frob": 1}}})",
         "names what cannot be set (see kestcfg describe): item eth9, eth0 property "
         "mac-address, eth0 property frob"},
        {R"({"items": {"chassis": {"current-time": "now"}}})", "chassis property current-time"},
        {R"({"items": {"eth0": {"polling-interval": "often"}}})",
         "bad value for eth0 property polling-interval"},
        {R"({"items": {"eth0": {"polling-mode": "sometimes"}}})",
         "expected a mode name (off, polling) or number"},
        {R"({"items": {"chassis": {"web-service": 1}}})", "bad value for chassis property"},
    };
    const std::string before = State();
    for (const auto& [content, message] : files) {
        SCOPED_TRACE(content);
        sysroot_.WriteFile("/file.json", content);
        const RunResult result = RunKestcfg({"apply", sysroot_.PathOf("/file.json")});
        EXPECT_EQ(2, result.exitCode);
        EXPECT_NE(std::string::npos, result.err.find(message)) << result.err;
    }
    EXPECT_EQ(2, RunKestcfg({"apply", sysroot_.PathOf("/missing.json")}).exitCode);
    EXPECT_EQ(before, State());
}

}  // namespace

}  // namespace kest::test::cfg
