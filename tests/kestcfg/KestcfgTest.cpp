// kestcfg as a user runs it: the built program, its standard output, error and exit code.
#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "kestcfg/KestcfgRunner.h"

namespace {

using kestcfg_test::RunKestcfg;
using kestcfg_test::RunResult;

TEST(KestcfgTest, InfoPrintsTheExpertsIdentity) {
    const std::string expected =
        "Class identifier:  999d9aa4-5475-4ca7-a560-93c51b5bfceb\n"
        "Display name:      KEST Configuration\n"
        "Version:           22.5\n"
        "Programmatic name: vqsyscfg\n";
    for (const auto& arguments :
         {std::vector<std::string>{"info"},
          std::vector<std::string>{"--plugin", KEST_PLUGIN_PATH, "info"},
          std::vector<std::string>{std::string("--plugin=") + KEST_PLUGIN_PATH, "info"},
          std::vector<std::string>{"--sysroot", "/tmp", "info"}}) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(0, result.exitCode) << result.err;
        EXPECT_EQ(expected, result.out);
        EXPECT_EQ("", result.err);
    }
}

TEST(KestcfgTest, InfoAsJson) {
    const RunResult result = RunKestcfg({"--json", "info"});
    EXPECT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(
        "{\"classId\":\"999d9aa4-5475-4ca7-a560-93c51b5bfceb\",\"displayName\":\"KEST "
        "Configuration\",\"version\":\"22.5\",\"programmaticName\":\"vqsyscfg\"}\n",
        result.out);
}

TEST(KestcfgTest, UnloadablePluginIsNamedWithTheLoadersReason) {
    const RunResult missing = RunKestcfg({"--plugin", "/nonexistent/libplugin.so", "info"});
    EXPECT_EQ(3, missing.exitCode);
    EXPECT_EQ("", missing.out);
    EXPECT_NE(std::string::npos,
              missing.err.find("kestcfg: cannot load the plug-in /nonexistent/libplugin.so: "))
        << missing.err;
    EXPECT_NE(std::string::npos, missing.err.find("No such file")) << missing.err;

    const RunResult noFactory = RunKestcfg({"--plugin", LIBRARY_WITHOUT_FACTORY_PATH, "info"});
    EXPECT_EQ(3, noFactory.exitCode);
    EXPECT_NE(
        std::string::npos,
        noFactory.err.find(std::string("kestcfg: the plug-in ") + LIBRARY_WITHOUT_FACTORY_PATH +
                           " has no function createKestSysApiChassisExpert"))
        << noFactory.err;
}

TEST(KestcfgTest, CommandLineMistakesAreUsageErrors) {
    const std::vector<std::vector<std::string>> mistakes = {
        {},
        {"--json"},
        {"frobnicate"},
        {"--frobnicate", "info"},
        {"--plugin"},
        {"--plugin="},
        {"info", "extra"},
        {"--sysroot", "/nonexistent/sysroot", "info"},
        {"--sysroot", KESTCFG_PATH, "info"},
        {"get", "a", "b"},
        {"refresh", "eth0"},
        {"set", "eth0"},
        {"sim"},
        {"sim", "init"},
        {"sim", "start", "/tmp/x"},
        {"sim", "init", ""},
    };
    for (const std::vector<std::string>& arguments : mistakes) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(2, result.exitCode);
        EXPECT_EQ("", result.out);
        EXPECT_EQ(0u, result.err.rfind("kestcfg: ", 0)) << result.err;
    }
}

TEST(KestcfgTest, ASysrootWithoutAControllerHasNoItemsToShow) {
    const kest::test::TempSysroot empty;
    for (const char* command : {"items", "get"}) {
        const RunResult result = RunKestcfg({"--sysroot", empty.Root(), command});
        EXPECT_EQ(3, result.exitCode) << command;
        EXPECT_EQ("", result.out);
        EXPECT_NE(std::string::npos, result.err.find("kestcfg: the plug-in reports no items"))
            << result.err;
    }
}

TEST(KestcfgTest, HelpListsTheCommands) {
    const RunResult result = RunKestcfg({"--help"});
    EXPECT_EQ(0, result.exitCode);
    EXPECT_EQ(0u, result.out.rfind("usage: kestcfg [--sysroot DIR] [--plugin PATH] [--json] "
                                   "[--no-wait] COMMAND",
                                   0));
    for (const char* command : {"info", "items", "get [ITEM]", "refresh ITEM TAG...",
                                "set ITEM NAME=VALUE...", "sim init DIR"}) {
        EXPECT_NE(std::string::npos, result.out.find(std::string("\n  ") + command + " "))
            << command;
    }
}

}  // namespace
