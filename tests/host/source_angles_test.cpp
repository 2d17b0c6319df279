// Directions from matrices.
#include "host/source_angles.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <limits>

#include "base/numeric_conversion.h"
#include "base/precision.h"

namespace tessaly::test {
namespace {

constexpr double pi = 3.14159265358979323846;

using Matrix = std::array<float, 16>;

Matrix identity() { return {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}; }

SourceAngles anglesAt(float x, float y, float z) {
    const Matrix listener = identity();
    Matrix source = identity();
    source[12] = x;
    source[13] = y;
    source[14] = z;
    return sourceAngles(listener.data(), source.data());
}

TEST(SourceAngles, MeetsTheMainDirections) {
    struct Case {
        float x, y, z;
        float azimuth, elevation;
    };
    const Case cases[] = {
        {0, 0, 2, 0, 0},  {2, 0, 0, 90, 0},   {-2, 0, 0, -90, 0}, {0, 0, -2, 180, 0},
        {2, 0, 2, 45, 0}, {-2, 0, 2, -45, 0}, {2, 0, -2, 135, 0}, {-2, 0, -2, -135, 0},
        {0, 2, 2, 0, 45}, {0, -2, 2, 0, -45}, {0, 50, 0, 90, 90}, {0, -50, 0, 90, -90},
    };
    for (const Case& c : cases) {
        const SourceAngles angles = anglesAt(c.x, c.y, c.z);
        EXPECT_NEAR(angles.azimuth, c.azimuth, 2e-5) << c.x << " " << c.y << " " << c.z;
        // The offset of a millimetre in the divisor shows in the elevation.
        EXPECT_NEAR(angles.elevation, c.elevation, 0.02) << c.x << " " << c.y << " " << c.z;
    }
}

TEST(SourceAngles, ASourceAtTheListenerIsAtTheRight) {
    const SourceAngles angles = anglesAt(0.0f, 0.0f, 0.0f);
    EXPECT_EQ(angles.azimuth, 90.0f);
    EXPECT_EQ(angles.elevation, 0.0f);
}

TEST(SourceAngles, NearThePlaneOfTheEarsTheSideDecides) {
    EXPECT_EQ(truncateToInt16(anglesAt(-1.0f, 0.0f, 0.0005f).azimuth), -90);
    EXPECT_NEAR(anglesAt(-1.0f, 0.0f, 0.0005f).azimuth, -90.0, 2e-5);
    EXPECT_EQ(anglesAt(1.0f, 0.0f, -0.0005f).azimuth, 90.0f);
    EXPECT_EQ(anglesAt(0.0f, 0.0f, 0.0005f).azimuth, 90.0f) << "also straight ahead";
    EXPECT_EQ(anglesAt(0.0f, 0.0f, -0.0009f).azimuth, 90.0f) << "and straight behind";
    EXPECT_EQ(anglesAt(0.0f, 0.0f, 0.001f).azimuth, 0.0f) << "the bound itself is outside";
}

TEST(SourceAngles, BehindIsExactlyOneHundredAndEighty) {
    EXPECT_EQ(anglesAt(0.0f, 0.0f, -1.0f).azimuth, 180.0f);
    EXPECT_EQ(anglesAt(-0.0f, 0.0f, -1.0f).azimuth, 180.0f) << "from either side";
}

TEST(SourceAngles, ElevationStaysBelowNinety) {
    for (const float y : {0.001f, 0.1f, 1.0f, 10.0f, 1000.0f}) {
        const SourceAngles angles = anglesAt(0.0f, y, 0.0f);
        EXPECT_LT(angles.elevation, 90.0f) << y;
        EXPECT_NEAR(angles.elevation, std::atan2(wide(y), 0.001) * 180.0 / pi, 1e-4) << y;
    }
}

TEST(SourceAngles, FollowsTheListenersMatrix) {
    // A listener at (1, 2, 3) that has turned to the right by each of these angles.
    for (int turn = -180; turn < 180; turn += 15) {
        const double t = turn * pi / 180.0;
        const double c = std::cos(t);
        const double s = std::sin(t);
        // Rows: right (c, 0, -s), up, forward (s, 0, c); columns are stored one after another.
        const double px = -(c * 1.0 - s * 3.0);
        const double pz = -(s * 1.0 + c * 3.0);
        const Matrix listener = {single(c),  0, single(s), 0, 0,          1,  0,          0,
                                 single(-s), 0, single(c), 0, single(px), -2, single(pz), 1};
        for (int direction = -170; direction <= 180; direction += 10) {
            for (const double elevation : {-60.0, 0.0, 35.0}) {
                const double a = direction * pi / 180.0;
                const double e = elevation * pi / 180.0;
                Matrix source{};  // the orientation does not count
                source[12] = single(1.0 + 5.0 * std::sin(a) * std::cos(e));
                source[13] = single(2.0 + 5.0 * std::sin(e));
                source[14] = single(3.0 + 5.0 * std::cos(a) * std::cos(e));
                const SourceAngles angles = sourceAngles(listener.data(), source.data());
                EXPECT_GT(angles.azimuth, -180.0f);
                EXPECT_LE(angles.azimuth, 180.0f);
                const double off = std::remainder(wide(angles.azimuth) - (direction - turn), 360.0);
                EXPECT_NEAR(off, 0.0, 1e-3) << turn << " " << direction;
                EXPECT_NEAR(angles.elevation,
                            std::atan2(5.0 * std::sin(e), 5.0 * std::cos(e) + 0.001) * 180.0 / pi,
                            1e-3);
            }
        }
    }
}

TEST(SourceAngles, RoundsInTheOrderOfItsTerms) {
    // A sum that loses its small terms one way and keeps them the other: 1e8 - 1e8 + 1.
    const Matrix listener = {1e8f, 0, 0, 0, -1e8f, 0, 0, 0, 1, 0, 0, 0, 0, 0, 1, 1};
    Matrix source{};
    source[12] = 1.0f;
    source[13] = 1.0f;
    source[14] = 1.0f;
    EXPECT_NEAR(sourceAngles(listener.data(), source.data()).azimuth, 45.0, 1e-4);
    const Matrix swapped = {1, 0, 0, 0, 1e8f, 0, 0, 0, -1e8f, 0, 0, 0, 0, 0, 1, 1};
    EXPECT_EQ(sourceAngles(swapped.data(), source.data()).azimuth, 0.0f);
}

TEST(SourceAngles, KeptOnesFollowEveryValueThatMoves) {
    KeptSourceAngles kept;
    Matrix listener = identity();
    Matrix source = identity();
    const auto expectFresh = [&](const char* what, std::size_t index) {
        const SourceAngles fresh = sourceAngles(listener.data(), source.data());
        for (int round = 0; round < 2; ++round) {
            const SourceAngles& angles = kept.of(listener.data(), source.data());
            EXPECT_EQ(std::memcmp(&angles, &fresh, sizeof fresh), 0) << what << " " << index;
        }
    };
    source[12] = 1.0f;
    source[13] = 2.0f;
    source[14] = 3.0f;
    constexpr float nan = std::numeric_limits<float>::quiet_NaN();
    expectFresh("start", 0);
    for (std::size_t index = 0; index < 16; ++index) {
        for (Matrix* const matrix : {&listener, &source}) {
            const float before = (*matrix)[index];
            for (const float value : {before + 0.25f, nan, before}) {
                (*matrix)[index] = value;
                expectFresh(matrix == &listener ? "listener" : "source", index);
            }
        }
    }
}

TEST(SourceAngles, EveryMatrixGivesAnAngleOrNoNumber) {
    const float odd[] = {
        std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
        -std::numeric_limits<float>::infinity(), std::numeric_limits<float>::max()};
    for (const float value : odd) {
        for (std::size_t element = 0; element < 16; ++element) {
            for (const bool inListener : {false, true}) {
                Matrix listener = identity();
                Matrix source = identity();
                (inListener ? listener : source)[element] = value;
                const SourceAngles angles = sourceAngles(listener.data(), source.data());
                // What the handler makes of them is always a whole number of degrees.
                EXPECT_LE(std::abs(truncateToInt16(angles.azimuth)), 180);
                EXPECT_LE(std::abs(truncateToInt16(angles.elevation)), 90);
            }
        }
    }
}

}  // namespace
}  // namespace tessaly::test
