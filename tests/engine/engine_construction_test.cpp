// Building an engine: refusals, order, sizes, shared tables, destruction.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <limits>
#include <vector>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

class EngineConstruction : public EngineFixture {
protected:
    void writeSets() {
        for (const int rate : {24000, 44100, 48000}) {
            writePackedHrirSet(directory.path(), rate);
        }
    }
    TempDirectory directory;
};

TEST_F(EngineConstruction, BlockLengthIsCheckedBeforeTheRate) {
    for (const int block : {-4, 0, 1, 3, 1000, 1025}) {
        essError = essErrorNone;
        LogCapture log;
        EngineRig rig(directory.path(), 12345, block);
        rig.build();
        EXPECT_EQ(essError, essErrorBlockSize) << block;
        EXPECT_EQ(
            log.count(LogStream::output, "Tessaly_e ERROR: buffersize is not power-of-two!!!"), 1u);
        EXPECT_EQ(engineCount, 1) << "a stopped engine counts as alive";
        rig.engine.reset();
        EXPECT_EQ(engineCount, 0);
    }
}

TEST_F(EngineConstruction, OtherRatesAreRefusedOnBothStreams) {
    for (const int rate : {0, -1, 22050, 96000}) {
        essError = essErrorNone;
        LogCapture log;
        EngineRig rig(directory.path(), rate, 256);
        rig.build();
        EXPECT_EQ(essError, essErrorSampleRate) << rate;
        EXPECT_EQ(log.count(LogStream::output, "samplerate not 44100, 48000 or 24000! so quit!"),
                  1u);
        EXPECT_EQ(log.errorLines(),
                  std::vector<std::string>{"Tessaly: samplerate not 44100, 48000 or 24000!"});
    }
}

TEST_F(EngineConstruction, AMissingDatabaseStops) {
    EngineRig rig(directory.path(), 48000, 256);
    LogCapture log;
    rig.build();
    EXPECT_EQ(essError, essErrorDatabaseMissing);
    EXPECT_EQ(rig.state().firstOLS, nullptr);
    EXPECT_EQ(log.count(LogStream::output, "Tessaly_e ERROR: database-file "), 1u);
    EXPECT_EQ(log.count(LogStream::output, "Tessaly_e ERROR: file not found "), 1u);
}

TEST_F(EngineConstruction, WithoutATransformPlanItStopsBehindTheConvolvers) {
    writeSets();
    spectralFaults.plansLeft = 0;
    EngineRig rig(directory.path(), 48000, 256);
    LogCapture log;
    rig.build();
    spectralFaults = {};
    EXPECT_EQ(essError, essErrorTransformPlan);
    EXPECT_NE(rig.state().firstOLS, nullptr);
    EXPECT_FALSE(rig.state().complete);
    EXPECT_EQ(log.count(LogStream::output, "couldn't load FFT Plan"), 1u);
    EXPECT_EQ(log.count(LogStream::output, "___tessCore_Stop"), 0u);
    std::fill(rig.output.begin(), rig.output.end(), 1.0f);
    rig.run();
    EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
}

TEST_F(EngineConstruction, WithoutMemoryForSpectraItIsAnErrorAndSilent) {
    writeSets();
    spectralFaults.spectraLeft = 0;
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    spectralFaults = {};
    EXPECT_EQ(essError, essErrorSpectrumMemory);
    std::fill(rig.input.begin(), rig.input.end(), 0.5f);
    rig.run();
    essError = essErrorNone;
    rig.run();
    for (const float sample : rig.output) {
        EXPECT_EQ(sample, 0.0f);
    }
}

