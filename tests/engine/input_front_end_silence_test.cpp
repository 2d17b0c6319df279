// The filters of every kernel table against the plain ones, and what silence spares them.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <random>
#include <vector>

#include "base/flush_denormals.h"
#include "convolution/simd/kernels.h"
#include "engine/input_front_end.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

/// Sample by sample, one filter after the other.
struct PlainChain {
    std::array<Biquad, 4> filters;  // shelf, occlusion, high cut, low cut
    bool bassBoost = false;
    bool occluded = false;

    explicit PlainChain(const InputFrontEnd& designs)
        : filters{designs.bassShelveFilter, designs.inputLowPass, designs.highCutFilter,
                  designs.lowCutFilter} {}
    /// Takes the coefficients over, as redesigns do; the state runs on.
    void follow(const InputFrontEnd& designs) {
        PlainChain next(designs);
        for (std::size_t k = 0; k < 4; ++k) {
            next.filters[k].z1 = filters[k].z1;
            next.filters[k].z2 = filters[k].z2;
        }
        filters = next.filters;
        occluded = designs.inputLowPassLevel > 0.0f;
    }
    float process(float sample) {
        sample = bassBoost ? filters[0].process(sample) : sample;
        sample = occluded ? filters[1].process(sample) : sample;
        return filters[3].process(filters[2].process(sample));
    }
};

class FrontEndOfEveryTable : public testing::TestWithParam<std::size_t> {
protected:
    void TearDown() override { forceKernels(nullptr); }

    /// A front end over the tested table.
    struct Built {
        explicit Built(const Kernels* kernels, int sampleRate, int block)
            : frontEnd((forceKernels(kernels), InputFrontEnd())) {
            const LogCapture quiet;
            frontEnd.prepareFilters(sampleRate);
            frontEnd.prepareWindow(block);
        }
        InputFrontEnd frontEnd;
    };
    float uniform(float low, float high) {
        return std::uniform_real_distribution<float>(low, high)(random);
    }
    std::vector<float> noise(int frames) {
        std::vector<float> samples(2 * static_cast<std::size_t>(frames));
        for (float& sample : samples) {
            sample = uniform(-1.0f, 1.0f);
        }
        return samples;
    }
    bool isPlain() const { return kernels == kernelsScalar; }

    const Kernels* kernels = availableKernels().tables[GetParam()];
    std::mt19937 random{9};
    FlushDenormalsScope denormals;
};

TEST_P(FrontEndOfEveryTable, RandomScenesAreThoseOfThePlainFilters) {
    for (const int block : {2, 4, 8, 16, 64, 256, 1024}) {
        Built built(kernels, block == 64 ? 24000 : 48000, block);
        InputFrontEnd& frontEnd = built.frontEnd;
        PlainChain plain(frontEnd);
        double peak = 1.0;
        for (int n = 0; n < 60; ++n) {
            if (n % 3 != 0) {
                frontEnd.followDistance(uniform(0.0f, 40.0f));
            }
            if (n % 4 == 1) {
                frontEnd.setInputLowPass(n % 8 == 1 ? uniform(0.0f, 1.0f) : 0.0f);
            }
            plain.bassBoost = n % 5 < 3;
            plain.follow(frontEnd);
            std::vector<float> input = noise(block);
            if (n % 10 > 7) {
                std::fill(input.begin(), input.end(), 0.0f);
            }
            const int channel = n % 7 == 0 ? 1 : 0;
            frontEnd.process(input.data(), channel, plain.bassBoost, false, 1.0f, 1.0f);
            for (int i = 0; i < block; ++i) {
                const float expected = plain.process(input[2 * i + channel]);
                peak = std::max(peak, std::abs(static_cast<double>(expected)));
                if (isPlain()) {
                    ASSERT_EQ(frontEnd.inputHistory[block + i], expected);
                } else {
                    ASSERT_NEAR(frontEnd.inputHistory[block + i], expected, 1e-7 * peak)
                        << "block " << n << " of " << block;
                }
            }
        }
    }
}

TEST_P(FrontEndOfEveryTable, AMinuteOfSilenceIsSleptThroughAndChangesNothing) {
    constexpr int block = 1024;
    // The plain filters are what takes time: one table sleeps a minute, the others some seconds.
    const int silentBlocks = (isPlain() ? 60 : 4) * 48000 / block;
    Built built(kernels, 48000, block);
    InputFrontEnd& frontEnd = built.frontEnd;
    PlainChain plain(frontEnd);
    frontEnd.setInputLowPass(0.5f);
    plain.follow(frontEnd);
    plain.bassBoost = true;
    const double allowed = isPlain() ? 1e-12 : 1e-7;
    const auto run = [&](const std::vector<float>& input) {
        frontEnd.process(input.data(), 0, true, false, 1.0f, 1.0f);
        double worst = 0.0;
        for (int i = 0; i < block; ++i) {
            const double expected = static_cast<double>(plain.process(input[2 * i]));
            worst = std::max(
                worst, std::abs(static_cast<double>(frontEnd.inputHistory[block + i]) - expected));
        }
        return worst;
    };
    for (int n = 0; n < 10; ++n) {
        ASSERT_LE(run(noise(block)), allowed);
    }
    std::vector<float> silence = noise(block);
    for (int i = 0; i < block; ++i) {
        silence[2 * i] = i % 2 == 0 ? 0.0f : -0.0f;  // of the channel that is read
    }
    int asleep = silentBlocks;
    for (int n = 0; n < silentBlocks; ++n) {
        ASSERT_LE(run(silence), n > asleep ? 1e-12 : allowed);
        if (asleep == silentBlocks && frontEnd.lowCutFilter.z1 == 0.0) {
            asleep = n;
        }
        if (n > asleep) {
            ASSERT_TRUE(std::all_of(frontEnd.inputHistory, frontEnd.inputHistory + 2 * block,
                                    [](float sample) { return sample == 0.0f; }));
        }
    }
    EXPECT_GT(asleep, 20) << "half a second at least of the lowest cut-off's decay";
    EXPECT_LT(asleep, 100);
    for (const Biquad* filter : {&frontEnd.bassShelveFilter, &frontEnd.inputLowPass,
                                 &frontEnd.highCutFilter, &frontEnd.lowCutFilter}) {
        EXPECT_EQ(filter->z1, 0.0);
        EXPECT_EQ(filter->z2, 0.0);
    }

    Built fresh(kernels, 48000, block);
    fresh.frontEnd.setInputLowPass(0.5f);
    for (int n = 0; n < 5; ++n) {
        const std::vector<float> input = noise(block);
        ASSERT_LE(run(input), allowed);
        fresh.frontEnd.process(input.data(), 0, true, false, 1.0f, 1.0f);
        for (int i = 0; i < 2 * block; ++i) {
            ASSERT_EQ(frontEnd.inputHistory[i], fresh.frontEnd.inputHistory[i]) << "as if new";
        }
    }
}

