// The convolver block by block: construction, ring, filter changes, failures, destruction.
#include "convolution/conv_class.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>

#include "base/ess_error.h"
#include "convolution/convolver_rig.h"
#include "convolution/kernel_fixture.h"
#include "minihost/no_allocation_scope.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

using testing::Each;
using testing::IsEmpty;
using testing::Not;

class ConvClass : public testing::Test {
protected:
    ConvClass() { reset(); }
    ~ConvClass() override { reset(); }

    static void reset() {
        resetConvolutionState();
        essError = essErrorNone;
        spectralFaults = SpectralFaults{};
    }
    /// The largest difference from a sample on over the largest magnitude of all.
    static double relativeError(const std::vector<double>& expected,
                                const std::vector<float>& found,
                                std::size_t first = 0) {
        double difference = 0.0;
        double peak = 1e-30;
        for (std::size_t i = 0; i < expected.size(); ++i) {
            if (i >= first) {
                difference =
                    std::max(difference, std::abs(expected[i] - static_cast<double>(found[i])));
            }
            peak = std::max(peak, std::abs(expected[i]));
        }
        return difference / peak;
    }

    /// Of what is heard, the second half.
    static double blockError(const std::vector<double>& expected, const std::vector<float>& found) {
        return relativeError(expected, found, expected.size() / 2);
    }
    static std::vector<float> blockOf(const std::vector<float>& window) {
        return {window.begin() + static_cast<std::ptrdiff_t>(window.size() / 2), window.end()};
    }

    static constexpr double tolerance = 3e-6;  // some roundings of single precision
};

