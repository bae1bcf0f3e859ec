// Forked child processes for tests of what several processes do at once. A child runs its body
// and exits with status 0, or 1 when the body recorded a test failure (which the child reports).
#pragma once

#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <functional>
#include <vector>

namespace kest::test {

// Forks a child that runs `body` and exits; -1 when the fork fails.
inline pid_t StartChild(const std::function<void()>& body) {
    std::fflush(stdout);
    std::fflush(stderr);
    const pid_t child = fork();
    if (child == 0) {
        body();
        std::fflush(stdout);
        std::fflush(stderr);
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

}  // namespace kest::test
