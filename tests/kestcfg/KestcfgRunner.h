// Running the built kestcfg as a user does: its standard output, error and exit code; and
// reading its --json output through python3's JSON parser.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <spawn.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

extern char** environ;

namespace kest::test::cfg {

struct RunResult {
    int exitCode = -1;
    std::string out;
    std::string err;
};

inline std::string ReadWhole(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

// A program started in the background, its output collected in temporary files.
struct RunningProgram {
    pid_t pid = -1;
    std::string directory;  // holds "out" and "err"
};

// Starts `program` with `arguments` (argv[0] is the program) and `environment` (the test's own by
// default), collecting standard output and error in temporary files; with `ownProcessGroup` the
// program leads a process group of its own, as a shell's foreground job does.
inline RunningProgram StartProgram(const std::string& program,
                                   const std::vector<std::string>& arguments,
                                   char* const* environment = environ,
                                   bool ownProcessGroup = false) {
    char directory[] = "/tmp/kestcfg-test-XXXXXX";
    EXPECT_NE(nullptr, mkdtemp(directory));
    RunningProgram running;
    running.directory = directory;
    const std::string outPath = running.directory + "/out";
    const std::string errPath = running.directory + "/err";

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, outPath.c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawn_file_actions_addopen(&actions, 2, errPath.c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    if (ownProcessGroup) {
        posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETPGROUP);
        posix_spawnattr_setpgroup(&attributes, 0);
    }
    std::vector<std::string> words = {program};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& word : words) {
        argv.push_back(word.data());
    }
    argv.push_back(nullptr);
    const int spawned =
        posix_spawn(&running.pid, program.c_str(), &actions, &attributes, argv.data(), environment);
    posix_spawn_file_actions_destroy(&actions);
    posix_spawnattr_destroy(&attributes);
    EXPECT_EQ(0, spawned);
    if (spawned != 0) {
        running.pid = -1;
    }
    return running;
}

// What the program has written to standard error so far.
inline std::string ErrorOutputSoFar(const RunningProgram& running) {
    return ReadWhole(running.directory + "/err");
}

// Waits for a started program; its exit code is -1 when a signal ended it.
inline RunResult FinishProgram(RunningProgram& running) {
    RunResult result;
    int status = 0;
    if (running.pid > 0 && waitpid(running.pid, &status, 0) == running.pid && WIFEXITED(status)) {
        result.exitCode = WEXITSTATUS(status);
    }
    running.pid = -1;
    const std::string outPath = running.directory + "/out";
    const std::string errPath = running.directory + "/err";
    result.out = ReadWhole(outPath);
    result.err = ReadWhole(errPath);
    unlink(outPath.c_str());
    unlink(errPath.c_str());
    rmdir(running.directory.c_str());
    return result;
}

// Runs `program` with `arguments` and `environment` and waits for it.
inline RunResult RunProgram(const std::string& program, const std::vector<std::string>& arguments,
                            char* const* environment = environ) {
    RunningProgram running = StartProgram(program, arguments, environment);
    return FinishProgram(running);
}

// Starts the kestcfg at `program` (the built one by default) in the background; when the tests
// run under an emulator (a cross build), through the same emulator command.
inline RunningProgram StartKestcfg(const std::vector<std::string>& arguments,
                                   bool ownProcessGroup = false, char* const* environment = environ,
                                   const std::string& program = KESTCFG_PATH) {
    std::vector<std::string> command = {KEST_TEST_EMULATOR};
    command.push_back(program);
    command.insert(command.end(), arguments.begin(), arguments.end());
    const std::string launcher = command.front();
    command.erase(command.begin());
    return StartProgram(launcher, command, environment, ownProcessGroup);
}

// Runs the kestcfg at `program` (the built one by default) with `environment` and waits for it.
inline RunResult RunKestcfg(const std::vector<std::string>& arguments,
                            char* const* environment = environ,
                            const std::string& program = KESTCFG_PATH) {
    RunningProgram running = StartKestcfg(arguments, false, environment, program);
    return FinishProgram(running);
}

// How many times `part` occurs in `text`, overlaps included.
inline size_t CountOf(const std::string& text, const std::string& part) {
    size_t count = 0;
    for (size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1)) {
        ++count;
    }
    return count;
}

// True when kestcfg runs natively. Under an emulator (a cross build, where the kernel does not
// start foreign binaries by itself) a kestcfg cannot start another kestcfg, such as the watcher
// of a change that undoes itself.
inline bool KestcfgStartsItself() {
    return std::vector<std::string>{KEST_TEST_EMULATOR}.empty();
}

// Polls `condition` every 10 ms, at most `limitMs`; true once it holds.
template <class Condition>
bool PollUntil(Condition condition, int limitMs = 60000) {
    for (int waited = 0; waited < limitMs; waited += 10) {
        if (condition()) {
            return true;
        }
        usleep(10000);
    }
    return condition();
}

// Parses `json` with python3 as exactly one JSON document and returns every scalar as a line
// "KEY/KEY=JSON", for example items/0/properties/host-name/value="kest-demo". Text that is not
// one JSON document fails the test.
inline std::string FlattenJson(const std::string& json) {
    char path[] = "/tmp/kestcfg-json-XXXXXX";
    const int fd = mkstemp(path);
    EXPECT_GE(fd, 0);
    EXPECT_EQ(static_cast<ssize_t>(json.size()), write(fd, json.data(), json.size()));
    close(fd);
    static const char kFlatten[] =
        "import json, sys\n"
        "def walk(path, value):\n"
        "    if isinstance(value, dict):\n"
        "        for key, item in value.items(): walk(path + [key], item)\n"
        "    elif isinstance(value, list):\n"
        "        for index, item in enumerate(value): walk(path + [str(index)], item)\n"
        "    else:\n"
        "        print('/'.join(path) + '=' + json.dumps(value, ensure_ascii=False))\n"
        "walk([], json.load(open(sys.argv[1], encoding='utf-8')))\n";
    const RunResult parsed = RunProgram("/usr/bin/python3", {"-c", kFlatten, path});
    unlink(path);
    EXPECT_EQ(0, parsed.exitCode) << "not one JSON document:\n" << json << parsed.err;
    return parsed.out;
}

}  // namespace kest::test::cfg
