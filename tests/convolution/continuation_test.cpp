// What results go on to be, against the convolution written out.
#include "convolution/continuation.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "convolution/kernel_fixture.h"
#include "convolution/partition_sums.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

constexpr std::size_t told = Continuation::samples;

/// A response of N partitions of B samples in both ears, its last result, and all of the input.
class Stream {
public:
    Stream(const Kernels& kernels, std::size_t blockLength, std::size_t partitions)
        : B(blockLength), N(partitions), input((N + 1) * B) {
        EXPECT_EQ(createFFT(transform_, static_cast<std::int32_t>(2 * B)), transformOk);
        sums_.prepare(kernels, static_cast<std::int32_t>(B), N, false);
        continuation.prepare(kernels, static_cast<std::int32_t>(B), N);
        EXPECT_TRUE(continuation.prepared());
        for (auto& ear : response) {
            ear = noise.samples(N * B);
        }
    }
    void take() {
        for (std::size_t k = 0; k < N; ++k) {
            continuation.takeTaps(k, response[0].data() + k * B, response[1].data() + k * B);
        }
    }
    /// The next block's window.
    void feed(const std::vector<float>& block, bool follows = true) {
        input.insert(input.end(), block.begin(), block.end());
        continuation.takeWindow(input.data() + input.size() - 2 * B, follows);
    }
    void feed() { feed(noise.samples(B)); }
    /// The block's result with the response as it stands, so that it may go on.
    void render() {
        std::vector<std::vector<ComplexBin>> spectra;
        const auto keep = [&] {
            spectra.emplace_back(B + 1);
            return spectra.back().data();
        };
        std::array<std::vector<ComplexBin>, 2> sum{std::vector<ComplexBin>(B + 1),
                                                   std::vector<ComplexBin>(B + 1)};
        const EarSpectra ears{sum[0].data(), sum[1].data()};
        const auto add = [&](std::size_t begin, std::size_t end) {
            sums_.begin();
            for (std::size_t k = begin; k < end; ++k) {
                ComplexBin* const x = keep();
                windowFFT(input.data() + input.size() - (k + 2) * B, x, transform_);
                ComplexBin* const left = keep();
                partitionFFT(response[0].data() + k * B, left, transform_);
                ComplexBin* const right = keep();
                partitionFFT(response[1].data() + k * B, right, transform_);
                sums_.add(x, left, right);
            }
        };
        add(0, scaledBegin);
        sums_.addTo(ears);
        add(scaledBegin, N);
        sums_.addTo(ears, gain);
        for (std::size_t ear = 0; ear < 2; ++ear) {
            std::vector<float> output(B);
            blockIFFT(sum[ear].data(), output.data(), static_cast<std::int32_t>(B), transform_,
                      continuation.wrapped(ear));
        }
        continuation.keep(N);
    }
    /// The newest block's first samples are what the response gives.
    void expectExact(std::int32_t count = told) {
        std::array<std::vector<float>, 2> got{std::vector<float>(told + 1, 0.5f),
                                              std::vector<float>(told + 1, 0.5f)};
        continuation.addTo(got[0].data(), got[1].data(), scaledBegin, gain, count);
        const double scale = 2.0 * static_cast<double>(B);
        const auto wanted = static_cast<std::size_t>(std::max(count, 0));
        for (std::size_t ear = 0; ear < 2; ++ear) {
            for (std::size_t n = 0; n < told + 1; ++n) {
                double expected = 0.5;
                const std::size_t at = input.size() - B + n;
                for (std::size_t j = 0; n < wanted && j < N * B; ++j) {
                    const double weight = j / B >= scaledBegin ? static_cast<double>(gain) : 1.0;
                    expected += scale * weight * static_cast<double>(response[ear][j]) *
                                static_cast<double>(input[at - j]);
                }
                ASSERT_NEAR(static_cast<double>(got[ear][n]), expected,
                            scale * 1e-6 * std::sqrt(static_cast<double>(N * B)))
                    << "ear " << ear << ", sample " << n;
            }
        }
    }

    Noise noise{31};
    std::size_t B;
    std::size_t N;
    std::vector<float> input;
    std::array<std::vector<float>, 2> response;
    std::size_t scaledBegin = 0;
    float gain = 1.0f;
    Continuation continuation;

private:
    TransformHandle transform_;
    PartitionSums sums_;
};

class ContinuedResults : public testing::TestWithParam<const Kernels*> {
protected:
    ContinuedResults() : forced_(GetParam()) {}

private:
    ForcedKernels forced_;
};

TEST_P(ContinuedResults, AreTheNextBlocksFirstSamples) {
    for (const auto& [B, N] :
         {std::pair<std::size_t, std::size_t>{64, 1}, {64, 5}, {128, 1}, {256, 3}, {1024, 2}}) {
        SCOPED_TRACE(testing::Message() << B << ' ' << N);
        Stream stream(*GetParam(), B, N);
        stream.take();
        for (std::size_t n = 0; n < N + 5; ++n) {
            SCOPED_TRACE(n);
            stream.feed();
            if (n > N + 1) {
                ASSERT_TRUE(stream.continuation.goesOn());
                stream.expectExact();
            }
            stream.render();
        }
    }
}

