// Crossfade, normalisation and the ambience bed.
#include "engine/output_stage.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

namespace tessaly::test {
namespace {

/// Gives the four result buffers contents that tell sample, ear and instance apart.
void fill(OutputStage& stage, int blocklenght) {
    for (int i = 0; i < 2 * blocklenght; ++i) {
        const auto v = static_cast<float>(i);
        stage.firstOutLeft[i] = 1.0f + v * 0.001f;
        stage.firstOutRight[i] = -2.0f + v * 0.002f;
        stage.secondOutLeft[i] = 5.0f - v * 0.003f;
        stage.secondOutRight[i] = 7.0f + v * 0.0005f;
    }
}

TEST(OutputStage, RampIsATriangleInSinglePrecision) {
    OutputStage stage;
    stage.prepare(256, true);
    ASSERT_EQ(stage.crossfadeRamp.size(), 128u);
    for (std::size_t i = 0; i < 64; ++i) {
        EXPECT_EQ(stage.crossfadeRamp[i], static_cast<float>(i) * 0.01587301678955555f);
        EXPECT_EQ(stage.crossfadeRamp[127 - i], stage.crossfadeRamp[i]);
    }
    EXPECT_EQ(stage.crossfadeRamp[0], 0.0f);
    EXPECT_NEAR(stage.crossfadeRamp[63], 1.0f, 1e-6f);
}

TEST(OutputStage, WithoutFadingThereIsNoRampAndNoSecondPair) {
    OutputStage stage;
    stage.prepare(256, false);
    EXPECT_TRUE(stage.crossfadeRamp.empty());
    EXPECT_EQ(stage.secondOutLeft, nullptr);
    EXPECT_EQ(stage.secondOutRight, nullptr);
}

TEST(OutputStage, CrossfadesTheFirstSixtyFourSamplesOnly) {
    constexpr int block = 256;
    OutputStage stage;
    stage.prepare(block, true);
    fill(stage, block);
    OutputStage before;
    before.prepare(block, true);
    fill(before, block);
    stage.crossfade();
    for (int i = 0; i < 2 * block; ++i) {
        const int k = i - block;
        if (k >= 0 && k < 64) {
            const float up = static_cast<float>(k) / 63.0f;
            EXPECT_NEAR(stage.firstOutLeft[i],
                        (1.0f - up) * before.secondOutLeft[i] + up * before.firstOutLeft[i], 1e-5);
            EXPECT_NEAR(stage.firstOutRight[i],
                        (1.0f - up) * before.secondOutRight[i] + up * before.firstOutRight[i],
                        1e-5);
        } else {
            EXPECT_EQ(stage.firstOutLeft[i], before.firstOutLeft[i]) << i;
            EXPECT_EQ(stage.firstOutRight[i], before.firstOutRight[i]) << i;
        }
    }
}

TEST(OutputStage, ShortBlocksStopAtTheirEndOnTheSameRamp) {
    for (const int block : {2, 16, 32}) {
        OutputStage stage;
        stage.prepare(block, true);
        fill(stage, block);
        OutputStage before;
        before.prepare(block, true);
        fill(before, block);
        stage.crossfade();  // must not write behind 2 * block floats
        for (int k = 0; k < block; ++k) {
            const float up = static_cast<float>(k) / 63.0f;
            EXPECT_NEAR(
                stage.firstOutLeft[block + k],
                (1.0f - up) * before.secondOutLeft[block + k] + up * before.firstOutLeft[block + k],
                1e-5);
        }
    }
}

TEST(OutputStage, ScaleUndoesTheTransformAndAppliesTheGain) {
    OutputStage stage;
    stage.setBlockGain(-6.0f, 512, false);
    EXPECT_EQ(stage.blockGainLinear, std::pow(10.0f, -6.0f * 0.05f));
    EXPECT_EQ(stage.outputNormalisation, 512.0f / stage.blockGainLinear);
    const float plain = stage.outputNormalisation;
    stage.setBlockGain(-6.0f, 512, true);
    EXPECT_EQ(stage.outputNormalisation, plain * 3.0f) << "compensated output is a third as loud";
}

TEST(OutputStage, WritesTheUpperHalvesInterleavedLeftFirst) {
    constexpr int block = 32;
    OutputStage stage;
    stage.prepare(block, true);
    fill(stage, block);
    stage.setBlockGain(0.0f, 2 * block, false);
    std::vector<float> output(2 * block, -1.0f);
    stage.write(output.data(), Ambience{}, 0, 0);
    const float scale = 1.0f / 64.0f;
    for (int i = 0; i < block; ++i) {
        EXPECT_EQ(output[static_cast<std::size_t>(2 * i)], stage.firstOutLeft[block + i] * scale);
        EXPECT_EQ(output[static_cast<std::size_t>(2 * i + 1)],
                  stage.firstOutRight[block + i] * scale);
    }
}

TEST(OutputStage, TheBedIsAddedAtItsOwnGainAndWrapsByBlocks) {
    constexpr int block = 1024;
    OutputStage stage;
    stage.prepare(block, true);
    fill(stage, block);
    stage.setBlockGain(-12.0f, 2 * block, false);
    Ambience bed;
    bed.setBlockLength(block);
    EXPECT_EQ(bed.ATMO_BLOCKS, 1040);
    bed.atmoBuffer = AlignedArray<float>(std::size_t{2} * ATMO_LENGTH);
    for (std::size_t i = 0; i < bed.atmoBuffer.size(); ++i) {
        bed.atmoBuffer[i] = std::sin(static_cast<float>(i % 9973));
    }
    std::vector<float> output(2 * block);
    const float scale = 1.0f / stage.outputNormalisation;
    for (const unsigned int counter : {0u, 1u, 1039u, 1040u, 4294967295u}) {
        stage.write(output.data(), bed, 1, counter);
        const std::size_t start = std::size_t{counter % 1040u} * block * 2;
        for (std::size_t i = 0; i < block; ++i) {
            const double left = stage.firstOutLeft[block + i];
            EXPECT_EQ(output[2 * i],
                      static_cast<float>(left * double{scale} +
                                         double{bed.atmoBuffer[start + 2 * i]} * 1.45));
        }
    }
}

TEST(OutputStage, ASelectionWithoutALoopHasNoBed) {
    constexpr int block = 64;
    OutputStage stage;
    stage.prepare(block, true);
    fill(stage, block);
    Ambience nothing;
    nothing.setBlockLength(block);
    std::vector<float> with(2 * block);
    std::vector<float> without(2 * block);
    stage.write(with.data(), nothing, 4, 17);
    stage.write(without.data(), nothing, 0, 17);
    EXPECT_EQ(with, without);
}

TEST(OutputStage, SilentGainGivesZerosNotNaN) {
    constexpr int block = 64;
    OutputStage stage;
    stage.prepare(block, true);
    fill(stage, block);
    stage.setBlockGain(-2000.0f, 2 * block, false);
    std::vector<float> output(2 * block, 1.0f);
    stage.write(output.data(), Ambience{}, 0, 0);
    for (const float sample : output) {
        EXPECT_EQ(sample, 0.0f);
    }
}

}  // namespace
}  // namespace tessaly::test
