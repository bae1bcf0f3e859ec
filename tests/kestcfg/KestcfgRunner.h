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

namespace kestcfg_test {

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

// Runs `program` with `arguments` (argv[0] is the program) and `environment` (the test's own by
// default), collecting standard output and error in temporary files.
inline RunResult RunProgram(const std::string& program, const std::vector<std::string>& arguments,
                            char* const* environment = environ) {
    char directory[] = "/tmp/kestcfg-test-XXXXXX";
    EXPECT_NE(nullptr, mkdtemp(directory));
    const std::string outPath = std::string(directory) + "/out";
    const std::string errPath = std::string(directory) + "/err";

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 1, outPath.c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawn_file_actions_addopen(&actions, 2, errPath.c_str(), O_WRONLY | O_CREAT, 0600);
    std::vector<std::string> words = {program};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& word : words) {
        argv.push_back(word.data());
    }
    argv.push_back(nullptr);

    RunResult result;
    pid_t child = 0;
    const int spawned =
        posix_spawn(&child, program.c_str(), &actions, nullptr, argv.data(), environment);
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

// Runs the kestcfg at `program` with `environment` (the test's own by default); when the tests
// run under an emulator (a cross build), through the same emulator command.
inline RunResult RunKestcfgAt(const std::string& program, const std::vector<std::string>& arguments,
                              char* const* environment = environ) {
    std::vector<std::string> command = {KEST_TEST_EMULATOR};
    if (command.empty()) {
        return RunProgram(program, arguments, environment);
    }
    const std::string launcher = command.front();
    command.erase(command.begin());
    command.push_back(program);
    command.insert(command.end(), arguments.begin(), arguments.end());
    return RunProgram(launcher, command, environment);
}

// Runs the built kestcfg.
inline RunResult RunKestcfg(const std::vector<std::string>& arguments,
                            char* const* environment = environ) {
    return RunKestcfgAt(KESTCFG_PATH, arguments, environment);
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

}  // namespace kestcfg_test
