// A level's linear factor, worked out on a change only.
#include "base/linear_level.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>

namespace tessaly {
namespace {

TEST(LinearLevel, EqualsThePlainFormForEverySequence) {
    LinearLevel level;
    constexpr float infinity = std::numeric_limits<float>::infinity();
    for (const float db : {0.0f, -0.0f, 6.0f, 6.0f, -96.0f, 24.0f, 1e-30f, -1e30f, infinity,
                           -infinity, 0.0f, -6.0f, -6.0f}) {
        EXPECT_EQ(std::bit_cast<std::uint32_t>(level.of(db)),
                  std::bit_cast<std::uint32_t>(decibelsToLinear(db)))
            << db;
    }
}

TEST(LinearLevel, WhatIsNoNumberDoesNotStick) {
    LinearLevel level;
    constexpr float nan = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(level.of(-6.0f), decibelsToLinear(-6.0f));
    EXPECT_TRUE(std::isnan(level.of(nan)));
    EXPECT_TRUE(std::isnan(level.of(nan)));
    EXPECT_EQ(level.of(-6.0f), decibelsToLinear(-6.0f));
    EXPECT_EQ(level.of(0.0f), 1.0f);
}

}  // namespace
}  // namespace tessaly
