// The measures of tails on sounds whose answers are known.
#include "data/tail_analysis.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "data/room_composition.h"
#include "tools/data/tail_test_set.h"

namespace tessaly::data {
namespace {

/// Gaussian noise by twelve uniforms, both ears of a preset's length.
std::vector<float> noise(const TailDesign& design, int sampleRate, bool sameEars) {
    std::mt19937 generator(7);
    const auto gaussian = [&generator] {
        double sum = -6.0;
        for (int i = 0; i < 12; ++i) {
            sum += static_cast<double>(generator()) / 4294967296.0;
        }
        return static_cast<float>(sum);
    };
    std::vector<float> tail(storedTailFrames(design, sampleRate) * earCount);
    for (std::size_t i = 0; i < tail.size(); i += 2) {
        tail[i] = gaussian();
        tail[i + 1] = sameEars ? tail[i] : gaussian();
    }
    return tail;
}

TEST(TailAnalysis, FindsTheDecayOfExponentialNoise) {
    const TailDesign& design = tailDesign(24);
    for (const int rate : {24000, 44100, 48000}) {
        std::vector<float> tail = noise(design, rate, false);
        constexpr double seconds = 0.8;
        for (std::size_t i = 0; i < tail.size(); ++i) {
            const double time = static_cast<double>(i / 2) / rate;
            tail[i] *= static_cast<float>(std::exp(-6.9078 * time / seconds));
        }
        const OctaveTimes times = measuredTimes(tail, rate, design);
        for (std::size_t octave = 1; octave < decayOctaves; ++octave) {
            EXPECT_NEAR(times[octave], seconds, 0.1 * seconds) << rate << " " << octave;
        }
    }
}

TEST(TailAnalysis, SilenceHasNoDecayNoDensityAndNoCoherence) {
    const TailDesign& design = tailDesign(53);
    const std::vector<float> tail(storedTailFrames(design, 24000) * earCount);
    for (const double time : measuredTimes(tail, 24000, design)) {
        EXPECT_EQ(time, 0.0);
    }
    EXPECT_EQ(echoDensity(tail, 24000, design).late, 0.0);
    for (const double value : tailCoherence(tail, 24000, 0.1)) {
        EXPECT_EQ(value, 0.0);
    }
}

TEST(TailAnalysis, DesignedTimesAreThoseOfTheOctavesMiddle) {
    const TailDesign& design = tailDesign(21);
    const OctaveTimes times = designedTimes(design.frames48000, 48000, design);
    // A sum of decays is a little longer than the one in its middle, the more the steeper they
    // change over the octave.
    for (std::size_t octave = 0; octave < decayOctaves; ++octave) {
        const double middle = design.decay.at(125.0 * std::exp2(static_cast<double>(octave)));
        EXPECT_NEAR(times[octave] / middle, 1.0, 0.06) << octave;
    }
}

TEST(TailAnalysis, CoherenceIsOneForEqualEarsAndZeroForIndependentOnes) {
    const TailDesign& design = tailDesign(24);
    for (const double value : tailCoherence(noise(design, 48000, true), 48000, 0.1)) {
        EXPECT_NEAR(value, 1.0, 1e-12);
    }
    for (const double value : tailCoherence(noise(design, 48000, false), 48000, 0.1)) {
        EXPECT_NEAR(value, 0.0, 0.2);
    }
}

TEST(TailAnalysis, CoherenceOfASetFollowsItsEars) {
    HrirSet set = tailTestSet(48000);
    const std::vector<double> weights = directionWeights(tailDesign(15));
    for (std::size_t i = 0; i < set.pairs.size(); i += 2) {
        set.pairs[i] = set.pairs[i + 1] = i % 4 == 0 ? 1.0f : 0.0f;
    }
    for (const double value : diffuseCoherence(set, weights)) {
        EXPECT_NEAR(value, 1.0, 1e-12);
    }
    for (std::size_t i = 0; i < set.pairs.size(); i += 2) {
        set.pairs[i] = -set.pairs[i];
    }
    for (const double value : diffuseCoherence(set, weights)) {
        EXPECT_NEAR(value, -1.0, 1e-12);
    }
}

TEST(TailAnalysis, EchoDensityTellsNoiseFromSingleImpulses) {
    const TailDesign& design = tailDesign(21);
    std::vector<float> tail = noise(design, 48000, false);
    EXPECT_NEAR(echoDensity(tail, 48000, design).late, 1.0, 0.05);
    for (std::size_t i = 0; i < tail.size(); ++i) {
        tail[i] = i % 200 < 2 ? 1.0f : 0.0f;
    }
    EXPECT_LT(echoDensity(tail, 48000, design).late, 0.1);
}

TEST(TailAnalysis, SamplesThatBreakARuleAreFound) {
    const TailDesign& design = tailDesign(53);
    std::vector<float> tail(storedTailFrames(design, 48000) * earCount);
    tail[8000] = 1.0f;
    tail[8002] = -1.0f;
    TailSamplesCheck check = checkTailSamples(tail, 48000, design);
    EXPECT_EQ(check.soundingBefore + check.notFinite, 0);
    EXPECT_LT(check.sumDecibels, -100.0);
    EXPECT_EQ(check.peak, 1.0);
    tail[3] = 1e-9f;
    tail[10] = std::nanf("");
    tail[tail.size() - 1] = 0.5f;
    check = checkTailSamples(tail, 48000, design);
    EXPECT_EQ(check.soundingBefore, 2);
    EXPECT_EQ(check.notFinite, 1);
    EXPECT_EQ(check.last, 0.5);
    EXPECT_EQ(check.lastJump, 0.5);
}

TEST(RoomComposition, PutsReflectionsAtTheirDelaysAndAddsTheTail) {
    // Room 15: walls at 466, 241, 500, 860, 397 and 512 samples of 44100 Hz.
    const TailDesign& design = tailDesign(15);
    const HrirSet set = tailTestSet(44100);
    std::vector<float> tail(storedTailFrames(design, 44100) * earCount);
    std::vector<double> room = composeRoom(design, set, tail);
    const auto firstSounding = [&room] {
        std::size_t i = 0;
        while (i < room.size() && room[i] == 0.0) {
            ++i;
        }
        return i / earCount;
    };
    EXPECT_EQ(firstSounding(), 241u);
    for (const std::size_t delay : {241u, 397u, 466u, 500u, 512u, 860u}) {
        EXPECT_NE(room[2 * delay], 0.0) << delay;
        EXPECT_EQ(room[2 * (delay + 3)], 0.0) << delay;
    }
    tail[2 * 100] = 0.5f;
    room = composeRoom(design, set, tail);
    EXPECT_EQ(firstSounding(), 100u);
    EXPECT_FLOAT_EQ(static_cast<float>(room[200]), 0.5f * 0.05306f);
}

}  // namespace
}  // namespace tessaly::data
