// The progress line.
#include "render/progress.h"

#include <gtest/gtest.h>
#include <pty.h>
#include <unistd.h>

#include <string>

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

// A terminal of our own shows what is written to it.
TEST(Progress, PiecesThatGoOnAtOnceShareOneLine) {
    int terminal = -1;
    int screen = -1;
    if (openpty(&screen, &terminal, nullptr, nullptr, nullptr) != 0) {
        GTEST_SKIP() << "no terminals here";
    }
    {
        JointProgress progress(terminal, "rendering", 4);
        progress.update(0, 1.0);
        usleep(150000);
        progress.update(3, 0.5);
        char text[200] = {};
        ASSERT_GT(read(screen, text, sizeof text - 1), 0);
        EXPECT_NE(std::string(text).find("rendering  37 %"), std::string::npos) << text;
    }
    close(terminal);
    close(screen);
}

}  // namespace
}  // namespace tessaly
