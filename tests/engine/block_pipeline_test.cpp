// The order of a block: flags, ticks, crossfades, counters.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

class BlockPipeline : public EngineFixture {
protected:
    BlockPipeline() {
        writePackedHrirSet(directory.path(), 48000);
        writePackedHrirSet(directory.path(), 44100);
    }

    /// Runs one block in which the source's first sample is 1.
    static void runImpulse(EngineRig& rig) {
        std::fill(rig.input.begin(), rig.input.end(), 0.0f);
        rig.input[0] = 1.0f;
        rig.run();
        rig.input[0] = 0.0f;
    }

    TempDirectory directory;
};

bool allZero(const ComplexBin* spectrum, int bins) {
    for (int i = 0; i < bins; ++i) {
        if (spectrum[i].re != 0.0f || spectrum[i].im != 0.0f) {
            return false;
        }
    }
    return true;
}

TEST_F(BlockPipeline, ANullInputWritesNothing) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    std::fill(rig.output.begin(), rig.output.end(), 3.0f);
    float* in = nullptr;
    float* out = rig.output.data();
    EXPECT_TRUE(rig.engine->comProcessing(in, out, 1));
    EXPECT_EQ(rig.output, std::vector<float>(512, 3.0f));
    EXPECT_EQ(blockCounter, 0u);
}

TEST_F(BlockPipeline, TheFirstBlockBuildsEverythingAndDoesNotCrossfade) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    ASSERT_TRUE(filterChangeAll);
    ASSERT_TRUE(forceUpdateAll);
    runImpulse(rig);
    EXPECT_FALSE(filterChangeAll);
    EXPECT_FALSE(forceUpdateAll);
    EXPECT_EQ(blockCounter, 1u);
    EXPECT_FALSE(allZero(rig.state().firstOLS->FDL[0], 257)) << "reached the first ring";
    EXPECT_TRUE(allZero(rig.state().secondOLS->FDL[0], 257)) << "and only that";
    EXPECT_FALSE(allZero(rig.state().firstOLS->filterPartsL[0], 257));
}

TEST_F(BlockPipeline, WithAlwaysUpdateEveryLaterBlockIsACrossfadeBlock) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    rig.run();
    runImpulse(rig);
    EXPECT_FALSE(allZero(rig.state().secondOLS->FDL[0], 257));
    EXPECT_EQ(rig.state().firstOLS->FDL[0], rig.state().firstOLS->FDLown[0]) << "given back";
    EXPECT_TRUE(allZero(rig.state().firstOLS->FDLown[0], 257))
        << "its own slot keeps the silent first block";
    EXPECT_FALSE(rig.state().output.secondOLSactive);
}

TEST_F(BlockPipeline, AStillSourceOfALazyEngineComposesOnce) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.alwaysUpdateFilter = 0;
    rig.build();
    rig.run();
    const float composed = rig.state().composer.filterLeft[10];
    ASSERT_NE(composed, 0.0f);
    rig.state().composer.filterLeft[10] = 123.0f;  // a rebuild would wipe this
    for (int i = 0; i < 5; ++i) {
        rig.run();
    }
    EXPECT_EQ(rig.state().composer.filterLeft[10], 123.0f);
    rig.azimuth = 30;
    rig.run();
    EXPECT_NE(rig.state().composer.filterLeft[10], 123.0f);
}

TEST_F(BlockPipeline, ALazyEngineRebuildsOnAnyMixChange) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.alwaysUpdateFilter = 0;
    rig.build();
    rig.run();
    rig.run();
    const float before = rig.state().composer.filterLeft[10];
    rig.mix.directGain = 0.5f;
    rig.run();
    EXPECT_FLOAT_EQ(rig.state().composer.filterLeft[10], before * 0.5f);
    // What nothing has changed is not written again, so the samples are given up first.
    const auto spoil = [&rig] {
        rig.state().composer.filterLeft[10] = 123.0f;
        rig.state().composer.forget();
    };
    spoil();
    rig.mix.mixSlot = std::numeric_limits<float>::quiet_NaN();
    rig.run();
    EXPECT_NE(rig.state().composer.filterLeft[10], 123.0f);
    spoil();
    rig.run();
    EXPECT_NE(rig.state().composer.filterLeft[10], 123.0f) << "a NaN differs in every block";
}

TEST_F(BlockPipeline, AlwaysUpdateActsAtOneExactly) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.alwaysUpdateFilter = 2;
    rig.build();
    rig.run();
    rig.run();
    rig.state().composer.filterLeft[10] = 123.0f;
    rig.state().composer.forget();
    rig.run();
    EXPECT_EQ(rig.state().composer.filterLeft[10], 123.0f);
}

TEST_F(BlockPipeline, TheHostsAzimuthIsReversed) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.azimuth = 90;
    rig.build();
    rig.run();
    EXPECT_EQ(rig.state().direction.phi, -90);
    EXPECT_EQ(rig.state().direction.indexPhi, 18);
}

