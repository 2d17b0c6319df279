// Mix buffers: birth, moves, filling.
#include "host/reverb_mix_buffers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <vector>

#include "host/host_instance.h"

namespace tessaly::test {
namespace {

class ReverbMixBuffersTest : public ::testing::Test {
protected:
    ReverbMixBuffersTest() { reverbmixbuffermap.clear(); }
    ~ReverbMixBuffersTest() override { reverbmixbuffermap.clear(); }
};

bool isZero(const ReverbMixBuffer& buffer) {
    return std::all_of(buffer.begin(), buffer.end(), [](float s) { return s == 0.0f; });
}

TEST_F(ReverbMixBuffersTest, AFirstIdGetsAZeroedBuffer) {
    changeReverbId(0, 5);
    ASSERT_NE(findMixBuffer(5), nullptr);
    EXPECT_EQ(findMixBuffer(5)->size(), 8192u);
    EXPECT_TRUE(isZero(*findMixBuffer(5)));
    EXPECT_EQ(reverbmixbuffermap.size(), 1u);
}

TEST_F(ReverbMixBuffersTest, NoIdGetsNone) {
    changeReverbId(0, 0);
    EXPECT_TRUE(reverbmixbuffermap.empty());
}

TEST_F(ReverbMixBuffersTest, AMoveTakesTheContentAlong) {
    changeReverbId(0, 5);
    findMixBuffer(5)->front() = 1.0f;
    findMixBuffer(5)->back() = 2.0f;
    changeReverbId(5, 6);
    EXPECT_EQ(findMixBuffer(5), nullptr);
    ASSERT_NE(findMixBuffer(6), nullptr);
    EXPECT_EQ(findMixBuffer(6)->front(), 1.0f);
    EXPECT_EQ(findMixBuffer(6)->back(), 2.0f);
}

TEST_F(ReverbMixBuffersTest, AMoveReplacesWhatTheOtherReverbHad) {
    changeReverbId(0, 5);
    changeReverbId(0, 6);
    findMixBuffer(5)->front() = 1.0f;
    findMixBuffer(6)->back() = 2.0f;
    changeReverbId(5, 6);
    EXPECT_EQ(findMixBuffer(6)->front(), 1.0f);
    EXPECT_EQ(findMixBuffer(6)->back(), 0.0f);
}

TEST_F(ReverbMixBuffersTest, GivingTheIdUpErasesTheBuffer) {
    changeReverbId(0, 5);
    changeReverbId(5, 0);
    EXPECT_TRUE(reverbmixbuffermap.empty());
}

TEST_F(ReverbMixBuffersTest, TheSameIdKeepsTheContent) {
    changeReverbId(0, 5);
    findMixBuffer(5)->front() = 1.0f;
    changeReverbId(5, 5);
    EXPECT_EQ(findMixBuffer(5)->front(), 1.0f);
}

TEST_F(ReverbMixBuffersTest, ASecondReverbClearsTheBuffer) {
    changeReverbId(0, 5);
    findMixBuffer(5)->front() = 1.0f;
    changeReverbId(0, 5);
    EXPECT_TRUE(isZero(*findMixBuffer(5)));
    EXPECT_EQ(reverbmixbuffermap.size(), 1u);
}

TEST_F(ReverbMixBuffersTest, AMoveFromAnErasedBufferBringsZeros) {
    changeReverbId(0, 6);
    findMixBuffer(6)->front() = 1.0f;
    changeReverbId(5, 6);
    EXPECT_TRUE(isZero(*findMixBuffer(6)));
    EXPECT_EQ(reverbmixbuffermap.size(), 1u);
    changeReverbId(7, 8);
    ASSERT_NE(findMixBuffer(8), nullptr);
    EXPECT_EQ(findMixBuffer(7), nullptr);
}

TEST_F(ReverbMixBuffersTest, BuffersStayWhereTheyAre) {
    changeReverbId(0, 50);
    const ReverbMixBuffer* buffer = findMixBuffer(50);
    for (int id = 1; id < 100; ++id) {
        if (id != 50) {
            changeReverbId(0, id);
        }
    }
    for (int id = 1; id < 50; ++id) {
        changeReverbId(id, 0);
    }
    EXPECT_EQ(findMixBuffer(50), buffer);
}

TEST_F(ReverbMixBuffersTest, NegativeIdsAreIdsToo) {
    changeReverbId(0, -7);
    EXPECT_NE(findMixBuffer(-7), nullptr);
}

TEST_F(ReverbMixBuffersTest, AddsStereoToTheLeftSlots) {
    const auto mix = std::make_unique<ReverbMixBuffer>();
    const std::vector<float> in = countedSamples(8);
    addToMixBuffer(*mix, in.data(), 4, 2, 0.5f);
    addToMixBuffer(*mix, in.data(), 4, 2, 0.5f);
    for (std::size_t i = 0; i < 4; ++i) {
        EXPECT_EQ((*mix)[2 * i], in[2 * i] + in[2 * i + 1]) << "summed, not halved, and added";
        EXPECT_EQ((*mix)[2 * i + 1], 0.0f);
    }
    EXPECT_EQ((*mix)[8], 0.0f);
}

TEST_F(ReverbMixBuffersTest, AddsMonoToTheLeftSlots) {
    const auto mix = std::make_unique<ReverbMixBuffer>();
    const std::vector<float> in = countedSamples(4);
    addToMixBuffer(*mix, in.data(), 4, 1, 2.0f);
    for (std::size_t i = 0; i < 4; ++i) {
        EXPECT_EQ((*mix)[2 * i], 2.0f * in[i]);
        EXPECT_EQ((*mix)[2 * i + 1], 0.0f);
    }
}

TEST_F(ReverbMixBuffersTest, OtherChannelCountsAddNothing) {
    const auto mix = std::make_unique<ReverbMixBuffer>();
    const std::vector<float> in = countedSamples(24);
    for (const int channels : {-1, 0, 3, 6}) {
        addToMixBuffer(*mix, in.data(), 4, channels, 1.0f);
    }
    EXPECT_TRUE(isZero(*mix));
}

TEST_F(ReverbMixBuffersTest, FramesBeyondTheBufferAreDropped) {
    const auto mix = std::make_unique<ReverbMixBuffer>();
    const std::vector<float> in(2 * 5000, 1.0f);
    addToMixBuffer(*mix, in.data(), 5000, 2, 1.0f);
    addToMixBuffer(*mix, in.data(), 5000, 1, 1.0f);
    EXPECT_EQ((*mix)[2 * 4095], 3.0f);
    EXPECT_EQ(mix->back(), 0.0f);
}

}  // namespace
}  // namespace tessaly::test
