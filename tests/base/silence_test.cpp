// Blocks of nothing but zeros.
#include "base/silence.h"

#include <gtest/gtest.h>

#include <limits>
#include <vector>

namespace tessaly {
namespace {

TEST(Silence, IsZerosOfAnyCount) {
    EXPECT_TRUE(isSilent(nullptr, 0));
    const std::vector<float> zeros(1000, 0.0f);
    for (const std::size_t count : {0u, 1u, 2u, 7u, 64u, 1000u}) {
        EXPECT_TRUE(isSilent(zeros.data(), count)) << count;
    }
}

TEST(Silence, EndsWithTheFirstValueAnywhere) {
    for (const float value : {1.0f, std::numeric_limits<float>::denorm_min(), -0.0f,
                              std::numeric_limits<float>::quiet_NaN()}) {
        for (const std::size_t count : {1u, 2u, 33u, 260u}) {
            for (std::size_t place = 0; place < count; ++place) {
                std::vector<float> samples(count, 0.0f);
                samples[place] = value;
                EXPECT_FALSE(isSilent(samples.data(), count)) << value << " at " << place;
            }
        }
    }
}

TEST(Silence, AConstantIsNone) {
    const std::vector<float> ones(100, 1.0f);
    EXPECT_FALSE(isSilent(ones.data(), ones.size()));
}

TEST(Silence, LooksNoFurtherThanItsCount) {
    std::vector<float> samples(10, 0.0f);
    samples[9] = 1.0f;
    EXPECT_TRUE(isSilent(samples.data(), 9));
    EXPECT_FALSE(isSilent(samples.data(), 10));
}

}  // namespace
}  // namespace tessaly
