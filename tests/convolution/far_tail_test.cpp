// The far tail alone: its sizes, and its results against the convolution written out.
#include "convolution/far_tail.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "base/ess_error.h"
#include "convolution/kernel_fixture.h"

namespace tessaly::test {
namespace {

TEST(FarTailRatio, IsAPowerOfTwoThatBalancesNearAndFar) {
    EXPECT_EQ(FarTail::ratioFor(48, 0), 4);
    EXPECT_EQ(FarTail::ratioFor(127, 0), 4);
    EXPECT_EQ(FarTail::ratioFor(128, 0), 8);
    EXPECT_EQ(FarTail::ratioFor(511, 0), 8);
    EXPECT_EQ(FarTail::ratioFor(864, 0), 16);
    EXPECT_EQ(FarTail::ratioFor(32767, 0), 64);
}

TEST(FarTailRatio, KeepsTheEarlyPartNear) {
    EXPECT_EQ(FarTail::ratioFor(73, 8), 4);
    EXPECT_EQ(FarTail::ratioFor(73, 9), 8);
    EXPECT_EQ(FarTail::ratioFor(196, 18), 16);
    EXPECT_EQ(FarTail::ratioFor(48, 33), 32);
}

TEST(FarTail, RefusesSizesThatDoNotFit) {
    const Kernels& kernels = selectKernels();
    EXPECT_FALSE(FarTail().prepare(kernels, 16, 8, 4)) << "nothing is far";
    EXPECT_TRUE(FarTail().prepare(kernels, 16, 9, 4));
    EXPECT_FALSE(FarTail().prepare(kernels, 16, 40, 2));
    EXPECT_FALSE(FarTail().prepare(kernels, 16, 40, 6));
    EXPECT_FALSE(FarTail().prepare(kernels, 0, 40, 4));
    EXPECT_FALSE(FarTail().prepare(kernels, 16384, 40, 4)) << "longer than any transform";
}

TEST(FarTail, WithoutMemoryIsNoError) {
    essError = essErrorNone;
    for (int left = 0; left < 5; ++left) {
        spectralFaults.spectraLeft = left;
        EXPECT_FALSE(FarTail().prepare(selectKernels(), 16, 20, 4)) << left;
        EXPECT_EQ(essError, essErrorNone);
    }
    spectralFaults.spectraLeft = -1;
    spectralFaults.plansLeft = 0;
    EXPECT_FALSE(FarTail().prepare(selectKernels(), 16, 20, 4));
    EXPECT_EQ(essError, essErrorNone);
    spectralFaults.plansLeft = -1;
}

/// Blocks of a far tail, with the whole input kept beside it.
struct Stream {
    Stream(std::int32_t blockLength, std::size_t partitions, std::int32_t ratio)
        : B(static_cast<std::size_t>(blockLength)), near(2 * static_cast<std::size_t>(ratio) * B) {
        EXPECT_TRUE(far.prepare(selectKernels(), blockLength, partitions, ratio));
        left = noise.samples(partitions * B);
        right = noise.samples(partitions * B);
        input.resize(2 * B);
    }

    void run(bool silent, bool wanted = true) {
        const std::vector<float> block = silent ? std::vector<float>(B) : noise.samples(B);
        input.insert(input.end(), block.begin(), block.end());
        const float* const window = input.data() + input.size() - 2 * B;
        const bool zeros = std::all_of(window, window + 2 * B, [](float x) { return x == 0.0f; });
        far.advance(window, zeros, wanted, left.data(), right.data());
    }
    /// Largest difference to what the far samples of the response make of the input, with 2B.
    double worst(const std::vector<float>& response, const std::vector<float>& got) const {
        double largest = 0.0;
        for (std::size_t i = 0; i < B; ++i) {
            const std::size_t now = input.size() - B + i;
            double expected = 0.0;
            for (std::size_t t = near; t < response.size() && t <= now; ++t) {
                expected += static_cast<double>(response[t]) * static_cast<double>(input[now - t]);
            }
            expected *= 2.0 * static_cast<double>(B);
            largest = std::max(largest, std::abs(expected - static_cast<double>(got[i])));
        }
        return largest;
    }
    void expectExact() {
        std::vector<float> gotL(B);
        std::vector<float> gotR(B);
        far.addTo(gotL.data(), gotR.data(), 1.0f, static_cast<std::int32_t>(B));
        EXPECT_LT(worst(left, gotL), 1e-3);  // of some 500
        EXPECT_LT(worst(right, gotR), 1e-3);
    }