TEST_F(ConvClass, ConstructionSetsSizesAndStarts) {
    ConvolverRig rig(64, 5);
    rig.hpTFselect = 3;
    rig.makeBoth();
    const convClass& first = *rig.first;
    EXPECT_EQ(first.convNumber, 0);
    EXPECT_EQ(rig.second->convNumber, 1);
    EXPECT_EQ(convInstanceCount, 2);
    EXPECT_EQ(first.instanceName, "firstOLSfeeded-Instanz");
    EXPECT_EQ(first.blockLength, 64);
    EXPECT_EQ(first.fftLength, 128);
    EXPECT_EQ(first.binCount, 65);
    EXPECT_EQ(first.fftOrder, 7);
    EXPECT_EQ(first.firLength, 320);
    EXPECT_EQ(first.firLengthHalf, 160);
    EXPECT_EQ(first.firBufferSize, 384);
    EXPECT_EQ(first.FDLtoBUFConv, 5);
    EXPECT_EQ(first.partitionsAtCreation, 5);
    EXPECT_EQ(first.FDLpos, 4) << "the engine's first step lands on 0";
    EXPECT_EQ(first.hpTFselectSeen, 3);
    EXPECT_EQ(first.hpTFloaded, 0);
    EXPECT_NE(first.fftHandle, nullptr);
    EXPECT_NE(first.ifftHandle, nullptr);
    EXPECT_EQ(first.fftHandleFull, nullptr);
    EXPECT_EQ(first.ifftHandleFull, nullptr);
    EXPECT_EQ(first.dftiStatus, 0);
    EXPECT_EQ(&first.input, &rig.input);
    EXPECT_EQ(&first.secondOLSactive, &rig.secondOLSactive);
    EXPECT_EQ(&first.hpTFselect, &rig.hpTFselect);
    EXPECT_EQ(&first.blockCounterRef, &rig.blockCounter);
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(ConvClass, CountOfInstancesNeverFalls) {
    for (int round = 0; round < 3; ++round) {
        ConvolverRig rig(16, 1);
        rig.makeFirst();
        EXPECT_EQ(rig.first->convNumber, round);
    }
    EXPECT_EQ(convInstanceCount, 3);
}

TEST_F(ConvClass, SpectraAreAlignedZeroedAndNoPageApart) {
    for (const std::int32_t blockLength : {2, 4, 16, 256, 512, 1024, 2048}) {
        ConvolverRig rig(blockLength, 3);
        rig.makeFirst();
        for (const auto* spectra :
             {&rig.first->FDL, &rig.first->filterPartsL, &rig.first->filterPartsR}) {
            for (std::size_t i = 0; i < spectra->size(); ++i) {
                const ComplexBin* const spectrum = (*spectra)[i];
                EXPECT_EQ(std::bit_cast<std::uintptr_t>(spectrum) % 64, 0u);
                for (std::int32_t k = 0; k < rig.first->binCount; ++k) {
                    ASSERT_EQ(spectrum[k].re, 0.0f);
                    ASSERT_EQ(spectrum[k].im, 0.0f);
                }
                if (i > 0) {
                    EXPECT_NE((spectrum - (*spectra)[i - 1]) * 8 % 4096, 0);
                }
            }
        }
        EXPECT_EQ(rig.first->FDLown, rig.first->FDL);
    }
}

TEST_F(ConvClass, SecondInstanceOwnsARingAndBorrowsTheRest) {
    ConvolverRig rig(16, 2);
    rig.makeFirst();
    const std::unique_ptr<convClass> second = rig.make(1);
    EXPECT_THAT(second->filterPartsL, Each(nullptr));
    EXPECT_THAT(second->filterPartsR, Each(nullptr));
    EXPECT_NE(second->FDL[0], nullptr);
    EXPECT_NE(second->FDL[0], rig.first->FDL[0]);
}

TEST_F(ConvClass, FirstBlockBuildsTheFilterBeforeItIsUsed) {
    ConvolverRig rig(32, 3);
    rig.makeBoth();
    Noise noise(1);
    rig.filterLeft = noise.samples(rig.filterLeft.size());
    rig.filterLeftPointer = rig.filterLeft.data();
    rig.feed(noise.samples(32));
    rig.forceUpdateAll = true;  // this flag alone is enough
    rig.run(false);
    EXPECT_EQ(rig.first->FDLpos, 0);
    RingModel model(32, 3);
    model.setResponse(rig.filterLeft);
    model.ring[0].assign(rig.window.begin(), rig.window.end());
    EXPECT_LT(blockError(model.output(model.ring, 0), rig.firstLeft), tolerance);
    EXPECT_THAT(rig.firstRight, Each(0.0f)) << "its response is zero";
    EXPECT_THAT(rig.secondLeft, Each(0.0f)) << "the first block never crossfades";
}

TEST_F(ConvClass, ProcessReturnsTheLeftOutput) {
    ConvolverRig rig(8, 1);
    rig.makeFirst();
    EXPECT_EQ(rig.first->process(), rig.firstLeft.data());
}

TEST_F(ConvClass, FilterStaysUntilAFlagAsksForIt) {
    ConvolverRig rig(16, 2);
    rig.makeFirst();
    Noise noise(2);
    rig.feed(noise.samples(16));
    std::ranges::fill(rig.filterLeft, 0.25f);
    rig.run(false);
    EXPECT_THAT(rig.firstLeft, Each(0.0f));
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Not(Each(0.0f)));
}

// ---- Plain blocks: a linear convolution ----

struct Shape {
    std::int32_t blockLength;
    std::int16_t partitions;
};
void PrintTo(const Shape& shape, std::ostream* out) {
    *out << shape.blockLength << " x " << shape.partitions;
}

class ConvClassShapes : public ConvClass, public testing::WithParamInterface<Shape> {};

TEST_P(ConvClassShapes, StillFilterConvolvesTheStream) {
    const Shape shape = GetParam();
    ConvolverRig rig(shape.blockLength, shape.partitions);
    rig.makeFirst();
    Noise noise(3);
    const auto block = static_cast<std::size_t>(shape.blockLength);
    const std::size_t length = block * static_cast<std::size_t>(shape.partitions);
    rig.filterLeft = noise.samples(rig.filterLeft.size());
    rig.filterRight = noise.samples(rig.filterRight.size());
    rig.filterLeftPointer = rig.filterLeft.data();
    rig.filterRightPointer = rig.filterRight.data();
    std::vector<float> stream;
    for (int n = 0; n < shape.partitions + 3; ++n) {
        const std::vector<float> samples = noise.samples(block);
        stream.insert(stream.end(), samples.begin(), samples.end());
        rig.feed(samples);
        rig.run(n == 0);
        const std::size_t start = stream.size() - block;
        const double scale = 2.0 * static_cast<double>(block);
        for (std::size_t i = 0; i < block; ++i) {
            double left = 0.0;
            double right = 0.0;
            for (std::size_t t = 0; t < length && t <= start + i; ++t) {
                const double sample = static_cast<double>(stream[start + i - t]);
                left += static_cast<double>(rig.filterLeft[t]) * sample;
                right += static_cast<double>(rig.filterRight[t]) * sample;
            }
            const double bound = 1e-5 * std::sqrt(static_cast<double>(length));
            ASSERT_NEAR(static_cast<double>(rig.firstLeft[block + i]) / scale, left, bound) << n;
            ASSERT_NEAR(static_cast<double>(rig.firstRight[block + i]) / scale, right, bound) << n;
        }
    }
}

