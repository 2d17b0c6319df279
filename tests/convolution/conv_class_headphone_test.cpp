// Headphone compensation inside the convolver: who makes the spectra, when they act, and what
// happens where they are missing, short or of another engine.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "base/ess_error.h"
#include "base/log.h"
#include "convolution/conv_class.h"
#include "convolution/convolver_rig.h"
#include "convolution/kernel_fixture.h"
#include "support/log_capture.h"
#include "support/plain_spectral.h"

namespace tessaly::test {
namespace {

using testing::Each;
using testing::IsEmpty;
using testing::Not;

class ConvClassHeadphone : public testing::Test {
protected:
    ConvClassHeadphone() { reset(); }
    ~ConvClassHeadphone() override { reset(); }

    static void reset() {
        resetConvolutionState();
        essError = essErrorNone;
    }
    static std::vector<std::string> traced(std::vector<std::string> lines) {
        return traceEnabled ? std::move(lines) : std::vector<std::string>{};
    }
    /// Lends a headphone filter of `length` floats, as the engine that loads it does.
    void lend(ConvolverRig& rig, std::int32_t length) {
        filter_ = noise_.samples(static_cast<std::size_t>(length));
        filter_.shrink_to_fit();
        rig.hpTFfilter = filter_.data();
        hpTFtimeLength = length;
    }
    void fillFilters(ConvolverRig& rig) {
        std::ranges::copy(noise_.samples(rig.filterLeft.size()), rig.filterLeft.begin());
        std::ranges::copy(noise_.samples(rig.filterRight.size()), rig.filterRight.begin());
    }
    /// One partition: window * response * headphone filter, circular over 2B samples, times 2B.
    std::vector<double> compensated(const ConvolverRig& rig, const std::vector<float>& fir) const {
        const auto block = static_cast<std::size_t>(rig.blockLength);
        std::vector<double> headphone(2 * block);
        std::copy_n(filter_.begin(), std::min(filter_.size(), headphone.size()), headphone.begin());
        const std::vector<double> window(rig.window.begin(), rig.window.end());
        const std::vector<double> response(fir.begin(),
                                           fir.begin() + static_cast<std::ptrdiff_t>(block));
        std::vector<double> result = circularProduct(circularProduct(window, response), headphone);
        for (double& value : result) {
            value *= 2.0 * static_cast<double>(block);
        }
        return result;
    }
    /// From sample `first` on.
    static void expectNear(const std::vector<double>& expected,
                           const std::vector<float>& found,
                           std::size_t first = 0) {
        double peak = 0.0;
        for (const double value : expected) {
            peak = std::max(peak, std::abs(value));
        }
        for (std::size_t i = first; i < expected.size(); ++i) {
            ASSERT_NEAR(static_cast<double>(found[i]), expected[i], 3e-6 * peak) << i;
        }
    }

