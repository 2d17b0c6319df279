// What a load asks of the engine, and what it leaves behind.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "handler/fake_engine.h"
#include "handler/instance_handler.h"
#include "handler/process_fixture.h"
#include "handler/process_state.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

constexpr int rate = 48000;
constexpr int frames = 64;

class EngineLoadTest : public ProcessFixture {
protected:
    EngineLoadTest() { setAssetPath(); }

    static FakeEngine& load(InstanceHandler& handler,
                            int room,
                            int hostRate = rate,
                            int hostFrames = frames) {
        handler.roomPreset = room;
        EXPECT_TRUE(handler.checkForChanges(hostRate, hostFrames));
        return fakeEngines().last();
    }

    LogCapture log;
};

TEST_F(EngineLoadTest, PassesTheArguments) {
    InstanceHandler handler(rate, frames);
    const FakeEngine& engine = load(handler, 5);
    EXPECT_EQ(engine.instanceName, "essCore_InstanceForUnity");
    EXPECT_EQ(engine.bundleBasePath, "/data/tessaly");
    EXPECT_EQ(engine.blocklenght, frames);
    EXPECT_EQ(engine.qualityValue, 0);
    EXPECT_EQ(engine.settingsPointer, &handler.engineSettings);
    EXPECT_EQ(engine.mixPointer, &handler.mixParameters);
    EXPECT_EQ(engine.handlerSlot, 1);
}

TEST_F(EngineLoadTest, FillsTheSettings) {
    InstanceHandler handler(rate, frames);
    handler.fading = false;
    handler.auralisation = true;
    handler.doppler = true;
    handler.settingsFloatA = 0.25f;
    handler.settingsFloatB = 0.5f;
    // What an earlier load or a test left must not get through.
    handler.qualityIn = 7;
    handler.hpTFSelectIn = 3;
    handler.limitThetaIn = 15;
    handler.engineSettings.qvInterpolateFilters = 1;
    handler.engineSettings.limitPhi = 10;
    bypass3DAudio = 1;
    const EngineSettings& s = load(handler, 5).settings;
    EXPECT_EQ(s.qvInterpolateSpectra, 0);
    EXPECT_EQ(s.qvInterpolateFilters, 0);
    EXPECT_EQ(s.qvEarlyReflections, 0);
    EXPECT_EQ(s.qvFlexReflections, 1);
    EXPECT_EQ(s.qvSmoothSteps, 0);
    EXPECT_EQ(s.fading, 0);
    EXPECT_EQ(s.qvTrackDirection, 1);
    EXPECT_EQ(s.qvUse256HRIR, 0);
    EXPECT_EQ(s.qvUpdateInterval, 1);
    EXPECT_EQ(s.qvHpTFcompSelect, 0);
    EXPECT_EQ(s.atmoSelect, 0);
    EXPECT_EQ(s.limitPhi, 180);
    EXPECT_EQ(s.limitTheta, 90);
    EXPECT_EQ(s.alwaysUpdateFilter, 1);
    EXPECT_EQ(s.sampleRate, rate);
    EXPECT_EQ(s.debugDump, 0);
    EXPECT_EQ(s.debugDumpName, "");
    EXPECT_EQ(s.settingsReserved, 1);
    EXPECT_EQ(s.defaultFirSize, 4096);
    EXPECT_EQ(s.doppler, 1);
    EXPECT_EQ(s.dopplerScale, 1.0f);
    EXPECT_EQ(s.auralisation, 1);
    EXPECT_EQ(s.bypass3DAudio, 1);
    EXPECT_EQ(s.settingsFloatA, 0.25f);
    EXPECT_EQ(s.settingsFloatB, 0.5f);
    EXPECT_EQ(fakeEngines().last().qualityValue, 0);
}

TEST_F(EngineLoadTest, AReverbHandlerAsksForUpdatesOnChangeOnly) {
    InstanceHandler handler(rate, frames);
    handler.alwaysUpdateFilter = false;
    EXPECT_EQ(load(handler, 5).settings.alwaysUpdateFilter, 0);
}

