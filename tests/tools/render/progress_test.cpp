// The progress line.
#include "render/progress.h"

#include <gtest/gtest.h>
#include <unistd.h>

namespace tessaly {
namespace {

TEST(Progress, TellsPartAndTimeLeft) {
    EXPECT_EQ(progressLine("rendering", 0.25, 3.0), "rendering  25 %, 9 s left");
    EXPECT_EQ(progressLine("rendering", 1.0, 3.0), "rendering 100 %, 0 s left");
    EXPECT_EQ(progressLine("rendering", 0.01, 10.0), "rendering   1 %, 17 min left");
}

TEST(Progress, PromisesNoTimeBeforeAnythingIsDone) {
    EXPECT_EQ(progressLine("rendering", 0.0, 3.0), "rendering   0 %");
}

TEST(Progress, SaysNothingIntoAPipe) {
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    {
        Progress progress(ends[1], "rendering");
        usleep(150000);
        progress.update(0.5);
    }
    close(ends[1]);
    char byte = 0;
    EXPECT_EQ(read(ends[0], &byte, 1), 0);
    close(ends[0]);
}

}  // namespace
}  // namespace tessaly
