// The built library, driven as a host drives it, against the reference's whole spatializer.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <memory>
#include <random>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "comparison/deviation.h"
#include "comparison/hosted_source.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

using namespace parameter;

/// Small sets at all rates.
const std::string& smallSets() {
    static const TempDirectory directory;
    for (const int rate : {24000, 44100, 48000}) {
        writePackedHrirSet(directory.path(), rate);
    }
    return directory.path();
}

Game& game() {
    static Game theGame(smallSets());
    return theGame;
}

class PlayedSource : public HostedSource {
public:
    PlayedSource(int sampleRate, int blockLength) : HostedSource(game(), sampleRate, blockLength) {}
};

class PluginComparison : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(game().pathTaken);
        ASSERT_EQ(game().library.getErrorState(), 1);
    }
    void TearDown() override {
        std::ostringstream largest;
        largest << deviation.largest();
        RecordProperty("largestDeviation", largest.str());
        std::printf("[ DEVIATION] %.2e of full scale in %zu samples, peak %.3f\n",
                    deviation.largest(), deviation.samples(), deviation.peak());
        EXPECT_LE(deviation.largest(), tolerance);
        EXPECT_GT(deviation.peak(), 0.05) << "silence was compared with silence";
        EXPECT_EQ(game().library.getErrorState(), 1);
    }

    Deviation deviation;
};

TEST_F(PluginComparison, WalkingSourceAtAllRatesAndBlockSizes) {
    for (const int rate : {24000, 44100, 48000}) {
        for (const int blockLength : {32, 64, 128, 256, 512, 1024, 2048, 4096}) {
            PlayedSource one(rate, blockLength);
            one.set(roomSelection, 0.0f);
            for (int block = 0; block < 16; ++block) {
                walk(one, block);
                ASSERT_TRUE(one.play(deviation, block % 5 == 4 ? 1 : 2));
            }
        }
    }
}

TEST_F(PluginComparison, SilenceUntilARoomIsSelected) {
    PlayedSource one(48000, 256);
    ASSERT_TRUE(one.play(deviation));
    EXPECT_EQ(deviation.peak(), 0.0);
    one.set(roomSelection, 3.0f);
    for (int block = 0; block < 8; ++block) {
        ASSERT_TRUE(one.play(deviation));
    }
}

TEST_F(PluginComparison, AngleAndDistanceFactors) {
    PlayedSource one(44100, 128);
    one.set(roomSelection, 0.0f);
    int block = 0;
    for (const float exponent : {1.0f, 1.005f, 0.5f, 2.0f, 0.1f, 10.0f}) {
        one.set(angle, exponent);
        one.set(distanceFactor, 0.3f + exponent);
        for (int k = 0; k < 37; ++k, ++block) {
            one.source.position = fromSpherical(5.0 * (2 * k - 36) + 1.7, 10.0 * (k % 9 - 4), 1.4);
            ASSERT_TRUE(one.play(deviation)) << exponent;
        }
    }
}

TEST_F(PluginComparison, SourcesOverheadBesideAndInsideTheHead) {
    PlayedSource one(48000, 256);
    one.set(roomSelection, 0.0f);
    constexpr std::array<Vector3, 13> places = {{
        {0.0, 0.0, 0.0},
        {0.0, 2.0, 0.0},
        {0.0, -2.0, 0.0},
        {0.0, 0.02, 0.0},
        {0.001, 0.02, 0.0},
        {0.0, -0.03, 0.004},
        {-1.0, 0.0, 0.0005},
        {1.0, 0.0, -0.0005},
        {-1.0, 0.0, 0.0},
        {-1.0, 0.5, 0.002},
        {0.0, 0.0, -1.0},
        {-0.00001, 0.0, -1.0},
        {0.00001, 0.0, -1.0},
    }};
    for (const Vector3& place : places) {
        one.source.position = place;
        for (int block = 0; block < 3; ++block) {
            ASSERT_TRUE(one.play(deviation)) << place.x << " " << place.y << " " << place.z;
        }
    }
}

TEST_F(PluginComparison, OcclusionSwingsOverItsTime) {
    for (const int rate : {24000, 48000}) {
        for (const int blockLength : {256, 1024}) {
            PlayedSource one(rate, blockLength);
            one.set(roomSelection, 0.0f);
            const int full = static_cast<int>(0.7 * rate / blockLength);
            for (const float target : {0.0f, 1.0f, 0.35f, 0.36f, 0.0f}) {
                one.set(occlusion, target);
                for (int block = 0; block < full; ++block) {
                    ASSERT_TRUE(one.play(deviation)) << target;
                }
            }
        }
    }
}

