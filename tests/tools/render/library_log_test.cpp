// Standard error kept in memory while a library works.
#include "render/library_log.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>

namespace tessaly {
namespace {

TEST(LibraryLog, KeepsTheLastLineAndGivesTheStreamBack) {
    ::testing::internal::CaptureStderr();
    {
        const LibraryLog log(false);
        std::fputs("first line\nsecond line\n\n", stderr);
        std::fflush(stderr);
        EXPECT_EQ(log.lastLine(), "second line");
        EXPECT_NE(log.ownError(), STDERR_FILENO);
        EXPECT_EQ(write(log.ownError(), "own\n", 4), 4);
    }
    std::fputs("after\n", stderr);
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "own\nafter\n");
}

TEST(LibraryLog, VerboseLeavesTheStreamAlone) {
    ::testing::internal::CaptureStderr();
    {
        const LibraryLog log(true);
        std::fputs("shown\n", stderr);
        EXPECT_EQ(log.ownError(), STDERR_FILENO);
        EXPECT_EQ(log.lastLine(), "");
    }
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "shown\n");
}

TEST(LibraryLog, SilenceHasNoLastLine) {
    const LibraryLog log(false);
    EXPECT_EQ(log.lastLine(), "");
}

}  // namespace
}  // namespace tessaly
