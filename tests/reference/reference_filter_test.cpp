// The reference filter against closed forms: gains at 0 Hz, at the cut-off and at half the rate.
#include "support/reference/reference_filter.h"

#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <limits>
#include <numbers>

namespace tessaly::reference {
namespace {

/// Gain of the coefficients at a normalised frequency, by the transfer function.
double gainAt(const Filter& f, double frequency) {
    const std::complex<double> z = std::polar(1.0, -2.0 * std::numbers::pi * frequency);
    return std::abs((f.b0 + f.b1 * z + f.b2 * z * z) / (1.0 + f.a1 * z + f.a2 * z * z));
}

TEST(ReferenceFilter, LowPassAndHighPassMeetTheirLimits) {
    for (const double frequency : {0.001, 0.05, 0.2, 0.45}) {
        const Filter low(0, 0.0, frequency);
        const Filter high(1, 0.0, frequency);
        EXPECT_NEAR(gainAt(low, 0.0), 1.0, 1e-9);
        EXPECT_NEAR(gainAt(low, 0.5), 0.0, 1e-9);
        EXPECT_NEAR(gainAt(low, frequency), 0.707, 1e-9);  // Q, at the cut-off
        EXPECT_NEAR(gainAt(high, 0.0), 0.0, 1e-9);
        EXPECT_NEAR(gainAt(high, 0.5), 1.0, 1e-9);
        EXPECT_NEAR(gainAt(high, frequency), 0.707, 1e-9);
    }
}

TEST(ReferenceFilter, BandPassNotchAndPeakActAtTheirCentre) {
    EXPECT_NEAR(gainAt(Filter(2, 0.0, 0.1), 0.1), 1.0, 1e-12);
    EXPECT_NEAR(gainAt(Filter(3, 0.0, 0.1), 0.1), 0.0, 1e-12);
    EXPECT_NEAR(gainAt(Filter(4, 6.0, 0.1), 0.1), std::pow(10.0, 0.3), 1e-12);
    EXPECT_NEAR(gainAt(Filter(4, -6.0, 0.1), 0.1), std::pow(10.0, -0.3), 1e-12);
}

TEST(ReferenceFilter, ShelvesReachTheirGainOnTheirSideOnly) {
    for (const double gainDb : {-12.0, -4.67, 4.67, 12.0}) {
        const double gain = std::pow(10.0, gainDb * 0.05);
        EXPECT_NEAR(gainAt(Filter(5, gainDb, 0.01), 0.0), gain, 1e-12);
        EXPECT_NEAR(gainAt(Filter(5, gainDb, 0.01), 0.5), 1.0, 1e-12);
        EXPECT_NEAR(gainAt(Filter(6, gainDb, 0.01), 0.0), 1.0, 1e-12);
        EXPECT_NEAR(gainAt(Filter(6, gainDb, 0.01), 0.5), gain, 1e-12);
    }
}

TEST(ReferenceFilter, FrequencyIsBounded) {
    EXPECT_EQ(boundedFrequency(0.457), 0.457);
    EXPECT_EQ(boundedFrequency(0.458), 0.458);
    EXPECT_EQ(boundedFrequency(2.0), 0.458);
    EXPECT_EQ(boundedFrequency(std::numeric_limits<double>::quiet_NaN()), 0.458);
    EXPECT_EQ(boundedFrequency(-1.0), 0.0);
}

TEST(ReferenceFilter, RecursionIsTheDifferenceEquation) {
    Filter filter(5, -4.67, 400.0 / 48000.0);
    std::array<double, 3> x{};
    std::array<double, 3> y{};
    for (int n = 0; n < 200; ++n) {
        x = {std::sin(0.3 * n * n), x[0], x[1]};
        const double expected = filter.b0 * x[0] + filter.b1 * x[1] + filter.b2 * x[2] -
                                filter.a1 * y[0] - filter.a2 * y[1];
        const double got = filter.run(x[0]);
        ASSERT_NEAR(got, expected, 1e-12);
        y = {got, y[0], y[1]};
    }
}

TEST(ReferenceFilter, RedesignKeepsTheStateAndUnknownTypesKeepTheCoefficients) {
    Filter filter(0, 0.0, 0.1);
    filter.run(1.0);
    const Filter before = filter;
    filter.design(7, 0.0, 0.3);
    EXPECT_EQ(filter.b0, before.b0);
    filter.design(0, 0.0, 0.3);
    EXPECT_NE(filter.b0, before.b0);
    EXPECT_EQ(filter.z1, before.z1);
    EXPECT_EQ(filter.z2, before.z2);
}

}  // namespace
}  // namespace tessaly::reference
