// The loops over samples of every table against the plain ones.
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <numbers>
#include <vector>

#include "convolution/kernel_fixture.h"

namespace tessaly::test {
namespace {

class SignalKernelsTest : public testing::TestWithParam<const Kernels*> {
protected:
    const SignalKernels& kernels = *GetParam()->signal;
    Noise noise{11};

    std::vector<float> samples(std::size_t count) {
        std::vector<float> made(count);
        for (float& sample : made) {
            sample = noise();
        }
        return made;
    }
    /// Low-pass or high-pass at a cut-off over the sample rate.
    static SectionCoefficients design(bool highPass, double frequency) {
        const double K = std::tan(std::numbers::pi * frequency);
        const double norm = 1.0 / (1.0 + K / 0.707 + K * K);
        const double b0 = highPass ? norm : K * K * norm;
        return {b0, highPass ? -2.0 * b0 : 2.0 * b0, b0, 2.0 * (K * K - 1.0) * norm,
                (1.0 - K / 0.707 + K * K) * norm};
    }
};

float step(RunningSection& section, float sample) {
    const SectionCoefficients& c = section.coefficients;
    const double x = static_cast<double>(sample);
    const double y = x * c.b0 + section.z1;
    section.z1 = x * c.b1 + section.z2 - c.a1 * y;
    section.z2 = x * c.b2 - c.a2 * y;
    return static_cast<float>(y);
}

/// Bits, but any NaN is as good as another.
std::uint32_t bits(float value) {
    return std::isnan(value) ? 0x7fc00000u : std::bit_cast<std::uint32_t>(value);
}

constexpr float guard = 77.0f;  // stands before and behind what a kernel may write

TEST_P(SignalKernelsTest, FiltersSideBySideAreTheRecursion) {
    const float odd[] = {std::numeric_limits<float>::quiet_NaN(),
                         std::numeric_limits<float>::infinity(), 1e-40f, 3e38f};
    for (std::size_t count = 0; count <= 30; ++count) {
        for (const std::size_t frames : {0, 1, 2, 7, 16, 33}) {
            std::vector<std::vector<float>> inputs(count);
            std::vector<std::vector<float>> outputs(count);
            std::vector<PairFilter> filters(count);
            for (std::size_t k = 0; k < count; ++k) {
                inputs[k] = samples(2 * frames + 1);
                if (k % 7 == 6 && frames > 2) {
                    inputs[k][1 + k % (2 * frames)] = odd[k % 4];
                }
                outputs[k].assign(2 * frames + 2, guard);
                filters[k] = {inputs[k].data() + 1, outputs[k].data() + 1,
                              design(k % 5 == 4, 0.02 + 0.0145 * static_cast<double>(k))};
            }
            kernels.filterPairs(frames, count, filters.data());
            for (std::size_t k = 0; k < count; ++k) {
                for (std::size_t ear = 0; ear < 2; ++ear) {
                    RunningSection section{filters[k].coefficients, 0.0, 0.0};
                    for (std::size_t i = 0; i < frames; ++i) {
                        const float expected = step(section, inputs[k][1 + 2 * i + ear]);
                        ASSERT_EQ(bits(outputs[k][1 + 2 * i + ear]), bits(expected))
                            << "filter " << k << " of " << count << ", frame " << i;
                    }
                }
                ASSERT_EQ(outputs[k].front(), guard);
                ASSERT_EQ(outputs[k].back(), guard);
            }
        }
    }
}

TEST_P(SignalKernelsTest, SectionsInSeriesFollowTheRecursion) {
    const SectionCoefficients designs[] = {design(true, 10.0 / 48000.0),   design(false, 0.458),
                                           design(false, 200.0 / 48000.0), design(false, 0.2),
                                           design(true, 180.0 / 24000.0),  design(false, 0.0)};
    for (std::size_t sections = 0; sections <= 4; ++sections) {
        for (const std::size_t count : {0, 1, 2, 4, 15, 16, 17, 64, 131, 1024}) {
            std::vector<RunningSection> series(sections);
            std::vector<RunningSection> plain(sections);
            for (int block = 0; block < 6; ++block) {
                for (std::size_t s = 0; s < sections; ++s) {
                    // Designs change from block to block, the state runs on.
                    const auto at = (s + static_cast<std::size_t>(block)) % std::size(designs);
                    series[s].coefficients = plain[s].coefficients = designs[at];
                }
                std::vector<float> block1 = samples(count + 2);
                std::vector<float> block2 = block1;
                const float before = block1.front();
                const float behind = block1.back();
                kernels.filterSeries(count, block1.data() + 1, sections, series.data());
                double peak = 1.0;
                for (std::size_t i = 1; i <= count; ++i) {
                    for (RunningSection& section : plain) {
                        block2[i] = step(section, block2[i]);
                    }
                    peak = std::max(peak, std::abs(static_cast<double>(block2[i])));
                }
                for (std::size_t i = 1; i <= count; ++i) {
                    ASSERT_NEAR(block1[i], block2[i], 1e-7 * peak) << sections << ' ' << count;
                }
                ASSERT_EQ(block1.front(), before);
                ASSERT_EQ(block1.back(), behind);
                for (std::size_t s = 0; s < sections; ++s) {
                    ASSERT_NEAR(series[s].z1, plain[s].z1, 3e-7 * peak);
                    ASSERT_NEAR(series[s].z2, plain[s].z2, 3e-7 * peak);
                }
            }
        }
    }
}

TEST_P(SignalKernelsTest, OneSectionKeepsDoublePrecision) {
    // No rounding between sections hides the error; the lowest cut-off is the most sensitive.
    RunningSection ahead{design(true, 10.0 / 48000.0), 0.0, 0.0};
    RunningSection plain = ahead;
    double worst = 0.0;
    for (int block = 0; block < 400; ++block) {
        std::vector<float> input = samples(1024);
        for (float& sample : input) {
            sample += 1.0f;
        }
        std::vector<float> output = input;
        kernels.filterSeries(output.size(), output.data(), 1, &ahead);
        for (const float sample : input) {
            step(plain, sample);
        }
        worst = std::max({worst, std::abs(ahead.z1 - plain.z1), std::abs(ahead.z2 - plain.z2)});
    }
    // The poles are 1e-3 from 1: a rounding of 1e-16 grows by up to the square of its inverse.
    EXPECT_LT(worst, 1e-10);
    EXPECT_GT(std::abs(plain.z1), 0.0);
}

TEST_P(SignalKernelsTest, ASampleThatIsNoNumberStaysInTheSeries) {
    RunningSection series[2] = {{design(false, 0.2), 0.0, 0.0}, {design(true, 0.001), 0.0, 0.0}};
    std::vector<float> block = samples(64);
    block[21] = std::numeric_limits<float>::infinity();
    kernels.filterSeries(block.size(), block.data(), 2, series);
    for (std::size_t i = 0; i + 7 < 21; ++i) {
        EXPECT_TRUE(std::isfinite(block[i])) << i;
    }
    for (std::size_t i = 21; i < block.size(); ++i) {
        EXPECT_FALSE(std::isfinite(block[i])) << i;
    }
}

TEST_P(SignalKernelsTest, PairsAreAddedWrittenAndMadeAsByPlainLoops) {
    for (std::size_t frames = 0; frames <= 67; ++frames) {
        const std::vector<float> pairs = samples(2 * frames + 3);
        const float* const from = pairs.data() + 1;
        const float gain = noise();
        const float second = noise();
        std::vector<float> even = samples(frames + 2);
        std::vector<float> odd = samples(frames + 2);
        const std::vector<float> evenBefore = even;
        const std::vector<float> oddBefore = odd;

        kernels.addPairs(frames, from, gain, even.data() + 1, odd.data() + 1);
        for (std::size_t i = 0; i < frames; ++i) {
            ASSERT_EQ(even[i + 1], evenBefore[i + 1] + from[2 * i] * gain);
            ASSERT_EQ(odd[i + 1], oddBefore[i + 1] + from[2 * i + 1] * gain);
        }
        kernels.writePairs(frames, from, gain, second, even.data() + 1, odd.data() + 1);
        for (std::size_t i = 0; i < frames; ++i) {
            ASSERT_EQ(even[i + 1], from[2 * i] * gain * second);
            ASSERT_EQ(odd[i + 1], from[2 * i + 1] * gain * second);
        }
        std::vector<float> made(2 * frames + 2, guard);
        kernels.interleave(frames, even.data() + 1, odd.data() + 1, gain, made.data() + 1);
        for (std::size_t i = 0; i < frames; ++i) {
            ASSERT_EQ(made[2 * i + 1], even[i + 1] * gain);
            ASSERT_EQ(made[2 * i + 2], odd[i + 1] * gain);
        }
        for (const std::vector<float>* array : {&even, &odd}) {
            const std::vector<float>& before = array == &even ? evenBefore : oddBefore;
            ASSERT_EQ(array->front(), before.front());
            ASSERT_EQ(array->back(), before.back());
        }
        ASSERT_EQ(made.front(), guard);
        ASSERT_EQ(made.back(), guard);
    }
}

TEST_P(SignalKernelsTest, SilenceIsZerosWithoutASignAndNothingElse) {
    for (const std::size_t count : {0u, 1u, 3u, 4u, 15u, 64u, 129u, 300u}) {
        for (const std::size_t offset : {0u, 1u}) {
            std::vector<float> made(offset + count + 1);
            made.back() = 1.0f;  // behind the samples
            ASSERT_TRUE(kernels.isSilent(count, made.data() + offset)) << count;
            for (std::size_t i = 0; i < count; ++i) {
                for (const float sound : {1.0f, -0.0f, 1e-45f, std::nanf("")}) {
                    made[offset + i] = sound;
                    ASSERT_FALSE(kernels.isSilent(count, made.data() + offset)) << count << i;
                }
                made[offset + i] = 0.0f;
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         SignalKernelsTest,
                         testing::ValuesIn(testableKernels()),
                         kernelTestName);

}  // namespace
}  // namespace tessaly::test
