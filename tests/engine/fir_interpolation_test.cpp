// The peak search and the aligned blend, inside the buffers and at their ends.
#include "engine/fir_interpolation.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>
#include <vector>

#include "engine/hrir_table_fixture.h"

namespace tessaly::test {
namespace {

constexpr float nan = std::numeric_limits<float>::quiet_NaN();

TEST(FindPeakIndex, TakesTheFirstOfTheLargestSignedValues) {
    std::vector<float> buffer(100, 0.0f);
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 0);
    buffer[30] = 0.5f;
    buffer[60] = 0.5f;
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 30) << "ties go to the earliest";
    buffer[80] = -0.9f;
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 30) << "a negative peak is not seen";
    buffer[99] = 0.6f;
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 99);
    const std::vector<float> negative(100, -1.0f);
    EXPECT_EQ(findPeakIndex(negative.data(), 100), 0);
}

TEST(FindPeakIndex, LooksAtOneHundredValuesAndNoMore) {
    std::vector<float> buffer(200, 0.0f);
    buffer[100] = 1.0f;
    EXPECT_EQ(findPeakIndex(buffer.data(), 200), 0);
    const std::vector<float> rising = {0.0f, 0.1f, 0.2f, 0.3f};
    EXPECT_EQ(findPeakIndex(rising.data(), 4), 3) << "a shorter buffer ends the search";
    EXPECT_EQ(findPeakIndex(nullptr, 0), 0);
}

TEST(FindPeakIndex, NaNsAreDefined) {
    std::vector<float> buffer(100, 0.25f);
    buffer[50] = nan;
    buffer[70] = 0.5f;
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 70);
    buffer[0] = nan;
    EXPECT_EQ(findPeakIndex(buffer.data(), 100), 0);
}

/// Noise with one peak per ear, of 2.0, at the given frames.
void fill(FirInterpolation& interpolation, std::size_t pair, int peakLeft, int peakRight) {
    std::mt19937 random(static_cast<unsigned>(31 + pair));
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    for (float& sample : interpolation.interpFilterLeft[pair]) {
        sample = noise(random);
    }
    for (float& sample : interpolation.interpFilterRight[pair]) {
        sample = noise(random);
    }
    interpolation.interpFilterLeft[pair][static_cast<std::size_t>(peakLeft)] = 2.0f;
    interpolation.interpFilterRight[pair][static_cast<std::size_t>(peakRight)] = 2.0f;
}

/// The blend of one ear by the plain loop: outside reads are 0, outside writes are dropped.
std::vector<float> plainBlend(const AlignedArray<float>& fresh,
                              const AlignedArray<float>& former,
                              int shift,
                              int align,
                              int count,
                              float fraction,
                              float before) {
    const int size = static_cast<int>(fresh.size());
    std::vector<float> out(fresh.size(), before);
    for (int i = 0; i < count; ++i) {
        const int from = shift + i;
        const float a = from >= 0 && from < size ? fresh[static_cast<std::size_t>(from)] : 0.0f;
        const float b = i < size ? former[static_cast<std::size_t>(i)] : 0.0f;
        if (align + i >= 0 && align + i < size) {
            out[static_cast<std::size_t>(align + i)] = a * fraction + b * (1.0f - fraction);
        }
    }
    return out;
}

struct Peaks {
    int newLeft;
    int newRight;
    int oldLeft;
    int oldRight;
};

constexpr std::array<Peaks, 8> peakCases = {{{20, 30, 20, 30},
                                             {25, 28, 20, 31},
                                             {12, 40, 22, 30},
                                             {99, 0, 0, 99},
                                             {0, 99, 99, 0},
                                             {0, 0, 99, 99},
                                             {99, 99, 0, 0},
                                             {3, 50, 0, 50}}};

/// Shift times fraction, away from zero by 0.55, toward zero to an integer.
int alignOf(int shift, double fraction) {
    const double v = shift * fraction;
    return static_cast<int>(v < 0.0 ? v - 0.55 : v + 0.55);
}

