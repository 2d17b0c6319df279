// The reference ring against a plain convolution, and the transform against plain sums.
#include "support/reference/reference_convolver.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

namespace tessaly::reference {
namespace {

std::vector<double> noise(int count, unsigned seed) {
    std::mt19937 generator(seed);
    std::uniform_real_distribution<double> value(-1.0, 1.0);
    std::vector<double> samples(static_cast<std::size_t>(count));
    for (double& sample : samples) {
        sample = value(generator);
    }
    return samples;
}

double convolvedAt(const std::vector<double>& x, const std::vector<double>& h, int n) {
    double sum = 0.0;
    for (int m = 0; m < static_cast<int>(h.size()) && m <= n; ++m) {
        sum += h[m] * x[n - m];
    }
    return sum;
}

TEST(ReferenceConvolver, TransformEqualsItsDefinition) {
    const int n = 16;
    const std::vector<double> real = noise(n, 1);
    const std::vector<double> imaginary = noise(n, 2);
    Pairs values(n);
    for (int i = 0; i < n; ++i) {
        values[i] = {real[i], imaginary[i]};
    }
    Pairs forward = values;
    fourier(forward, false);
    for (int k = 0; k < n; ++k) {
        std::complex<double> sum;
        for (int i = 0; i < n; ++i) {
            sum += values[i] * std::polar(1.0, -2.0 * M_PI * k * i / n);
        }
        ASSERT_NEAR(std::abs(forward[k] - sum), 0.0, 1e-13);
    }
    fourier(forward, true);
    for (int i = 0; i < n; ++i) {
        ASSERT_NEAR(std::abs(forward[i] / 16.0 - values[i]), 0.0, 1e-14);
    }
}

class ReferenceRing : public ::testing::TestWithParam<std::tuple<int, int, Arithmetic>> {};

TEST_P(ReferenceRing, ConstantResponseIsAPlainConvolution) {
    const auto [b, n, arithmetic] = GetParam();
    const int blocks = 3 * n + 2;
    const std::vector<double> x = noise(blocks * b, 3);
    const std::vector<double> left = noise(n * b, 4);
    const std::vector<double> right = noise(n * b, 5);
    PartitionedResponse response(b, n);
    response.cut(left, right);
    WindowRing ring(b, n);
    std::vector<double> window(static_cast<std::size_t>(2 * b), 0.0);
    int position = n - 1;
    for (int block = 0; block < blocks; ++block) {
        std::copy(window.begin() + b, window.end(), window.begin());
        std::copy_n(x.begin() + block * b, b, window.begin() + b);
        position = (position + 1) % n;
        ring.write(position, window);
        const Pairs out = convolveBlock(ring, position, response, arithmetic);
        for (int i = 0; i < b; ++i) {
            ASSERT_NEAR(out[i].real(), convolvedAt(x, left, block * b + i), 1e-11);
            ASSERT_NEAR(out[i].imag(), convolvedAt(x, right, block * b + i), 1e-11);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Sizes,
                         ReferenceRing,
                         ::testing::Combine(::testing::Values(2, 64),
                                            ::testing::Values(1, 2, 3, 8),
                                            ::testing::Values(Arithmetic::direct,
                                                              Arithmetic::transformed)));

TEST(ReferenceConvolver, TransformedSumsEqualDirectSumsForLargeBlocks) {
    const int b = 1024;
    const int n = 3;
    PartitionedResponse response(b, n);
    response.cut(noise(n * b, 6), noise(n * b, 7));
    WindowRing ring(b, n);
    for (int slot = 0; slot < n; ++slot) {
        ring.write(slot, noise(2 * b, 8u + static_cast<unsigned>(slot)));
    }
    const Pairs direct = convolveBlock(ring, 1, response, Arithmetic::direct);
    const Pairs transformed = convolveBlock(ring, 1, response, Arithmetic::transformed);
    for (int i = 0; i < b; ++i) {
        ASSERT_NEAR(std::abs(direct[i] - transformed[i]), 0.0, 1e-11);
    }
}

TEST(ReferenceConvolver, CuttingAgainEqualsCuttingAfresh) {
    const int b = 16;
    const int n = 4;
    std::vector<double> left = noise(n * b, 20);
    std::vector<double> right = noise(n * b, 21);
    PartitionedResponse again(b, n);
    again.cut(left, right);
    left[b + 3] = 0.5;       // the second partition
    right[4 * b - 1] = 0.0;  // and the last
    again.cut(left, right);
    PartitionedResponse fresh(b, n);
    fresh.cut(left, right);
    for (int p = 0; p < n; ++p) {
        ASSERT_EQ(again.taps(p), fresh.taps(p)) << p;
        ASSERT_EQ(again.spectrum(p), fresh.spectrum(p)) << p;
    }
    const std::vector<double> silence(static_cast<std::size_t>(n * b), 0.0);
    again.cut(silence, silence);
    for (int p = 0; p < n; ++p) {
        ASSERT_EQ(again.spectrum(p), Pairs(static_cast<std::size_t>(2 * b))) << p;
    }
}

TEST(ReferenceConvolver, SlotsAreSilentUntilWritten) {
    WindowRing ring(4, 2);
    EXPECT_TRUE(ring.silent(0));
    ring.write(0, noise(8, 22));
    EXPECT_FALSE(ring.silent(0));
    EXPECT_TRUE(ring.silent(1));
    ring.write(0, std::vector<double>(8, 0.0));
    EXPECT_TRUE(ring.silent(0));
    std::vector<double> last(8, 0.0);
    last[7] = -1e-300;
    ring.write(1, last);
    EXPECT_FALSE(ring.silent(1));
}

TEST(ReferenceConvolver, DirectFeedActsCircularlyOverTwoBlocks) {
    const int b = 8;
    std::vector<double> taps(static_cast<std::size_t>(2 * b), 0.0);
    taps[3] = 1.0;
    taps[b + 2] = 0.25;
    PartitionedResponse response(b, 2);
    response.feedDirectly(taps, taps);
    WindowRing ring(b, 2);
    const std::vector<double> window = noise(2 * b, 11);
    ring.write(0, window);
    ring.write(1, noise(2 * b, 12));  // behind partition 1, which holds nothing
    for (const Arithmetic arithmetic : {Arithmetic::direct, Arithmetic::transformed}) {
        const Pairs out = convolveBlock(ring, 0, response, arithmetic);
        for (int i = 0; i < b; ++i) {
            // The tap at b + 2 reaches back past the window's start for the first two samples.
            const double wrapped = window[(b + i - (b + 2) + 2 * b) % (2 * b)];
            ASSERT_NEAR(out[i].real(), window[b + i - 3] + 0.25 * wrapped, 1e-13);
        }
    }
}

}  // namespace
}  // namespace tessaly::reference