TEST_P(ContinuedResults, FollowEachChangeOfTheResponseAndOfItsEndsGain) {
    Stream stream(*GetParam(), 128, 4);
    stream.take();
    for (int n = 0; n < 40; ++n) {
        SCOPED_TRACE(n);
        stream.feed(n > 20 && n < 26 ? std::vector<float>(128) : stream.noise.samples(128));
        if (stream.continuation.goesOn()) {
            stream.expectExact();
        }
        const std::size_t k = static_cast<std::size_t>(n) % 4;
        for (auto& ear : stream.response) {
            // Partitions that begin with zeros, or are nothing else, too.
            const std::vector<float> taps = stream.noise.samples(128);
            std::copy(taps.begin(), taps.end(), ear.begin() + static_cast<std::ptrdiff_t>(128 * k));
            std::fill_n(ear.begin() + static_cast<std::ptrdiff_t>(128 * k), n % 3 * 64, 0.0f);
        }
        stream.take();
        stream.scaledBegin = static_cast<std::size_t>(n) / 2 % 5;
        stream.gain = n % 7 == 0 ? 0.0f : stream.noise();
        stream.render();
    }
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         ContinuedResults,
                         testing::ValuesIn(testableKernels()),
                         kernelTestName);

TEST(Continuation, TellsFewerSamplesToo) {
    Stream stream(selectKernels(), 128, 2);
    stream.take();
    for (int n = 0; n < 4; ++n) {
        stream.feed();
        stream.render();
    }
    stream.feed();
    stream.expectExact(5);
    stream.expectExact(0);
    stream.expectExact(-3);
}

TEST(Continuation, GoesOnOnlyWhenAllWindowsThatCountFollowedEachOther) {
    constexpr std::size_t N = 3;
    Stream stream(selectKernels(), 64, N);
    stream.take();
    const auto run = [&](bool follows = true) {
        stream.feed(stream.noise.samples(64), follows);
        const bool goesOn = stream.continuation.goesOn();
        stream.render();
        return goesOn;
    };
    const auto expectAWhileWithout = [&] {
        for (std::size_t n = 0; n < N; ++n) {
            EXPECT_FALSE(run()) << n;
        }
        EXPECT_TRUE(run());
    };
    expectAWhileWithout();
    stream.continuation.forget();
    expectAWhileWithout();
    EXPECT_FALSE(run(false));
    for (std::size_t n = 1; n < N; ++n) {
        EXPECT_FALSE(run()) << n;
    }
    EXPECT_TRUE(run());
    stream.continuation.drop();
    stream.feed();
    EXPECT_FALSE(stream.continuation.goesOn()) << "there is no last result";
    stream.render();
    EXPECT_TRUE(run()) << "the windows still follow";
}

TEST(Continuation, TakesSilenceAsAWindowOfZeros) {
    constexpr std::size_t N = 3;
    Stream stream(selectKernels(), 64, N);
    stream.take();
    for (std::size_t n = 0; n < N + 1; ++n) {
        stream.feed();
    }
    const std::vector<float> zeros(64);
    stream.feed(zeros);
    stream.feed(zeros);
    for (int n = 0; n < 2; ++n) {
        stream.input.insert(stream.input.end(), 64, 0.0f);
        stream.continuation.takeSilence(true);
    }
    for (std::size_t n = 0; n < N; ++n) {
        stream.render();
        stream.feed();
        ASSERT_TRUE(stream.continuation.goesOn());
        stream.expectExact();
    }
    stream.continuation.takeSilence(false);
    stream.render();
    EXPECT_FALSE(stream.continuation.goesOn());
}

TEST(Continuation, KeepsNoResultThatHoldsNoNumbersOrHasMorePartitions) {
    Stream stream(selectKernels(), 64, 2);
    stream.take();
    for (int n = 0; n < 4; ++n) {
        stream.feed();
        stream.render();
    }
    EXPECT_EQ(stream.continuation.kept(), 2u);
    stream.continuation.keep(3);
    EXPECT_EQ(stream.continuation.kept(), 0u);
    for (const float odd :
         {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
          -std::numeric_limits<float>::infinity()}) {
        for (const std::size_t ear : {0u, 1u}) {
            stream.render();
            EXPECT_EQ(stream.continuation.kept(), 2u);
            stream.continuation.wrapped(ear).output[told - 1] = odd;
            stream.continuation.keep(2);
            EXPECT_EQ(stream.continuation.kept(), 0u) << odd;
        }
    }
}

TEST(Continuation, LooksAtNoPartitionBehindThosePrepared) {
    Stream stream(selectKernels(), 64, 1);
    stream.take();
    const std::vector<float> other = stream.noise.samples(64);
    stream.continuation.takeTaps(1, other.data(), other.data());
    for (int n = 0; n < 3; ++n) {
        stream.feed();
        stream.render();
    }
    stream.feed();
    stream.expectExact();
}

TEST(Continuation, IsNotPreparedWithoutATransform) {
    spectralFaults.plansLeft = 0;
    Continuation continuation;
    continuation.prepare(selectKernels(), 64, 1);
    spectralFaults = {};
    EXPECT_FALSE(continuation.prepared());
    const std::vector<float> taps(64, 1.0f);
    continuation.takeTaps(0, taps.data(), taps.data());
    EXPECT_FALSE(continuation.goesOn());
}

}  // namespace
}  // namespace tessaly::test
