// Levels and differences measured on signals whose answers are known.
#include "render/binaural_measures.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <numbers>
#include <random>

namespace tessaly {
namespace {

// A sum of sines from 200 to 8000 Hz with fixed phases: noise-like, and known between samples.
double signalAt(double seconds) {
    double sum = 0.0;
    for (int i = 0; i < 60; ++i) {
        const double frequency = 200.0 * std::pow(40.0, i / 59.0);
        const double phase = 2.399963 * i * i;
        sum += std::sin(2.0 * std::numbers::pi * frequency * seconds + phase);
    }
    return 0.02 * sum;
}

std::vector<float> stereoOf(double rate,
                            double seconds,
                            const std::function<double(double)>& left,
                            const std::function<double(double)>& right) {
    std::vector<float> stereo;
    for (int i = 0; i < static_cast<int>(seconds * rate); ++i) {
        stereo.push_back(static_cast<float>(left(i / rate)));
        stereo.push_back(static_cast<float>(right(i / rate)));
    }
    return stereo;
}

TEST(BinauralMeasures, FindsFractionalDelaysAtEveryRate) {
    for (const double rate : {24000.0, 44100.0, 48000.0}) {
        for (const double delay : {-0.73, -0.31, -0.005, 0.0, 0.1234, 0.666, 0.9}) {
            // The left ear is late by the delay: the right ear is first where it is positive.
            const auto late = [&](double t) { return 0.3 * signalAt(t - delay * 0.001); };
            const std::vector<float> stereo = stereoOf(rate, 0.2, late, signalAt);
            const std::optional<double> found = interauralTime(stereo, rate);
            ASSERT_TRUE(found.has_value()) << rate << " Hz, " << delay << " ms";
            // A parabola through samples of a band below 3 kHz is good to a few microseconds.
            EXPECT_NEAR(*found, delay, 0.004) << rate << " Hz";
        }
    }
}

TEST(BinauralMeasures, DecayingSoundDoesNotDrawTheAnswer) {
    const auto decaying = [](double t) {
        return std::exp(-60.0 * t) * std::sin(2.0 * std::numbers::pi * 110.0 * t);
    };
    const std::vector<float> stereo = stereoOf(48000.0, 0.3, decaying, decaying);
    for (const BinauralPoint& point : measureBinaural(stereo, 48000.0, 0.02)) {
        if (point.timeDifference) {
            EXPECT_NEAR(*point.timeDifference, 0.0, 0.001) << point.time;
        }
    }
}

TEST(BinauralMeasures, UnlikeEarsHaveNoTimeDifference) {
    std::mt19937_64 generator(5);
    const auto noise = [&](double) {
        return static_cast<double>(generator() >> 11) / 9007199254740992.0 - 0.5;
    };
    const std::vector<float> stereo = stereoOf(48000.0, 0.5, noise, noise);
    EXPECT_FALSE(interauralTime(stereo, 48000.0).has_value());
}

TEST(BinauralMeasures, SilenceHasNoDifferences) {
    const std::vector<float> stereo(20000, 0.0f);
    EXPECT_FALSE(interauralTime(stereo, 48000.0).has_value());
    for (const BinauralPoint& point : measureBinaural(stereo, 48000.0, 0.02)) {
        EXPECT_EQ(point.leftDb, silenceDb);
        EXPECT_EQ(point.rightDb, silenceDb);
        EXPECT_FALSE(point.levelDifference.has_value());
        EXPECT_FALSE(point.timeDifference.has_value());
    }
}

TEST(BinauralMeasures, LevelsAreRmsInDecibels) {
    // A sine of full scale is -3.01 dB rms; a tenth of it is 20 dB below.
    const auto sine = [](double t) { return std::sin(2.0 * std::numbers::pi * 1000.0 * t); };
    const auto tenth = [&](double t) { return 0.1 * sine(t); };
    const std::vector<float> stereo = stereoOf(48000.0, 0.5, tenth, sine);
    const std::vector<BinauralPoint> points = measureBinaural(stereo, 48000.0, 0.05);
    ASSERT_EQ(points.size(), 10u);
    for (const BinauralPoint& point : points) {
        EXPECT_NEAR(point.leftDb, -23.01, 0.01);
        EXPECT_NEAR(point.rightDb, -3.01, 0.01);
        ASSERT_TRUE(point.levelDifference.has_value());
        EXPECT_NEAR(*point.levelDifference, 20.0, 0.001);
    }
}

TEST(BinauralMeasures, QuietStretchesHaveLevelsButNoDifferences) {
    const auto fading = [](double t) { return signalAt(t) * (t < 0.25 ? 1.0 : 0.002); };
    const std::vector<float> stereo = stereoOf(48000.0, 0.5, fading, fading);
    for (const BinauralPoint& point : measureBinaural(stereo, 48000.0, 0.02)) {
        if (point.time < 0.22 || point.time > 0.28) {
            EXPECT_EQ(point.levelDifference.has_value(), point.time < 0.25) << point.time;
            EXPECT_EQ(point.timeDifference.has_value(), point.time < 0.25) << point.time;
        }
        EXPECT_GT(point.leftDb, silenceDb);
    }
}

TEST(BinauralMeasures, ShortAndEmptySignalsAreSafe) {
    EXPECT_TRUE(measureBinaural({}, 48000.0, 0.02).empty());
    const std::vector<float> two = {0.5f, 0.25f};
    const std::vector<BinauralPoint> points = measureBinaural(two, 48000.0, 0.02);
    ASSERT_EQ(points.size(), 1u);
    EXPECT_NEAR(*points[0].levelDifference, -6.0206, 0.001);
}

}  // namespace
}  // namespace tessaly