TEST(InterpolateFIR, EqualsThePlainLoopForAllShiftsAndSizes) {
    for (const int size : {100, 128, 160, 1024}) {
        for (const int hrirLength : {70, 128, 139, 256}) {
            for (const Peaks& peaks : peakCases) {
                for (const float offset : {0.0f, 1.0f, 2.0f, -3.0f, 4.0f, 5.0f}) {
                    FirInterpolation interpolation;
                    interpolation.prepare(size);
                    interpolation.interpFilterNew = 1;
                    fill(interpolation, 1, peaks.newLeft, peaks.newRight);
                    fill(interpolation, 0, peaks.oldLeft, peaks.oldRight);
                    Ears out(size, 7.0f);
                    interpolation.interpolateFIR(out.left.get(), out.right.get(), size, hrirLength,
                                                 true, offset);
                    const int shiftLeft = peaks.newLeft - peaks.oldLeft;
                    const int shiftRight = peaks.newRight - peaks.oldRight;
                    const float fraction = std::fabs(offset * 0.2f);
                    const int alignLeft =
                        alignOf(shiftLeft, static_cast<double>(std::fabs(offset)) / 5.0);
                    const int alignRight =
                        alignOf(shiftRight, static_cast<double>(std::fabs(offset)) / 5.0);
                    EXPECT_EQ(interpolation.peakShiftLeft, shiftLeft);
                    EXPECT_EQ(interpolation.peakShiftRight, shiftRight);
                    EXPECT_EQ(interpolation.alignShiftLeft, alignLeft);
                    EXPECT_EQ(interpolation.alignShiftRight, alignRight);
                    EXPECT_EQ(interpolation.interpWeightNew, fraction);
                    EXPECT_EQ(interpolation.interpWeightOld, 1.0f - fraction);
                    // The left ear's shift rules the length of both.
                    const int count = std::abs(shiftLeft) + hrirLength;
                    const auto left = plainBlend(interpolation.interpFilterLeft[1],
                                                 interpolation.interpFilterLeft[0], shiftLeft,
                                                 alignLeft, count, fraction, 7.0f);
                    const auto right = plainBlend(interpolation.interpFilterRight[1],
                                                  interpolation.interpFilterRight[0], shiftRight,
                                                  alignRight, count, fraction, 7.0f);
                    for (int i = 0; i < size; ++i) {
                        ASSERT_EQ(out.at(0, i), left[static_cast<std::size_t>(i)])
                            << "left " << i << " of " << size << ", " << shiftLeft;
                        ASSERT_EQ(out.at(1, i), right[static_cast<std::size_t>(i)])
                            << "right " << i << " of " << size << ", " << shiftRight;
                    }
                }
            }
        }
    }
}

TEST(InterpolateFIR, WholeGridStepTakesTheNewBufferAlone) {
    FirInterpolation interpolation;
    interpolation.prepare(512);
    interpolation.interpFilterNew = 1;
    fill(interpolation, 1, 24, 30);
    fill(interpolation, 0, 20, 33);
    Ears out(512);
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 512, 128, true, 5.0f);
    EXPECT_EQ(interpolation.alignShiftLeft, 4);
    EXPECT_EQ(interpolation.alignShiftRight, -3);
    for (int i = 4; i < 128; ++i) {
        EXPECT_EQ(out.at(0, i), interpolation.interpFilterLeft[1][static_cast<std::size_t>(i)]);
    }
    for (int i = 0; i < 128; ++i) {
        EXPECT_EQ(out.at(1, i), interpolation.interpFilterRight[1][static_cast<std::size_t>(i)]);
    }
}

