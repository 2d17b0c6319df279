// Synthetic tails: the same every time, silent before their start, with their decay.
#include "data/tail_synthesis.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "base/precision.h"
#include "data/data_error.h"
#include "data/tail_analysis.h"
#include "data/tail_builder.h"
#include "data/tail_envelope.h"
#include "data/tail_random.h"
#include "tools/data/tail_test_set.h"

namespace tessaly::data {
namespace {

std::vector<float> inSingle(const std::vector<double>& samples) {
    return {samples.begin(), samples.end()};
}

TEST(TailRandom, FollowsTheStandardsGenerator) {
    std::mt19937_64 generator(1015);
    TailRandom random(1015);
    EXPECT_EQ(random.uniform(), static_cast<double>(generator() >> 11) / 9007199254740992.0);
    const double u = static_cast<double>(generator() >> 11) / 9007199254740992.0;
    EXPECT_EQ(random.exponential(), -std::log(1.0 - u));
    EXPECT_EQ(random.sign(), generator() >= 0x8000000000000000u ? -1.0 : 1.0);
}

TEST(TailRandom, HasTheMomentsOfItsDistributions) {
    TailRandom random(1);
    constexpr int count = 100000;
    double uniform = 0.0;
    double exponential = 0.0;
    double sign = 0.0;
    for (int i = 0; i < count; ++i) {
        uniform += random.uniform() / count;
        exponential += random.exponential() / count;
        sign += random.sign() / count;
    }
    // Five standard deviations of each mean.
    EXPECT_NEAR(uniform, 0.5, 5.0 * 0.289 / std::sqrt(count));
    EXPECT_NEAR(exponential, 1.0, 5.0 / std::sqrt(count));
    EXPECT_NEAR(sign, 0.0, 5.0 / std::sqrt(count));
}

TEST(TailSynthesis, TheSamePresetIsTheSameTailAndOthersAreNot) {
    const HrirSet set = tailTestSet(48000);
    const std::vector<double> first = synthesiseTail(tailDesign(20), set);
    EXPECT_EQ(first, synthesiseTail(tailDesign(20), set));
    EXPECT_EQ(first.size(), 2u * 4096u);
    EXPECT_NE(first, synthesiseTail(tailDesign(52), set));
}

TEST(TailSynthesis, BeginsAtItsStartAndEndsInSilence) {
    const HrirSet set = tailTestSet(48000);
    for (const int preset : {20, 41, 53}) {
        const TailDesign& design = tailDesign(preset);
        const std::vector<float> tail = inSingle(synthesiseTail(design, set));
        const TailSamplesCheck check = checkTailSamples(tail, 48000, design);
        EXPECT_EQ(check.soundingBefore, 0) << preset;
        EXPECT_EQ(check.last, 0.0) << preset;
        EXPECT_LT(check.lastJump, 1e-4) << preset;
        EXPECT_LT(check.sumDecibels, -100.0) << preset;
        EXPECT_GT(check.peak, 0.0) << preset;
    }
}

TEST(TailSynthesis, DecaysAsDesigned) {
    const HrirSet set = tailTestSet(48000);
    for (const int preset : {53, 23, 41}) {
        const TailDesign& design = tailDesign(preset);
        const std::vector<float> tail = inSingle(synthesiseTail(design, set));
        const OctaveTimes times = measuredTimes(tail, 48000, design);
        const OctaveTimes wanted = designedTimes(tail.size() / 2, 48000, design);
        for (std::size_t octave = 2; octave < decayOctaves; ++octave) {
            EXPECT_NEAR(times[octave] / wanted[octave], 1.0, 0.12) << preset << " " << octave;
        }
    }
}

TEST(TailSynthesis, NeedsASetOfTheDesignRate) {
    EXPECT_THROW(synthesiseTail(tailDesign(20), tailTestSet(44100)), DataError);
}

TEST(TailEnvelope, RisesFromTheStartToTheOnset) {
    const TailDesign& design = tailDesign(16);
    const TailEnvelope envelope(design, 48000);
    std::vector<double> ones(envelope.frames(), 1.0);
    envelope.apply(ones, 1);
    const auto at = [&](double seconds) {
        return ones[static_cast<std::size_t>(std::lround(seconds * 48000.0))];
    };
    EXPECT_EQ(ones[envelope.startFrame() - 1], 0.0);
    EXPECT_NEAR(at(0.7 * design.onsetSeconds), std::sqrt(0.5), 1e-3);
    EXPECT_NEAR(at(design.onsetSeconds), 1.0, 1e-6);
    EXPECT_EQ(ones.back(), 0.0);
}

TEST(TailEnvelope, EchoesStandOut) {
    const TailEnvelope envelope(tailDesign(33), 48000);
    std::vector<double> ones(envelope.frames(), 1.0);
    envelope.apply(ones, 1);
    EXPECT_NEAR(ones[1824], 2.2, 1e-9);        // 38 ms
    EXPECT_NEAR(ones[3456], 2.2 * 0.8, 1e-9);  // 72 ms
    EXPECT_NEAR(ones[9600], 0.15, 1e-9);       // 200 ms, between two
}

TEST(TailEnvelope, RemovesTheSumWithItsOwnShape) {
    const TailEnvelope envelope(tailDesign(53), 24000);
    std::vector<double> samples(2 * envelope.frames(), 0.25);
    envelope.apply(samples, 2);
    EXPECT_GT(envelope.removeSum(samples, 2), 0.0);
    double left = 0.0;
    for (std::size_t i = 0; i < samples.size(); i += 2) {
        left += samples[i];
    }
    EXPECT_NEAR(left, 0.0, 1e-9);
    EXPECT_EQ(samples[2 * (envelope.startFrame() - 1)], 0.0);
}

TEST(TailBuilder, AllRatesHaveTheSameRatioOfDirectToTail) {
    const HrirSet set = tailTestSet(48000);
    const TailDesign& design = tailDesign(53);
    const double direct = directEnergy(set);
    const BuiltTail tail =
        buildTail(design, set, direct, TailOptions{}, nullptr, {44100, 48000, 24000});
    const int rates[] = {44100, 48000, 24000};
    for (std::size_t i = 0; i < 3; ++i) {
        std::vector<double> pairs(tail.stored[i].begin(), tail.stored[i].end());
        for (double& sample : pairs) {
            sample *= wide(design.presetGain);
        }
        const double ratio = 10.0 * std::log10(direct / middleEnergy(pairs, rates[i]));
        EXPECT_NEAR(ratio, design.directToTail(), 0.02) << rates[i];
    }
}

TEST(TailBuilder, LevelOptionsShiftOrScaleToAPeak) {
    const HrirSet set = tailTestSet(48000);
    const TailDesign& design = tailDesign(20);
    const double direct = directEnergy(set);
    const auto peakOf = [&](const TailOptions& options) {
        const BuiltTail tail = buildTail(design, set, direct, options, nullptr, {48000});
        return checkTailSamples(tail.stored[0], 48000, design).peak;
    };
    EXPECT_NEAR(peakOf({TailLevel::peak, 0.0}), 0.9, 1e-6);
    const double reference = peakOf({});
    EXPECT_NEAR(peakOf({TailLevel::rule, 6.0}) / reference, std::pow(10.0, 0.3), 1e-6);
    EXPECT_THROW(checkTailOptions({TailLevel::rule, std::nan("")}), DataError);
    EXPECT_THROW(checkTailOptions({TailLevel::rule, 41.0}), DataError);
}

TEST(TailBuilder, OptionsAndOriginsReadBack) {
    const TailOptions options{TailLevel::peak, -2.5};
    EXPECT_EQ(tailOptionsFromText(toText(options)), options);
    EXPECT_EQ(tailOptionsFromText(""), TailOptions{});
    EXPECT_THROW(tailOptionsFromText("level=loud"), DataError);
    EXPECT_THROW(tailOptionsFromText("dry=1"), DataError);

    TailOrigin origin;
    origin.preset = 16;
    origin.file = "my hall; left.wav";
    origin.sha256 = "abc";
    origin.matchLevel = false;
    origin.askedDb = -1.5;
    origin.licence = "CC0";
    const TailOrigin read = tailOriginFromText(toText(origin));
    EXPECT_EQ(read.preset, 16);
    EXPECT_EQ(read.file, "my hall, left.wav");
    EXPECT_EQ(read.sha256, "abc");
    EXPECT_FALSE(read.matchLevel);
    EXPECT_DOUBLE_EQ(read.askedDb, -1.5);
    TailOrigin synthetic;
    synthetic.preset = 60;
    EXPECT_EQ(tailOriginFromText(toText(synthetic)).file, "");
    for (const char* text : {"", "15", "14 x: synthetic", "15 x: guessed", "15 x: measured; a"}) {
        EXPECT_THROW(tailOriginFromText(text), DataError) << text;
    }
}

}  // namespace
}  // namespace tessaly::data
