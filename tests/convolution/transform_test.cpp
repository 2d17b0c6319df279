// The real transform of every kernel table against the naive one.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>

#include "convolution/kernel_fixture.h"
#include "convolution/spectral_primitives.h"
#include "convolution/transform_tables.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

class Transform : public testing::TestWithParam<const Kernels*> {
protected:
    // Rounding of single precision grows with the depth of the transform.
    static double tolerance(std::size_t length) {
        return 3e-7 * static_cast<double>(std::bit_width(length) - 1);
    }
    // The definition takes a time that grows with the square of the length: of long blocks every
    // so manieth value is compared, an odd step, so that all remainders occur.
    static std::size_t step(std::size_t values) { return values <= 1025 ? 1 : values / 512 | 1; }
    TransformHandle plan(std::size_t length) const {
        const ForcedKernels forced(GetParam());
        TransformHandle handle;
        EXPECT_EQ(createFFT(handle, static_cast<std::int32_t>(length)), transformOk);
        return handle;
    }
};

TEST_P(Transform, EqualsNaiveTransformForwardAndBackward) {
    for (std::size_t length = 4; length <= 16384; length *= 2) {
        SCOPED_TRACE(length);
        Noise noise(static_cast<std::uint32_t>(length));
        const TransformHandle handle = plan(length);
        const std::vector<float> input = noise.samples(length);
        std::vector<ComplexBin> bins(length / 2 + 1);
        ASSERT_EQ(FFT(input.data(), bins.data(), handle), transformOk);
        const Spectrum roots = plainRoots(length);
        Spectrum expected;
        std::vector<ComplexBin> got;
        for (std::size_t k = 0; k < bins.size(); k += step(bins.size())) {
            expected.push_back(plainBin(input, roots, k));
            got.push_back(bins[k]);
        }
        EXPECT_LT(relativeRms(expected, got.data()), tolerance(length));
        EXPECT_EQ(bins.front().im, 0.0f);
        EXPECT_EQ(bins.back().im, 0.0f);

        const std::vector<ComplexBin> source = noise.bins(length / 2 + 1);
        Spectrum reference;
        for (const ComplexBin& bin : source) {
            reference.emplace_back(static_cast<double>(bin.re), static_cast<double>(bin.im));
        }
        std::vector<float> output(length);
        ASSERT_EQ(IFFT(source.data(), output.data(), handle), transformOk);
        std::vector<double> expectedSamples;
        std::vector<float> samples;
        for (std::size_t j = 0; j < length; j += step(length)) {
            expectedSamples.push_back(plainSample(reference, roots, j));
            samples.push_back(output[j]);
        }
        EXPECT_LT(relativeRms(expectedSamples, samples.data()), tolerance(length));
    }
}

TEST_P(Transform, ForwardAndBackwardMultiplyByLength) {
    for (std::size_t length = 4; length <= 16384; length *= 2) {
        SCOPED_TRACE(length);
        const TransformHandle handle = plan(length);
        const std::vector<float> input = Noise(7).samples(length);
        std::vector<ComplexBin> bins(length / 2 + 1);
        std::vector<float> output(length);
        FFT(input.data(), bins.data(), handle);
        IFFT(bins.data(), output.data(), handle);
        std::vector<double> expected;
        for (const float sample : input) {
            expected.push_back(static_cast<double>(sample) * static_cast<double>(length));
        }
        EXPECT_LT(relativeRms(expected, output.data()), 2.0 * tolerance(length));
    }
}

TEST_P(Transform, ImpulseAtEachPlaceTurnsEachBin) {
    // One sample at j gives e^(-2 pi i j k / n): finds a misplaced bin or a wrong sign at once.
    for (std::size_t length = 4; length <= 512; length *= 2) {
        const TransformHandle handle = plan(length);
        const Spectrum roots = plainRoots(length);
        for (std::size_t j = 0; j < length; ++j) {
            std::vector<float> input(length);
            input[j] = 1.0f;
            std::vector<ComplexBin> bins(length / 2 + 1);
            FFT(input.data(), bins.data(), handle);
            for (std::size_t k = 0; k < bins.size(); ++k) {
                const std::complex<double> root = roots[j * k % length];
                ASSERT_NEAR(static_cast<double>(bins[k].re), root.real(), 1e-6)
                    << length << ' ' << j << ' ' << k;
                ASSERT_NEAR(static_cast<double>(bins[k].im), root.imag(), 1e-6)
                    << length << ' ' << j << ' ' << k;
            }
        }
    }
}