TEST_F(EngineConstruction, AStoppedEngineCanBeAskedForAnything) {
    const struct {
        int rate;
        int block;
    } cases[] = {{48000, 3}, {12345, 256}, {48000, 256}};
    for (const auto& c : cases) {
        essError = essErrorNone;
        EngineRig rig(directory.path(), c.rate, c.block);
        rig.build();
        ASSERT_LT(essError, 0);
        rig.engine->setInputLowPass(0.5f);
        rig.engine->setInputLowPass(1.0f);
        std::fill(rig.output.begin(), rig.output.end(), 1.0f);
        rig.run();
        EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
        essError = essErrorNone;  // as if another engine's load had gone well
        rig.run();
        EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
        EXPECT_EQ(rig.engine->getReverbDistanceGain(), 1.0f);
        EXPECT_EQ(rig.engine->Stop(), 1);
    }
}

TEST_F(EngineConstruction, EveryRateAndBlockLengthBuilds) {
    writeSets();
    for (const int rate : {24000, 44100, 48000}) {
        for (int block = 2; block <= 4096; block *= 2) {
            resetProcess();
            EngineRig rig(directory.path(), rate, block);
            rig.build();
            ASSERT_EQ(essError, essErrorNone) << rate << "/" << block;
            EXPECT_TRUE(rig.state().complete);
            EXPECT_EQ(rig.state().sizes.fdlCount, 1);
            EXPECT_EQ(rig.state().sizes.FIR_size, block);
            rig.run();
            rig.run();
        }
    }
}

TEST_F(EngineConstruction, RatiosAndScalesByRate) {
    writeSets();
    const struct {
        int rate;
        float ratio;
        int taps;
    } cases[] = {{24000, 0.5442177f, 70}, {44100, 1.0f, 128}, {48000, 1.0884354f, 139}};
    for (const auto& c : cases) {
        resetProcess();
        EngineRig rig(directory.path(), c.rate, 256);
        rig.build();
        EXPECT_EQ(rig.state().sampleRateRatio, c.ratio);
        EXPECT_EQ(rig.state().switches.hrirLength, c.taps);
        EXPECT_EQ(rig.state().samplesPerMetre, static_cast<float>(c.rate * 0.0029118863199580685));
    }
}

TEST_F(EngineConstruction, BadLimitsResetBoth) {
    writeSets();
    LogCapture log;
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.limitPhi = 181;
    rig.settings.limitTheta = 45;
    rig.build();
    EXPECT_EQ(rig.state().switches.limitPhi, 180);
    EXPECT_EQ(rig.state().switches.limitTheta, 90);
    EXPECT_EQ(rig.settings.limitPhi, 181) << "the handler's record stays";
    EXPECT_EQ(
        log.count(LogStream::output, "WARNING: Limits for Phi (0-180) or Theta (0-90) exceedet!!!"),
        1u);
    EXPECT_EQ(log.count(LogStream::output, "limitPhi set to 180 and limitTheta set to 90!"), 1u);
}

TEST_F(EngineConstruction, LimitsGoDownToTheGrid) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.limitPhi = 47;
    rig.build();
    EXPECT_EQ(rig.state().switches.limitPhi, 45);
    EXPECT_EQ(rig.state().direction.phiSteps, 18);
}

TEST_F(EngineConstruction, FirstBlockAlwaysFindsAChange) {
    writeSets();
    for (const int azimuth : {0, 5, -180, 180}) {
        resetProcess();
        EngineRig rig(directory.path(), 48000, 256);
        rig.azimuth = static_cast<std::int16_t>(azimuth);
        rig.distance = 2.0f;
        rig.build();
        EXPECT_EQ(rig.state().direction.phi, 5 - azimuth);
        EXPECT_EQ(rig.state().direction.theta, 5);
        EXPECT_EQ(rig.state().law.distance, static_cast<float>(2.0 + 0.4));
        EXPECT_EQ(rig.state().law.distanceOld, 2.0f);
        EXPECT_EQ(rig.state().direction.phiOld, azimuth);
        EXPECT_EQ(rig.state().direction.indexPhiOld, (azimuth + 180) / 5);
    }
}