// ---- Crossfade blocks: two rings ----

TEST_P(ConvClassShapes, CrossfadeAndPlainBlocksFollowTheModelOfTwoRings) {
    const Shape shape = GetParam();
    const auto block = static_cast<std::size_t>(shape.blockLength);
    const auto count = static_cast<std::size_t>(shape.partitions);
    for (const std::uint32_t pattern : {0b1010'1010'1010'1011u, 0b1111'0011'0101'1001u,
                                        0b1111'1111'1111'1111u, 0b0001'0000'1000'0101u}) {
        reset();
        ConvolverRig rig(shape.blockLength, shape.partitions);
        rig.makeBoth();
        // The models share nothing with the convolver: windows in time, sums in double.
        RingModel left(block, count);
        RingModel right(block, count);
        std::vector<RingModel::Window> secondRing = left.ring;
        Noise noise(pattern);
        std::size_t newest = count - 1;
        for (int n = 0; n < 3 * shape.partitions + 13; ++n) {
            SCOPED_TRACE(n);
            const bool update = ((pattern >> (n % 16)) & 1u) != 0;
            rig.feed(noise.samples(block));
            if (update) {
                const std::vector<float> newLeft = noise.samples(rig.filterLeft.size());
                const std::vector<float> newRight = noise.samples(rig.filterRight.size());
                std::ranges::copy(newLeft, rig.filterLeft.begin());
                std::ranges::copy(newRight, rig.filterRight.begin());
            }
            const bool crossfade = update && rig.blockCounter != 0;
            rig.run(update);

            newest = (newest + 1) % count;
            const RingModel::Window window(rig.window.begin(), rig.window.end());
            if (crossfade) {
                // The old filter over the second ring, then the new one over that same ring; the
                // first ring's slot keeps what it had.
                secondRing[newest] = window;
                EXPECT_LT(blockError(left.output(secondRing, newest), rig.secondLeft), tolerance);
                EXPECT_LT(blockError(right.output(secondRing, newest), rig.secondRight), tolerance);
                left.setResponse(rig.filterLeft);
                right.setResponse(rig.filterRight);
                EXPECT_LT(blockError(left.output(secondRing, newest), rig.firstLeft), tolerance);
                EXPECT_LT(blockError(right.output(secondRing, newest), rig.firstRight), tolerance);
            } else {
                left.ring[newest] = window;
                if (update) {
                    left.setResponse(rig.filterLeft);
                    right.setResponse(rig.filterRight);
                }
                EXPECT_LT(blockError(left.output(left.ring, newest), rig.firstLeft), tolerance);
                EXPECT_LT(blockError(right.output(left.ring, newest), rig.firstRight), tolerance);
            }
            ASSERT_EQ(rig.first->FDL, rig.first->FDLown);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Shapes,
                         ConvClassShapes,
                         testing::Values(Shape{32, 1},
                                         Shape{32, 2},
                                         Shape{32, 3},
                                         Shape{32, 8},
                                         Shape{2, 1},
                                         Shape{2, 5},
                                         Shape{4, 3},
                                         Shape{8, 2},
                                         Shape{64, 3},
                                         Shape{128, 2}));

TEST_F(ConvClass, FilterChangeOfOnePartitionIsExact) {
    // Both instances give the stream's linear convolution with the old and with the new response.
    ConvolverRig rig(32, 1);
    rig.makeBoth();
    Noise noise(4);
    std::vector<float> oldFilter = noise.samples(32);
    std::ranges::copy(oldFilter, rig.filterLeft.begin());
    rig.feed(noise.samples(32));
    rig.run(true);
    for (int n = 0; n < 6; ++n) {
        rig.feed(noise.samples(32));
        const std::vector<float> newFilter = noise.samples(32);
        std::ranges::copy(newFilter, rig.filterLeft.begin());
        rig.run(true);
        for (std::size_t i = 32; i < 64; ++i) {
            double before = 0.0;
            double after = 0.0;
            for (std::size_t t = 0; t < 32; ++t) {
                before +=
                    static_cast<double>(oldFilter[t]) * static_cast<double>(rig.window[i - t]);
                after += static_cast<double>(newFilter[t]) * static_cast<double>(rig.window[i - t]);
            }
            EXPECT_NEAR(static_cast<double>(rig.secondLeft[i]) / 64.0, before, 1e-5);
            EXPECT_NEAR(static_cast<double>(rig.firstLeft[i]) / 64.0, after, 1e-5);
        }
        oldFilter = newFilter;
    }
}

TEST_F(ConvClass, RingOfOneStaysAtZero) {
    ConvolverRig rig(16, 1);
    rig.makeBoth();
    for (int n = 0; n < 4; ++n) {
        rig.run(n % 2 == 1);
        EXPECT_EQ(rig.first->FDLpos, 0);
        EXPECT_EQ(rig.second->FDLpos, 0);
    }
}

TEST_F(ConvClass, CrossfadeBlockLeavesTheFirstRingAsItWas) {
    ConvolverRig rig(16, 3);
    rig.makeBoth();
    Noise noise(5);
    for (int n = 0; n < 3; ++n) {
        rig.feed(noise.samples(16));
        rig.run(n == 0);
    }
    std::vector<std::vector<ComplexBin>> before;
    for (const ComplexBin* spectrum : rig.first->FDLown) {
        before.emplace_back(spectrum, spectrum + 17);
    }
    rig.feed(noise.samples(16));
    rig.run(true);
    for (std::size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(std::memcmp(rig.first->FDL[i], before[i].data(), 17 * sizeof(ComplexBin)), 0);
    }
    // Of the second ring only the slot of this block holds anything.
    EXPECT_EQ(rig.second->FDLpos, 0);
    EXPECT_NE(rig.second->FDL[0][3].re, 0.0f);
    EXPECT_EQ(rig.second->FDL[1][3].re, 0.0f);
    EXPECT_EQ(rig.second->FDL[2][3].re, 0.0f);
}

TEST_F(ConvClass, FirstInstanceTransformsNoInputInACrossfadeBlock) {
    ConvolverRig rig(16, 2);
    rig.makeBoth();
    rig.feed(Noise(15).samples(16));
    rig.secondOLSactive = true;
    rig.first->FDLpos = 0;
    rig.first->FDL[0][5] = {3.0f, 4.0f};  // stands for what the second instance left there
    rig.first->process();
    EXPECT_EQ(rig.first->FDL[0][5].re, 3.0f);
    EXPECT_EQ(rig.first->FDL[0][5].im, 4.0f);
    rig.second->FDLpos = 0;
    rig.second->process();
    EXPECT_NE(rig.second->FDL[0][5].re, 0.0f) << "the second one does";
}

TEST_F(ConvClass, UnchangedPartitionsKeepTheirSpectraAndChangedOnesDoNot) {
    ConvolverRig rig(16, 3);
    rig.makeFirst();
    Noise noise(6);
    std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
    rig.run(true);
    std::vector<std::vector<ComplexBin>> before;
    for (const ComplexBin* spectrum : rig.first->filterPartsL) {
        before.emplace_back(spectrum, spectrum + 17);
    }
    rig.filterLeft[20] += 1.0f;
    rig.run(true);
    for (std::size_t i = 0; i < 3; ++i) {
        const bool same =
            std::memcmp(rig.first->filterPartsL[i], before[i].data(), 17 * sizeof(ComplexBin)) == 0;
        EXPECT_EQ(same, i != 1) << i;
    }
    rig.filterLeft[20] -= 1.0f;
    rig.filterLeft[21] = -0.0f;  // equal to 0 but another sample
    rig.run(true);
    EXPECT_TRUE(std::signbit(rig.first->timePartsL[1][5]));
}

TEST_F(ConvClass, TimePartsHoldTheSamplesOfTheirPartition) {
    ConvolverRig rig(8, 3);
    rig.makeFirst();
    std::ranges::copy(Noise(7).samples(rig.filterLeft.size()), rig.filterLeft.begin());
    rig.run(true);
    for (std::size_t p = 0; p < 3; ++p) {
        for (std::size_t i = 0; i < 8; ++i) {
            EXPECT_EQ(rig.first->timePartsL[p][i], rig.filterLeft[8 * p + i]);
            EXPECT_EQ(rig.first->timePartsR[p][i], rig.filterRight[8 * p + i]);
        }
    }
}

TEST_F(ConvClass, SilenceAfterASharedBlockIsSilentInThePlainOrderToo) {
    ConvolverRig rig(16, 1);
    rig.makeBoth();
    Noise noise(31);
    std::ranges::copy(noise.samples(16), rig.filterLeft.begin());
    const std::vector<float> silence(16);
    const auto play = [&rig](const std::vector<float>& block, bool shared) {
        rig.heardOfOld = shared ? 16 : -1;
        rig.feed(block);
        rig.run(true);
    };
    play(noise.samples(16), true);
    for (int n = 0; n < 4; ++n) {
        play(silence, false);  // the second instance knows its results to be zeros
    }
    play(noise.samples(16), true);
    ASSERT_NE(rig.secondLeft[20], 0.0f);
    play(silence, true);
    play(silence, false);
    play(silence, false);
    EXPECT_THAT(std::vector<float>(rig.secondLeft.begin() + 16, rig.secondLeft.end()), Each(0.0f));
    EXPECT_THAT(std::vector<float>(rig.firstLeft.begin() + 16, rig.firstLeft.end()), Each(0.0f));
}

TEST_F(ConvClass, SecondInstanceNeverWritesTheFilter) {
    ConvolverRig rig(16, 2);
    rig.makeBoth();
    std::ranges::fill(rig.filterLeft, 1.0f);
    rig.filterChangeAll = true;
    rig.forceUpdateAll = true;
    rig.second->process();
    EXPECT_EQ(rig.first->filterPartsL[0][0].re, 0.0f);
    EXPECT_EQ(rig.first->filterPartsL[1][0].re, 0.0f);
}

TEST_F(ConvClass, ClearFDLSilencesThePast) {
    ConvolverRig rig(16, 4);
    rig.makeFirst();
    Noise noise(8);
    std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
    for (int n = 0; n < 4; ++n) {
        rig.feed(noise.samples(16));
        rig.run(n == 0);
    }
    rig.first->clearFDL();
    for (const ComplexBin* spectrum : rig.first->FDL) {
        for (int k = 0; k < 17; ++k) {
            ASSERT_EQ(spectrum[k].re, 0.0f);
            ASSERT_EQ(spectrum[k].im, 0.0f);
        }
    }
    std::ranges::fill(rig.window, 0.0f);
    rig.run(false);
    EXPECT_THAT(rig.firstLeft, Each(0.0f));
}

TEST_F(ConvClass, NotANumberLeavesWithTheRing) {
    ConvolverRig rig(16, 3);
    rig.makeFirst();
    Noise noise(9);
    std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
    rig.feed(noise.samples(16));
    rig.window[20] = std::nanf("");
    rig.run(true);
    EXPECT_TRUE(std::isnan(rig.firstLeft[16]));
    for (int n = 0; n < 4; ++n) {
        rig.feed(noise.samples(16));
        rig.run(false);
    }
    EXPECT_FALSE(std::isnan(rig.firstLeft[16]));
}

TEST_F(ConvClass, RingIndexOutsideOfTheRingIsTakenModulo) {
    Noise noise(10);
    const std::vector<float> filter = noise.samples(64);
    const std::vector<float> samples = noise.samples(16);
    const auto outputAt = [&](std::int16_t position) {
        reset();
        ConvolverRig rig(16, 3);
        rig.makeFirst();
        std::ranges::copy(filter, rig.filterLeft.begin());
        rig.feed(samples);
        rig.first->FDLpos = position;
        rig.filterChangeAll = true;
        rig.first->process();
        return rig.firstLeft;
    };
    const std::vector<float> expected = outputAt(1);
    for (const int position : {4, -2, 32767 - 32766 % 3 - 0, -32768 + 0}) {
        const int slot = ((position % 3) + 3) % 3;
        EXPECT_EQ(outputAt(static_cast<std::int16_t>(position)),
                  outputAt(static_cast<std::int16_t>(slot)))
            << position;
    }
    EXPECT_EQ(outputAt(4), expected);
}

TEST_F(ConvClass, PartitionCountBelowOneCountsAsOne) {
    for (const std::int16_t partitions :
         {std::int16_t{0}, std::int16_t{-1}, std::int16_t{-32768}}) {
        ConvolverRig rig(16, 1);
        rig.partitions = partitions;
        rig.makeFirst();
        EXPECT_EQ(rig.first->FDLtoBUFConv, 1);
        EXPECT_EQ(rig.first->FDLpos, 0);
        EXPECT_EQ(rig.first->FDL.size(), 1u);
        rig.filterChangeAll = true;
        rig.first->process();
    }
}

TEST_F(ConvClass, ResponseShorterThanThePartitionsEndsInZeros) {
    // Three partitions, but buffers of two blocks: nothing behind them is read.
    ConvolverRig rig(16, 3);
    rig.filterLeft.assign(32, 1.0f);
    rig.filterLeft.shrink_to_fit();
    rig.filterRight = rig.filterLeft;
    rig.filterRight.shrink_to_fit();
    rig.filterLeftPointer = rig.filterLeft.data();
    rig.filterRightPointer = rig.filterRight.data();
    rig.makeFirst();
    EXPECT_EQ(rig.first->firBufferSize, 32);
    rig.run(true);
    EXPECT_NE(rig.first->filterPartsL[1][0].re, 0.0f);
    EXPECT_EQ(rig.first->filterPartsL[2][0].re, 0.0f);
}

// ---- Direct feed ----

TEST_F(ConvClass, DirectFeedTransformsTwoBlocksOfTheResponseCircularly) {
    for (const std::int16_t partitions : {std::int16_t{1}, std::int16_t{3}}) {
        ConvolverRig rig(16, partitions);
        rig.directFilterFeed = 1;
        rig.makeBoth();
        Noise noise(11);
        std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
        std::ranges::copy(noise.samples(rig.filterRight.size()), rig.filterRight.begin());
        rig.feed(noise.samples(16));
        rig.run(true);
        EXPECT_EQ(rig.first->timePartsL[0], rig.filterLeft.data());
        EXPECT_EQ(rig.first->timePartsR[0], rig.filterRight.data());
        const std::vector<double> window(rig.window.begin(), rig.window.end());
        const auto expected = [&window](const std::vector<float>& fir) {
            std::vector<double> result =
                circularProduct(window, std::vector<double>(fir.begin(), fir.begin() + 32));
            for (double& value : result) {
                value *= 32.0;
            }
            return result;
        };
        EXPECT_LT(relativeError(expected(rig.filterLeft), rig.firstLeft), tolerance);
        EXPECT_LT(relativeError(expected(rig.filterRight), rig.firstRight), tolerance);
        for (std::size_t p = 1; p < static_cast<std::size_t>(partitions); ++p) {
            EXPECT_THAT(std::vector<float>(rig.first->timePartsL[p], rig.first->timePartsL[p] + 16),
                        Each(0.0f));
            for (std::size_t k = 0; k < 17; ++k) {
                ASSERT_EQ(rig.first->filterPartsL[p][k].re, 0.0f);
                ASSERT_EQ(rig.first->filterPartsR[p][k].im, 0.0f);
            }
        }
        // In an update the buffer counts as it stands then, also where only its second block
        // differs.
        rig.filterLeft[31] += 0.5f;
        rig.run(true);
        EXPECT_LT(relativeError(expected(rig.filterLeft), rig.firstLeft), tolerance);
    }
}

TEST_F(ConvClass, DirectFeedLeavesTheEnginesBuffersToTheEngine) {
    auto rig = std::make_unique<ConvolverRig>(16, std::int16_t{2});
    rig->directFilterFeed = 1;
    rig->makeBoth();
    rig->run(true);
    rig->first.reset();
    rig->second.reset();
    std::ranges::fill(rig->filterLeft, 1.0f);  // still there
    EXPECT_EQ(rig->filterLeft.back(), 1.0f);
}

TEST_F(ConvClass, DirectFeedOfAShortBufferReadsNothing) {
    ConvolverRig rig(16, 1);
    rig.directFilterFeed = 1;
    rig.filterLeft.assign(20, 1.0f);
    rig.filterLeft.shrink_to_fit();
    rig.filterLeftPointer = rig.filterLeft.data();
    rig.filterRightPointer = rig.filterLeft.data();
    rig.makeFirst();
    rig.run(true);
    EXPECT_EQ(rig.first->filterPartsL[0][0].re, 0.0f);
}

// ---- Failures ----

TEST_F(ConvClass, MissingPlanIsReportedByItsCode) {
    const LogCapture log;
    spectralFaults.plansLeft = 0;
    ConvolverRig rig(16, 2);
    rig.makeFirst();
    EXPECT_EQ(essError, -201);
    EXPECT_EQ(rig.first->fftHandle, nullptr);
    EXPECT_NE(rig.first->dftiStatus, 0);
    std::ranges::fill(rig.firstLeft, 5.0f);
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Each(5.0f)) << "output keeps what it held";
    // One input transform and two filter transforms of each ear.
    EXPECT_EQ(log.count(LogStream::output,
                        "Tessaly ERROR: FFT not working! status 3 transform handle is empty"),
              5u);
    EXPECT_THAT(log.errorLines(), IsEmpty());
}

TEST_F(ConvClass, MissingBackwardPlanAloneSetsNoCode) {
    spectralFaults.plansLeft = 1;
    ConvolverRig rig(16, 2);
    rig.makeFirst();
    EXPECT_NE(rig.first->fftHandle, nullptr);
    EXPECT_EQ(rig.first->ifftHandle, nullptr);
    EXPECT_EQ(essError, essErrorNone);
    std::ranges::fill(rig.firstLeft, 5.0f);
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Each(5.0f));
    EXPECT_NE(rig.first->dftiStatus, 0);
}

