// Shared returns with the measured data set, and rooms changed in every block: the library against
// the reference, source by source and return by return.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "comparison/deviation.h"
#include "comparison/hosted_source.h"
#include "comparison/measured_game.h"

namespace tessaly::test {
namespace {

using namespace parameter;

constexpr int usedSends = 17;
constexpr int sendId = 18;
constexpr int sendLevel = 19;
constexpr int burstBlocks = 4;

class GameComparison : public ::testing::Test {
protected:
    void SetUp() override {
        if (!measuredSetThere()) {
            GTEST_SKIP() << "no data set";
        }
        ASSERT_TRUE(measuredGame().pathTaken);
        ASSERT_EQ(measuredGame().library.getErrorState(), 1);
    }
    void TearDown() override {
        if (IsSkipped()) {
            return;
        }
        std::printf("[ DEVIATION] %.2e of full scale in %zu samples, peak %.3f\n",
                    deviation.largest(), deviation.samples(), deviation.peak());
        EXPECT_LE(deviation.largest(), tolerance);
        EXPECT_GT(deviation.peak(), 0.02) << "silence was compared with silence";
        EXPECT_EQ(measuredGame().library.getErrorState(), 1);
    }

    Deviation deviation;
};

// ---- Returns ----

struct Format {
    int sampleRate;
    int blockLength;
};

std::ostream& operator<<(std::ostream& out, const Format& one) {
    return out << one.sampleRate << "/" << one.blockLength;
}

class ReturnRendering : public GameComparison, public ::testing::WithParamInterface<Format> {};
INSTANTIATE_TEST_SUITE_P(Formats,
                         ReturnRendering,
                         ::testing::Values(Format{48000, 1024},
                                           Format{44100, 512},
                                           Format{24000, 256},
                                           Format{48000, 4096}),
                         [](const auto& each) {
                             return "At" + std::to_string(each.param.sampleRate) + "By" +
                                    std::to_string(each.param.blockLength);
                         });

TEST_P(ReturnRendering, ManySourcesInTwoReturnsUntilTheirTailsHaveRunOut) {
    const auto [rate, blockLength] = GetParam();
    constexpr int stoneRoom = 20;
    constexpr int bath = 25;
    Deviation returned;
    HostedReturn first(measuredGame(), rate, blockLength, 3);
    HostedReturn second(measuredGame(), rate, blockLength, -7);
    first.set(return_parameter::roomSelection, stoneRoom);
    second.set(return_parameter::roomSelection, bath);
    second.set(return_parameter::reverb, 6.0f);
    takeRooms(first.handler());
    takeRooms(second.handler());
    std::vector<std::unique_ptr<HostedSource>> sources;
    for (int k = 0; k < 5; ++k) {
        HostedSource& one = *sources.emplace_back(
            std::make_unique<HostedSource>(measuredGame(), rate, blockLength));
        takeRooms(one.handler());
        one.set(roomSelection, k % 2 == 0 ? 0.0f : 2.0f);
        one.set(reverbDisable, 1.0f);
        one.set(usedSends, 2.0f);
        one.set(sendId, 3.0f);
        one.set(sendLevel, static_cast<float>(-3 * k));
        one.set(sendId, -7.0f);
        one.set(sendLevel, static_cast<float>(3 * k - 12));
    }
    int step = 0;
    const auto play = [&](int blocks, float peak) {
        for (int block = 0; block < blocks; ++block, ++step) {
            int k = 0;
            for (const auto& one : sources) {
                one->noisePeak = peak;
                walk(*one, step + 9 * k);
                ASSERT_TRUE(one->play(deviation, k % 2 == 0 ? 2 : 1)) << "source " << k;
                ++k;
            }
            ASSERT_TRUE(first.play(returned));
            ASSERT_TRUE(second.play(returned));
        }
    };
    play(burstBlocks, 0.1f);
    const int longest =
        std::max(first.handler().engine()->partitions(), second.handler().engine()->partitions());
    play(longest + 1, 0.0f);
    EXPECT_GT(returned.peak(), 0.01) << "the returns are not silent";
    first.set(return_parameter::roomSize, 70.0f);
    first.set(return_parameter::gain, -4.0f);
    second.set(return_parameter::mute, 1.0f);
    play(burstBlocks, 0.1f);
    second.set(return_parameter::mute, 0.0f);
    second.set(return_parameter::roomSelection, 28.0f);
    first.set(return_parameter::bypass, 1.0f);
    play(burstBlocks, 0.1f);
    std::printf("[ DEVIATION] returns: %.2e of full scale in %zu samples, peak %.3f\n",
                returned.largest(), returned.samples(), returned.peak());
    EXPECT_LE(returned.largest(), tolerance);
}

/// A return's output while these of six sources are there and send.
std::vector<float> returnOf(const std::vector<int>& present) {
    constexpr int rate = 48000;
    constexpr int blockLength = 1024;
    Deviation ignored;
    HostedReturn reverb(measuredGame(), rate, blockLength, 3);
    takeRooms(reverb.handler());
    reverb.set(return_parameter::roomSelection, 20.0f);
    std::vector<std::unique_ptr<HostedSource>> sources;
    for (const int k : present) {
        HostedSource& one = *sources.emplace_back(
            std::make_unique<HostedSource>(measuredGame(), rate, blockLength));
        takeRooms(one.handler());
        one.set(roomSelection, 0.0f);
        one.set(reverbDisable, 1.0f);
        one.set(usedSends, 1.0f);
        one.set(sendId, 3.0f);
        one.set(sendLevel, static_cast<float>(-k));
        one.seedNoise(static_cast<unsigned>(100 + k));
        one.noisePeak = 0.15f;
    }
    std::vector<float> heard;
    for (int block = 0; block < 30; ++block) {
        std::size_t k = 0;
        for (const auto& one : sources) {
            walk(*one, block + 11 * present[k++]);
            EXPECT_TRUE(one->play(ignored));
        }
        EXPECT_TRUE(reverb.play(ignored));
        heard.insert(heard.end(), reverb.heard().begin(), reverb.heard().end());
    }
    return heard;
}

TEST_F(GameComparison, SixSourcesInOneReturnAreTheSumOfSix) {
    const std::vector<float> together = returnOf({0, 1, 2, 3, 4, 5});
    std::vector<double> sum(together.size(), 0.0);
    for (int k = 0; k < 6; ++k) {
        const std::vector<float> alone = returnOf({k});
        for (std::size_t i = 0; i < sum.size(); ++i) {
            sum[i] += static_cast<double>(alone[i]);
        }
    }
    const std::string difference = deviation.compare(together, sum);
    EXPECT_EQ(difference, "");
    EXPECT_LE(deviation.largest(), 1e-6);
}

// ---- Changing rooms ----

TEST_F(GameComparison, ThreeHundredRoomChangesInThreeHundredBlocks) {
    constexpr int changes = 300;
    constexpr float noise = 0.3f;
    int loads = 0;
    double nearestToTheMost = 0.0;
    HostedSource one(measuredGame(), 48000, 1024);
    takeRooms(one.handler());
    const auto rooms = one.handler().adjustOptions;
    one.handler().adjustOptions = [&](reference::EngineOptions& options) {
        rooms(options);
        ++loads;
    };
    one.noisePeak = noise;
    one.set(roomSelection, 0.0f);
    ASSERT_TRUE(one.play(deviation));
    ::testing::internal::CaptureStderr();
    for (int change = 1; change <= changes; ++change) {
        const int room = change * 17 % roomCount;
        one.set(roomSelection, static_cast<float>(room));
        one.set(reverbDisable, change % 5 == 0 ? 1.0f : 0.0f);
        one.set(auralization, change % 3 == 0 ? 1.0f : 0.0f);
        if (change % 20 == 0) {
            setWalls({2.0f + 0.1f * static_cast<float>(change % 7), 1.8f, 4.0f, 6.0f, 3.0f,
                      change % 40 == 0 ? -1.0f : 5.0f});
        }
        walk(one, change);
        ASSERT_TRUE(one.play(deviation)) << "change " << change << " to room " << room;
        // No sample can exceed the input's peak times the sum of a response's magnitudes; half as
        // much again for the overshoot of the input filters.
        const reference::Engine& engine = *one.handler().engine();
        double left = 0.0;
        double right = 0.0;
        for (const double tap : engine.responseLeft()) {
            left += std::abs(tap);
        }
        for (const double tap : engine.responseRight()) {
            right += std::abs(tap);
        }
        const double most = 1.5 * static_cast<double>(noise) * std::max(left, right);
        double peak = 0.0;
        for (const float sample : one.heard()) {
            peak = std::max(peak, std::abs(static_cast<double>(sample)));
        }
        EXPECT_LT(peak, most) << "room " << room;
        EXPECT_GT(peak, 0.0) << "room " << room;
        nearestToTheMost = std::max(nearestToTheMost, peak / most);
    }
    const std::string log = ::testing::internal::GetCapturedStderr();
    EXPECT_EQ(loads, 1 + changes);
    int announced = 0;
    for (std::size_t at = log.find("Loading instance"); at != std::string::npos;
         at = log.find("Loading instance", at + 1)) {
        ++announced;
    }
    EXPECT_EQ(announced, changes) << "the library changed its engine in every block";
    std::printf("[ PEAK     ] at most %.0f %% of what the responses allow\n",
                100.0 * nearestToTheMost);
}

}  // namespace
}  // namespace tessaly::test