TEST_F(EngineLoadTest, RoomsDecideReflectionsAndTail) {
    struct Case {
        int room;
        bool reverb;
        int reflections;
        int tail;
    };
    const Case cases[] = {
        {0, true, 0, 0},    {1, true, 0, 0},   {2, true, 11, 0},   {2, false, 11, 0},
        {4, true, 30, 30},  {4, false, 30, 0}, {51, true, 50, 50}, {52, true, 0, 0},
        {53, true, 0, 0},   {60, true, 0, 0},  {9, true, 25, 25},  {15, true, 0, 0},
        {1000, true, 0, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE("room " + std::to_string(c.room));
        InstanceHandler handler(rate, frames);
        handler.reverbActive = c.reverb;
        const EngineSettings& s = load(handler, c.room).settings;
        EXPECT_EQ(s.earlyFlexRefPreset, c.reflections);
        EXPECT_EQ(s.qvReverb, c.tail);
        EXPECT_EQ(essError, essErrorNone) << "no room is no failure";
    }
}

TEST_F(EngineLoadTest, DisablingTheReverbKeepsTheReflections) {
    InstanceHandler handler(rate, frames);
    load(handler, 9);
    handler.reverbActive = false;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    EXPECT_FALSE(handler.checkForChanges(rate, frames));
    EXPECT_EQ(fakeEngines().last().settings.earlyFlexRefPreset, 25);
    EXPECT_EQ(fakeEngines().last().settings.qvReverb, 0);
}

TEST_F(EngineLoadTest, LatchesTheInputsUnscaled) {
    InstanceHandler handler(rate, frames);
    handler.azimuth = -37.9f;
    handler.elevation = 12.9f;
    handler.distance = 3.5f;
    handler.distanceScale = 2.0f;
    handler.angleExponent = 3.0f;
    handler.masterGainDb = -20.0f;
    handler.gainDb = -20.0f;
    const FakeEngine& engine = load(handler, 5);
    EXPECT_EQ(engine.phiAtConstruction, -37);
    EXPECT_EQ(engine.thetaAtConstruction, 12);
    EXPECT_EQ(engine.distanceAtConstruction, 3.5f);
    EXPECT_EQ(engine.gainDbAtConstruction, 0.0f);
}

TEST_F(EngineLoadTest, LatchesWhatItLoadedWith) {
    InstanceHandler handler(rate, frames);
    handler.auralisation = true;
    handler.reverbActive = false;
    bypass3DAudio = 1;
    load(handler, 5, 44100, 256);
    EXPECT_EQ(handler.sampleRate, 44100);
    EXPECT_EQ(handler.blocklenght, 256);
    EXPECT_EQ(handler.roomPresetIn, 5);
    EXPECT_TRUE(handler.fadingIn);
    EXPECT_TRUE(handler.auralisationIn);
    EXPECT_FALSE(handler.dopplerIn);
    EXPECT_FALSE(handler.reverbActiveIn);
    EXPECT_EQ(handler.bypass3DAudioIn, 1);
}

TEST_F(EngineLoadTest, PutsTheGainsBackAndKeepsTheOtherMixValues) {
    InstanceHandler handler(rate, frames);
    handler.mixParameters.directGain = 0.1f;
    handler.mixParameters.earlyGain = 0.2f;
    handler.mixParameters.reverbGain = 0.3f;
    handler.mixParameters.unityDistance = 1;
    handler.mixParameters.roomSize = 0.5f;
    const MixParameters& mix = load(handler, 5).mixAtConstruction;
    EXPECT_EQ(mix.directGain, 1.0f);
    EXPECT_EQ(mix.earlyGain, 1.0f);
    EXPECT_EQ(mix.reverbGain, 1.0f);
    EXPECT_EQ(mix.unityDistance, 1);
    EXPECT_EQ(mix.roomSize, 0.5f);
}

TEST_F(EngineLoadTest, TakesTheRoomsValuesOver) {
    fakeEngines().atConstruction = [](FakeEngine&, LiveControls& controls) {
        controls.reflectionLP_Fc = 7000.0f;
        controls.reflectionLP2_Fc = 1.0f;
        controls.reverbLP_Fc = 9000.0f;
        controls.roomDistances = {3.0f, 1.5f, 4.0f, 5.0f, 6.0f, -1.0f};
    };
    InstanceHandler handler(rate, frames);
    handler.reflectionLP = 1234.0f;
    handler.reverbLP = 2345.0f;
    load(handler, 5);
    EXPECT_EQ(handler.reflectionLP, 7000.0f);
    EXPECT_EQ(handler.reverbLP, 9000.0f);
    EXPECT_EQ(handler.roomWallCopy, (std::array<float, 6>{3.0f, 1.5f, 4.0f, 5.0f, 6.0f, -1.0f}));
}

TEST_F(EngineLoadTest, AllocatesZeroedBlocksOfTheNewSize) {
    InstanceHandler handler(rate, frames);
    for (const int hostFrames : {2, 64, 4096}) {
        handler.roomPreset = 5;
        ASSERT_TRUE(handler.checkForChanges(rate, hostFrames));
        for (int i = 0; i < 2 * hostFrames; ++i) {
            ASSERT_EQ(handler.inputBlock[i], 0.0f);
            ASSERT_EQ(handler.outputBlock[i], 0.0f);
        }
        std::fill_n(handler.inputBlock, 2 * hostFrames, 1.0f);
        std::fill_n(handler.outputBlock, 2 * hostFrames, 1.0f);
    }
}

TEST_F(EngineLoadTest, IsMutedAndNotLoadedWhileItBuilds) {
    InstanceHandler handler(rate, frames);
    int constructions = 0;
    fakeEngines().atConstruction = [&](FakeEngine&, LiveControls&) {
        EXPECT_TRUE(handler.internalMute);
        EXPECT_FALSE(handler.isLoaded);
        ++constructions;
    };
    load(handler, 5);
    EXPECT_FALSE(handler.internalMute);
    EXPECT_TRUE(handler.isLoaded);
    load(handler, 6);
    EXPECT_EQ(constructions, 2);
}

TEST_F(EngineLoadTest, AnnouncesTheLoad) {
    InstanceHandler handler(rate, frames);
    log.clear();
    load(handler, 5, 44100, 512);
    EXPECT_EQ(log.output(),
              "Tessaly_h: Loading instance = 1 samplerate = 44100 buffersize = 512 preset = 5\n");
    EXPECT_EQ(log.error(), "");
}

TEST_F(EngineLoadTest, ReportsAFailureAndKeepsTheEngine) {
    fakeEngines().atConstruction = [](FakeEngine&, LiveControls&) { essError = -103; };
    InstanceHandler handler(rate, frames);
    log.clear();
    load(handler, 5);
    EXPECT_EQ(log.errorLines(),
              (std::vector<std::string>{"Tessaly_h: ERROR code -103",
                                        "Tessaly_h: Load Engine with error: -103"}));
    EXPECT_EQ(essError, -103);
    EXPECT_TRUE(handler.isLoaded);
    EXPECT_FALSE(handler.internalMute);
    EXPECT_NE(handler.activeEngine(), nullptr);
}

TEST_F(EngineLoadTest, PutsAnyOtherStateBackToGood) {
    essError = 0;
    InstanceHandler handler(rate, frames);
    log.clear();
    load(handler, 5);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log.error(), "");
}