TEST_F(ConvClass, EveryFailedAllocationSetsItsCodeAndStaysHarmless) {
    // Ring, filters left and right, two sums, four over parts and a product; the second instance:
    // ring, six sums and a product; headphone spectra of both, and the common one.
    int failures = 0;
    for (std::int32_t allowed = 0; allowed < 26; ++allowed) {
        reset();
        LogCapture log;
        ConvolverRig rig(16, 1);
        std::vector<float> headphone(32, 0.1f);
        rig.hpTFactive = true;
        rig.hpTFfilter = headphone.data();
        hpTFtimeLength = 32;
        spectralFaults.spectraLeft = allowed;
        rig.makeBoth();
        spectralFaults.spectraLeft = -1;
        failures += essError == -202 ? 1 : 0;
        for (int n = 0; n < 4; ++n) {
            rig.run(n % 2 == 0);
        }
        rig.first.reset();
        rig.second.reset();
    }
    EXPECT_EQ(failures, 23);
}

TEST_F(ConvClass, SeveralPartitionsSurviveEveryFailedAllocationInBothOrdersOfACrossfade) {
    // Ring, filters left and right and six sums; the second instance: ring and six sums.
    for (const std::int32_t heardOfOld : {-1, 8}) {
        int failures = 0;
        for (std::int32_t allowed = 0; allowed < 20; ++allowed) {
            reset();
            const LogCapture log;
            ConvolverRig rig(16, 3);
            rig.heardOfOld = heardOfOld;
            spectralFaults.spectraLeft = allowed;
            rig.makeBoth();
            spectralFaults.spectraLeft = -1;
            failures += essError == -202 ? 1 : 0;
            std::ranges::fill(rig.filterLeft, 0.5f);
            for (int n = 0; n < 6; ++n) {
                rig.feed(std::vector<float>(16, 1.0f));
                rig.run(n % 2 == 0);
            }
            // An instance that lacks memory for its sums is silent.
            if (allowed < 9) {
                EXPECT_THAT(rig.firstLeft, Each(0.0f)) << allowed;
            }
        }
        EXPECT_EQ(failures, 16);
    }
}

