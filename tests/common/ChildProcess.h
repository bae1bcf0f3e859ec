// Helpers for tests that need a process of their own (process-wide state such as the tracer's,
// the environment, signal dispositions or a dropped privilege): running a body in a forked
// child, capturing a standard stream, and listing what a directory holds.
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

// Runs `body` in a forked child, whose changes to process-wide state end with it; failures are
// reported by the child and make the test fail here.
inline void RunInChild(const std::function<void()>& body) {
    std::fflush(nullptr);
    pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        body();
        std::fflush(nullptr);
        _exit(::testing::Test::HasFailure() ? 1 : 0);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "child status " << status;
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
