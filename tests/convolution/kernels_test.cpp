// The vector operations of every kernel table against plain separate passes.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>

#include "convolution/kernel_fixture.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

constexpr std::size_t lengths[] = {1, 2, 3, 4, 5, 7, 8, 9, 15, 16, 17, 31, 33, 63, 65, 129, 257};

bool sameBits(const ComplexBin* a, const ComplexBin* b, std::size_t count) {
    return std::memcmp(a, b, count * sizeof(ComplexBin)) == 0;
}

class KernelTable : public testing::TestWithParam<const Kernels*> {};

TEST_P(KernelTable, MultiplyAndAddEqualPlainLoopsBitForBit) {
    for (const std::size_t bins : lengths) {
        for (std::size_t offset = 0; offset < 4; ++offset) {
            Noise noise(static_cast<std::uint32_t>(bins));
            const std::vector<ComplexBin> a = noise.bins(bins + offset);
            const std::vector<ComplexBin> b = noise.bins(bins + offset);
            std::vector<ComplexBin> expected(bins);
            std::vector<ComplexBin> y(bins + offset + 1, ComplexBin{99.0f, 99.0f});

            plainMultiply(bins, a.data() + offset, b.data() + offset, expected.data());
            GetParam()->multiply(bins, a.data() + offset, b.data() + offset, y.data() + offset);
            EXPECT_TRUE(sameBits(y.data() + offset, expected.data(), bins)) << bins;

            plainAdd(bins, a.data() + offset, b.data() + offset, expected.data());
            GetParam()->add(bins, a.data() + offset, b.data() + offset, y.data() + offset);
            EXPECT_TRUE(sameBits(y.data() + offset, expected.data(), bins)) << bins;
            EXPECT_EQ(y.back().re, 99.0f) << "wrote behind " << bins;
        }
    }
}

TEST_P(KernelTable, MultiplyAndAddWorkInPlaceOnEitherSide) {
    for (const std::size_t bins : lengths) {
        Noise noise(static_cast<std::uint32_t>(bins));
        const std::vector<ComplexBin> a = noise.bins(bins);
        const std::vector<ComplexBin> b = noise.bins(bins);
        std::vector<ComplexBin> product(bins);
        std::vector<ComplexBin> total(bins);
        std::vector<ComplexBin> square(bins);
        plainMultiply(bins, a.data(), b.data(), product.data());
        plainAdd(bins, a.data(), b.data(), total.data());
        plainMultiply(bins, a.data(), a.data(), square.data());

        std::vector<ComplexBin> y = a;
        GetParam()->multiply(bins, y.data(), b.data(), y.data());
        EXPECT_TRUE(sameBits(y.data(), product.data(), bins));
        y = b;
        GetParam()->multiply(bins, a.data(), y.data(), y.data());
        EXPECT_TRUE(sameBits(y.data(), product.data(), bins));
        y = a;
        GetParam()->multiply(bins, y.data(), y.data(), y.data());
        EXPECT_TRUE(sameBits(y.data(), square.data(), bins));
        y = a;
        GetParam()->add(bins, y.data(), b.data(), y.data());
        EXPECT_TRUE(sameBits(y.data(), total.data(), bins));
        y = b;
        GetParam()->add(bins, a.data(), y.data(), y.data());
        EXPECT_TRUE(sameBits(y.data(), total.data(), bins));
    }
}

TEST_P(KernelTable, MultiplyCarriesNotANumberAndInfinity) {
    std::vector<ComplexBin> a = Noise(1).bins(17);
    const std::vector<ComplexBin> b = Noise(2).bins(17);
    a[3].re = std::nanf("");
    a[16].im = HUGE_VALF;
    std::vector<ComplexBin> y(17);
    GetParam()->multiply(17, a.data(), b.data(), y.data());
    for (std::size_t i = 0; i < y.size(); ++i) {
        EXPECT_EQ(std::isnan(y[i].re), i == 3) << i;
        EXPECT_EQ(std::isinf(y[i].im), i == 16) << i;
    }
}