TEST_F(ConvClass, BadBlockLengthHasNoPlan) {
    for (const std::int32_t blockLength : {0, 1, 3, -4, 65536}) {
        reset();
        const LogCapture log;
        ConvolverRig rig(16, 1);
        rig.blockLength = blockLength;
        rig.makeFirst();
        EXPECT_EQ(essError, -201) << blockLength;
    }
}

TEST_F(ConvClass, NullBuffersAreRefusedNotRead) {
    const LogCapture log;
    ConvolverRig rig(16, 2);
    rig.makeBoth();
    rig.input = nullptr;
    rig.filterLeftPointer = nullptr;
    rig.filterRightPointer = nullptr;
    rig.firstLeftPointer = nullptr;
    rig.firstRightPointer = nullptr;
    rig.run(true);
    EXPECT_EQ(log.count(LogStream::output, "Tessaly ERROR: FFT not working! status 6 "), 1u);
    EXPECT_EQ(rig.first->process(), nullptr);
}

TEST_F(ConvClass, SecondInstanceWithNothingLentIsSilent) {
    ConvolverRig rig(16, 2);
    rig.makeFirst();
    rig.second = rig.make(1);
    std::ranges::fill(rig.window, 1.0f);
    std::ranges::fill(rig.secondLeft, 5.0f);
    rig.second->process();
    EXPECT_THAT(blockOf(rig.secondLeft), Each(0.0f));
}

