// kestcfg as a user runs it: the built program, its standard output, error and exit code.
#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

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
          std::vector<std::string>{"--sysroot", "/tmp", "info"},
          std::vector<std::string>{"info", "--sysroot=/tmp", "--plugin", KEST_PLUGIN_PATH}}) {
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
    EXPECT_EQ(result.out, RunKestcfg({"info", "--json"}).out) << "the option after the command";
}

TEST(KestcfgTest, VersionNamesTheToolAndThePlugin) {
    const RunResult result = RunKestcfg({"--version"});
    EXPECT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(std::string("kestcfg 22.5\nplug-in 22.5 (") + KEST_PLUGIN_PATH + ")\n", result.out);
    EXPECT_EQ("kestcfg=\"22.5\"\nplugin=\"22.5\"\npluginPath=\"" KEST_PLUGIN_PATH "\"\n",
              FlattenJson(RunKestcfg({"--json", "--version"}).out));
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

TEST(KestcfgTest, CommandLineMistakesAreUsageErrorsWithAHint) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> mistakes = {
        {{}, "kestcfg"},
        {{"frobnicate"}, "kestcfg"},
        {{"--frobnicate", "info"}, "kestcfg info"},
        {{"--plugin"}, "kestcfg"},
        {{"--plugin="}, "kestcfg"},
        {{"info", "extra"}, "kestcfg info"},
        {{"--sysroot", "/nonexistent/sysroot", "info"}, "kestcfg info"},
        {{"--sysroot", KESTCFG_PATH, "info"}, "kestcfg info"},
        {{"get", "--frobnicate"}, "kestcfg get"},
        {{"refresh", "eth0"}, "kestcfg refresh"},
        {{"set", "eth0"}, "kestcfg set"},
        {{"sim"}, "kestcfg sim"},
        {{"sim", "init"}, "kestcfg sim init"},
        {{"sim", "start", "/tmp/x"}, "kestcfg sim"},
        {{"sim", "init", ""}, "kestcfg sim init"},
    };
    for (const auto& [arguments, topic] : mistakes) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(2, result.exitCode);
        EXPECT_EQ("", result.out);
        EXPECT_EQ(0u, result.err.rfind("kestcfg: ", 0)) << result.err;
        EXPECT_NE(std::string::npos,
                  result.err.find("\nTry '" + topic + " --help' for more information.\n"))
            << result.err;
        std::vector<std::string> withJson = arguments;
        withJson.push_back("--json");
        const std::string flat = FlattenJson(RunKestcfg(withJson).out);
        EXPECT_EQ(0u, flat.find("error/exitStatus=2\nerror/message=\"")) << flat;
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

TEST(KestcfgTest, EveryCommandHasItsOwnHelp) {
    const RunResult overall = RunKestcfg({"--help"});
    EXPECT_EQ(0, overall.exitCode);
    EXPECT_EQ(0u, overall.out.find("Configures a KEST chassis controller")) << overall.out;
    const std::vector<std::pair<std::vector<std::string>, std::string>> commands = {
        {{"info"}, "info"},
        {{"items"}, "items"},
        {{"describe"}, "describe [OPTIONS] [ITEM]"},
        {{"export"}, "export [OPTIONS] [ITEM...]"},
        {{"apply"}, "apply [OPTIONS] FILE"},
        {{"firmware-status"}, "firmware-status"},
        {{"get"}, "get [OPTIONS] [ITEM] [NAME...]"},
        {{"refresh"}, "refresh [OPTIONS] ITEM TAG..."},
        {{"set"}, "set [OPTIONS] ITEM NAME=VALUE..."},
        {{"firmware"}, "firmware [OPTIONS] ITEM IMAGE"},
        {{"sim", "init"}, "sim init [OPTIONS] DIR"},
        {{"confirm"}, "confirm"},
        {{"pending"}, "pending"},
        {{"rollback"}, "rollback"},
    };
    for (const auto& [words, usage] : commands) {
        SCOPED_TRACE(usage);
        EXPECT_NE(std::string::npos, overall.out.find("\n  " + words.front() + " "));
        std::vector<std::string> arguments = words;
        arguments.push_back("--help");
        const RunResult help = RunKestcfg(arguments);
        EXPECT_EQ(0, help.exitCode) << help.err;
        EXPECT_NE(std::string::npos, help.out.find("Usage: kestcfg " + usage)) << help.out;
        EXPECT_EQ("", help.err);
    }
}

}  // namespace

}  // namespace kest::test::cfg
