// Flat copies between buffers of different channel counts.
#include "handler/block_copy.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

using tessaly::copyOrZero;
using tessaly::floatsIn;

TEST(BlockCopy, CountsFloatsOfPositiveChannelCounts) {
    EXPECT_EQ(floatsIn(64, 2), 128u);
    EXPECT_EQ(floatsIn(64, 0), 0u);
    EXPECT_EQ(floatsIn(64, -3), 0u);
    EXPECT_EQ(floatsIn(0, 2), 0u);
}

TEST(BlockCopy, CopiesWhatIsThereAndZeroesTheRest) {
    const std::vector<float> in = {1.0f, 2.0f, 3.0f};
    std::vector<float> out(5, 9.0f);
    copyOrZero(in.data(), in.size(), out.data(), out.size());
    EXPECT_EQ(out, (std::vector<float>{1.0f, 2.0f, 3.0f, 0.0f, 0.0f}));
}

TEST(BlockCopy, StopsAtWhatIsWanted) {
    const std::vector<float> in = {1.0f, 2.0f, 3.0f};
    std::vector<float> out(3, 9.0f);
    copyOrZero(in.data(), in.size(), out.data(), 2);
    EXPECT_EQ(out, (std::vector<float>{1.0f, 2.0f, 9.0f}));
}

TEST(BlockCopy, WorksInPlace) {
    std::vector<float> buffer = {1.0f, 2.0f, 3.0f, 4.0f};
    copyOrZero(buffer.data(), 2, buffer.data(), 4);
    EXPECT_EQ(buffer, (std::vector<float>{1.0f, 2.0f, 0.0f, 0.0f}));
}

TEST(BlockCopy, TakesNullBuffers) {
    std::vector<float> out(4, 9.0f);
    copyOrZero(nullptr, 4, out.data(), out.size());
    EXPECT_EQ(out, std::vector<float>(4, 0.0f));
    const std::vector<float> in(4, 1.0f);
    copyOrZero(in.data(), in.size(), nullptr, 4);
}

}  // namespace
