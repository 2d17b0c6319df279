// Runs a piece of a test in a process of its own, for state that a process can set only once.
#pragma once

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <functional>

namespace tessaly::test {

/// Forks, runs `body` in the child and fails the calling test if an expectation in it failed or
/// the child died. The child prints its own failures; what it changes is not seen by the caller.
inline void inFreshProcess(const std::function<void()>& body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        body();
        std::fflush(nullptr);
        _exit(::testing::Test::HasFailure() ? 1 : 0);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status)) << "the child died, status " << status;
    EXPECT_EQ(WEXITSTATUS(status), 0) << "see the child's failures above";
}

}  // namespace tessaly::test
