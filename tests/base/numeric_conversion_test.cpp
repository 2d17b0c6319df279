// Tests of the conversions from floating point to integers.
#include "base/numeric_conversion.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace tessaly {
namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();
constexpr std::int32_t highest = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t lowest = std::numeric_limits<std::int32_t>::min();

TEST(TruncateToInt32, CutsTowardZero) {
    EXPECT_EQ(truncateToInt32(0.999999999), 0);
    EXPECT_EQ(truncateToInt32(-0.999999999), 0);
    EXPECT_EQ(truncateToInt32(52.7), 52);
    EXPECT_EQ(truncateToInt32(-52.7), -52);
    EXPECT_EQ(truncateToInt32(-0.0), 0);
    EXPECT_EQ(truncateToInt32(2.5f), 2);
    EXPECT_EQ(truncateToInt32(-2.5f), -2);
}

TEST(TruncateToInt32, IsExactUpToTheLimits) {
    EXPECT_EQ(truncateToInt32(2147483646.9), 2147483646);
    EXPECT_EQ(truncateToInt32(2147483647.0), highest);
    EXPECT_EQ(truncateToInt32(-2147483647.9), -2147483647);
    EXPECT_EQ(truncateToInt32(-2147483648.0), lowest);
    // The floats next to the limits.
    EXPECT_EQ(truncateToInt32(2147483520.0f), 2147483520);
    EXPECT_EQ(truncateToInt32(-2147483648.0f), lowest);
}

TEST(TruncateToInt32, SaturatesBeyondTheLimits) {
    EXPECT_EQ(truncateToInt32(2147483647.5), highest);
    EXPECT_EQ(truncateToInt32(2147483648.0f), highest);
    EXPECT_EQ(truncateToInt32(1e30), highest);
    EXPECT_EQ(truncateToInt32(-2147483649.0), lowest);
    EXPECT_EQ(truncateToInt32(-1e30f), lowest);
    EXPECT_EQ(truncateToInt32(infinity), highest);
    EXPECT_EQ(truncateToInt32(-infinity), lowest);
    EXPECT_EQ(truncateToInt32(std::numeric_limits<float>::infinity()), highest);
}

TEST(TruncateToInt32, MakesZeroOfWhatIsNoNumber) {
    EXPECT_EQ(truncateToInt32(notANumber), 0);
    EXPECT_EQ(truncateToInt32(-notANumber), 0);
    EXPECT_EQ(truncateToInt32(std::numeric_limits<float>::quiet_NaN()), 0);
}

TEST(WrapToInt16, KeepsTheLowBits) {
    EXPECT_EQ(wrapToInt16(32767), 32767);
    EXPECT_EQ(wrapToInt16(32768), -32768);
    EXPECT_EQ(wrapToInt16(65535), -1);
    EXPECT_EQ(wrapToInt16(65536), 0);
    EXPECT_EQ(wrapToInt16(-32768), -32768);
    EXPECT_EQ(wrapToInt16(-32769), 32767);
    EXPECT_EQ(wrapToInt16(highest), -1);
    EXPECT_EQ(wrapToInt16(lowest), 0);
}

TEST(TruncateToInt16, CutsThenWraps) {
    EXPECT_EQ(truncateToInt16(179.99), 179);
    EXPECT_EQ(truncateToInt16(-179.99f), -179);
    EXPECT_EQ(truncateToInt16(32767.9), 32767);
    EXPECT_EQ(truncateToInt16(32768.0), -32768);
    EXPECT_EQ(truncateToInt16(65536.0f), 0);
    EXPECT_EQ(truncateToInt16(infinity), -1);
    EXPECT_EQ(truncateToInt16(-infinity), 0);
    EXPECT_EQ(truncateToInt16(notANumber), 0);
}

TEST(NumericConversion, WorksAtCompileTime) {
    static_assert(truncateToInt32(-3.9) == -3);
    static_assert(truncateToInt16(40000.0) == -25536);
    static_assert(wrapToInt16(40000) == -25536);
}

}  // namespace
}  // namespace tessaly