    Noise noise_{21};
    std::vector<float> filter_;
};

TEST_F(ConvClassHeadphone, FirstInstanceOfTheProcessTransformsTheFilter) {
    const LogCapture log;
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeFirst();
    ASSERT_NE(HpTF_Freq, nullptr);
    EXPECT_GE(HpTF_FreqBins, 33);
    EXPECT_LT(relativeRms(plainForward(filter_), HpTF_Freq), 1e-6);
    EXPECT_EQ(rig.first->hpTFloaded, 1);
    EXPECT_EQ(rig.first->hpTFtimeCopy, filter_.data());
    EXPECT_EQ(log.outputLines(), traced({"FDLtoBUFConv = 1"}));
    EXPECT_THAT(log.errorLines(), IsEmpty());
}

TEST_F(ConvClassHeadphone, OnePartitionIsCompensatedInPlainAndCrossfadeBlocks) {
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeBoth();
    EXPECT_EQ(rig.second->hpTFspectrumL, rig.first->hpTFspectrumL);
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
    expectNear(compensated(rig, rig.filterRight), rig.firstRight);

    const std::vector<float> oldLeft = rig.filterLeft;
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    expectNear(compensated(rig, oldLeft), rig.secondLeft);
    expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
    expectNear(compensated(rig, rig.filterRight), rig.firstRight);
}

TEST_F(ConvClassHeadphone, ComesAndGoesWhileOnePartitionPlays) {
    // Compensation needs another kind of spectra: what stands when it is switched on, and off
    // again, is the response that was heard before, with or without an update in between.
    const LogCapture log;
    for (const bool updateMeanwhile : {false, true}) {
        for (const bool crossfadeFirst : {false, true}) {
            SCOPED_TRACE(testing::Message() << updateMeanwhile << crossfadeFirst);
            reset();
            ConvolverRig rig(32, 1);
            rig.heardOfOld = 32;
            lend(rig, 64);
            rig.makeBoth();
            fillFilters(rig);
            rig.feed(noise_.samples(32));
            rig.run(true);
            const auto plain = [&rig](const std::vector<float>& fir) {
                RingModel model(32, 1);
                model.setResponse(fir);
                model.ring[0].assign(rig.window.begin(), rig.window.end());
                return model.output(model.ring, 0);
            };
            expectNear(plain(rig.filterLeft), rig.firstLeft, 32);

            rig.hpTFactive = true;
            rig.hpTFselect = 1;
            rig.feed(noise_.samples(32));
            rig.run(false);
            EXPECT_THAT(rig.firstLeft, Each(0.0f)) << "nothing compensated stands yet";
            if (updateMeanwhile) {
                if (!crossfadeFirst) {
                    fillFilters(rig);
                }
                rig.feed(noise_.samples(32));
                rig.run(true);
                expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
                expectNear(compensated(rig, rig.filterRight), rig.firstRight);
            }

            rig.hpTFactive = false;
            const std::vector<float> oldLeft = rig.filterLeft;
            if (crossfadeFirst) {
                fillFilters(rig);
                rig.feed(noise_.samples(32));
                rig.run(true);
                expectNear(plain(oldLeft), rig.secondLeft, 32);
                expectNear(plain(rig.filterLeft), rig.firstLeft, 32);
            }
            rig.feed(noise_.samples(32));
            rig.run(false);
            expectNear(plain(rig.filterLeft), rig.firstLeft, 32);
            expectNear(plain(rig.filterRight), rig.firstRight, 32);
        }
    }
}

TEST_F(ConvClassHeadphone, ComesAndGoesWithoutTakingWhatWasWrittenMeanwhile) {
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    FirNotes notes;
    rig.makeFirst();
    rig.first->watch(&notes, 0);  // keeps no copies, as in an engine
    fillFilters(rig);
    const std::vector<float> taken = rig.filterLeft;
    notes.written.include(0, static_cast<int>(rig.filterLeft.size()));
    rig.feed(noise_.samples(32));
    rig.run(true);

    std::ranges::fill(rig.filterLeft, 0.0f);  // a stop, or a block that was not made
    rig.hpTFactive = true;
    rig.hpTFselect = 1;
    rig.feed(noise_.samples(32));
    rig.run(false);
    rig.hpTFactive = false;
    rig.feed(noise_.samples(32));
    rig.run(false);
    RingModel model(32, 1);
    model.setResponse(taken);
    model.ring[0].assign(rig.window.begin(), rig.window.end());
    expectNear(model.output(model.ring, 0), rig.firstLeft, 32);
}

TEST_F(ConvClassHeadphone, IsSwitchedOnAndOffInARunOfMoves) {
    ConvolverRig plain(64, 1);
    lend(plain, 128);
    plain.makeBoth();
    ConvolverRig moving(64, 1);
    moving.hpTFfilter = plain.hpTFfilter;
    moving.heardOfOld = 64;
    moving.makeBoth();
    FirNotes notes;
    moving.first->watch(&notes, 0);
    moving.first->continueResults();
    int continued = 0;
    for (int n = 0; n < 40; ++n) {
        SCOPED_TRACE(n);
        for (ConvolverRig* const rig : {&plain, &moving}) {
            rig->hpTFactive = n / 10 % 2 == 1;
            rig->hpTFselect = rig->hpTFactive ? 1 : 0;
        }
        moving.first->beforeWriting(n > 0);
        fillFilters(plain);
        moving.filterLeft = plain.filterLeft;
        moving.filterRight = plain.filterRight;
        notes.written.include(0, static_cast<int>(moving.filterLeft.size()));
        const std::vector<float> input = noise_.samples(64);
        for (ConvolverRig* const rig : {&plain, &moving}) {
            rig->feed(input);
            rig->run(true);
            // As an engine lends what the first instance has made meanwhile.
            rig->second->hpTFspectrumL = rig->first->hpTFspectrumL;
            rig->second->hpTFspectrumR = rig->first->hpTFspectrumR;
        }
        continued += moving.first->oldContinued() ? 1 : 0;
        expectNear({plain.firstLeft.begin(), plain.firstLeft.end()}, moving.firstLeft, 64);
        if (n > 0 && n % 10 > 1) {
            expectNear({plain.secondLeft.begin(), plain.secondLeft.end()}, moving.secondLeft, 64);
        }
    }
    EXPECT_GT(continued, 5);
}

TEST_F(ConvClassHeadphone, LaterInstancesReadTheCommonSpectrumAndMakeNone) {
    const LogCapture log;
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeFirst();
    ComplexBin* const common = HpTF_Freq;
    ConvolverRig other(32, 1);
    other.hpTFactive = true;
    other.makeFirst();
    EXPECT_EQ(HpTF_Freq, common);
    EXPECT_EQ(other.first->hpTFloaded, 1);
    fillFilters(other);
    other.feed(noise_.samples(32));
    other.run(true);
    expectNear(compensated(other, other.filterLeft), other.firstLeft);
    EXPECT_EQ(log.outputLines(),
              traced({"FDLtoBUFConv = 1",
                      "Filter for HpTF-Compensation already present in first Instance of "
                      "convClass. (static)"}));
}

TEST_F(ConvClassHeadphone, SeveralPartitionsStayUncompensatedAndSaySoOnceAnUpdate) {
    ConvolverRig rig(32, 3);
    lend(rig, 64);
    rig.hpTFactive = true;
    LogCapture log;
    rig.makeFirst();
    ASSERT_NE(HpTF_Freq, nullptr);
    for (int k = 0; k < 33; ++k) {
        EXPECT_EQ(HpTF_Freq[k].re, 0.0f) << "stays zero with several partitions";
    }
    EXPECT_EQ(log.outputLines(), traced({"FDLtoBUFConv = 3"}));
    log.clear();

    fillFilters(rig);
    const std::vector<float> left = rig.filterLeft;
    rig.feed(noise_.samples(32));
    rig.run(true);
    EXPECT_EQ(rig.filterLeft, left) << "the response goes on unchanged";
    const std::string refused =
        "Tessaly ERROR: FFT not working! status 3 transform handle is empty";
    if (traceEnabled) {
        const std::string refusedBack =
            "Tessaly ERROR: IFFT not working! status 3 transform handle is empty";
        EXPECT_THAT(log.outputLines(), testing::ElementsAre("Full HPTF-CONV", refused, refused,
                                                            refusedBack, refusedBack));
    } else {
        EXPECT_THAT(log.outputLines(), testing::ElementsAre(refused, refused));
    }
    EXPECT_THAT(log.errorLines(), IsEmpty());

    RingModel model(32, 3);
    model.setResponse(rig.filterLeft);
    model.ring[0].assign(rig.window.begin(), rig.window.end());
    expectNear(model.output(model.ring, 0), rig.firstLeft, 32);

    log.clear();
    rig.run(false);
    EXPECT_THAT(log.lines(), IsEmpty()) << "a block without an update is quiet";
    EXPECT_EQ(rig.first->fftHandleFull, nullptr);
    EXPECT_EQ(rig.first->ifftHandleFull, nullptr);
}

TEST_F(ConvClassHeadphone, FullLengthBranchStaysInsideForLongResponses) {
    // firLengthHalf + 1 bins exceed B + 1 from three partitions on.
    for (const std::int16_t partitions :
         {std::int16_t{2}, std::int16_t{3}, std::int16_t{9}, std::int16_t{40}}) {
        reset();
        const LogCapture log;
        ConvolverRig rig(16, partitions);
        rig.hpTFactive = true;
        rig.makeBoth();
        rig.run(true);
        rig.run(true);
        EXPECT_EQ(log.count(LogStream::output, "FFT not working! status 3"),
                  traceEnabled ? 8u : 4u);
    }
}

TEST_F(ConvClassHeadphone, LongerResponseThanTheMakersReadsZerosBehindTheCommonSpectrum) {
    const LogCapture log;
    ConvolverRig maker(16, 2);
    maker.hpTFactive = true;
    maker.makeFirst();
    EXPECT_EQ(HpTF_FreqBins, 17);
    ConvolverRig rig(16, 20);
    rig.hpTFactive = true;
    rig.makeFirst();
    rig.run(true);
    for (int k = 0; k < 161; ++k) {
        ASSERT_EQ(rig.first->hpTFspectrumL[k].re, 0.0f);
    }
}

TEST_F(ConvClassHeadphone, LongerBlocksThanTheMakersReadZerosBehindTheCommonSpectrum) {
    ConvolverRig maker(16, 1);
    lend(maker, 32);
    maker.hpTFactive = true;
    maker.makeFirst();
    ConvolverRig rig(64, 1);
    rig.hpTFactive = true;
    rig.makeFirst();
    fillFilters(rig);
    rig.feed(noise_.samples(64));
    rig.run(true);
    const ComplexBin* const product = rig.first->hpTFspectrumL;
    EXPECT_NE(product[16].re, 0.0f);
    for (int k = 17; k < 65; ++k) {
        EXPECT_EQ(product[k].re, 0.0f) << k;
        EXPECT_EQ(product[k].im, 0.0f) << k;
    }
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(ConvClassHeadphone, ShortOrMissingTimeFilterCountsAsZeros) {
    for (const std::int32_t length : {0, 1, 20, 63, 64, 100}) {
        reset();
        ConvolverRig rig(32, 1);
        lend(rig, length);
        rig.hpTFactive = true;
        rig.makeFirst();
        std::vector<float> padded = filter_;
        padded.resize(64);
        if (length == 0) {
            EXPECT_EQ(HpTF_Freq[3].re, 0.0f);
        } else {
            EXPECT_LT(relativeRms(plainForward(padded), HpTF_Freq), 1e-6) << length;
        }
    }
    reset();
    ConvolverRig rig(32, 1);
    hpTFtimeLength = 64;  // told but not there
    rig.hpTFactive = true;
    rig.makeFirst();
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Each(0.0f));
}

TEST_F(ConvClassHeadphone, NobodyMadeASpectrumSoCompensationIsSilence) {
    // The first instance of the process went before compensation came on.
    {
        ConvolverRig gone(32, 1);
        gone.makeFirst();
    }
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeBoth();
    EXPECT_EQ(HpTF_Freq, nullptr);
    fillFilters(rig);
    for (int n = 0; n < 3; ++n) {
        rig.feed(noise_.samples(32));
        rig.run(true);
        EXPECT_THAT(rig.firstLeft, Each(0.0f));
        EXPECT_THAT(rig.secondLeft, Each(0.0f));
    }
}

TEST_F(ConvClassHeadphone, SwitchedOnWithoutANewSelectionIsSilence) {
    // No product spectra were ever made, and none are read.
    ConvolverRig rig(32, 1);
    rig.makeBoth();
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Not(Each(0.0f)));
    rig.hpTFactive = true;
    for (const bool update : {false, true}) {
        rig.run(update);
        EXPECT_EQ(rig.first->hpTFspectrumL, nullptr);
        EXPECT_THAT(rig.firstLeft, Each(0.0f));
        EXPECT_THAT(rig.firstRight, Each(0.0f));
    }
    EXPECT_THAT(rig.secondLeft, Each(0.0f));
    rig.hpTFactive = false;
    rig.run(false);
    EXPECT_THAT(rig.firstLeft, Not(Each(0.0f)));
}

TEST_F(ConvClassHeadphone, NewSelectionSilencesUntilTheNextUpdate) {
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeFirst();
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    EXPECT_THAT(rig.firstLeft, Not(Each(0.0f)));
    ComplexBin* const productBefore = rig.first->hpTFspectrumL;
    ComplexBin* const commonBefore = HpTF_Freq;

    const std::vector<float> oldFilter = filter_;
    const float* const oldPointer = rig.hpTFfilter;
    std::vector<float> kept = std::move(filter_);
    lend(rig, 64);
    EXPECT_NE(rig.hpTFfilter, oldPointer);
    rig.hpTFselect = 5;
    rig.run(false);
    EXPECT_NE(rig.first->hpTFspectrumL, productBefore);
    EXPECT_NE(HpTF_Freq, commonBefore);
    EXPECT_EQ(rig.first->hpTFselectSeen, 5);
    EXPECT_THAT(rig.firstLeft, Each(0.0f));
    EXPECT_THAT(rig.firstRight, Each(0.0f));
    rig.run(true);
    expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
    // What was replaced stays readable for a late reader.
    EXPECT_NE(productBefore[1].re, 0.0f);
    EXPECT_NE(commonBefore[1].re, 0.0f);
}

TEST_F(ConvClassHeadphone, SelectionWatchTellsWhatItDid) {
    LogCapture log;
    ConvolverRig rig(16, 1);
    rig.makeFirst();                                       // number 0
    const std::unique_ptr<convClass> later = rig.make(0);  // number 1
    rig.hpTFselect = 1;
    rig.first->process();
    EXPECT_EQ(log.outputLines(),
              traced({"HpTF not loaded yet-> so loading...", "FDLtoBUFConv = 1"}));
    EXPECT_EQ(rig.first->hpTFloaded, 1);
    log.clear();
    rig.first->process();
    EXPECT_THAT(log.lines(), IsEmpty()) << "seen";
    rig.hpTFselect = 2;
    rig.first->process();
    EXPECT_EQ(log.outputLines(),
              traced({"HpTF already allocated only transform it, but load it better!",
                      "FDLtoBUFConv = 1"}));
    log.clear();
    later->process();
    EXPECT_EQ(log.outputLines(),
              traced({"HpTF not loaded yet-> so loading...",
                      "Filter for HpTF-Compensation already present in first Instance of "
                      "convClass. (static)"}));
    log.clear();
    rig.hpTFselect = 0;
    ComplexBin* const product = later->hpTFspectrumL;
    later->process();
    EXPECT_EQ(log.outputLines(), traced({"HpTF already loaded and allocated so nothing to do!"}));
    EXPECT_EQ(later->hpTFspectrumL, product);
    EXPECT_EQ(later->hpTFselectSeen, 0);
}

TEST_F(ConvClassHeadphone, SelectionIsWatchedWhileCompensationIsOff) {
    ConvolverRig rig(16, 1);
    rig.makeFirst();
    rig.hpTFselect = 4;
    rig.run(false);
    EXPECT_EQ(rig.first->hpTFselectSeen, 4);
    EXPECT_EQ(rig.first->hpTFloaded, 1);
    EXPECT_NE(rig.first->hpTFspectrumL, nullptr);
}

TEST_F(ConvClassHeadphone, SecondInstanceSwitchedOnLaterIsSilentInCrossfadeBlocks) {
    ConvolverRig rig(32, 1);
    rig.makeBoth();
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.hpTFselect = 3;
    rig.feed(noise_.samples(32));
    rig.run(true);
    EXPECT_NE(rig.second->hpTFspectrumL, nullptr);
    EXPECT_NE(rig.second->hpTFspectrumL, rig.first->hpTFspectrumL);
    EXPECT_THAT(rig.secondLeft, Each(0.0f));
    EXPECT_THAT(rig.secondRight, Each(0.0f));
    expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
    rig.run(true);
    EXPECT_THAT(rig.secondLeft, Each(0.0f)) << "and stays so";
}

TEST_F(ConvClassHeadphone, BorrowedProductsOutliveTheirMaker) {
    ConvolverRig rig(32, 1);
    lend(rig, 64);
    rig.hpTFactive = true;
    rig.makeBoth();
    fillFilters(rig);
    rig.feed(noise_.samples(32));
    rig.run(true);
    const float before = rig.second->hpTFspectrumL[1].re;
    rig.first.reset();
    EXPECT_EQ(rig.second->hpTFspectrumL[1].re, before);
}

TEST_F(ConvClassHeadphone, DirectFeedOfOnePartitionIsCompensated) {
    ConvolverRig rig(16, 1);
    lend(rig, 32);
    rig.hpTFactive = true;
    rig.directFilterFeed = 1;
    rig.makeFirst();
    fillFilters(rig);
    std::fill(rig.filterLeft.begin() + 16, rig.filterLeft.end(), 0.0f);
    rig.feed(noise_.samples(16));
    rig.run(true);
    expectNear(compensated(rig, rig.filterLeft), rig.firstLeft);
}

TEST_F(ConvClassHeadphone, DirectFeedOfSeveralPartitionsNeverEntersTheFullLengthBranch) {
    const LogCapture log;
    ConvolverRig rig(16, 3);
    rig.hpTFactive = true;
    rig.directFilterFeed = 1;
    rig.makeFirst();
    rig.run(true);
    EXPECT_EQ(log.count(LogStream::output, "not working"), 0u);
}

}  // namespace
}  // namespace tessaly::test