TEST_P(KernelTable, RingSumEqualsPlainPassesWithinItsBound) {
    // Ring and partition index run against each other, from every newest slot.
    for (const std::size_t partitions : {1u, 2u, 3u, 4u, 5u, 7u, 8u, 9u, 13u}) {
        for (const std::size_t bins : lengths) {
            Noise noise(static_cast<std::uint32_t>(bins * 100 + partitions));
            const std::size_t offset = bins % 4;  // unaligned as well
            std::vector<std::vector<ComplexBin>> storage;
            const auto pointers = [&] {
                std::vector<const ComplexBin*> entries;
                for (std::size_t i = 0; i < partitions; ++i) {
                    storage.push_back(noise.bins(bins + offset));
                    entries.push_back(storage.back().data() + offset);
                }
                return entries;
            };
            storage.reserve(3 * partitions);
            const std::vector<const ComplexBin*> ring = pointers();
            const std::vector<const ComplexBin*> left = pointers();
            const std::vector<const ComplexBin*> right = pointers();
            const std::size_t newest = (bins * 7) % partitions;

            std::vector<ComplexBin> scratch(bins);
            std::vector<ComplexBin> expectedL(bins);
            std::vector<ComplexBin> expectedR(bins);
            plainRing(bins, partitions, newest, ring.data(), left.data(), scratch.data(),
                      expectedL.data());
            plainRing(bins, partitions, newest, ring.data(), right.data(), scratch.data(),
                      expectedR.data());

            std::vector<ComplexBin> sumL(bins + 1, ComplexBin{99.0f, 99.0f});
            std::vector<ComplexBin> sumR(bins + 1, ComplexBin{99.0f, 99.0f});
            GetParam()->ringSum(bins, partitions, newest, ring.data(), left.data(), right.data(),
                                sumL.data(), sumR.data());
            EXPECT_EQ(sumL.back().re, 99.0f);
            EXPECT_EQ(sumR.back().re, 99.0f);
            // Noise is below 1, so each part of a product is below 2.
            const float bound = 4.0f * static_cast<float>(partitions * (partitions + 2)) * 0x1p-24f;
            for (std::size_t i = 0; i < bins; ++i) {
                ASSERT_NEAR(sumL[i].re, expectedL[i].re, bound) << partitions << ' ' << bins;
                ASSERT_NEAR(sumL[i].im, expectedL[i].im, bound) << partitions << ' ' << bins;
                ASSERT_NEAR(sumR[i].re, expectedR[i].re, bound) << partitions << ' ' << bins;
                ASSERT_NEAR(sumR[i].im, expectedR[i].im, bound) << partitions << ' ' << bins;
            }
        }
    }
}

TEST_P(KernelTable, ListSumEqualsPlainPassesAndAddsOntoASum) {
    for (const std::size_t count : {0u, 1u, 2u, 3u, 4u, 5u, 8u, 11u}) {
        for (const std::size_t bins : lengths) {
            Noise noise(static_cast<std::uint32_t>(bins * 100 + count));
            std::vector<std::vector<ComplexBin>> storage;
            storage.reserve(3 * count);
            const auto pointers = [&] {
                std::vector<const ComplexBin*> entries;
                for (std::size_t i = 0; i < count; ++i) {
                    storage.push_back(noise.bins(bins));
                    entries.push_back(storage.back().data());
                }
                return entries;
            };
            const std::vector<const ComplexBin*> input = pointers();
            const std::vector<const ComplexBin*> left = pointers();
            const std::vector<const ComplexBin*> right = pointers();
            const std::vector<ComplexBin> start = noise.bins(bins);
            for (const bool onto : {false, true}) {
                std::vector<ComplexBin> sumL = start;
                std::vector<ComplexBin> sumR = start;
                sumL.push_back({99.0f, 99.0f});
                sumR.push_back({99.0f, 99.0f});
                GetParam()->listSum(bins, count, input.data(), left.data(), right.data(), onto,
                                    sumL.data(), sumR.data());
                const float bound = 4.0f * static_cast<float>((count + 1) * (count + 2)) * 0x1p-24f;
                const auto compare = [&](const std::vector<const ComplexBin*>& response,
                                         const std::vector<ComplexBin>& got) {
                    std::vector<ComplexBin> expected =
                        onto || count == 0 ? start : std::vector<ComplexBin>(bins);
                    std::vector<ComplexBin> scratch(bins);
                    for (std::size_t n = 0; n < count; ++n) {
                        plainMultiply(bins, input[n], response[n], scratch.data());
                        plainAdd(bins, scratch.data(), expected.data(), expected.data());
                    }
                    for (std::size_t i = 0; i < bins; ++i) {
                        ASSERT_NEAR(got[i].re, expected[i].re, bound) << count << ' ' << bins;
                        ASSERT_NEAR(got[i].im, expected[i].im, bound) << count << ' ' << bins;
                    }
                    EXPECT_EQ(got.back().re, 99.0f);
                };
                compare(left, sumL);
                compare(right, sumR);
            }
        }
    }
}