// ---- Block time and life ----

TEST_F(ConvClass, BlocksAllocateNothing) {
    ConvolverRig rig(64, 4);
    rig.makeBoth();
    Noise noise(12);
    std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
    rig.feed(noise.samples(64));
    const NoAllocationScope scope;
    for (int n = 0; n < 20; ++n) {
        rig.filterLeft[static_cast<std::size_t>(n)] += 0.25f;
        rig.run(n % 3 == 0);
    }
    rig.first->clearFDL();
    EXPECT_EQ(scope.allocations(), 0u);
    EXPECT_EQ(scope.releases(), 0u);
}

TEST_F(ConvClass, ManyLivesGiveTheSameSoundInEitherOrderOfDestruction) {
    std::vector<float> expected;
    for (int round = 0; round < 50; ++round) {
        ConvolverRig rig(16, 3);
        rig.makeBoth();
        Noise noise(13);
        std::ranges::copy(noise.samples(rig.filterLeft.size()), rig.filterLeft.begin());
        for (int n = 0; n < 5; ++n) {
            rig.feed(noise.samples(16));
            rig.run(n % 2 == 0);
        }
        if (round == 0) {
            expected = rig.firstLeft;
        }
        EXPECT_EQ(rig.firstLeft, expected);
        if (round % 2 == 0) {
            rig.second.reset();
        }
        rig.first.reset();
    }
}