TEST_F(BlockPipeline, BetweenTicksNothingIsLookedAt) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.qvUpdateInterval = 4;
    rig.build();
    rig.run();  // counter 0
    rig.azimuth = 40;
    rig.distance = 5.0f;
    for (int block = 1; block < 4; ++block) {
        rig.run();
        EXPECT_EQ(rig.state().direction.phi, 0) << block;
        EXPECT_EQ(rig.state().law.distance, 1.0f) << block;
    }
    rig.run();  // counter 4
    EXPECT_EQ(rig.state().direction.phi, -40);
    EXPECT_EQ(rig.state().law.distance, 5.0f);
}

TEST_F(BlockPipeline, AnIntervalOfZeroCountsAsOne) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.qvUpdateInterval = 0;
    rig.build();
    rig.run();
    rig.azimuth = 40;
    rig.run();
    EXPECT_EQ(rig.state().direction.phi, -40);
}

TEST_F(BlockPipeline, TheLastEngineAloneStepsTheCounter) {
    EngineRig first(directory.path(), 48000, 256);
    EngineRig second(directory.path(), 48000, 256);
    first.build();
    second.build();
    first.run();
    EXPECT_EQ(blockCounter, 0u);
    second.run();
    EXPECT_EQ(blockCounter, 1u);
    first.run();
    EXPECT_EQ(blockCounter, 1u);
    second.run();
    EXPECT_EQ(blockCounter, 2u);
    second.engine.reset();
    first.run();
    EXPECT_EQ(blockCounter, 3u) << "the survivor is the last one now";
}

TEST_F(BlockPipeline, AnEngineThatDoesNotRunYetHoldsTheCounterForAll) {
    EngineRig first(directory.path(), 48000, 256);
    first.build();
    first.run();
    first.run();
    EngineRig second(directory.path(), 48000, 256);
    second.build();
    for (int i = 0; i < 3; ++i) {
        first.run();
        EXPECT_EQ(blockCounter, 0u);
    }
}

TEST_F(BlockPipeline, AnErrorSkipsTheConvolutionAndSaysSo) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    rig.run();
    essError = essErrorWavUnreadable;
    rig.state().output.firstOutLeft[256] = 512.0f;
    LogCapture log;
    rig.run();
    EXPECT_EQ(log.outputLines(),
              std::vector<std::string>{"Tessaly_e ERROR: no comProcessing due to essError: -110"});
    EXPECT_EQ(rig.output[0], 1.0f) << "what the buffers hold is written all the same";
}

TEST_F(BlockPipeline, CompensatedOutputIsAThirdAsLoud) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    rig.run();
    EXPECT_EQ(rig.state().output.outputNormalisation, 512.0f);
    hpTFactive = true;
    rig.run();
    EXPECT_EQ(rig.state().output.outputNormalisation, 1536.0f);
}

TEST_F(BlockPipeline, OnlyEngineZeroWatchesTheHeadphoneSelection) {
    EngineRig first(directory.path(), 48000, 1024);
    EngineRig second(directory.path(), 48000, 1024);
    first.build();
    second.build();
    second.settings.qvHpTFcompSelect = 11;
    second.run();
    EXPECT_EQ(qvHpTFcompSelect, 0);
    EXPECT_FALSE(hpTFactive);
    first.settings.qvHpTFcompSelect = 11;
    first.run();
    EXPECT_EQ(qvHpTFcompSelect, 11);
    EXPECT_TRUE(hpTFactive) << "a zero filter is in place";
}

TEST_F(BlockPipeline, AStartedSelectionBelowLongBlocksComesBackWithTheFirstBlock) {
    writeWav(directory.file("/770ALIF3_CUB_Mono.wav"), 1, 44100, 32, std::vector<float>(256, 0.1f));
    EngineRig rig(directory.path(), 48000, 512);
    rig.settings.qvHpTFcompSelect = 3;
    rig.build();
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 0);
    rig.run();
    EXPECT_TRUE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 3);
}

TEST_F(BlockPipeline, ForcedUpdatesOfALazyInterpolatingEngineTakeHalfAGridStep) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.alwaysUpdateFilter = 0;
    rig.settings.qvInterpolateFilters = 1;
    rig.build();
    rig.run();
    EXPECT_FALSE(rig.state().direction.filterUpdatePending) << "cleared at the end of a block";
    rig.distance = 3.0f;  // no direction change, but a forced update
    rig.run();
    EXPECT_EQ(rig.state().direction.interpAngleOffset, 2.5f);
}