TEST_F(PluginComparison, LevelsChannelsAndSwitches) {
    PlayedSource one(48000, 256);
    one.set(roomSelection, 0.0f);
    constexpr std::array<std::pair<int, float>, 22> changes = {{
        {gain, -6.0f},         {direct, 3.0f},        {inputChannel, -1.0f}, {inputChannel, 1.0f},
        {inputChannel, -0.3f}, {inputChannel, -2.0f}, {bassBoost, 1.0f},     {bassBoost, 0.0f},
        {bypass, 1.0f},        {bypass, 0.0f},        {unityDistance, 1.0f}, {gain, -1.0f},
        {unityDistance, 0.0f}, {roomSize, 50.0f},     {roomSize, 100.0f},    {direct, -96.0f},
        {direct, 0.0f},        {auralization, 1.0f},  {auralization, 0.0f},  {gain, 5.0f},
        {bypass, 2.0f},        {bypass, 0.5f},
    }};
    int block = 0;
    for (const auto& [index, value] : changes) {
        one.set(index, value);
        for (int k = 0; k < 8; ++k, ++block) {
            walk(one, block);
            one.attenuation = k == 5 ? 0.0f : 0.5f;  // 0 mutes while the host's curve is taken
            ASSERT_TRUE(one.play(deviation, k % 3 == 2 ? 1 : 2)) << index << " = " << value;
        }
    }
}

TEST_F(PluginComparison, ReloadsForRateBlockRoomAndReverb) {
    PlayedSource one(48000, 256);
    PlayedSource other(48000, 256);
    one.set(roomSelection, 0.0f);
    other.set(roomSelection, 15.0f);
    int block = 0;
    const auto rounds = [&](const char* what) {
        for (int k = 0; k < 10; ++k, ++block) {
            walk(one, block);
            walk(other, block + 40);
            ASSERT_TRUE(one.play(deviation)) << what;
            ASSERT_TRUE(other.play(deviation)) << what;
        }
    };
    rounds("start");
    one.set(reverbDisable, 1.0f);
    rounds("reverb disabled");
    one.setFormat(48000, 1024);
    rounds("longer blocks");
    other.setFormat(44100, 64);
    rounds("another rate");
    one.set(roomSelection, 34.0f);
    other.set(auralization, 1.0f);
    rounds("another room");
    one.setFormat(24000, 64);
    other.setFormat(24000, 64);
    rounds("another rate for both");
}

TEST_F(PluginComparison, BypassOf3DTakesPanPairsAndBack) {
    PlayedSource one(44100, 512);
    one.set(roomSelection, 0.0f);
    for (const bool pan : {false, true, false}) {
        game().library.set3DBypass(pan);
        game().process.bypass3DAudio = pan;
        for (int block = 0; block < 12; ++block) {
            walk(one, block);
            ASSERT_TRUE(one.play(deviation)) << pan;
        }
    }
}

TEST_F(PluginComparison, ShortBlocksKeepTheRestOfTheInputBlock) {
    PlayedSource one(48000, 256);
    one.set(roomSelection, 0.0f);
    for (int block = 0; block < 24; ++block) {
        walk(one, block);
        ASSERT_TRUE(one.play(deviation, 2, block % 4 == 3 ? 100 : 256));
    }
}

class RandomGame : public PluginComparison, public ::testing::WithParamInterface<unsigned> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         RandomGame,
                         ::testing::Range(1u, 9u),
                         ::testing::PrintToStringParamName());

TEST_P(RandomGame, SourcesWithChangingParameters) {
    std::mt19937 random(GetParam());
    const auto between = [&](int low, int high) {
        return std::uniform_int_distribution<int>(low, high)(random);
    };
    const auto real = [&](float low, float high) {
        return std::uniform_real_distribution<float>(low, high)(random);
    };
    constexpr std::array<int, 3> rates = {24000, 44100, 48000};
    const int rate = rates[GetParam() % 3];
    const int blockLength = 64 << between(0, 5);
    std::vector<std::unique_ptr<HostedSource>> sources;
    for (int turn = 0; turn < 60; ++turn) {
        if (sources.empty() || (sources.size() < 4 && between(1, 12) == 1)) {
            sources.push_back(std::make_unique<PlayedSource>(rate, blockLength));
            sources.back()->set(roomSelection, 0.0f);
        } else if (sources.size() > 1 && between(1, 20) == 1) {
            sources.erase(sources.begin() + between(0, static_cast<int>(sources.size()) - 1));
        }
        for (std::size_t k = 0; k < sources.size(); ++k) {
            HostedSource& one = *sources[k];
            walk(one, turn + 17 * static_cast<int>(k));
            one.attenuation = real(0.05f, 1.0f);
            switch (between(0, 19)) {
                case 0:
                    one.set(gain, real(-12.0f, 3.0f));
                    break;
                case 1:
                    one.set(direct, real(-12.0f, 3.0f));
                    break;
                case 2:
                    one.set(angle, real(0.3f, 3.0f));
                    break;
                case 3:
                    one.set(distanceFactor, real(0.05f, 6.0f));
                    break;
                case 4:
                    one.set(unityDistance, real(0.0f, 2.0f));
                    break;
                case 5:
                    one.set(occlusion, real(0.0f, 1.0f));
                    break;
                case 6:
                    one.set(inputChannel, real(-1.2f, 1.0f));
                    break;
                case 7:
                    one.set(bassBoost, real(0.0f, 2.0f));
                    break;
                case 8:
                    one.set(bypass, real(0.0f, 1.3f));
                    break;
                case 9:
                    one.set(reverbDisable, real(0.0f, 2.0f));
                    break;
                default:
                    break;
            }
            ASSERT_TRUE(one.play(deviation, between(1, 6) == 1 ? 1 : 2))
                << "source " << k << " turn " << turn;
        }
    }
}

}  // namespace
}  // namespace tessaly::test