    Noise noise{21};
    std::size_t B;
    std::size_t near;  ///< samples
    std::vector<float> left;
    std::vector<float> right;
    std::vector<float> input;
    FarTail far;
};

TEST(FarTail, GivesTheFarSamplesConvolutionFromItsFirstRoundsOn) {
    for (const auto& [partitions, ratio] :
         {std::pair{std::size_t{9}, 4}, {std::size_t{21}, 4}, {std::size_t{40}, 8}}) {
        SCOPED_TRACE(partitions);
        Stream stream(16, partitions, ratio);
        int ready = 0;
        for (int n = 0; n < 160; ++n) {
            SCOPED_TRACE(n);
            stream.run(n > 60 && n < 130);
            if (stream.far.ready()) {
                ++ready;
                stream.expectExact();
            }
        }
        EXPECT_GT(ready, 120);
    }
}

TEST(FarTail, AddsTheFirstSamplesWithAGain) {
    Stream stream(16, 21, 4);
    for (int n = 0; n < 60; ++n) {
        stream.run(false);
    }
    ASSERT_TRUE(stream.far.ready());
    std::vector<float> whole(16);
    std::vector<float> other(16);
    stream.far.addTo(whole.data(), other.data(), 1.0f, 16);
    std::vector<float> part(16, 1.0f);
    stream.far.addTo(part.data(), other.data(), 0.5f, 5);
    for (std::size_t i = 0; i < part.size(); ++i) {
        EXPECT_FLOAT_EQ(part[i], i < 5 ? 1.0f + 0.5f * whole[i] : 1.0f);
    }
}

TEST(FarTail, StartsAnewWithAnotherResponse) {
    Stream stream(16, 21, 4);
    for (int n = 0; n < 60; ++n) {
        stream.run(false);
    }
    ASSERT_TRUE(stream.far.ready());
    stream.left = stream.noise.samples(stream.left.size());
    stream.far.responseChanged();
    int missed = 0;
    for (int n = 0; n < 40; ++n) {
        stream.run(false);
        missed += stream.far.ready() ? 0 : 1;
        if (stream.far.ready()) {
            stream.expectExact();
        }
    }
    EXPECT_GT(missed, 4);
    EXPECT_LT(missed, 20);
}

TEST(FarTail, TrustsNoInputWithAGap) {
    Stream stream(16, 21, 4);
    for (int n = 0; n < 60; ++n) {
        stream.run(false);
    }
    ASSERT_TRUE(stream.far.ready());
    stream.input[stream.input.size() - 1] += 1.0f;  // not what was taken
    stream.run(false);
    EXPECT_FALSE(stream.far.ready());
    int missed = 0;
    for (; !stream.far.ready() && missed < 100; ++missed) {
        stream.run(false);
    }
    EXPECT_GE(missed, 21) << "until the gap has left the response";
    EXPECT_LT(missed, 100);
    stream.expectExact();
}

TEST(FarTail, MakesNothingThatIsNotWanted) {
    Stream stream(16, 21, 4);
    for (int n = 0; n < 60; ++n) {
        stream.run(false, false);
        EXPECT_FALSE(stream.far.ready());
    }
    for (int n = 0; n < 12; ++n) {
        stream.run(false, true);
    }
    ASSERT_TRUE(stream.far.ready());
    stream.expectExact();
}

}  // namespace
}  // namespace tessaly::test
