// Time differences: the sphere's formula, its inverse, and the estimate from samples.
#include "data/interaural_time.h"

#include <gtest/gtest.h>

#include "tools/data/synthetic_head.h"

namespace tessaly::data {
namespace {

TEST(Woodworth, IsPositiveAtTheLeftAndFollowsTheSphere) {
    // a / c (pi / 2 + 1) with a = 0.0875 m, c = 343 m/s.
    const double side = 0.0875 / 343.0 * (0.5 * std::numbers::pi + 1.0);
    EXPECT_NEAR(woodworth({90.0, 0.0}), side, 1e-15);
    EXPECT_NEAR(woodworth({270.0, 0.0}), -side, 1e-15);
    EXPECT_NEAR(woodworth({-90.0, 0.0}), -side, 1e-15);
    EXPECT_NEAR(woodworth({30.0, 0.0}), 0.0875 / 343.0 * (std::numbers::pi / 6.0 + 0.5), 1e-15);
    EXPECT_NEAR(woodworth({30.0, 0.0}), woodworth({150.0, 0.0}), 1e-15);
    EXPECT_NEAR(woodworth({0.0, 40.0}), 0.0, 1e-15);
    EXPECT_NEAR(woodworth({90.0, 90.0}), 0.0, 1e-15);
}

TEST(Woodworth, InverseReturnsTheLateralAngle) {
    for (int degrees = 0; degrees <= 90; degrees += 5) {
        const double lateral = radians(degrees);
        const double seconds = headSeconds * (lateral + std::sin(lateral));
        EXPECT_NEAR(woodworthInverse(seconds), lateral, 1e-12) << degrees;
    }
}

TEST(Woodworth, InverseStopsAtNinetyDegrees) {
    EXPECT_DOUBLE_EQ(woodworthInverse(1e-3), 0.5 * std::numbers::pi);
}

TEST(EarDelays, DifferByTheTimeDifferenceAndKeepTheNearEarOnTheSphere) {
    for (const double itd : {-700e-6, -300e-6, -1e-6, 0.0, 1e-6, 300e-6, 656e-6, 700e-6}) {
        const EarDelays delays = earDelays(itd);
        EXPECT_NEAR(delays.right - delays.left, itd, 1e-18) << itd;
        const double near = std::min(delays.left, delays.right);
        EXPECT_NEAR(near, -headSeconds * std::sin(woodworthInverse(std::abs(itd))), 1e-15) << itd;
        EXPECT_GE(near, -headSeconds - 1e-12) << itd;
    }
}

std::vector<double> impulseResponse(double place, double echoGain) {
    std::vector<double> samples(256);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = impulseAt(static_cast<double>(i), place) +
                     echoGain * impulseAt(static_cast<double>(i), place + 6.0);
    }
    return samples;
}

class ItdAtRate : public testing::TestWithParam<double> {};

TEST_P(ItdAtRate, FractionalDelaysAreFoundWithinTwoMicroseconds) {
    const double rate = GetParam();
    ItdEstimator estimator(rate, 256);
    for (const double microseconds : {-612.0, -250.3, -7.1, 0.0, 33.3, 400.0, 660.0}) {
        const double seconds = microseconds * 1e-6;
        // The ears differ in tone too: minimum-phase differences must not count as delay.
        const std::vector<double> left = impulseResponse(100.0, 0.5);
        const std::vector<double> right = impulseResponse(100.0 + seconds * rate, -0.3);
        const auto found =
            estimator.estimate(left.data(), right.data(), seconds + 60e-6, itdSearchSeconds);
        ASSERT_TRUE(found.has_value()) << microseconds;
        EXPECT_NEAR(*found, seconds, 2e-6) << microseconds;
    }
}

INSTANTIATE_TEST_SUITE_P(Rates, ItdAtRate, testing::Values(24000.0, 44100.0, 48000.0, 96000.0));

TEST(ItdEstimator, DelaysKeptBesideTheSamplesAreAdded) {
    ItdEstimator estimator(44100.0, 256);
    const std::vector<double> left = impulseResponse(100.0, 0.0);
    const std::vector<double> right = impulseResponse(102.0, 0.0);
    const auto found =
        estimator.estimate(left.data(), right.data(), 300e-6, itdSearchSeconds, 250e-6);
    ASSERT_TRUE(found.has_value());
    EXPECT_NEAR(*found, 250e-6 + 2.0 / 44100.0, 1e-6);
}

TEST(ItdEstimator, InvertedEarsHaveNoEstimate) {
    ItdEstimator estimator(44100.0, 256);
    const std::vector<double> left = impulseResponse(100.0, 0.0);
    std::vector<double> right = left;
    for (double& sample : right) {
        sample = -sample;
    }
    // Within 50 us of the true lag the correlation of inverted ears stays negative.
    EXPECT_FALSE(estimator.estimate(left.data(), right.data(), 0.0, 50e-6).has_value());
}

}  // namespace
}  // namespace tessaly::data
