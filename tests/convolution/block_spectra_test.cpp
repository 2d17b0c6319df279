// Convolution by block spectra, with every kernel table, against the sum written out.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>

#include "convolution/kernel_fixture.h"
#include "convolution/partition_sums.h"
#include "convolution/spectral_primitives.h"
#include "convolution/transform_tables.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

class BlockSpectra : public testing::TestWithParam<const Kernels*> {
protected:
    BlockSpectra() : forced_(GetParam()) {}

    static TransformHandle plan(std::size_t length) {
        TransformHandle handle;
        EXPECT_EQ(createFFT(handle, static_cast<std::int32_t>(length)), transformOk);
        return handle;
    }
    static std::vector<ComplexBin> product(const TransformHandle& handle,
                                           const std::vector<float>& window,
                                           const std::vector<float>& partition) {
        const std::size_t length = partition.size();
        std::vector<ComplexBin> input(length);
        std::vector<ComplexBin> response(length);
        EXPECT_EQ(windowFFT(window.data(), input.data(), handle), transformOk);
        EXPECT_EQ(partitionFFT(partition.data(), response.data(), handle), transformOk);
        const ComplexBin* const x = input.data();
        const ComplexBin* const h = response.data();
        std::vector<ComplexBin> sum(length);
        std::vector<ComplexBin> unused(length);
        GetParam()->sumOfProducts(GetParam()->transformLanes(static_cast<std::int32_t>(length)),
                                  length, 1, &x, &h, &h, nullptr, nullptr, sum.data(),
                                  unused.data());
        return sum;
    }
    /// Sample n of the convolution, written out: zeros lie on both sides of the window.
    static double productSample(const std::vector<float>& window,
                                const std::vector<float>& partition,
                                std::size_t n) {
        double sum = 0.0;
        for (std::size_t j = 0; j < partition.size() && j <= n; ++j) {
            if (n - j < window.size()) {
                sum += static_cast<double>(partition[j]) * static_cast<double>(window[n - j]);
            }
        }
        return sum;
    }
    /// What `block` gives for a window and a partition of half its length.
    static std::vector<float> convolved(const TransformHandle& handle,
                                        const std::vector<float>& window,
                                        const std::vector<float>& partition) {
        const std::size_t length = partition.size();
        const std::vector<ComplexBin> sum = product(handle, window, partition);
        std::vector<float> output(length + 1, 99.0f);
        EXPECT_EQ(blockIFFT(sum.data(), output.data(), static_cast<std::int32_t>(length), handle),
                  transformOk);
        EXPECT_EQ(output.back(), 99.0f) << "wrote behind the block";
        output.pop_back();
        return output;
    }

private:
    ForcedKernels forced_;
};

TEST_P(BlockSpectra, ConvolveAWindowWithAPartitionForTheSecondHalf) {
    for (std::size_t length = 2; length <= 16384; length *= 2) {
        SCOPED_TRACE(length);
        const TransformHandle handle = plan(2 * length);
        Noise noise(static_cast<std::uint32_t>(length));
        const std::vector<float> window = noise.samples(2 * length);
        const std::vector<float> partition = noise.samples(length);
        const std::vector<float> output = convolved(handle, window, partition);
        std::vector<double> expected;
        std::vector<float> got;
        // Of long blocks every so manieth sample, an odd step.
        for (std::size_t n = 0; n < length; n += length / 256 | 1) {
            expected.push_back(2.0 * static_cast<double>(length) *
                               productSample(window, partition, length + n));
            got.push_back(output[n]);
        }
        EXPECT_LT(relativeRms(expected, got.data()), 5e-7);
    }
}

TEST_P(BlockSpectra, ImpulseAtEachPlaceDelaysTheWindow) {
    // Finds a misplaced root or a row in the wrong order at once.
    for (std::size_t length = 2; length <= 512; length *= 2) {
        const TransformHandle handle = plan(2 * length);
        const std::vector<float> window = Noise(2).samples(2 * length);
        for (std::size_t j = 0; j < length; j += length / 64 + 1) {
            std::vector<float> partition(length);
            partition[j] = 1.0f;
            const std::vector<float> output = convolved(handle, window, partition);
            for (std::size_t n = 0; n < length; ++n) {
                ASSERT_NEAR(output[n] / static_cast<float>(2 * length), window[length + n - j],
                            2e-6f)
                    << length << ' ' << j << ' ' << n;
            }
        }
    }
}

