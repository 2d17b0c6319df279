// A source that is silent for long costs nothing, and is heard again as if it had never rested.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr int block = 256;  // frames

/// What the engine is asked for beside silence.
struct Scene {
    const char* name;
    std::int16_t preset;   ///< of the reflections, 0: none
    bool fading;           ///< crossfades at a change of response
    std::uint8_t updates;  ///< `alwaysUpdateFilter`
    bool movesWhileSilent;
};

void PrintTo(const Scene& scene, std::ostream* out) { *out << scene.name; }

class Silence : public EngineFixture, public testing::WithParamInterface<Scene> {
protected:
    Silence() { writePackedHrirSet(directory.path(), 48000); }

    /// Sound, a pause of `pauseBlocks`, sound again; what is played in the pause is `inPause`
    /// times noise. @return all blocks after the pause
    std::vector<float> play(int pauseBlocks, float inPause) {
        resetProcess();
        const LogCapture quiet;
        EngineRig rig(directory.path(), 48000, block);
        rig.settings.earlyFlexRefPreset = GetParam().preset;
        rig.settings.qvFlexReflections = 1;
        rig.settings.qvTrackDirection = 1;
        rig.settings.fading = GetParam().fading ? 1 : 0;
        rig.settings.alwaysUpdateFilter = GetParam().updates;
        rig.build();
        std::mt19937 random(9);
        const auto noise = [&random] {
            return static_cast<float>(random() >> 8) * (2.0f / 16777216.0f) - 1.0f;
        };
        std::vector<float> heard;
        const int last = 20 + pauseBlocks + 20;
        for (int n = 0; n < last; ++n) {
            const bool pause = n >= 20 && n < 20 + pauseBlocks;
            for (std::size_t i = 0; i < rig.input.size(); i += 2) {
                rig.input[i] = (pause ? inPause : 0.5f) * noise();
            }
            if (!pause || GetParam().movesWhileSilent) {
                rig.azimuth = static_cast<std::int16_t>(n * 7 % 360 - 180);
                rig.distance = 1.0f + 0.01f * static_cast<float>(n % 150);
                rig.mix.earlyGain = 1.0f - 0.002f * static_cast<float>(n % 100);
            }
            rig.run();
            if (n >= 20 + pauseBlocks) {
                heard.insert(heard.end(), rig.output.begin(), rig.output.end());
            } else if (n == last - 21) {
                silentAtTheEnd = rig.state().firstOLS->resultSilent();
                waits = rig.state().composer.isBehind();
            }
        }
        return heard;
    }

    TempDirectory directory;
    bool silentAtTheEnd = false;  ///< the pause's last block was known to be zeros
    bool waits = false;           ///< a response had been put off
};

TEST_P(Silence, EndsAsIfItHadBeenInaudibleSound) {
    // The input filters are at rest after about a second.
    constexpr int pauseBlocks = 300;
    const std::vector<float> rested = play(pauseBlocks, 0.0f);
    EXPECT_TRUE(silentAtTheEnd);
    EXPECT_TRUE(waits);
    const std::vector<float> plain = play(pauseBlocks, 1e-14f);
    EXPECT_FALSE(silentAtTheEnd);
    EXPECT_FALSE(waits);
    ASSERT_EQ(rested.size(), plain.size());
    float largest = 0.0f;
    float worst = 0.0f;
    for (std::size_t i = 0; i < plain.size(); ++i) {
        largest = std::max(largest, std::fabs(plain[i]));
        worst = std::max(worst, std::fabs(plain[i] - rested[i]));
    }
    EXPECT_GT(largest, 0.01f);
    EXPECT_LT(worst, 2e-7f * std::max(largest, 1.0f));
}

TEST_P(Silence, OfAFewBlocksPutsNothingOff) {
    play(12, 0.0f);
    EXPECT_FALSE(waits);
}

