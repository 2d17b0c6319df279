// The window, the order of the filters, and the laws of their cut-offs.
#include "engine/input_front_end.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "support/log_capture.h"

namespace tessaly::test {
namespace {

constexpr std::array<int, 3> sampleRates = {24000, 44100, 48000};
constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

void prepare(InputFrontEnd& frontEnd, int sampleRate, int block) {
    const LogCapture quiet;
    frontEnd.prepareFilters(sampleRate);
    frontEnd.prepareWindow(block);
}

std::vector<float> noiseFrames(std::mt19937& random, int frames) {
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    std::vector<float> samples(2 * static_cast<std::size_t>(frames));
    for (float& sample : samples) {
        sample = noise(random);
    }
    return samples;
}

/// Cut-off over sample rate as a design stores it.
double bounded(double cutOff, int sampleRate) {
    const float quotient = static_cast<float>(cutOff) / static_cast<float>(sampleRate);
    return std::fmin(static_cast<double>(quotient), 0.458);
}

TEST(InputFrontEndFilters, StartAtTheirCutOffs) {
    for (const int sampleRate : sampleRates) {
        InputFrontEnd frontEnd;
        prepare(frontEnd, sampleRate, 64);
        EXPECT_EQ(frontEnd.highCutFilter.filterType, Biquad::lowPass);
        EXPECT_EQ(frontEnd.highCutFilter.normalisedFrequency, bounded(20000.0, sampleRate));
        EXPECT_EQ(frontEnd.lowCutFilter.filterType, Biquad::highPass);
        EXPECT_EQ(frontEnd.lowCutFilter.normalisedFrequency, bounded(10.0, sampleRate));
        EXPECT_EQ(frontEnd.bassShelveFilter.filterType, Biquad::lowShelf);
        EXPECT_EQ(frontEnd.bassShelveFilter.gainDb, -4.67);
        EXPECT_EQ(frontEnd.bassShelveFilter.normalisedFrequency, bounded(400.0, sampleRate));
        EXPECT_EQ(frontEnd.inputLowPass.filterType, Biquad::lowPass);
        EXPECT_EQ(frontEnd.inputLowPass.normalisedFrequency, bounded(20000.0, sampleRate));
    }
}

TEST(InputFrontEndFilters, LogTheShelvesFrequency) {
    const LogCapture log;
    InputFrontEnd frontEnd;
    frontEnd.prepareFilters(48000);
    ASSERT_EQ(log.outputLines().size(), 1u);
    EXPECT_EQ(log.outputLines()[0], "bassShelveFilter_Fc / sampleRate = 0.00833333");
    EXPECT_TRUE(log.errorLines().empty());
}

TEST(InputFrontEnd, TakesOneChannelThroughItsFiltersInOrder) {
    std::mt19937 random(3);
    for (const int sampleRate : sampleRates) {
        for (const int channel : {0, 1}) {
            for (const bool bassBoost : {false, true}) {
                for (const float level : {0.0f, 0.6f}) {
                    InputFrontEnd frontEnd;
                    prepare(frontEnd, sampleRate, 96);
                    frontEnd.setInputLowPass(level);
                    frontEnd.followDistance(12.0f);
                    Biquad shelf = frontEnd.bassShelveFilter;
                    Biquad occlusion = frontEnd.inputLowPass;
                    Biquad highCut = frontEnd.highCutFilter;
                    Biquad lowCut = frontEnd.lowCutFilter;
                    std::vector<float> former(96, 0.0f);
                    for (int n = 0; n < 4; ++n) {
                        const std::vector<float> input = noiseFrames(random, 96);
                        frontEnd.inputGain = 5.0f;
                        frontEnd.process(input.data(), channel, bassBoost, false, 1.0f, 1.0f);
                        EXPECT_EQ(frontEnd.inputGain, 1.0f);
                        for (std::size_t i = 0; i < 96; ++i) {
                            float sample = input[2 * i + static_cast<std::size_t>(channel)];
                            sample = bassBoost ? shelf.process(sample) : sample;
                            sample = level > 0.0f ? occlusion.process(sample) : sample;
                            sample = lowCut.process(highCut.process(sample));
                            // A rounding to single between the filters may fall the other way.
                            EXPECT_NEAR(frontEnd.inputHistory[96 + i], sample, 1e-7);
                            EXPECT_EQ(frontEnd.inputHistory[i], former[i]) << "window moved";
                            former[i] = frontEnd.inputHistory[96 + i];
                        }
                    }
                }
            }
        }
    }
}

TEST(InputFrontEnd, DelayLineStandsBeforeTheFilters) {
    std::mt19937 random(4);
    InputFrontEnd frontEnd;
    prepare(frontEnd, 48000, 128);
    frontEnd.doppler.prepare(48000, 128);
    DopplerLine line;
    line.prepare(48000, 128);
    Biquad highCut = frontEnd.highCutFilter;
    Biquad lowCut = frontEnd.lowCutFilter;
    float old = 3.0f;
    for (int n = 0; n < 10; ++n) {
        const float distance = old - 0.02f;
        const std::vector<float> input = noiseFrames(random, 128);
        frontEnd.process(input.data(), 1, false, true, distance, old);
        std::vector<float> expected(128);
        line.process(input.data() + 1, 1.0f, distance, old, expected.data());
        for (std::size_t i = 0; i < 128; ++i) {
            EXPECT_NEAR(frontEnd.inputHistory[128 + i],
                        lowCut.process(highCut.process(expected[i])), 1e-7);
        }
        old = distance;
    }
}

TEST(InputFrontEnd, ReadsNothingBehindTheBlock) {
    InputFrontEnd frontEnd;
    prepare(frontEnd, 44100, 2);
    const std::vector<float> input = {0.1f, 0.2f, 0.3f, 0.4f};
    frontEnd.process(input.data(), 0, true, false, 1.0f, 1.0f);
    frontEnd.process(input.data(), 1, true, false, 1.0f, 1.0f);
    EXPECT_NE(frontEnd.inputHistory[3], 0.0f);
}

double highCutAt(double d) {
    double cutOff = 7000.0 - (d - 20.0) * 300.0;
    if (d < 10.0) {
        cutOff = 20000.0 - d * 900.0;
    } else if (d < 20.0) {
        cutOff = 11000.0 - (d - 10.0) * 400.0;
    }
    return std::fmax(cutOff, 3000.0);
}

TEST(InputFrontEndDistance, CutOffsFollowTheirLaws) {
    for (const int sampleRate : sampleRates) {
        InputFrontEnd frontEnd;
        prepare(frontEnd, sampleRate, 64);
        for (int step = 1; step < 450; ++step) {
            const float distance = static_cast<float>(step) * 0.1f;
            const double d = static_cast<double>(distance);
            frontEnd.followDistance(distance);
            // One or two single-precision steps at 20 kHz and at 180 Hz.
            EXPECT_NEAR(static_cast<double>(frontEnd.highCut_Fc), highCutAt(d), 4e-3) << d;
            EXPECT_NEAR(static_cast<double>(frontEnd.lowCut_Fc),
                        d < 30.0 ? 10.0 + d * 170.0 / 30.0 : 180.0, 3e-5)
                << d;
            EXPECT_EQ(frontEnd.highCutFilter.normalisedFrequency,
                      bounded(static_cast<double>(frontEnd.highCut_Fc), sampleRate));
            EXPECT_EQ(frontEnd.lowCutFilter.normalisedFrequency,
                      bounded(static_cast<double>(frontEnd.lowCut_Fc), sampleRate));
        }
    }
}

TEST(InputFrontEndDistance, PrecisionOfEachBranchIsPinned) {
    // Where single and double precision differ, the branch says which it is.
    InputFrontEnd frontEnd;
    prepare(frontEnd, 44100, 64);
    for (int step = 1; step < 1000; ++step) {
        const float nearBy = static_cast<float>(step) * 0.00997f;
        frontEnd.followDistance(nearBy);
        EXPECT_EQ(frontEnd.highCut_Fc, 20000.0f - nearBy * 9000.0f * 0.1f);
        const double product = static_cast<double>(nearBy * 170.0f);
        EXPECT_EQ(frontEnd.lowCut_Fc, static_cast<float>(product * 0.03333333333333333 + 10.0));

        const float middle = 10.0f + nearBy;
        frontEnd.followDistance(middle);
        EXPECT_EQ(
            frontEnd.highCut_Fc,
            static_cast<float>(11000.0 - (static_cast<double>(middle) - 10.0) * 4000.0 * 0.1));

        const float far = 20.0f + nearBy;
        frontEnd.followDistance(far);
        const float inSingle = (far - 20.0f) * 3000.0f * 0.1f;
        EXPECT_EQ(frontEnd.highCut_Fc, static_cast<float>(7000.0 - static_cast<double>(inSingle)));
    }
}

TEST(InputFrontEndDistance, LimitsTakeTheUpperBranch) {
    InputFrontEnd frontEnd;
    prepare(frontEnd, 48000, 64);
    frontEnd.followDistance(10.0f);
    EXPECT_EQ(frontEnd.highCut_Fc, 11000.0f);
    frontEnd.followDistance(20.0f);
    EXPECT_EQ(frontEnd.highCut_Fc, 7000.0f);
    frontEnd.followDistance(30.0f);
    EXPECT_EQ(frontEnd.lowCut_Fc, 180.0f);
    for (const float far : {33.4f, 100.0f, 1e30f, infinity}) {
        frontEnd.followDistance(far);
        EXPECT_EQ(frontEnd.highCut_Fc, 3000.0f) << far;
        EXPECT_EQ(frontEnd.lowCut_Fc, 180.0f) << far;
    }
}

TEST(InputFrontEndDistance, StateRunsOnAndANaNLeavesFiniteFilters) {
    InputFrontEnd frontEnd;
    prepare(frontEnd, 48000, 32);
    const std::vector<float> input(64, 0.5f);
    frontEnd.process(input.data(), 0, false, false, 1.0f, 1.0f);
    const double z1 = frontEnd.highCutFilter.z1;
    const double z2 = frontEnd.lowCutFilter.z2;
    ASSERT_NE(z1, 0.0);
    frontEnd.followDistance(15.0f);
    EXPECT_EQ(frontEnd.highCutFilter.z1, z1);
    EXPECT_EQ(frontEnd.lowCutFilter.z2, z2);
    frontEnd.followDistance(nan);
    EXPECT_EQ(frontEnd.highCutFilter.normalisedFrequency, 0.458);
    frontEnd.process(input.data(), 0, false, false, nan, nan);
    EXPECT_TRUE(std::isfinite(frontEnd.inputHistory[63]));
}

TEST(InputFrontEndOcclusion, LevelSetsTheCutOff) {
    for (const int sampleRate : sampleRates) {
        InputFrontEnd frontEnd;
        prepare(frontEnd, sampleRate, 64);
        float former = 0.0f;
        for (int step = 1; step <= 100; ++step) {
            const float level = static_cast<float>(step) * 0.01f;
            EXPECT_EQ(frontEnd.setInputLowPass(level), former);
            EXPECT_EQ(frontEnd.inputLowPassLevel, level);
            const double expected = 200.0 * std::pow(100.0, 1.0 - static_cast<double>(level));
            // Single-precision power: a few steps of relative 6e-8, magnified by ln 100.
            EXPECT_NEAR(static_cast<double>(frontEnd.inputLowPass_Fc) / expected, 1.0, 1e-6);
            EXPECT_EQ(frontEnd.inputLowPass.normalisedFrequency,
                      bounded(static_cast<double>(frontEnd.inputLowPass_Fc), sampleRate));
            former = level;
        }
        EXPECT_EQ(frontEnd.inputLowPass_Fc, 200.0f) << "fully occluded";
        EXPECT_EQ(frontEnd.setInputLowPass(0.0f), 1.0f);
        EXPECT_EQ(frontEnd.inputLowPass_Fc, 20000.0f) << "open";
    }
}

TEST(InputFrontEndOcclusion, SameLevelDesignsNothingAndTheStateIsKept) {
    InputFrontEnd frontEnd;
    prepare(frontEnd, 48000, 32);
    frontEnd.setInputLowPass(0.5f);
    const std::vector<float> input(64, 0.5f);
    frontEnd.process(input.data(), 0, false, false, 1.0f, 1.0f);
    const double z1 = frontEnd.inputLowPass.z1;
    ASSERT_NE(z1, 0.0);
    frontEnd.inputLowPass.b0 = 42.0;
    EXPECT_EQ(frontEnd.setInputLowPass(0.5f), 0.5f);
    EXPECT_EQ(frontEnd.inputLowPass.b0, 42.0);
    frontEnd.setInputLowPass(0.7f);
    EXPECT_NE(frontEnd.inputLowPass.b0, 42.0);
    EXPECT_EQ(frontEnd.inputLowPass.z1, z1);
    EXPECT_EQ(frontEnd.inputLowPass.Q, 0.707);
}

TEST(InputFrontEndOcclusion, OddLevelsAreDefinedAndPass) {
    InputFrontEnd frontEnd;
    prepare(frontEnd, 48000, 32);
    const std::vector<float> input(64, 0.5f);
    for (const float level : {nan, infinity, -infinity, 50.0f, -50.0f, 3e38f, -3e38f}) {
        frontEnd.setInputLowPass(level);
        EXPECT_GE(frontEnd.inputLowPass.normalisedFrequency, 0.0) << level;
        EXPECT_LE(frontEnd.inputLowPass.normalisedFrequency, 0.458) << level;
        frontEnd.process(input.data(), 0, true, false, 1.0f, 1.0f);
        EXPECT_TRUE(std::isfinite(frontEnd.inputHistory[63])) << level;
    }
    frontEnd.setInputLowPass(nan);
    EXPECT_FALSE(frontEnd.inputLowPassLevel > 0.0f) << "a NaN leaves the filter out";
    frontEnd.setInputLowPass(0.25f);
    EXPECT_EQ(frontEnd.inputLowPassLevel, 0.25f);
}

TEST(InputFrontEnd, HalfPreparedIsSafe) {
    const std::vector<float> input(64, 0.5f);
    InputFrontEnd bare;
    EXPECT_EQ(bare.setInputLowPass(0.5f), 0.0f);
    EXPECT_EQ(bare.setInputLowPass(0.0f), 0.5f);
    bare.followDistance(5.0f);
    bare.process(input.data(), 0, true, true, 1.0f, 2.0f);
    EXPECT_EQ(bare.inputHistory, nullptr);

    const LogCapture quiet;
    InputFrontEnd filtersOnly;
    filtersOnly.prepareFilters(44100);
    filtersOnly.setInputLowPass(0.5f);
    filtersOnly.process(input.data(), 0, true, true, 1.0f, 2.0f);
    EXPECT_EQ(filtersOnly.inputHistory, nullptr);

    InputFrontEnd noRate;
    noRate.prepareFilters(0);
    EXPECT_EQ(noRate.highCutFilter.normalisedFrequency, 0.458);
}

}  // namespace
}  // namespace tessaly::test