TEST_P(BlockSpectra, OfAPartitionIsThatOfAWindowWithZerosBehindIt) {
    for (std::size_t length = 2; length <= 8192; length *= 2) {
        SCOPED_TRACE(length);
        const TransformHandle handle = plan(2 * length);
        const std::vector<float> partition = Noise(3).samples(length);
        std::vector<float> window = partition;
        window.resize(2 * length);
        std::vector<ComplexBin> expected(length);
        std::vector<ComplexBin> got(length + 1, ComplexBin{99.0f, 99.0f});
        ASSERT_EQ(windowFFT(window.data(), expected.data(), handle), transformOk);
        ASSERT_EQ(partitionFFT(partition.data(), got.data(), handle), transformOk);
        for (std::size_t k = 0; k < length; ++k) {
            ASSERT_EQ(got[k].re, expected[k].re) << k;
            ASSERT_EQ(got[k].im, expected[k].im) << k;
        }
        EXPECT_EQ(got.back().re, 99.0f) << "wrote behind the spectrum";
    }
}

TEST_P(BlockSpectra, OfAPartitionOfFewSamplesNeedOnlyThese) {
    for (std::size_t length = 2; length <= 8192; length *= 2) {
        const TransformHandle handle = plan(2 * length);
        Noise noise(static_cast<std::uint32_t>(length));
        const std::size_t part = std::max<std::size_t>(length / 64, 1);
        for (int round = 0; round < 40; ++round) {
            // From no part to all of them; those that sound lie together, or apart.
            std::uint64_t sounding = 0;
            const int count = round < 3 ? round : 2 * round - 14;
            const int first = static_cast<int>((noise() + 1.0f) * 32.0f) % 64;
            for (int k = 0; k < count; ++k) {
                sounding |= std::uint64_t{1} << ((first + (round % 2 == 0 ? k : 11 * k)) % 64);
            }
            SCOPED_TRACE(testing::Message() << length << ", parts " << std::hex << sounding);
            std::vector<float> partition = noise.samples(length);
            std::vector<float> unread = partition;
            for (std::size_t i = 0; i < length && length >= 64; ++i) {
                if ((sounding >> (i / part) & 1) == 0) {
                    partition[i] = 0.0f;
                }
            }
            // Vectors, of up to 16 samples, that hold something are read.
            for (std::size_t i = 0; i < length; ++i) {
                const std::size_t vector = i / 16 * 16;
                float any = 0.0f;
                for (std::size_t n = vector; n < std::min(vector + 16, length); ++n) {
                    any += std::fabs(partition[n]);
                }
                const bool read = any > 0.0f || std::popcount(sounding) > 24;
                unread[i] = length < 64 || read ? partition[i] : 1e30f;
            }
            std::vector<ComplexBin> expected(length);
            std::vector<ComplexBin> got(length + 1, ComplexBin{99.0f, 99.0f});
            ASSERT_EQ(partitionFFT(partition.data(), expected.data(), handle), transformOk);
            ASSERT_EQ(partitionFFT(unread.data(), got.data(), handle, sounding), transformOk);
            for (std::size_t k = 0; k < length; ++k) {
                const float near = 1e-6f * std::sqrt(static_cast<float>(length));
                ASSERT_NEAR(got[k].re, expected[k].re, near) << k;
                ASSERT_NEAR(got[k].im, expected[k].im, near) << k;
            }
            EXPECT_EQ(got.back().re, 99.0f) << "wrote behind the spectrum";
        }
    }
}