TEST_F(EngineLoadTest, ComplainsAboutASlotThatDoesNotExistAndGoesOn) {
    InstanceHandler handler(rate, frames);
    load(handler, 5);
    handler.activeInstance = 2;
    EXPECT_EQ(handler.activeEngine(), nullptr);
    log.clear();
    load(handler, 6);
    EXPECT_EQ(log.count(LogStream::output,
                        "Tessaly_h: ERROR to many instances of essCore called! Max number is 2 "
                        "but called 2 now!!!"),
              1u);
    EXPECT_EQ(handler.activeInstance, 0);
    EXPECT_EQ(fakeEngines().aliveCount(), 1u);
}

TEST_F(EngineLoadTest, HoldsNoBlocksForLengthsThatNoEngineTakes) {
    // The engine's block length has 16 bits: 66048 would arrive as 512.
    struct Case {
        int hostFrames;
        int engineFrames;
    };
    const Case cases[] = {{32768, -32768},
                          {66048, 512},
                          {-1, -1},
                          {std::numeric_limits<int>::max(), -1},
                          {std::numeric_limits<int>::min(), 0}};
    fakeEngines().atConstruction = [](FakeEngine& engine, LiveControls&) {
        if (engine.blocklenght <= 0) {
            essError = essErrorBlockSize;
        }
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.hostFrames);
        essError = essErrorNone;
        InstanceHandler handler(rate, c.hostFrames);
        EXPECT_EQ(load(handler, 5, rate, c.hostFrames).blocklenght, c.engineFrames);
        const std::vector<float> in(2 * frames, 0.5f);
        std::vector<float> out(2 * frames, 9.0f);
        EXPECT_EQ(handler.processBlock(in.data(), out.data(), frames, 2, 2), 1);
        EXPECT_EQ(out, std::vector<float>(2 * frames, 0.0f));
        EXPECT_TRUE(fakeEngines().last().blocks.empty());
    }
}

TEST_F(EngineLoadTest, TakesAnglesThatAreNoNumbers) {
    InstanceHandler handler(rate, frames);
    handler.azimuth = std::numeric_limits<float>::quiet_NaN();
    handler.elevation = std::numeric_limits<float>::infinity();
    handler.distance = std::numeric_limits<float>::infinity();
    const FakeEngine& engine = load(handler, 5);
    EXPECT_EQ(engine.phiAtConstruction, 0);
    EXPECT_EQ(engine.thetaAtConstruction, -1) << "the low 16 bits of the largest integer";
    EXPECT_TRUE(std::isinf(engine.distanceAtConstruction));
}

}  // namespace
}  // namespace tessaly::test
