// Decay curves and reverberation times against decays that are known.
#include "report/response_decay.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>

#include "tools/report/sample_report.h"

namespace tessaly {
namespace {

constexpr int rate = 48000;

// A dense decay without chance: sines in every octave, each falling by 60 dB in the time given.
std::vector<float> decayingSines(double decaySeconds, double seconds, int sampleRate) {
    std::vector<float> samples(static_cast<std::size_t>(seconds * sampleRate));
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const double time = static_cast<double>(i) / sampleRate;
        double sum = 0.0;
        for (double hertz = 125.0; hertz < 0.5 * sampleRate; hertz *= 2.0) {
            sum += std::sin(6.283185307179586 * hertz * time + hertz);
        }
        samples[i] = static_cast<float>(0.1 * sum * std::pow(10.0, -3.0 * time / decaySeconds));
    }
    return samples;
}

TEST(ResponseDecay, CurveOfAnExponentialIsAStraightLine) {
    // What is to come of exp(-kt) is exp(-kt) of all: -60 dB per decay time.
    std::vector<float> response(rate * 2);
    for (std::size_t i = 0; i < response.size(); ++i) {
        response[i] =
            static_cast<float>(std::pow(10.0, -3.0 * static_cast<double>(i) / (0.8 * rate)));
    }
    const std::vector<double> curve = energyDecay(response);
    ASSERT_EQ(curve.size(), response.size());
    EXPECT_DOUBLE_EQ(curve[0], 0.0);
    for (const double seconds : {0.1, 0.4, 0.8, 1.2}) {
        EXPECT_NEAR(curve[static_cast<std::size_t>(seconds * rate)], -60.0 * seconds / 0.8, 0.01);
    }
}

TEST(ResponseDecay, CurveStaysAboveItsFloor) {
    const std::array<float, 3> response = {1.0f, 1e-20f, 0.0f};
    const std::vector<double> curve = energyDecay(response);
    EXPECT_DOUBLE_EQ(curve[1], decayFloorDb);
    EXPECT_DOUBLE_EQ(curve[2], decayFloorDb);
    EXPECT_TRUE(energyDecay({}).empty());
    EXPECT_DOUBLE_EQ(energyDecay(std::array<float, 2>{})[0], decayFloorDb);
}

TEST(ResponseDecay, OnsetIsWithinTwentyDecibelsOfThePeak) {
    std::vector<float> response(100, 0.0f);
    EXPECT_EQ(onsetOf(response), 0u);
    response[10] = 0.05f;
    response[20] = -0.2f;
    response[30] = 1.0f;
    EXPECT_EQ(onsetOf(response), 20u);
}

TEST(ResponseDecay, TimesOfKnownDecaysAreRightWithinTwoPerCent) {
    for (const int sampleRate : {24000, 44100, 48000}) {
        for (const double seconds : {0.4, 1.2, 3.0}) {
            const auto decays =
                octaveDecays(decayingSines(seconds, 1.6 * seconds, sampleRate), sampleRate);
            for (const OctaveDecay& decay : decays) {
                SCOPED_TRACE(testing::Message()
                             << sampleRate << " Hz, " << seconds << " s, " << decay.hertz << " Hz");
                ASSERT_TRUE(decay.t20.has_value());
                ASSERT_TRUE(decay.t30.has_value());
                EXPECT_NEAR(*decay.t20, seconds, 0.02 * seconds);
                EXPECT_NEAR(*decay.t30, seconds, 0.02 * seconds);
            }
        }
    }
}

TEST(ResponseDecay, TimesOfNoiseAreRightWithinItsChance) {
    // The spread of one decay is about sqrt(1 / (bandwidth * time)): 12 % at 125 Hz, 1 % at 8 kHz.
    const auto decays = octaveDecays(decayingNoise(1.0, 1.7, rate, 5), rate);
    for (const OctaveDecay& decay : decays) {
        SCOPED_TRACE(decay.hertz);
        ASSERT_TRUE(decay.t30.has_value());
        EXPECT_NEAR(*decay.t30, 1.0, 1.5 * std::sqrt(1.0 / (0.7 * decay.hertz)));
    }
}

TEST(ResponseDecay, DirectSoundDoesNotShortenTheTime) {
    std::vector<float> response = decayingSines(1.0, 1.6, rate);
    response.insert(response.begin(), 100, 0.0f);
    response[100] = 20.0f;
    const auto decays = octaveDecays(response, rate);
    for (const OctaveDecay& decay : decays) {
        ASSERT_TRUE(decay.t20.has_value()) << decay.hertz;
        EXPECT_NEAR(*decay.t20, 1.0, 0.02) << decay.hertz;
    }
}

TEST(ResponseDecay, NoiseFloorHidesTimesThatReachIntoIt) {
    // Noise 40 dB below: 20 dB of decay are clear of it, 30 dB are not.
    std::vector<float> response = decayingNoise(0.5, 2.0, rate, 1);
    const std::vector<float> noise = decayingNoise(1e9, 2.0, rate, 2);
    std::vector<float> loud = response;
    for (std::size_t i = 0; i < response.size(); ++i) {
        response[i] += 0.001f * noise[i];
        loud[i] += 0.03f * noise[i];
    }
    for (const OctaveDecay& decay : octaveDecays(response, rate)) {
        EXPECT_TRUE(decay.t20.has_value()) << decay.hertz;
    }
    for (const OctaveDecay& decay : octaveDecays(loud, rate)) {
        EXPECT_FALSE(decay.t20.has_value()) << decay.hertz;
        EXPECT_FALSE(decay.t30.has_value()) << decay.hertz;
    }
    for (const OctaveDecay& decay : octaveDecays(noise, rate)) {
        EXPECT_FALSE(decay.t20.has_value()) << decay.hertz;
    }
}

TEST(ResponseDecay, CutDecayShowsWhatItsRangeAllows) {
    // Cut at -18 dB nothing is shown, cut at -70 dB everything.
    for (const OctaveDecay& decay : octaveDecays(decayingNoise(1.0, 0.3, rate, 3), rate)) {
        EXPECT_FALSE(decay.t20.has_value()) << decay.hertz;
        EXPECT_FALSE(decay.t30.has_value()) << decay.hertz;
    }
    for (const OctaveDecay& decay : octaveDecays(decayingNoise(1.0, 1.2, rate, 3), rate)) {
        EXPECT_TRUE(decay.t20.has_value()) << decay.hertz;
        EXPECT_TRUE(decay.t30.has_value()) << decay.hertz;
    }
}

TEST(ResponseDecay, ResponsesWithoutARoomHaveNoTimes) {
    std::vector<float> dry(4800, 0.0f);
    dry[20] = 1.0f;
    dry[21] = -0.3f;
    // What rings on far below the direct sound is the filters', not a room's.
    std::vector<float> ringing = decayingSines(0.2, 0.4, rate);
    for (float& sample : ringing) {
        sample *= 1e-4f;
    }
    ringing[0] = 1.0f;
    for (const std::vector<float>& response : {std::vector<float>(), std::vector<float>(1, 1.0f),
                                               std::vector<float>(4800, 0.0f), dry, ringing}) {
        for (const OctaveDecay& decay : octaveDecays(response, rate)) {
            EXPECT_FALSE(decay.t20.has_value()) << response.size();
            EXPECT_FALSE(decay.t30.has_value()) << response.size();
        }
    }
}

TEST(ResponseDecay, DecaysShorterThanTheFilterAreNotTold) {
    const auto decays = octaveDecays(decayingNoise(0.06, 0.3, rate, 4), rate);
    EXPECT_FALSE(decays[0].t20.has_value());
    EXPECT_TRUE(decays[6].t20.has_value());
}

}  // namespace
}  // namespace tessaly