class ConvClassTables : public ConvClass, public testing::WithParamInterface<const Kernels*> {};

TEST_P(ConvClassTables, EveryTableRendersTheModel) {
    const ForcedKernels forced(GetParam());
    for (const Shape shape : {Shape{2, 3}, Shape{16, 2}, Shape{64, 5}, Shape{256, 3}}) {
        ConvolverRig rig(shape.blockLength, shape.partitions);
        rig.makeFirst();
        const auto block = static_cast<std::size_t>(shape.blockLength);
        RingModel model(block, static_cast<std::size_t>(shape.partitions));
        Noise noise(14);
        std::ranges::copy(noise.samples(rig.filterRight.size()), rig.filterRight.begin());
        model.setResponse(rig.filterRight);
        for (int n = 0; n < shape.partitions + 1; ++n) {
            rig.feed(noise.samples(block));
            rig.run(n == 0);
            const auto newest = static_cast<std::size_t>(n % shape.partitions);
            model.ring[newest].assign(rig.window.begin(), rig.window.end());
            ASSERT_LT(blockError(model.output(model.ring, newest), rig.firstRight), tolerance);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Tables,
                         ConvClassTables,
                         testing::ValuesIn(testableKernels()),
                         kernelTestName);

}  // namespace
}  // namespace tessaly::test
