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

/// A block spectrum's bins one by one: groups of `lanes` real and as many imaginary parts.
std::vector<ComplexBin> unpacked(const ComplexBin* spectrum, std::size_t bins, std::size_t lanes) {
    std::vector<ComplexBin> values(bins);
    const float* const floats = &spectrum->re;
    for (std::size_t k = 0; k < bins; ++k) {
        const std::size_t at = k / lanes * 2 * lanes + k % lanes;
        values[k] = {floats[at], floats[at + lanes]};
    }
    return values;
}

TEST_P(KernelTable, SumOfProductsEqualsPlainPassesOntoAnyBase) {
    for (const std::size_t lanes : {1u, 4u, 8u, 16u}) {
        if (GetParam()->transformLanes(static_cast<std::int32_t>(lanes * lanes * 4)) !=
            static_cast<std::int32_t>(lanes)) {
            continue;  // not a width of this table
        }
        for (const std::size_t count : {1u, 2u, 3u, 4u, 5u, 8u, 11u}) {
            for (const std::size_t rows : {1u, 2u, 3u, 7u, 16u}) {
                const std::size_t bins = rows * lanes;
                Noise noise(static_cast<std::uint32_t>(bins * 100 + count));
                const std::size_t offset = count % 3;  // unaligned as well
                std::vector<std::vector<ComplexBin>> storage;
                storage.reserve(3 * count);
                const auto pointers = [&] {
                    std::vector<const ComplexBin*> entries;
                    for (std::size_t i = 0; i < count; ++i) {
                        storage.push_back(noise.bins(bins + offset));
                        entries.push_back(storage.back().data() + offset);
                    }
                    return entries;
                };
                const std::vector<const ComplexBin*> input = pointers();
                const std::vector<const ComplexBin*> left = pointers();
                const std::vector<const ComplexBin*> right = pointers();
                const std::vector<ComplexBin> baseL = noise.bins(bins);
                const std::vector<ComplexBin> baseR = noise.bins(bins);
                enum class Base { none, apart, same };
                for (const Base base : {Base::none, Base::apart, Base::same}) {
                    std::vector<ComplexBin> sumL = baseL;
                    std::vector<ComplexBin> sumR = baseR;
                    sumL.push_back({99.0f, 99.0f});
                    sumR.push_back({99.0f, 99.0f});
                    const auto from = [base](const std::vector<ComplexBin>& apart,
                                             const std::vector<ComplexBin>& same) {
                        return base == Base::none    ? nullptr
                               : base == Base::apart ? apart.data()
                                                     : same.data();
                    };
                    GetParam()->sumOfProducts(static_cast<std::int32_t>(lanes), bins, count,
                                              input.data(), left.data(), right.data(),
                                              from(baseL, sumL), from(baseR, sumR), sumL.data(),
                                              sumR.data());
                    // Noise is below 1, so each part of a product is below 2.
                    const float bound =
                        4.0f * static_cast<float>((count + 1) * (count + 2)) * 0x1p-24f;
                    const auto compare = [&](const std::vector<const ComplexBin*>& response,
                                             const std::vector<ComplexBin>& start,
                                             const std::vector<ComplexBin>& sum) {
                        std::vector<ComplexBin> expected =
                            base == Base::none ? std::vector<ComplexBin>(bins)
                                               : unpacked(start.data(), bins, lanes);
                        std::vector<ComplexBin> scratch(bins);
                        for (std::size_t n = 0; n < count; ++n) {
                            plainMultiply(bins, unpacked(input[n], bins, lanes).data(),
                                          unpacked(response[n], bins, lanes).data(),
                                          scratch.data());
                            plainAdd(bins, scratch.data(), expected.data(), expected.data());
                        }
                        const std::vector<ComplexBin> got = unpacked(sum.data(), bins, lanes);
                        for (std::size_t i = 0; i < bins; ++i) {
                            ASSERT_NEAR(got[i].re, expected[i].re, bound) << count << ' ' << bins;
                            ASSERT_NEAR(got[i].im, expected[i].im, bound) << count << ' ' << bins;
                        }
                        EXPECT_EQ(sum.back().re, 99.0f);
                    };
                    compare(left, baseL, sumL);
                    compare(right, baseR, sumR);
                }
            }
        }
    }
}

TEST_P(KernelTable, SumOfNoProductsWritesNothing) {
    const std::vector<ComplexBin> before = Noise(3).bins(16);
    std::vector<ComplexBin> sum = before;
    GetParam()->sumOfProducts(1, 16, 0, nullptr, nullptr, nullptr, nullptr, nullptr, sum.data(),
                              sum.data());
    EXPECT_TRUE(sameBits(sum.data(), before.data(), sum.size()));
}

TEST_P(KernelTable, AddScaledEqualsThePlainLoopInAnyPlace) {
    for (const std::size_t count : lengths) {
        Noise noise(static_cast<std::uint32_t>(count));
        const std::vector<float> term = noise.samples(count);
        const std::vector<float> base = noise.samples(count);
        std::vector<float> apart(count + 1, 99.0f);
        std::vector<float> ontoBase = base;
        std::vector<float> ontoTerm = term;
        GetParam()->addScaled(count, 0.37f, term.data(), base.data(), apart.data());
        GetParam()->addScaled(count, 0.37f, term.data(), ontoBase.data(), ontoBase.data());
        GetParam()->addScaled(count, 0.37f, ontoTerm.data(), base.data(), ontoTerm.data());
        for (std::size_t i = 0; i < count; ++i) {
            ASSERT_NEAR(apart[i], base[i] + 0.37f * term[i], 1.2e-7f) << count;
            ASSERT_EQ(apart[i], ontoBase[i]) << count;
            ASSERT_EQ(apart[i], ontoTerm[i]) << count;
        }
        EXPECT_EQ(apart.back(), 99.0f);
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
        EXPECT_NE(kernels->backward, nullptr);
        EXPECT_NE(kernels->window, nullptr);
        EXPECT_NE(kernels->partition, nullptr);
        EXPECT_NE(kernels->block, nullptr);
        EXPECT_NE(kernels->sumOfProducts, nullptr);
        EXPECT_NE(kernels->multiply, nullptr);
        EXPECT_NE(kernels->add, nullptr);
        EXPECT_NE(kernels->addScaled, nullptr);
        EXPECT_NE(kernels->addTaps, nullptr);
        for (std::int32_t points = 2; points <= 32768; points *= 2) {
            const std::int32_t lanes = kernels->transformLanes(points);
            EXPECT_LE(lanes * lanes, points) << kernels->name;
        }
    }
}

}  // namespace
}  // namespace tessaly::test