TEST(InterpolateFIR, PeaksAreFoundOnlyWhenAnUpdateIsPending) {
    FirInterpolation interpolation;
    interpolation.prepare(256);
    interpolation.interpFilterNew = 1;
    fill(interpolation, 1, 30, 10);
    fill(interpolation, 0, 20, 25);
    Ears out(256);
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 256, 128, false, 1.0f);
    EXPECT_EQ(interpolation.peakShiftLeft, 0);
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 256, 128, true, 1.0f);
    EXPECT_EQ(interpolation.peakLeft[1], 30);
    EXPECT_EQ(interpolation.peakRight[0], 25);
    EXPECT_EQ(interpolation.peakShiftLeft, 10);
    EXPECT_EQ(interpolation.peakShiftRight, -15);
    EXPECT_EQ(interpolation.peakShiftMaxLeft, 10);
    EXPECT_EQ(interpolation.peakShiftMaxRight, 0) << "raised only";
    fill(interpolation, 1, 22, 40);
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 256, 128, false, 1.0f);
    EXPECT_EQ(interpolation.peakShiftLeft, 10) << "kept without an update";
    interpolation.interpFilterLeft[1][30] = 0.0f;
    interpolation.interpFilterRight[1][10] = 0.0f;
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 256, 128, true, 1.0f);
    EXPECT_EQ(interpolation.peakShiftLeft, 2);
    EXPECT_EQ(interpolation.peakShiftMaxLeft, 10);
    EXPECT_EQ(interpolation.peakShiftMaxRight, 15);
}

TEST(InterpolateFIR, RoundsByFiftyFiveHundredths) {
    FirInterpolation interpolation;
    interpolation.prepare(256);
    interpolation.interpFilterNew = 1;
    Ears out(256);
    struct Case {
        int shift;
        float offset;
        int align;
    };
    // 3 * 0.2 = 0.6, 1.15 in all: 1. 2 * 0.2 = 0.4: 0.95, so 0. 9 * 0.05 = 0.45 and 0.55: 1.
    const std::array<Case, 6> cases = {
        {{3, 1.0f, 1}, {-3, 1.0f, -1}, {2, 1.0f, 0}, {-2, 1.0f, 0}, {23, 0.1f, 1}, {22, 0.1f, 0}}};
    for (const Case& c : cases) {
        interpolation.peakShiftLeft = static_cast<std::int16_t>(c.shift);
        interpolation.interpolateFIR(out.left.get(), out.right.get(), 256, 128, false, c.offset);
        EXPECT_EQ(interpolation.alignShiftLeft, c.align) << c.shift << " * " << c.offset;
    }
}

TEST(InterpolateFIR, OddOffsetsStayInsideTheBuffers) {
    FirInterpolation interpolation;
    interpolation.prepare(64);
    interpolation.interpFilterNew = 1;
    fill(interpolation, 1, 60, 0);
    fill(interpolation, 0, 0, 60);
    Ears out(64);
    const float infinity = std::numeric_limits<float>::infinity();
    for (const float offset : {nan, infinity, -infinity, 1e30f, 3000.0f, 100.0f, -100.0f}) {
        interpolation.interpolateFIR(out.left.get(), out.right.get(), 64, 256, true, offset);
        EXPECT_EQ(interpolation.peakShiftLeft, 60);
        EXPECT_EQ(interpolation.peakShiftRight, -60);
    }
}

TEST(InterpolateFIR, UnpreparedWritesNothing) {
    FirInterpolation interpolation;
    Ears out(32, 7.0f);
    interpolation.interpolateFIR(out.left.get(), out.right.get(), 32, 128, true, 5.0f);
    EXPECT_EQ(out.at(0, 0), 7.0f);
    EXPECT_EQ(out.at(1, 31), 7.0f);
}

TEST(FirInterpolation, StartsOnOneBufferWithTheOldWeight) {
    FirInterpolation interpolation;
    interpolation.prepare(128);
    EXPECT_EQ(interpolation.interpFilterNew, 0);
    EXPECT_EQ(interpolation.interpFilterOld, 0);
    EXPECT_EQ(interpolation.interpWeightNew, 0.0f);
    EXPECT_EQ(interpolation.interpWeightOld, 1.0f);
    for (std::size_t k = 0; k < 2; ++k) {
        EXPECT_EQ(interpolation.interpFilterLeft[k].size(), 128u);
        EXPECT_EQ(interpolation.interpFilterRight[k].size(), 128u);
    }
}

}  // namespace
}  // namespace tessaly::test