INSTANTIATE_TEST_SUITE_P(Scenes,
                         Silence,
                         testing::Values(Scene{"still", 0, true, 1, false},
                                         Scene{"moving", 0, true, 1, true},
                                         Scene{"movingLazily", 0, true, 0, true},
                                         Scene{"withoutCrossfade", 0, false, 1, true},
                                         Scene{"reflections", 25, true, 1, true}),
                         [](const auto& tested) { return std::string(tested.param.name); });

/// A source that moved in silence, and then loads of other engines that replace its HRIRs.
class ReplacedHrirs : public EngineFixture {
protected:
    ReplacedHrirs() : rig(directory_.path(), 48000, block) {
        writePackedHrirSet(directory_.path(), 48000);
        rig.settings.qvTrackDirection = 1;
        rig.settings.alwaysUpdateFilter = 0;  // composes when it moves, and not when it wakes
        rig.build();
        for (int n = 0; n < 40; ++n) {
            rig.azimuth = static_cast<std::int16_t>(n * 2);
            rig.run();
        }
        EXPECT_TRUE(rig.state().composer.isBehind());
        former = direct();
    }
    /// The HRIR's first sample as the direct sound takes it.
    float direct() {
        const SourceDirection& direction = rig.state().direction;
        return hrirAt(direction.indexPhi, direction.indexTheta)[1] * rig.state().law.directGain *
               rig.mix.directGain;
    }
    void loadAnother(bool bypass) {
        EngineRig other(directory_.path(), 48000, block);
        other.settings.qvTrackDirection = 1;
        other.settings.bypass3DAudio = bypass;
        other.build();
    }
    float wake() {
        rig.input.assign(rig.input.size(), 0.5f);
        rig.run();
        EXPECT_FALSE(rig.state().composer.isBehind());
        return composedSample(rig.state().composer, 0, 0);
    }

private:
    TempDirectory directory_;
    LogCapture quiet_;

protected:
    EngineRig rig;
    float former = 0.0f;
};

TEST_F(ReplacedHrirs, AResponseThatNobodyHeardIsWrittenWithItsOwn) {
    loadAnother(true);
    EXPECT_NE(direct(), former);
    EXPECT_EQ(wake(), former);
}

TEST_F(ReplacedHrirs, AfterTwoLoadsItIsWrittenWithThoseOfNow) {
    loadAnother(true);
    loadAnother(false);
    loadAnother(true);
    const float now = direct();
    EXPECT_NE(now, former);
    EXPECT_EQ(wake(), now);
}

/// A source that has moved while nobody heard it.
class MovedInSilence : public EngineFixture {
protected:
    MovedInSilence() : rig(directory_.path(), 48000, block) {
        writePackedHrirSet(directory_.path(), 48000);
        rig.settings.qvTrackDirection = 1;
    }
    void move() {
        rig.build();
        for (int n = 0; n < 40; ++n) {
            rig.azimuth = static_cast<std::int16_t>(n * 5);
            rig.run();
        }
        ASSERT_TRUE(rig.state().composer.isBehind());
    }

private:
    TempDirectory directory_;
    LogCapture quiet_;

protected:
    EngineRig rig;
};

TEST_F(MovedInSilence, AHeadphoneSelectionFindsTheResponseThatNobodyHeardWritten) {
    // It silences what was taken before it until the next update: what was put off is no update.
    rig.settings.alwaysUpdateFilter = 0;
    move();
    rig.state().firstOLS->hpTFselectSeen = 7;  // as if the process's selection had changed
    rig.run();
    EXPECT_FALSE(rig.state().composer.isBehind());
}

TEST_F(MovedInSilence, AStopWritesTheResponseThatNobodyHeard) {
    move();
    const ComplexBin before = rig.state().firstOLS->filterPartsL[0][9];
    rig.engine->Stop();
    EXPECT_FALSE(rig.state().composer.isBehind());
    const ComplexBin after = rig.state().firstOLS->filterPartsL[0][9];
    EXPECT_NE(before.re, after.re) << "the direction had changed since";
}

}  // namespace
}  // namespace tessaly::test