TEST_P(FrontEndOfEveryTable, TheWindowMovesOnThroughShortSilences) {
    for (const bool doppler : {false, true}) {
        Built built(kernels, 48000, 64);
        InputFrontEnd& frontEnd = built.frontEnd;
        frontEnd.doppler.prepare(48000, 64);
        // Filters that let through and keep nothing: at rest after every block.
        for (Biquad* filter : {&frontEnd.highCutFilter, &frontEnd.lowCutFilter}) {
            filter->b0 = 1.0;
            filter->b1 = filter->b2 = filter->a1 = filter->a2 = 0.0;
        }
        DopplerLine line;
        line.prepare(48000, 64);
        std::vector<float> former(64, 0.0f);
        for (const int sounding : {0, 1, 0, 1, 1, 0, 0, 1, 0, 0, 0, 1, 0, 0, 0, 0, 1}) {
            std::vector<float> input = noise(64);
            for (std::size_t i = 0; sounding == 0 && i < 64; ++i) {
                input[2 * i] = 0.0f;
            }
            std::vector<float> expected(64);
            for (std::size_t i = 0; i < 64; ++i) {
                expected[i] = input[2 * i];
            }
            if (doppler) {
                line.process(input.data(), 1.0f, 0.2f, 0.2f, expected.data());
            }
            frontEnd.process(input.data(), 0, false, doppler, 0.2f, 0.2f);
            for (std::size_t i = 0; i < 64; ++i) {
                ASSERT_EQ(frontEnd.inputHistory[i], former[i]);
                ASSERT_EQ(frontEnd.inputHistory[64 + i], expected[i]);
            }
            former = expected;
        }
    }
}

TEST_P(FrontEndOfEveryTable, FiltersAtRestDoNotRunInSilence) {
    Built built(kernels, 48000, 64);
    InputFrontEnd& frontEnd = built.frontEnd;
    frontEnd.lowCutFilter.b0 = std::numeric_limits<double>::quiet_NaN();
    const std::vector<float> silence(128, 0.0f);
    frontEnd.process(silence.data(), 0, true, false, 1.0f, 1.0f);
    EXPECT_EQ(frontEnd.inputHistory[127], 0.0f);
    std::vector<float> click = silence;
    click[126] = 1e-30f;
    frontEnd.process(click.data(), 0, true, false, 1.0f, 1.0f);
    EXPECT_TRUE(std::isnan(frontEnd.inputHistory[127])) << "the last sample wakes them";
    frontEnd.process(silence.data(), 0, true, false, 1.0f, 1.0f);
    EXPECT_TRUE(std::isnan(frontEnd.inputHistory[127])) << "no number is no rest";
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         FrontEndOfEveryTable,
                         testing::Range<std::size_t>(0, availableKernels().count),
                         [](const testing::TestParamInfo<std::size_t>& tested) {
                             return availableKernels().tables[tested.param]->name;
                         });

TEST(InputFrontEndAhead, SeesSilenceOnlyOnceTheWholeWindowIsSilent) {
    const LogCapture quiet;
    InputFrontEnd frontEnd;
    frontEnd.prepareFilters(48000);
    frontEnd.prepareWindow(16);
    for (Biquad* const filter : {&frontEnd.highCutFilter, &frontEnd.lowCutFilter,
                                 &frontEnd.bassShelveFilter, &frontEnd.inputLowPass}) {
        filter->clear();
    }
    frontEnd.inputHistory[20] = 1.0f;  // of the block before, which moves to the lower half
    const std::vector<float> silence(32);
    const auto play = [&] {
        const bool seen = frontEnd.seesSilence(silence.data(), 0, false, false);
        frontEnd.process(silence.data(), 0, false, false, 1.0f, 1.0f);
        const bool zeros = std::all_of(frontEnd.inputHistory, frontEnd.inputHistory + 32,
                                       [](float sample) { return sample == 0.0f; });
        EXPECT_TRUE(!seen || zeros);
        return seen;
    };
    EXPECT_FALSE(play());
    EXPECT_TRUE(play());
    EXPECT_FALSE(frontEnd.seesSilence(silence.data(), 0, false, true)) << "a delay line may sound";
}

}  // namespace
}  // namespace tessaly::test
