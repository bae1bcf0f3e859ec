// Helpers for tests that need processes of their own (process-wide state such as the tracer's,
// the environment, signal dispositions or a dropped privilege, or several processes at once):
// running bodies in forked children, capturing a standard stream, listing a directory.
#pragma once

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <functional>
#include <sstream>
#include <string>
#include <vector>

namespace kest::test {

// Forks a child that runs `body` and exits with status 0, or 1 when the body recorded a test
// failure (which the child reports); -1 when the fork fails.
inline pid_t StartChild(const std::function<void()>& body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        body();
        std::fflush(nullptr);
        _exit(::testing::Test::HasFailure() ? 1 : 0);
    }
    return child;
}

// Waits for `child` and returns its wait status, or -1 when there is no such child.
inline int WaitForChild(pid_t child) {
    int status = -1;
    return child > 0 && waitpid(child, &status, 0) == child ? status : -1;
}

// True for the wait status of a child that exited with status 0.
inline bool ExitedCleanly(int status) {
    return status != -1 && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// Runs `body` in a forked child, whose changes to process-wide state end with it; failures are
// reported by the child and make the test fail here.
inline void RunInChild(const std::function<void()>& body) {
    const int status = WaitForChild(StartChild(body));
    EXPECT_TRUE(ExitedCleanly(status)) << "child wait status " << status;
}

// Runs body(0) ... body(count - 1) in as many children at once and expects each to exit cleanly.
inline void RunInChildren(int count, const std::function<void(int)>& body) {
    std::vector<pid_t> children;
    for (int i = 0; i < count; ++i) {
        children.push_back(StartChild([&body, i] { body(i); }));
    }
    for (const pid_t child : children) {
        const int status = WaitForChild(child);
        EXPECT_TRUE(ExitedCleanly(status)) << "child wait status " << status;
    }
}

// Sends what the process writes to standard output or standard error (`descriptor` 1 or 2) to
// a file while the object lives.
class StreamCapture {
  public:
    StreamCapture(int descriptor, const std::string& file)
        : descriptor_(descriptor), file_(file), saved_(dup(descriptor)) {
        std::fflush(nullptr);
        int target = open(file.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
        dup2(target, descriptor);
        close(target);
    }
    ~StreamCapture() {
        std::fflush(nullptr);
        dup2(saved_, descriptor_);
        close(saved_);
        if (::testing::Test::HasFailure()) {  // failure reports may be among the captured text
            std::string captured = Text();
            (void)!write(descriptor_, captured.data(), captured.size());
        }
    }
    StreamCapture(const StreamCapture&) = delete;
    StreamCapture& operator=(const StreamCapture&) = delete;

    std::string Text() const {
        std::fflush(nullptr);
        std::ifstream in(file_, std::ios::binary);
        std::ostringstream content;
        content << in.rdbuf();
        return content.str();
    }

  private:
    int descriptor_;
    std::string file_;
    int saved_;
};

// Names of the entries of `directory` (without "." and ".."), unsorted; none when it is missing.
inline std::vector<std::string> EntriesOf(const std::string& directory) {
    std::vector<std::string> names;
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator(directory, error)) {
        names.push_back(entry.path().filename());
    }
    return names;
}

// The lines of `text` without their line feeds.
inline std::vector<std::string> LinesOf(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) {
        lines.push_back(line);
    }
    return lines;
}

}  // namespace kest::test
