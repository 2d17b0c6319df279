// Tests of the shared units and of the changes of precision.
#include "base/units.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <type_traits>

#include "base/precision.h"

namespace tessaly {
namespace {

TEST(Units, SamplesPerMetreFollowFromTheSpeedOfSound) {
    EXPECT_NEAR(1.0 / samplesPerMetrePerHertz, 343.42, 1e-3);
    EXPECT_EQ(samplesPerMetrePerHertz, 0.0029118863199580685);
}

TEST(Units, DecibelsBecomeLinearInSinglePrecision) {
    static_assert(std::is_same_v<decltype(decibelsToLinear(0.0f)), float>);
    EXPECT_EQ(decibelsToLinear(0.0f), 1.0f);
    for (float level = -96.0f; level <= 24.0f; level += 0.5f) {
        const double expected = std::pow(10.0, wide(level) / 20.0);
        // Two roundings of the exponent, magnified by ln 10 * level / 20, and one of the result.
        EXPECT_NEAR(wide(decibelsToLinear(level)) / expected, 1.0, 2e-6) << level;
    }
}

TEST(Units, DecibelsOfTheExtremesAreDefined) {
    constexpr float infinity = std::numeric_limits<float>::infinity();
    EXPECT_EQ(decibelsToLinear(-infinity), 0.0f);
    EXPECT_EQ(decibelsToLinear(infinity), infinity);
    EXPECT_TRUE(std::isnan(decibelsToLinear(std::numeric_limits<float>::quiet_NaN())));
}

TEST(Precision, WideningIsExactAndNarrowingRoundsOnce) {
    static_assert(std::is_same_v<decltype(wide(0.1f)), double>);
    static_assert(std::is_same_v<decltype(single(0.1)), float>);
    EXPECT_EQ(wide(0.1f), 0.100000001490116119384765625);
    EXPECT_EQ(single(wide(0.1f)), 0.1f);
    // Ties go to even.
    EXPECT_EQ(single(1.0 + 0x1p-24), 1.0f);
    EXPECT_EQ(single(1.0 + 0x1.8p-23), 1.0f + 0x1p-22f);
}

}  // namespace
}  // namespace tessaly