TEST_P(BlockSpectra, FewerSamplesAreThoseOfTheWholeBlockBitForBit) {
    for (std::size_t length = 2; length <= 8192; length *= 2) {
        const TransformHandle handle = plan(2 * length);
        const std::vector<ComplexBin> spectrum = Noise(4).bins(length);
        std::vector<float> expected(length);
        ASSERT_EQ(
            blockIFFT(spectrum.data(), expected.data(), static_cast<std::int32_t>(length), handle),
            transformOk);
        for (const std::size_t samples :
             {std::size_t{0}, std::size_t{1}, std::size_t{16}, std::size_t{64}, std::size_t{200},
              length / 2, length - 1, length + 7}) {
            SCOPED_TRACE(testing::Message() << length << ", " << samples << " samples");
            std::vector<float> got(length + 1, 99.0f);
            ASSERT_EQ(
                blockIFFT(spectrum.data(), got.data(), static_cast<std::int32_t>(samples), handle),
                transformOk);
            for (std::size_t i = 0; i < std::min(samples, length); ++i) {
                ASSERT_EQ(got[i], expected[i]) << i;
            }
            EXPECT_EQ(got.back(), 99.0f);
        }
    }
}

TEST_P(BlockSpectra, WrappedSamplesAreTheProductsStartLessWhatItGoesOnToBe) {
    for (std::size_t length = 2; length <= 2048; length *= 2) {
        SCOPED_TRACE(length);
        const TransformHandle handle = plan(2 * length);
        Noise noise(static_cast<std::uint32_t>(length));
        const std::vector<float> window = noise.samples(2 * length);
        const std::vector<float> partition = noise.samples(length);
        const std::vector<ComplexBin> sum = product(handle, window, partition);
        const auto samples = static_cast<double>(length);
        const double scale = 2.0 * samples * std::sqrt(samples);
        std::vector<double> expected(length);
        for (std::size_t n = 0; n < length; ++n) {
            expected[n] = 2.0 * samples *
                          (productSample(window, partition, n) -
                           productSample(window, partition, 2 * length + n));
        }
        const auto all = static_cast<std::int32_t>(length);
        std::vector<float> block(length);
        ASSERT_EQ(blockIFFT(sum.data(), block.data(), all, handle), transformOk);
        for (const std::size_t wanted : {std::size_t{0}, std::size_t{1}, std::size_t{16},
                                         std::size_t{64}, length / 2, length, length + 7}) {
            SCOPED_TRACE(wanted);
            const std::size_t count = std::min(wanted, length);
            const std::size_t vectors = std::min((count + 15) / 16 * 16, std::max(length, count));
            std::vector<float> again(length);
            std::vector<float> wrapped(length + 16, 99.0f);
            ASSERT_EQ(blockIFFT(sum.data(), again.data(), all, handle,
                                {wrapped.data(), static_cast<std::int32_t>(wanted)}),
                      transformOk);
            EXPECT_EQ(again, block) << "whatever else is made";
            for (std::size_t n = 0; n < count; ++n) {
                ASSERT_NEAR(static_cast<double>(wrapped[n]), expected[n], 1e-6 * scale) << n;
            }
            EXPECT_EQ(wrapped[vectors], 99.0f) << "wrote behind them";
            // Nor do they need the others.
            std::vector<float> alone(length + 16, 99.0f);
            ASSERT_EQ(blockIFFT(sum.data(), again.data(), 0, handle,
                                {alone.data(), static_cast<std::int32_t>(wanted)}),
                      transformOk);
            for (std::size_t i = 0; i < count; ++i) {
                ASSERT_EQ(alone[i], wrapped[i]) << i;
            }
        }
    }
}

TEST_P(BlockSpectra, ZerosStayZeros) {
    for (std::size_t length = 2; length <= 2048; length *= 2) {
        const TransformHandle handle = plan(2 * length);
        const std::vector<float> window(2 * length);
        std::vector<ComplexBin> spectrum(length, ComplexBin{1.0f, 1.0f});
        windowFFT(window.data(), spectrum.data(), handle);
        std::vector<float> output(length, 1.0f);
        blockIFFT(spectrum.data(), output.data(), static_cast<std::int32_t>(length), handle);
        for (const ComplexBin& bin : spectrum) {
            ASSERT_EQ(bin.re, 0.0f);
            ASSERT_EQ(bin.im, 0.0f);
        }
        EXPECT_THAT(output, testing::Each(0.0f));
    }
}