TEST_F(EngineConstruction, EnginesAreNumberedByThoseAlive) {
    writeSets();
    EngineRig first(directory.path(), 48000, 256);
    EngineRig second(directory.path(), 48000, 256);
    first.build();
    blockCounter = 77;
    LogCapture log;
    second.build();
    EXPECT_EQ(first.state().instanceNumber, 0);
    EXPECT_EQ(second.state().instanceNumber, 1);
    EXPECT_EQ(engineCount, 2);
    EXPECT_EQ(blockCounter, 0u) << "every construction restarts it";
    EXPECT_EQ(log.count(LogStream::output, "Database already loaded!"), 1u);
    first.engine.reset();
    EXPECT_EQ(log.count(LogStream::output, "0 delete"), 1u);
    EngineRig third(directory.path(), 48000, 256);
    third.build();
    EXPECT_EQ(third.state().instanceNumber, 1) << "numbers are not unique";
}

TEST_F(EngineConstruction, AnotherBypassRebuildsTheTablesUnderALivingEngine) {
    writeSets();
    EngineRig first(directory.path(), 48000, 256);
    first.build();
    const float before = hrirAt(36, 18)[0];
    EngineRig second(directory.path(), 48000, 256);
    second.settings.bypass3DAudio = 1;
    second.build();
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(databaseBypassMode, 1);
    EXPECT_NE(hrirAt(36, 18)[0], before) << "a pair of taps now";
    first.input[0] = 1.0f;
    first.run();
    second.run();
}

TEST_F(EngineConstruction, ASecondEngineAtAnotherRateReadsOnBehindTheShorterEntries) {
    writeSets();
    EngineRig first(directory.path(), 24000, 256);
    first.build();
    EngineRig second(directory.path(), 48000, 256);
    second.azimuth = -5;  // engine azimuth 5: the last entry of the set
    second.elevation = 85;
    second.build();
    ASSERT_EQ(essError, essErrorNone);
    EXPECT_EQ(second.state().switches.hrirLength, 139) << "of entries with 70 frames";
    second.input[0] = 1.0f;
    second.run();
    const float* last = hrirAt(37, 35);
    EXPECT_EQ(last, hrirTable[2521]);
    for (int frame = 70; frame < 139; ++frame) {
        EXPECT_EQ(second.state().composer.filterLeft[frame], 0.0f) << "zeros behind the set";
    }
}

TEST_F(EngineConstruction, ALongTailInTinyBlocksLoads) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 2);
    rig.settings.qvReverb = 1;  // synthetic tail: the default response of 4096
    rig.build();
    ASSERT_EQ(essError, essErrorNone);
    EXPECT_EQ(rig.state().sizes.fdlCount, 2048);
    rig.run();
    rig.run();
}

TEST_F(EngineConstruction, StopClearsSignalsAndResponse) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.build();
    std::fill(rig.input.begin(), rig.input.end(), 0.5f);
    rig.run();
    rig.run();
    ASSERT_NE(rig.state().frontEnd.inputHistory[300], 0.0f);
    EXPECT_EQ(rig.engine->Stop(), 1);
    for (int i = 0; i < 512; ++i) {
        ASSERT_EQ(rig.state().frontEnd.inputHistory[i], 0.0f);
        ASSERT_EQ(rig.state().composer.filterLeft[i], 0.0f);
        ASSERT_EQ(rig.state().composer.filterRight[i], 0.0f);
        ASSERT_EQ(rig.state().output.firstOutLeft[i], 0.0f);
        ASSERT_EQ(rig.state().output.secondOutRight[i], 0.0f);
    }
    for (int bin = 0; bin <= 256; ++bin) {
        ASSERT_EQ(rig.state().firstOLS->FDL[0][bin].re, 0.0f);
        ASSERT_EQ(rig.state().secondOLS->FDL[0][bin].re, 0.0f);
    }
}

