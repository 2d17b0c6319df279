// The double-precision transform against its definition.
#include "data/fft.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>
#include <random>

#include "data/data_error.h"

namespace tessaly::data {
namespace {

std::vector<double> noise(std::size_t length) {
    std::mt19937 generator(7);
    std::vector<double> values(length);
    for (double& value : values) {
        value = static_cast<double>(generator()) / 4294967296.0 - 0.5;
    }
    return values;
}

class FftLength : public testing::TestWithParam<std::size_t> {};

TEST_P(FftLength, ForwardEqualsTheSumOfItsDefinition) {
    const std::size_t length = GetParam();
    const std::vector<double> time = noise(length);
    RealTransform transform(length);
    std::vector<Complex> spectrum(transform.bins());
    transform.forward(time.data(), spectrum.data());
    ASSERT_EQ(spectrum.size(), length / 2 + 1);
    for (std::size_t k = 0; k < spectrum.size(); ++k) {
        double real = 0.0;
        double imaginary = 0.0;
        for (std::size_t i = 0; i < length; ++i) {
            const double angle = 2.0 * std::numbers::pi * static_cast<double>(k * i % length) /
                                 static_cast<double>(length);
            real += time[i] * std::cos(angle);
            imaginary -= time[i] * std::sin(angle);
        }
        EXPECT_NEAR(spectrum[k].real(), real, 1e-11) << "bin " << k;
        EXPECT_NEAR(spectrum[k].imag(), imaginary, 1e-11) << "bin " << k;
    }
    EXPECT_EQ(spectrum.front().imag(), 0.0);
    EXPECT_EQ(spectrum.back().imag(), 0.0);
}

TEST_P(FftLength, InverseGivesTheSignalBack) {
    const std::size_t length = GetParam();
    const std::vector<double> time = noise(length);
    RealTransform transform(length);
    std::vector<Complex> spectrum(transform.bins());
    std::vector<double> back(length);
    transform.forward(time.data(), spectrum.data());
    transform.inverse(spectrum.data(), back.data());
    for (std::size_t i = 0; i < length; ++i) {
        EXPECT_NEAR(back[i], time[i], 1e-14) << "sample " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(PowersOfTwo, FftLength, testing::Values(4, 8, 16, 64, 1024));

TEST(Fft, LongLengthsKeepTheirPrecision) {
    constexpr std::size_t length = 16384;
    const std::vector<double> time = noise(length);
    RealTransform transform(length);
    std::vector<Complex> spectrum(transform.bins());
    std::vector<double> back(length);
    transform.forward(time.data(), spectrum.data());
    transform.inverse(spectrum.data(), back.data());
    double largest = 0.0;
    for (std::size_t i = 0; i < length; ++i) {
        largest = std::max(largest, std::abs(back[i] - time[i]));
    }
    EXPECT_LT(largest, 1e-14);
}

TEST(Fft, RefusesLengthsThatAreNoPowerOfTwo) {
    for (const std::size_t length : {0u, 1u, 2u, 3u, 6u, 100u}) {
        EXPECT_THROW(RealTransform{length}, DataError) << length;
    }
}

TEST(Fft, NextPowerOfTwoIsNotBelow) {
    EXPECT_EQ(nextPowerOfTwo(1), 1u);
    EXPECT_EQ(nextPowerOfTwo(512), 512u);
    EXPECT_EQ(nextPowerOfTwo(513), 1024u);
}

}  // namespace
}  // namespace tessaly::data
