// Blocks of nothing but zeros.
#include "base/silence.h"

#include <gtest/gtest.h>

#include <limits>
#include <vector>

namespace tessaly {
namespace {

TEST(Silence, IsZerosOfEitherSignAndAnyCount) {
    EXPECT_TRUE(allZero(nullptr, 0));
    for (const float zero : {0.0f, -0.0f}) {
        std::vector<float> zeros(1000, 0.0f);
        for (std::size_t i = 0; i < zeros.size(); i += 3) {
            zeros[i] = zero;
        }
        for (const std::size_t count : {0u, 1u, 2u, 7u, 64u, 1000u}) {
            EXPECT_TRUE(allZero(zeros.data(), count)) << count;
        }
    }
}

TEST(Silence, EndsWithTheFirstValueAnywhere) {
    for (const float value : {1.0f, -1.0f, std::numeric_limits<float>::denorm_min(),
                              std::numeric_limits<float>::quiet_NaN()}) {
        for (const std::size_t count : {1u, 2u, 33u, 260u}) {
            for (std::size_t place = 0; place < count; ++place) {
                std::vector<float> samples(count, 0.0f);
                samples[place] = value;
                EXPECT_FALSE(allZero(samples.data(), count)) << value << " at " << place;
            }
        }
    }
}

TEST(Silence, AConstantIsNone) {
    const std::vector<float> ones(100, 1.0f);
    EXPECT_FALSE(allZero(ones.data(), ones.size()));
}

TEST(Silence, LooksNoFurtherThanItsCount) {
    std::vector<float> samples(130, 0.0f);
    samples[129] = 1.0f;
    EXPECT_TRUE(allZero(samples.data(), 129));
    EXPECT_FALSE(allZero(samples.data(), 130));
}

}  // namespace
}  // namespace tessaly
