// kestcfg as a user runs it: the built program, its standard output, error and exit code.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <spawn.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

extern char** environ;

namespace {

struct RunResult {
    int exitCode = -1;
    std::string out;
    std::string err;
};

std::string ReadWhole(const std::string& path) {
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

// Runs kestcfg with `arguments`, collecting its output in temporary files.
RunResult RunKestcfg(const std::vector<std::string>& arguments) {
    char directory[] = "/tmp/kestcfg-test-XXXXXX";
    EXPECT_NE(nullptr, mkdtemp(directory));
    const std::string outPath = std::string(directory) + "/out";
    const std::string errPath = std::string(directory) + "/err";

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, outPath.c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawn_file_actions_addopen(&actions, 2, errPath.c_str(), O_WRONLY | O_CREAT, 0600);
    std::vector<std::string> words = {KESTCFG_PATH};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& word : words) {
        argv.push_back(word.data());
    }
    argv.push_back(nullptr);

    RunResult result;
    pid_t child = 0;
    const int spawned = posix_spawn(&child, KESTCFG_PATH, &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    EXPECT_EQ(0, spawned);
    int status = 0;
    if (spawned == 0 && waitpid(child, &status, 0) == child && WIFEXITED(status)) {
        result.exitCode = WEXITSTATUS(status);
    }
    result.out = ReadWhole(outPath);
    result.err = ReadWhole(errPath);
    unlink(outPath.c_str());
    unlink(errPath.c_str());
    rmdir(directory);
    return result;
}

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
    };
    for (const std::vector<std::string>& arguments : mistakes) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(2, result.exitCode);
        EXPECT_EQ("", result.out);
        EXPECT_EQ(0u, result.err.rfind("kestcfg: ", 0)) << result.err;
    }
}

TEST(KestcfgTest, HelpListsTheCommands) {
    const RunResult result = RunKestcfg({"--help"});
    EXPECT_EQ(0, result.exitCode);
    EXPECT_EQ(0u, result.out.rfind("usage: kestcfg [--sysroot DIR] [--plugin PATH] [--json] "
                                   "COMMAND",
                                   0));
    EXPECT_NE(std::string::npos, result.out.find("\n  info "));
}

}  // namespace
