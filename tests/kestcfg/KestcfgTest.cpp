// kestcfg as a user runs it: the built program, its standard output, error and exit code.
#include <gtest/gtest.h>

#include <iterator>
#include <sstream>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

// The expert's identity and the versions, for people and as JSON, wherever the options stand.
TEST(KestcfgTest, InfoAndVersionPrintTheIdentity) {
    const std::string info =
        "Class identifier:  999d9aa4-5475-4ca7-a560-93c51b5bfceb\n"
        "Display name:      KEST Configuration\n"
        "Version:           22.5\n"
        "Programmatic name: vqsyscfg\n";
    const std::string infoJson =
        "{\"classId\":\"999d9aa4-5475-4ca7-a560-93c51b5bfceb\",\"displayName\":\"KEST "
        "Configuration\",\"version\":\"22.5\",\"programmaticName\":\"vqsyscfg\"}\n";
    const std::vector<std::pair<std::vector<std::string>, std::string>> runs = {
        {{"info"}, info},
        {{"--plugin", KEST_PLUGIN_PATH, "info"}, info},
        {{std::string("--plugin=") + KEST_PLUGIN_PATH, "info"}, info},
        {{"--sysroot", "/tmp", "info"}, info},
        {{"info", "--sysroot=/tmp", "--plugin", KEST_PLUGIN_PATH}, info},
        {{"--json", "info"}, infoJson},
        {{"info", "--json"}, infoJson},
        {{"--version"}, "kestcfg 22.5\nplug-in 22.5 (" KEST_PLUGIN_PATH ")\n"},
    };
    for (const auto& [arguments, expected] : runs) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(0, result.exitCode) << result.err;
        EXPECT_EQ(expected, result.out);
        EXPECT_EQ("", result.err);
    }
    EXPECT_EQ("kestcfg=\"22.5\"\nplugin=\"22.5\"\npluginPath=\"" KEST_PLUGIN_PATH "\"\n",
              FlattenJson(RunKestcfg({"--json", "--version"}).out));
}

// A plug-in that cannot be used, or one without items to show, ends with status 3 and says why.
TEST(KestcfgTest, UnusablePluginsAndEmptyControllersFailWithTheReason) {
    const kest::test::TempSysroot empty;
    ExpectRuns({
        {{"--plugin", "/nonexistent/libplugin.so", "info"},
         3,
         "kestcfg: cannot load the plug-in /nonexistent/libplugin.so: "},
        {{"--plugin", "/nonexistent/libplugin.so", "info"}, 3, "No such file"},
        {{"--plugin", LIBRARY_WITHOUT_FACTORY_PATH, "info"},
         3,
         "kestcfg: the plug-in " LIBRARY_WITHOUT_FACTORY_PATH
         " has no function createKestSysApiChassisExpert"},
        {{"items"}, 3, "kestcfg: the plug-in reports no items"},
        {{"get"}, 3, "kestcfg: the plug-in reports no items"},
    });
}

TEST(KestcfgTest, EveryCommandHasItsOwnHelp) {
    const RunResult overall = RunKestcfg({"--help"});
    EXPECT_EQ(0, overall.exitCode);
    EXPECT_EQ(0u, overall.out.find("Configures a KEST chassis controller")) << overall.out;
    for (const std::string usage :
         {"info", "items", "describe [OPTIONS] [ITEM]", "export [OPTIONS] [ITEM...]",
          "apply [OPTIONS] FILE", "firmware-status", "get [OPTIONS] [ITEM] [NAME...]",
          "refresh [OPTIONS] ITEM TAG...", "set [OPTIONS] ITEM NAME=VALUE...",
          "firmware [OPTIONS] ITEM IMAGE", "sim init [OPTIONS] DIR", "confirm", "pending",
          "rollback"}) {
        SCOPED_TRACE(usage);
        const std::string command = usage.substr(0, usage.find(" ["));
        EXPECT_NE(std::string::npos,
                  overall.out.find("\n  " + usage.substr(0, usage.find(' ')) + " "));
        std::istringstream words(command + " --help");
        const RunResult help = RunKestcfg({std::istream_iterator<std::string>(words), {}});
        EXPECT_EQ(0, help.exitCode) << help.err;
        EXPECT_NE(std::string::npos, help.out.find("Usage: kestcfg " + usage)) << help.out;
        EXPECT_EQ("", help.err);
    }
}

}  // namespace

}  // namespace kest::test::cfg