TEST_F(EngineConstruction, HoldsOnlyWhatItsSettingsUse) {
    writeSets();
    const auto held = [](EngineRig& rig) {
        EngineState& state = rig.build().state();
        EXPECT_TRUE(state.complete);
        return std::vector<bool>{!state.frontEnd.doppler.dopplerLine.empty(),
                                 !state.interpolation.interpFilterLeft[0].empty(),
                                 !state.output.secondOutLeftBuffer.empty(),
                                 !state.tail.reverbIR.empty(),
                                 !state.debugDumpBuffer.empty(),
                                 !state.ambience.atmoBuffer.empty()};
    };
    struct Case {
        const char* name;
        std::size_t index;  // size: none
        std::function<void(EngineSettings&)> set;
    };
    const Case cases[] = {
        {"nothing", 6, [](EngineSettings&) {}},
        {"doppler", 0, [](EngineSettings& settings) { settings.doppler = 1; }},
        {"interpolation", 1, [](EngineSettings& settings) { settings.qvInterpolateFilters = 1; }},
        {"fading", 2, [](EngineSettings& settings) { settings.fading = 1; }},
        {"tail", 3, [](EngineSettings& settings) { settings.qvReverb = 20; }},
        {"dump", 4, [](EngineSettings& settings) { settings.debugDump = 1; }},
        {"ambience", 5, [](EngineSettings& settings) { settings.atmoSelect = 1; }},
    };
    writePackedTails(directory.path(), 48000, {20});
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        essError = essErrorNone;
        LogCapture log;
        EngineRig rig(directory.path(), 48000, 256);
        rig.settings.doppler = 0;
        rig.settings.fading = 0;
        c.set(rig.settings);
        std::vector<bool> wanted(6, false);
        if (c.index < wanted.size()) {
            wanted[c.index] = true;
        }
        EXPECT_EQ(held(rig), wanted);
    }
}

TEST_F(EngineConstruction, AFreshEngineStartsFromSilence) {
    writeSets();
    writePackedTails(directory.path(), 48000, {20});
    const auto isZero = [](const AlignedArray<float>& samples) {
        return std::all_of(samples.begin(), samples.end(), [](float s) { return s == 0.0f; });
    };
    // The second one gets memory that the first one wrote to.
    for (int life = 0; life < 3; ++life) {
        LogCapture log;
        EngineRig rig(directory.path(), 48000, 256);
        rig.settings.qvReverb = 20;
        rig.settings.fading = 1;
        const EngineState& state = rig.build().state();
        EXPECT_EQ(log.outputLines().back(), "___tessCore_Stop");
        EXPECT_TRUE(isZero(state.frontEnd.inputHistoryBuffer));
        EXPECT_TRUE(isZero(state.composer.filterLeftBuffer));
        EXPECT_TRUE(isZero(state.composer.filterRightBuffer));
        EXPECT_TRUE(isZero(state.output.firstOutLeftBuffer));
        EXPECT_TRUE(isZero(state.output.firstOutRightBuffer));
        EXPECT_TRUE(isZero(state.output.secondOutLeftBuffer));
        EXPECT_TRUE(isZero(state.output.secondOutRightBuffer));
        for (convClass* const convolver : {state.firstOLS.get(), state.secondOLS.get()}) {
            for (const ComplexBin* const spectrum : convolver->FDL) {
                for (int bin = 0; bin <= rig.blocklenght(); ++bin) {
                    ASSERT_EQ(spectrum[bin].re, 0.0f);
                    ASSERT_EQ(spectrum[bin].im, 0.0f);
                }
            }
        }
        rig.run();
        EXPECT_EQ(rig.output, std::vector<float>(rig.output.size(), 0.0f));
        std::fill(rig.input.begin(), rig.input.end(), 0.5f);
        for (int block = 0; block < 20; ++block) {
            rig.run();
        }
        EXPECT_NE(rig.output, std::vector<float>(rig.output.size(), 0.0f));
    }
}

TEST_F(EngineConstruction, TheSecondConvolverSharesTheFirstOnesSpectra) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.qvReverb = 1;
    rig.build();
    ASSERT_EQ(rig.state().sizes.fdlCount, 16);
    for (int i = 0; i < 16; ++i) {
        EXPECT_EQ(rig.state().firstOLS->filterPartsL[i], rig.state().secondOLS->filterPartsL[i]);
        EXPECT_EQ(rig.state().firstOLS->filterPartsR[i], rig.state().secondOLS->filterPartsR[i]);
        EXPECT_NE(rig.state().firstOLS->FDL[i], rig.state().secondOLS->FDL[i]);
    }
}