TEST_P(BlockSpectra, ArraysNeedNoAlignmentAndInputsStay) {
    for (std::size_t length = 2; length <= 2048; length *= 2) {
        const TransformHandle handle = plan(2 * length);
        const std::vector<float> samples = Noise(11).samples(2 * length);
        std::vector<ComplexBin> expected(length);
        windowFFT(samples.data(), expected.data(), handle);
        std::vector<float> expectedBlock(length);
        blockIFFT(expected.data(), expectedBlock.data(), static_cast<std::int32_t>(length), handle);
        for (const std::size_t offset : {1u, 3u}) {
            std::vector<float> moved(offset);
            moved.insert(moved.end(), samples.begin(), samples.end());
            const std::vector<float> movedBefore = moved;
            std::vector<ComplexBin> spectrum(offset + length);
            windowFFT(moved.data() + offset, spectrum.data() + offset, handle);
            EXPECT_EQ(moved, movedBefore);
            std::vector<float> block(offset + length);
            blockIFFT(spectrum.data() + offset, block.data() + offset,
                      static_cast<std::int32_t>(length), handle);
            for (std::size_t k = 0; k < length; ++k) {
                ASSERT_EQ(spectrum[offset + k].re, expected[k].re);
                ASSERT_EQ(spectrum[offset + k].im, expected[k].im);
                ASSERT_EQ(block[offset + k], expectedBlock[k]);
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         BlockSpectra,
                         testing::ValuesIn(testableKernels()),
                         kernelTestName);

TEST(BlockSpectra, AreRefusedWithoutAPlanOrAnArray) {
    std::vector<float> samples(16);
    std::vector<ComplexBin> bins(8);
    EXPECT_EQ(computeWindow(nullptr, samples.data(), bins.data()), transformEmptyHandle);
    EXPECT_EQ(computePartition(nullptr, samples.data(), bins.data()), transformEmptyHandle);
    EXPECT_EQ(computeBlock(nullptr, bins.data(), samples.data(), 4), transformEmptyHandle);
    TransformHandle handle;
    ASSERT_EQ(createTransform(handle, 16), transformOk);
    EXPECT_EQ(computeWindow(handle, samples.data(), bins.data()), transformNotCommitted);
    ASSERT_EQ(commitTransform(handle), transformOk);
    EXPECT_EQ(computeWindow(handle, nullptr, bins.data()), transformNullArray);
    EXPECT_EQ(computeWindow(handle, samples.data(), nullptr), transformNullArray);
    EXPECT_EQ(computePartition(handle, nullptr, bins.data()), transformNullArray);
    EXPECT_EQ(computePartition(handle, samples.data(), nullptr), transformNullArray);
    EXPECT_EQ(computeBlock(handle, nullptr, samples.data(), 4), transformNullArray);
    EXPECT_EQ(computeBlock(handle, bins.data(), nullptr, 4), transformNullArray);
    EXPECT_EQ(computeBlock(handle, bins.data(), samples.data(), -1), transformOk);
}

TEST(BlockSpectra, HaveAPlanOfTheirOwnThatRefusesTheOthers) {
    std::vector<float> samples(32);
    std::vector<ComplexBin> bins(17);
    TransformHandle handle;
    EXPECT_EQ(createBlockTransform(handle, 24), transformBadLength);
    EXPECT_EQ(handle, nullptr);
    ASSERT_EQ(createBlockTransform(handle, 32), transformOk);
    EXPECT_EQ(computeWindow(handle, samples.data(), bins.data()), transformOk);
    EXPECT_EQ(computeForward(handle, samples.data(), bins.data()), transformOtherKind);
    EXPECT_EQ(computeBackward(handle, bins.data(), samples.data()), transformOtherKind);
    spectralFaults.plansLeft = 0;
    EXPECT_EQ(createBlockTransform(handle, 32), transformNoMemory);
    spectralFaults = {};
    EXPECT_EQ(handle, nullptr);
}

TEST(BlockTables, AreSharedAndRefuseWhatNoKernelAsksFor) {
    ASSERT_NE(blockTables(64, 8), nullptr);
    EXPECT_EQ(blockTables(64, 8), blockTables(64, 8));
    EXPECT_NE(blockTables(64, 8), blockTables(64, 4));
    EXPECT_EQ(blockTables(64, 8)->columns, 8);
    EXPECT_EQ(blockTables(1, 1), nullptr);
    EXPECT_EQ(blockTables(48, 1), nullptr);
    EXPECT_EQ(blockTables(32, 8), nullptr);
    EXPECT_EQ(blockTables(65536, 8), nullptr);
}

}  // namespace
}  // namespace tessaly::test