TEST_P(KernelTable, AddTapsEqualsTheSumWrittenOut) {
    for (const std::size_t samples : {0u, 1u, 3u, 4u, 7u, 8u, 16u, 31u, 64u, 65u, 130u}) {
        for (const std::size_t taps : {0u, 1u, 2u, 7u, 128u}) {
            Noise noise(static_cast<std::uint32_t>(samples * 200 + taps));
            const std::vector<float> left = noise.samples(taps);
            const std::vector<float> right = noise.samples(taps);
            const std::size_t past = std::max<std::size_t>(taps, 1) - 1;
            const std::vector<float> input = noise.samples(past + samples);
            const std::vector<float> start = noise.samples(samples);
            std::vector<float> sumL = start;
            std::vector<float> sumR = start;
            sumL.push_back(99.0f);
            sumR.push_back(99.0f);
            GetParam()->addTaps(samples, taps, left.data(), right.data(), input.data() + past,
                                sumL.data(), sumR.data());
            const double bound = 2.0 * static_cast<double>((taps + 1) * (taps + 1)) * 0x1p-24;
            for (std::size_t n = 0; n < samples; ++n) {
                double expectedL = static_cast<double>(start[n]);
                double expectedR = expectedL;
                for (std::size_t k = 0; k < taps; ++k) {
                    const double x = static_cast<double>(input[past + n - k]);
                    expectedL += static_cast<double>(left[k]) * x;
                    expectedR += static_cast<double>(right[k]) * x;
                }
                ASSERT_NEAR(static_cast<double>(sumL[n]), expectedL, bound) << taps;
                ASSERT_NEAR(static_cast<double>(sumR[n]), expectedR, bound) << taps;
            }
            EXPECT_EQ(sumL.back(), 99.0f);
            EXPECT_EQ(sumR.back(), 99.0f);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Tables, KernelTable, testing::ValuesIn(testableKernels()), kernelTestName);

TEST(KernelDispatch, OffersThePlainTableFirstAndTakesTheLast) {
    const KernelList& list = availableKernels();
    ASSERT_GE(list.count, 1u);
    EXPECT_EQ(list.tables[0], kernelsScalar);
    EXPECT_EQ(&selectKernels(), list.tables[list.count - 1]);
    for (std::size_t i = 0; i < list.count; ++i) {
        EXPECT_NE(list.tables[i], nullptr);
    }
}

TEST(KernelDispatch, ForcedTableHoldsUntilTakenBack) {
    forceKernels(kernelsScalar);
    EXPECT_EQ(&selectKernels(), kernelsScalar);
    forceKernels(nullptr);
    const KernelList& list = availableKernels();
    EXPECT_EQ(&selectKernels(), list.tables[list.count - 1]);
}

TEST(KernelDispatch, EveryTableIsComplete) {
    for (const Kernels* kernels : testableKernels()) {
        EXPECT_NE(kernels->transformLanes, nullptr);
        EXPECT_NE(kernels->forward, nullptr);
        EXPECT_NE(kernels->forwardHalf, nullptr);
        EXPECT_NE(kernels->backward, nullptr);
        EXPECT_NE(kernels->backwardMiddle, nullptr);
        EXPECT_NE(kernels->backwardBlock, nullptr);
        EXPECT_NE(kernels->multiply, nullptr);
        EXPECT_NE(kernels->add, nullptr);
        EXPECT_NE(kernels->ringSum, nullptr);
        EXPECT_NE(kernels->listSum, nullptr);
        EXPECT_NE(kernels->addTaps, nullptr);
        for (std::int32_t points = 2; points <= 32768; points *= 2) {
            const std::int32_t lanes = kernels->transformLanes(points);
            EXPECT_LE(lanes * lanes, points) << kernels->name;
        }
    }
}

}  // namespace
}  // namespace tessaly::test