TEST_F(EngineConstruction, WithoutFadingThereIsOneConvolver) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.fading = 0;
    rig.build();
    EXPECT_NE(rig.state().firstOLS, nullptr);
    EXPECT_EQ(rig.state().secondOLS, nullptr);
    rig.run();
    rig.run();
}

TEST_F(EngineConstruction, AConstantDirectionTakesTheFirstEntryOfTheSet) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.qvTrackDirection = 0;
    rig.azimuth = 90;
    rig.build();
    ASSERT_EQ(essError, essErrorNone);
    ASSERT_NE(rig.state().database->staticFilter, nullptr);
    EXPECT_EQ(*rig.state().database->staticFilter, hrirTable[0]);
}

TEST_F(EngineConstruction, AStaticFilterThatWasNeverLoadedIsSilent) {
    writeSets();
    EngineRig first(directory.path(), 48000, 256);
    first.build();
    EngineRig second(directory.path(), 48000, 256);
    second.settings.qvTrackDirection = 0;
    second.build();
    EXPECT_EQ(second.state().database->staticFilter, nullptr);
    std::fill(second.input.begin(), second.input.end(), 0.5f);
    second.run();
    second.run();
    EXPECT_EQ(second.output, std::vector<float>(second.output.size(), 0.0f));
}

TEST_F(EngineConstruction, DebugDumpIsAllocatedNamedAndPrinted) {
    writeSets();
    EngineRig rig(directory.path(), 48000, 256);
    rig.settings.debugDump = 1;
    rig.settings.debugDumpName = "dump";
    LogCapture log;
    rig.build();
    EXPECT_EQ(log.count(LogStream::output, "dump.wav"), 1u);
    EXPECT_EQ(rig.state().debugDumpBuffer.size() * sizeof(float), 8519680u);
    for (std::size_t i = 0; i < 10; ++i) {
        rig.state().debugDumpBuffer[i] = static_cast<float>(i);
    }
    log.clear();
    rig.run();
    EXPECT_EQ(
        log.outputLines(),
        std::vector<std::string>{"0>_0\t1>_1\t2>_2\t3>_3\t4>_4\t5>_5\t6>_6\t7>_7\t8>_8\t9>_9\t"});
}

TEST_F(EngineConstruction, AmbienceOfALaterEngineIsOff) {
    writeSets();
    EngineRig first(directory.path(), 48000, 256);
    first.build();
    EngineRig second(directory.path(), 48000, 256);
    second.settings.atmoSelect = 2;
    second.build();
    EXPECT_EQ(second.state().switches.atmoSelect, 0);
    EXPECT_EQ(essError, essErrorNone) << "nothing was looked for";
    second.run();
}

TEST_F(EngineConstruction, TwoHundredLivesKeepNothingButTheTables) {
    writeSets();
    for (int i = 0; i < 200; ++i) {
        EngineRig rig(directory.path(), 48000, 64);
        rig.settings.doppler = 1;
        rig.settings.qvInterpolateFilters = 1;
        rig.build();
        rig.run();
    }
    EXPECT_EQ(engineCount, 0);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_NE(HRTFStream, nullptr) << "the set outlives all engines";
}

TEST_F(EngineConstruction, ExtremeInputsAtConstructionAreDefined) {
    writeSets();
    for (const float distance : {std::numeric_limits<float>::quiet_NaN(),
                                 std::numeric_limits<float>::infinity(), -5.0f, 1e30f}) {
        EngineRig rig(directory.path(), 48000, 64);
        rig.settings.doppler = 1;
        rig.distance = distance;
        rig.azimuth = -32768;
        rig.elevation = 32767;
        rig.build();
        EXPECT_TRUE(rig.state().complete);
        rig.run();
        rig.run();
    }
}

}  // namespace
}  // namespace tessaly::test