TEST_P(Transform, ZerosStayZeros) {
    for (std::size_t length = 4; length <= 1024; length *= 2) {
        const TransformHandle handle = plan(length);
        const std::vector<float> input(length);
        std::vector<ComplexBin> bins(length / 2 + 1, ComplexBin{1.0f, 1.0f});
        FFT(input.data(), bins.data(), handle);
        std::vector<float> output(length, 1.0f);
        IFFT(bins.data(), output.data(), handle);
        for (const ComplexBin& bin : bins) {
            ASSERT_EQ(bin.re, 0.0f);
            ASSERT_EQ(bin.im, 0.0f);
        }
        EXPECT_THAT(output, testing::Each(0.0f));
    }
}

TEST_P(Transform, ArraysNeedNoAlignmentAndInputsStay) {
    for (std::size_t length = 4; length <= 2048; length *= 2) {
        for (const std::size_t offset : {0u, 1u, 3u}) {
            const TransformHandle handle = plan(length);
            const std::vector<float> samples = Noise(11).samples(length + offset);
            const std::vector<float> samplesBefore = samples;
            std::vector<ComplexBin> bins(length / 2 + 1 + offset + 1, ComplexBin{99.0f, 99.0f});
            FFT(samples.data() + offset, bins.data() + offset, handle);
            EXPECT_EQ(samples, samplesBefore);
            EXPECT_EQ(bins.back().re, 99.0f) << "wrote behind the spectrum";
            const Spectrum reference = plainForward(std::vector<float>(
                samples.begin() + static_cast<std::ptrdiff_t>(offset), samples.end()));
            EXPECT_LT(relativeRms(reference, bins.data() + offset), tolerance(length));

            const std::vector<ComplexBin> binsBefore = bins;
            std::vector<float> output(length + offset + 1, 99.0f);
            IFFT(bins.data() + offset, output.data() + offset, handle);
            EXPECT_EQ(output.back(), 99.0f) << "wrote behind the samples";
            for (std::size_t k = 0; k < bins.size(); ++k) {
                ASSERT_EQ(bins[k].re, binsBefore[k].re);
                ASSERT_EQ(bins[k].im, binsBefore[k].im);
            }
        }
    }
}

TEST_P(Transform, BackwardIgnoresImaginaryPartsOfFirstAndLastBin) {
    for (std::size_t length = 4; length <= 2048; length *= 2) {
        const TransformHandle handle = plan(length);
        std::vector<ComplexBin> bins = Noise(5).bins(length / 2 + 1);
        bins.front().im = 0.0f;
        bins.back().im = 0.0f;
        std::vector<float> clean(length);
        IFFT(bins.data(), clean.data(), handle);
        bins.front().im = 1000.0f;
        bins.back().im = -777.0f;
        std::vector<float> ignored(length);
        IFFT(bins.data(), ignored.data(), handle);
        EXPECT_EQ(clean, ignored) << length;
    }
}

INSTANTIATE_TEST_SUITE_P(Tables, Transform, testing::ValuesIn(testableKernels()), kernelTestName);

TEST(TransformTables, RefusesWhatNoKernelAsksFor) {
    EXPECT_EQ(transformTables(0, 1), nullptr);
    EXPECT_EQ(transformTables(1, 1), nullptr);
    EXPECT_EQ(transformTables(48, 1), nullptr);
    EXPECT_EQ(transformTables(65536, 8), nullptr);
    EXPECT_EQ(transformTables(32, 8), nullptr) << "fewer points than lanes squared";
    EXPECT_EQ(transformTables(64, 2), nullptr);
    EXPECT_EQ(transformTables(-64, 8), nullptr);
}

TEST(TransformTables, AreSharedByAllPlansOfALength) {
    ASSERT_NE(transformTables(64, 8), nullptr);
    EXPECT_EQ(transformTables(64, 8), transformTables(64, 8));
    EXPECT_NE(transformTables(64, 8), transformTables(64, 4));
    EXPECT_EQ(transformTables(64, 8)->columns, 8);
}

}  // namespace
}  // namespace tessaly::test
