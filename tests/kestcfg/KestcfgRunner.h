// Running the built kestcfg as a user does, on a demo controller in a temporary sysroot: its
// standard output, error and exit code, and its --json output read as one JSON document.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <functional>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

#include "common/TempSysroot.h"
#include "hostkit/DemoController.h"

extern char** environ;

namespace kest::test::cfg {

struct RunResult {
    int exitCode = -1;  // -1 when a signal ended the program
    std::string out;
    std::string err;
};

inline std::string ReadWhole(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

// A program started in the background, its output collected in "out" and "err" in `directory`.
struct RunningProgram {
    pid_t pid = -1;
    std::string directory;
    std::string ErrorSoFar() const { return ReadWhole(directory + "/err"); }
};

// Starts `command` (the program's path first) with `environment`; with `ownProcessGroup` the
// program leads a process group of its own, as a shell's foreground job does.
inline RunningProgram StartProgram(std::vector<std::string> command, bool ownProcessGroup = false,
                                   char* const* environment = environ) {
    char directory[] = "/tmp/kestcfg-test-XXXXXX";
    EXPECT_NE(nullptr, mkdtemp(directory));
    RunningProgram running{-1, directory};
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    for (const auto& [descriptor, name] : {std::pair{1, "/out"}, std::pair{2, "/err"}}) {
        posix_spawn_file_actions_addopen(&actions, descriptor, (running.directory + name).c_str(),
                                         O_WRONLY | O_CREAT, 0600);
    }
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    posix_spawnattr_setflags(&attributes, ownProcessGroup ? POSIX_SPAWN_SETPGROUP : 0);
    std::vector<char*> argv;
    for (std::string& word : command) {
        argv.push_back(word.data());
    }
    argv.push_back(nullptr);
    if (posix_spawn(&running.pid, argv[0], &actions, &attributes, argv.data(), environment) != 0) {
        ADD_FAILURE() << "cannot start " << command[0];
        running.pid = -1;
    }
    posix_spawn_file_actions_destroy(&actions);
    posix_spawnattr_destroy(&attributes);
    return running;
}

// Waits for a started program and collects its output.
inline RunResult FinishProgram(RunningProgram& running) {
    RunResult result;
    int status = 0;
    if (running.pid > 0 && waitpid(running.pid, &status, 0) == running.pid && WIFEXITED(status)) {
        result.exitCode = WEXITSTATUS(status);
    }
    running.pid = -1;
    result.out = ReadWhole(running.directory + "/out");
    result.err = running.ErrorSoFar();
    std::filesystem::remove_all(running.directory);
    return result;
}

inline RunResult RunProgram(const std::vector<std::string>& command,
                            char* const* environment = environ) {
    RunningProgram running = StartProgram(command, false, environment);
    return FinishProgram(running);
}

// The command that runs the kestcfg at `program` with `arguments`; under an emulator (a cross
// build), through the same emulator command.
inline std::vector<std::string> Kestcfg(const std::vector<std::string>& arguments,
                                        const std::string& program = KESTCFG_PATH) {
    std::vector<std::string> command = {KEST_TEST_EMULATOR};
    command.push_back(program);
    command.insert(command.end(), arguments.begin(), arguments.end());
    return command;
}

inline RunResult RunKestcfg(const std::vector<std::string>& arguments,
                            char* const* environment = environ) {
    return RunProgram(Kestcfg(arguments), environment);
}

// How many times `part` occurs in `text`, overlaps included.
inline size_t CountOf(const std::string& text, const std::string& part) {
    size_t count = 0;
    for (size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1)) {
        ++count;
    }
    return count;
}

// False under an emulator (a cross build, where the kernel does not start foreign binaries by
// itself): there a kestcfg cannot start another kestcfg, such as the watcher of a change.
inline bool KestcfgStartsItself() {
    return std::vector<std::string>{KEST_TEST_EMULATOR}.empty();
}

// Polls `condition` every 10 ms, at most `limitMs`; true once it holds.
template <class Condition>
bool PollUntil(Condition condition, int limitMs = 60000) {
    for (int waited = 0; waited < limitMs && !condition(); waited += 10) {
        usleep(10000);
    }
    return condition();
}

// Reads `json` as exactly one JSON document and returns every scalar as a line "KEY/KEY=JSON",
// e.g. items/0/properties/host-name/value="kest-demo". Anything else fails the test.
inline std::string FlattenJson(const std::string& json) {
    std::string flat;
    std::function<void(const std::string&, const nlohmann::ordered_json&)> walk =
        [&](const std::string& path, const nlohmann::ordered_json& value) {
            if (!value.is_structured()) {
                flat += path + "=" + value.dump() + "\n";
                return;
            }
            for (const auto& entry : value.items()) {
                walk(path + (path.empty() ? "" : "/") + entry.key(), entry.value());
            }
        };
    try {
        walk("", nlohmann::ordered_json::parse(json));
    } catch (const nlohmann::json::exception& error) {
        ADD_FAILURE() << "not one JSON document (" << error.what() << "):\n" << json;
    }
    return flat;
}

// A kestcfg run and what it shows: its exit status and a part of its standard output, or of its
// standard error when it fails (its standard output then empty); with --json, a part of the
// flattened document.
struct Expected {
    std::vector<std::string> arguments;
    int exitCode;
    std::string part;
};

inline void ExpectRuns(const std::vector<Expected>& runs) {
    for (const Expected& run : runs) {
        SCOPED_TRACE(testing::PrintToString(run.arguments));
        const RunResult result = RunKestcfg(run.arguments);
        EXPECT_EQ(run.exitCode, result.exitCode) << result.err;
        const auto& words = run.arguments;
        const bool json = std::find(words.begin(), words.end(), "--json") != words.end();
        if (!json && run.exitCode != 0) {
            EXPECT_EQ("", result.out);
        }
        const std::string shown =
            json ? FlattenJson(result.out) : (run.exitCode == 0 ? result.out : result.err);
        EXPECT_NE(std::string::npos, shown.find(run.part)) << shown;
    }
}

// A fresh demo controller in a temporary sysroot, which KEST_SYSROOT names for the test's
// lifetime, so kestcfg finds it unless a test passes --sysroot.
class DemoControllerTest : public testing::Test {
  protected:
    static constexpr const char* kStatePath = kest::hostkit::kControllerStatePath;
    static constexpr const char* kCallLog = kest::hostkit::kControllerCallLogPath;

    void SetUp() override {
        kest::hostkit::CreateDemoController(sysroot_.Root(),
                                            KESTCFG_SOURCE_DATA_DIR "/timezone.ini");
    }

    std::string State() const { return sysroot_.ReadFile(kStatePath); }
    std::string Calls() const { return sysroot_.ReadFile(kCallLog); }

    kest::test::TempSysroot sysroot_;
};

}  // namespace kest::test::cfg
