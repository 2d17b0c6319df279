// Tests of the pan pair against its definition in double precision.
#include "resources/pan_pair.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>
#include <vector>

namespace tessaly {
namespace {

constexpr float panGain = 1.65f;

struct Taps {
    int posFirst = -1;
    int posSecond = -1;
    float first = 0.0f;
    float second = 0.0f;
    int count = 0;  ///< values that are not zero
};

/// Writes a pair over non-zero memory, with a guard behind it, and finds the taps.
Taps tapsOf(int hrirLength, int phi) {
    constexpr float guard = 77.0f;
    std::vector<float> pairs(hrirLength * 2 + 2, guard);
    writePanPair(pairs.data(), hrirLength, static_cast<std::int16_t>(phi), panGain);
    EXPECT_EQ(pairs[hrirLength * 2], guard);
    EXPECT_EQ(pairs[hrirLength * 2 + 1], guard);
    Taps taps;
    for (int n = 0; n < hrirLength; ++n) {
        if (pairs[2 * n] != 0.0f) {
            taps.posFirst = n;
            taps.first = pairs[2 * n];
            ++taps.count;
        }
        if (pairs[2 * n + 1] != 0.0f) {
            taps.posSecond = n;
            taps.second = pairs[2 * n + 1];
            ++taps.count;
        }
    }
    return taps;
}

TEST(PanPair, LevelsFollowTheSineOfTheAzimuth) {
    for (const int length : {70, 128, 139, 256}) {
        for (int phi = -180; phi <= 180; ++phi) {
            const Taps taps = tapsOf(length, phi);
            const double s = std::sin(phi / 180.0 * std::numbers::pi) + 1.0;
            ASSERT_EQ(taps.count, 2) << length << ' ' << phi;
            // Single-precision arithmetic on values up to 3.3.
            EXPECT_NEAR(taps.first, (2.0 - s) * 1.65 * 0.5 * 0.6 + 0.4, 5e-7) << phi;
            EXPECT_NEAR(taps.second, 1.65 * s * 0.5 * 0.6 + 0.4, 5e-7) << phi;
        }
    }
}

TEST(PanPair, PositionsFollowTheSineOfTheAzimuth) {
    int compared = 0;
    for (const int length : {70, 128, 139, 256}) {
        for (int phi = -180; phi <= 180; ++phi) {
            const double half = length * 0.5;
            const double position = (std::sin(phi / 180.0 * std::numbers::pi) + 1.0) * half * 0.5;
            if (std::abs(position - std::round(position)) < 1e-4) {
                continue;  // single precision decides there, see the exact cases below
            }
            const Taps taps = tapsOf(length, phi);
            EXPECT_EQ(taps.posFirst, std::trunc(position)) << length << ' ' << phi;
            EXPECT_EQ(taps.posSecond, std::trunc(half - std::trunc(position))) << phi;
            ++compared;
        }
    }
    EXPECT_GT(compared, 4 * 361 - 60);
}

TEST(PanPair, ExactPositionsAtTheMainDirections) {
    struct Row {
        int length, phi, posFirst, posSecond;
    };
    // clang-format off
    constexpr Row rows[] = {
        // length, phi, first, second
        {128,    0, 32, 32},
        {128,   90, 64,  0},   // left: the right ear is the later one
        {128,  -90,  0, 64},
        {128,  180, 31, 33},   // the sine of the rounded angle is just below zero
        {128, -180, 32, 32},
        { 70,    0, 17, 18},
        { 70,   90, 35,  0},
        { 70,  -90,  0, 35},
        {139,    0, 34, 35},
        {139,   90, 69,  0},
        {139,  -90,  0, 69},
        {256,   90, 128, 0},
        {256,  180, 63, 65},
    };
    // clang-format on
    for (const Row& row : rows) {
        const Taps taps = tapsOf(row.length, row.phi);
        EXPECT_EQ(taps.posFirst, row.posFirst) << row.length << ' ' << row.phi;
        EXPECT_EQ(taps.posSecond, row.posSecond) << row.length << ' ' << row.phi;
    }
}

TEST(PanPair, NearerEarIsLouderAndEarlier) {
    const Taps left = tapsOf(128, 90);
    EXPECT_FLOAT_EQ(left.second, 1.65f * 0.6f + 0.4f);
    EXPECT_FLOAT_EQ(left.first, 0.4f);
    EXPECT_LT(left.posSecond, left.posFirst);
    const Taps right = tapsOf(128, -90);
    EXPECT_FLOAT_EQ(right.first, 1.65f * 0.6f + 0.4f);
    EXPECT_FLOAT_EQ(right.second, 0.4f);
    EXPECT_LT(right.posFirst, right.posSecond);
}

TEST(PanPair, StaysInsideTheShortestPairs) {
    for (const int length : {1, 2, 3}) {
        for (const int phi : {-32768, -90, 0, 90, 180, 32767}) {
            EXPECT_EQ(tapsOf(length, phi).count, 2) << length << ' ' << phi;
        }
    }
}

TEST(PanPair, WritesNothingWithoutRoom) {
    float value[2] = {5.0f, 6.0f};
    writePanPair(value, 0, 90, panGain);
    writePanPair(value, -4, -90, panGain);
    writePanPair(nullptr, 128, 0, panGain);
    EXPECT_EQ(value[0], 5.0f);
    EXPECT_EQ(value[1], 6.0f);
}

}  // namespace
}  // namespace tessaly