TEST_F(BlockPipeline, DistanceBelowElevenCentimetresDoesNotForce) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.alwaysUpdateFilter = 0;
    rig.distance = 0.05f;
    rig.build();
    rig.run();  // first block: flags are set from the start
    EXPECT_EQ(rig.state().law.distance, 0.1f);
    rig.state().composer.filterLeft[10] = 123.0f;
    rig.run();  // 0.05 differs from 0.1 in every block, but the old distance is 0.1
    EXPECT_EQ(rig.state().composer.filterLeft[10], 123.0f);
}

TEST_F(BlockPipeline, ImpulseComesOutAsTheComposedResponse) {
    for (const int rate : {44100, 48000}) {
        resetProcess();
        EngineRig rig(directory.path(), rate, 256);
        rig.azimuth = 45;
        rig.gainDb = -6.0f;
        rig.build();
        rig.run();
        runImpulse(rig);
        // Two input filters stand in front of the response; all is linear, so running the composed
        // response through them gives what an impulse must give.
        Biquad highCut(Biquad::lowPass, 0.0, 19100.0 / rate);
        Biquad lowCut(Biquad::highPass, 0.0, (170.0 / 30.0 + 10.0) / rate);
        const float gain = std::pow(10.0f, -0.3f);
        for (std::size_t i = 0; i < 256; ++i) {
            const float left = rig.state().composer.filterLeft[i];
            const float expected = lowCut.process(highCut.process(left)) * gain;
            EXPECT_NEAR(rig.output[2 * i], expected, 2e-6f) << i;
        }
    }
}

TEST_F(BlockPipeline, TheDelayLineSettlesThePitch) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.doppler = 1;
    rig.build();
    for (const float distance : {1.0f, 1.3f, 9.0f}) {
        rig.distance = distance;
        rig.run();
        EXPECT_EQ(rig.state().law.dopplerPitch, 1.0f) << distance;
    }
}

TEST_F(BlockPipeline, ExtremeControlsNeverLeaveTheBuffers) {
    writePackedTails(directory.path(), 48000, {20});
    EngineRig rig(directory.path(), 48000, 64);
    rig.settings.doppler = 1;
    rig.settings.qvSmoothSteps = 0;
    rig.settings.earlyFlexRefPreset = 20;
    rig.settings.qvReverb = 20;
    rig.settings.auralisation = 1;
    rig.build();
    ASSERT_EQ(essError, essErrorNone);
    ASSERT_GT(rig.state().reflections.flexReflectionCount, 6);
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float inf = std::numeric_limits<float>::infinity();
    const float values[] = {nan, inf, -inf, 0.0f, -1.0f, 1e30f, 25.0f, 0.1f};
    const int angles[] = {-32768, 32767, -181, 181, 184, -90, 90, 0};
    for (int i = 0; i < 64; ++i) {
        const std::size_t k = static_cast<std::size_t>(i);
        rig.distance = values[k % 8];
        rig.gainDb = values[(k / 2) % 8];
        rig.azimuth = static_cast<std::int16_t>(angles[(k / 3) % 8]);
        rig.elevation = static_cast<std::int16_t>(angles[(k / 5) % 8]);
        rig.mix.directGain = values[(k / 7) % 8];
        rig.engine->setInputLowPass(values[(k / 4) % 8]);
        rig.mix.earlyGain = values[(k / 2 + 1) % 8];
        rig.mix.reverbGain = values[(k / 3 + 2) % 8];
        rig.mix.unityDistance = static_cast<std::uint8_t>(k % 3 == 0);
        LiveControls& controls = rig.engine->controls();
        controls.roomSizeFactor = values[(k / 6) % 8];
        controls.reverbLP_Fc = values[(k / 6 + 1) % 8];
        controls.reflectionLP_Fc = values[(k / 2 + 3) % 8];
        controls.reflectionLP2_Fc = values[(k / 3 + 4) % 8];
        controls.roomDistances[k % 6] = values[(k / 5) % 8];
        rig.run();
        for (int r = 0; r < rig.state().reflections.flexReflectionCount; ++r) {
            const ReflectionRecord& record =
                rig.state().reflections.records[static_cast<std::size_t>(r)];
            ASSERT_TRUE(record.indexPhi >= 0 && record.indexPhi <= 72) << record.indexPhi;
            ASSERT_TRUE(record.indexTheta >= 0 && record.indexTheta <= 36) << record.indexTheta;
        }
    }
}

TEST_F(BlockPipeline, NarrowLimitsOnThePackedSetAreSilentWhereNothingIsMapped) {
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.limitPhi = 45;
    rig.settings.limitTheta = 0;
    rig.azimuth = 20;
    rig.build();
    ASSERT_EQ(essError, essErrorNone);
    std::fill(rig.input.begin(), rig.input.end(), 0.5f);
    rig.run();
    rig.run();
    // The poles alone are mapped, and not at this azimuth.
    EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
    for (float& sample : rig.output) {
        sample = 1.0f;
    }
    rig.run();
    EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
}

}  // namespace
}  // namespace tessaly::test
