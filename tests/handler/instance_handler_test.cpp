// A handler's life and when it loads.
#include "handler/instance_handler.h"

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "handler/fake_engine.h"
#include "handler/no_debug_log.h"
#include "handler/process_fixture.h"
#include "handler/process_state.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

constexpr int rate = 48000;
constexpr int frames = 64;

class InstanceHandlerTest : public ProcessFixture {
protected:
    LogCapture log;
};

TEST_F(InstanceHandlerTest, StartsWaitingWithItsStartValues) {
    setAssetPath();
    const InstanceHandler handler(rate, frames);
    EXPECT_TRUE(fakeEngines().built.empty()) << "no room is selected in construction";
    EXPECT_EQ(handler.activeEngine(), nullptr);
    EXPECT_EQ(handler.activeInstance, 0);
    EXPECT_EQ(handler.nextInstance, 0);
    EXPECT_EQ(handler.otherInstance, 1);
    EXPECT_EQ(handler.processResult, 1);
    EXPECT_FALSE(handler.bypassExternal);
    EXPECT_FALSE(handler.unityDistanceMute);
    EXPECT_TRUE(handler.internalMute);
    EXPECT_FALSE(handler.isLoaded);
    EXPECT_EQ(handler.checkCounter, 0);
    EXPECT_EQ(handler.settingsChanged, 0);
    EXPECT_EQ(handler.azimuthIn, 0);
    EXPECT_EQ(handler.elevationIn, 0);
    EXPECT_EQ(handler.distanceIn, 1.0f);
    EXPECT_EQ(handler.gainDb, 0.0f);
    EXPECT_EQ(handler.sampleRate, 0);
    EXPECT_EQ(handler.blocklenght, 0);
    EXPECT_EQ(handler.roomPreset, -1);
    EXPECT_EQ(handler.roomPresetIn, -1);
    EXPECT_TRUE(handler.fading);
    EXPECT_FALSE(handler.fadingIn);
    EXPECT_FALSE(handler.auralisation);
    EXPECT_FALSE(handler.auralisationIn);
    EXPECT_FALSE(handler.doppler);
    EXPECT_FALSE(handler.dopplerIn);
    EXPECT_TRUE(handler.reverbActive);
    EXPECT_FALSE(handler.reverbActiveIn);
    EXPECT_EQ(handler.bypass3DAudioIn, 0);
    EXPECT_EQ(handler.azimuth, 0.0f);
    EXPECT_EQ(handler.elevation, 0.0f);
    EXPECT_EQ(handler.reverbGainDb, 0.0f);
    EXPECT_EQ(handler.earlyGainDb, 0.0f);
    EXPECT_EQ(handler.masterGainDb, 0.0f);
    EXPECT_EQ(handler.directGainDb, 0.0f);
    EXPECT_EQ(handler.occlusion, 0.0f);
    EXPECT_EQ(handler.occlusionTarget, 0.0f);
    EXPECT_EQ(handler.distance, 9.0f);
    EXPECT_EQ(handler.roomSize, 1.0f);
    EXPECT_EQ(handler.distanceScale, 1.0f);
    EXPECT_EQ(handler.angleExponent, 1.0f);
    EXPECT_EQ(handler.reflectionLP, 20000.0f);
    EXPECT_EQ(handler.reverbLP, 20000.0f);
    EXPECT_FALSE(handler.unityDistance);
    EXPECT_EQ(handler.unityAttenuation, 0.0f);
    EXPECT_EQ(handler.unityReverbMix, 1.0f);
    EXPECT_EQ(handler.earlyFadeThreshold, 0.15f);
    EXPECT_TRUE(handler.bassBoost);
    EXPECT_EQ(handler.inputChannel, 0.0f);
    EXPECT_EQ(handler.occlusionTime, 0.55f);
    EXPECT_EQ(handler.occlusionAttenuationDb, 24.0f);
    for (const float wall : handler.roomWallCopy) {
        EXPECT_EQ(wall, 1.0f);
    }
    EXPECT_EQ(handler.qualityIn, 0);
    EXPECT_EQ(handler.hpTFSelectIn, 0);
    EXPECT_EQ(handler.limitThetaIn, 90);
    EXPECT_EQ(handler.settingsFloatA, 0.0f);
    EXPECT_EQ(handler.settingsFloatB, 0.0f);
    EXPECT_TRUE(handler.alwaysUpdateFilter);
    EXPECT_EQ(handler.inputBlock, nullptr);
    EXPECT_EQ(handler.outputBlock, nullptr);
}

TEST_F(InstanceHandlerTest, NumbersHandlersByThoseAlive) {
    auto first = std::make_unique<InstanceHandler>(rate, frames);
    const InstanceHandler second(rate, frames);
    EXPECT_EQ(first->handlerNumber, 1);
    EXPECT_EQ(second.handlerNumber, 2);
    first.reset();
    EXPECT_EQ(handlerCount, 1);
    const InstanceHandler third(rate, frames);
    EXPECT_EQ(third.handlerNumber, 2) << "numbers are for log text and may repeat";
}

TEST_F(InstanceHandlerTest, InstallsADebugLogEachTime) {
    const int before = debugLogInstallations();
    const InstanceHandler first(rate, frames);
    const InstanceHandler second(rate, frames);
    EXPECT_EQ(debugLogInstallations(), before + 2);
}

TEST_F(InstanceHandlerTest, WaitsQuietlyUntilAllIsKnown) {
    struct Case {
        const char* missing;
        bool path;
        int room;
        int hostRate;
        int hostFrames;
    };
    const Case cases[] = {
        {"path", false, 5, rate, frames},
        {"room", true, -1, rate, frames},
        {"rate", true, 5, 0, frames},
        {"block size", true, 5, rate, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.missing);
        resetProcess();
        if (c.path) {
            setAssetPath();
        }
        InstanceHandler handler(c.hostRate, c.hostFrames);
        handler.roomPreset = c.room;
        for (int block = 0; block < 3; ++block) {
            EXPECT_FALSE(handler.checkForChanges(c.hostRate, c.hostFrames));
        }
        EXPECT_EQ(handler.checkCounter, 0) << "a test that fails is no check";
        EXPECT_FALSE(handler.isLoaded);
        EXPECT_TRUE(fakeEngines().built.empty());

        setAssetPath();
        handler.roomPreset = 5;
        EXPECT_TRUE(handler.checkForChanges(rate, frames));
        EXPECT_TRUE(handler.isLoaded);
    }
}

TEST_F(InstanceHandlerTest, AlternatesSlotsFromTheSecondOn) {
    setAssetPath();
    InstanceHandler handler(rate, frames);
    handler.roomPreset = 5;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    EXPECT_EQ(handler.activeInstance, 1);
    EXPECT_EQ(fakeEngines().last().handlerSlot, 1);
    EXPECT_EQ(handler.instance[0], nullptr);

    ASSERT_TRUE(handler.checkForChanges(rate, 2 * frames));
    EXPECT_EQ(handler.activeInstance, 0);
    EXPECT_EQ(fakeEngines().last().handlerSlot, 0);
    EXPECT_EQ(handler.instance[1], nullptr);
    EXPECT_EQ(fakeEngines().last().aliveBefore, 1u) << "the old engine lives through the load";
    EXPECT_EQ(fakeEngines().aliveCount(), 1u);

    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    EXPECT_EQ(handler.activeInstance, 1);
}

TEST_F(InstanceHandlerTest, ReloadsOnceForEachSetting) {
    struct Setting {
        const char* name;
        std::function<void(InstanceHandler&, int& hostRate, int& hostFrames)> change;
    };
    const Setting settings[] = {
        {"rate", [](InstanceHandler&, int& hostRate, int&) { hostRate = 44100; }},
        {"block size", [](InstanceHandler&, int&, int& hostFrames) { hostFrames = 128; }},
        {"room", [](InstanceHandler& h, int&, int&) { h.roomPreset = 7; }},
        {"fading", [](InstanceHandler& h, int&, int&) { h.fading = false; }},
        {"auralisation", [](InstanceHandler& h, int&, int&) { h.auralisation = true; }},
        {"doppler", [](InstanceHandler& h, int&, int&) { h.doppler = true; }},
        {"reverb", [](InstanceHandler& h, int&, int&) { h.reverbActive = false; }},
        {"3D bypass", [](InstanceHandler&, int&, int&) { bypass3DAudio = 1; }},
    };
    for (const Setting& setting : settings) {
        SCOPED_TRACE(setting.name);
        resetProcess();
        setAssetPath();
        InstanceHandler handler(rate, frames);
        handler.roomPreset = 5;
        int hostRate = rate;
        int hostFrames = frames;
        ASSERT_TRUE(handler.checkForChanges(hostRate, hostFrames));
        ASSERT_FALSE(handler.checkForChanges(hostRate, hostFrames));
        setting.change(handler, hostRate, hostFrames);
        EXPECT_TRUE(handler.checkForChanges(hostRate, hostFrames));
        EXPECT_EQ(handler.settingsChanged, 0);
        EXPECT_FALSE(handler.checkForChanges(hostRate, hostFrames));
        EXPECT_EQ(handler.checkCounter, 1);
        EXPECT_EQ(fakeEngines().built.size(), 2u);
    }
}

TEST_F(InstanceHandlerTest, KeepsItsEngineForLiveValues) {
    setAssetPath();
    InstanceHandler handler(rate, frames);
    handler.roomPreset = 5;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    handler.masterGainDb = -6.0f;
    handler.directGainDb = -6.0f;
    handler.earlyGainDb = -6.0f;
    handler.reverbGainDb = -6.0f;
    handler.angleExponent = 2.0f;
    handler.distanceScale = 2.0f;
    handler.occlusionTarget = 1.0f;
    handler.inputChannel = 1.0f;
    handler.reflectionLP = 500.0f;
    handler.reverbLP = 500.0f;
    handler.roomSize = 0.0f;
    handler.bassBoost = false;
    handler.bypassExternal = true;
    handler.unityDistance = true;
    EXPECT_FALSE(handler.checkForChanges(rate, frames));
    EXPECT_EQ(fakeEngines().built.size(), 1u);
}

TEST_F(InstanceHandlerTest, EveryHandlerFollowsThe3DBypass) {
    setAssetPath();
    InstanceHandler first(rate, frames);
    InstanceHandler second(rate, frames);
    first.roomPreset = 5;
    second.roomPreset = 5;
    ASSERT_TRUE(first.checkForChanges(rate, frames));
    ASSERT_TRUE(second.checkForChanges(rate, frames));
    bypass3DAudio = 1;
    EXPECT_TRUE(first.checkForChanges(rate, frames));
    EXPECT_TRUE(second.checkForChanges(rate, frames));
    EXPECT_EQ(fakeEngines().last().settings.bypass3DAudio, 1);
}

TEST_F(InstanceHandlerTest, HandlersShareNoEngine) {
    setAssetPath();
    InstanceHandler first(rate, frames);
    InstanceHandler second(rate, frames);
    first.roomPreset = 5;
    second.roomPreset = 5;
    ASSERT_TRUE(first.checkForChanges(rate, frames));
    ASSERT_TRUE(second.checkForChanges(rate, frames));
    EXPECT_EQ(fakeEngines().last().handlerSlot, 1) << "each starts with its own second slot";
    EXPECT_NE(first.activeEngine(), second.activeEngine());
    EXPECT_EQ(fakeEngines().aliveCount(), 2u);
}

TEST_F(InstanceHandlerTest, ARoomTakenBackKeepsTheEngine) {
    setAssetPath();
    InstanceHandler handler(rate, frames);
    handler.roomPreset = 5;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    handler.roomPreset = -3;
    EXPECT_FALSE(handler.checkForChanges(rate, frames));
    EXPECT_TRUE(handler.isLoaded);
    EXPECT_EQ(fakeEngines().aliveCount(), 1u);
}

TEST_F(InstanceHandlerTest, ARoomBeyondSixteenBitsLoadsOnce) {
    setAssetPath();
    InstanceHandler handler(rate, frames);
    handler.roomPreset = std::numeric_limits<int>::max();
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    EXPECT_EQ(fakeEngines().last().settings.earlyFlexRefPreset, 0);
    EXPECT_FALSE(handler.checkForChanges(rate, frames));
}

TEST_F(InstanceHandlerTest, LoadsInEveryBlockThatDiffersForLongerThanItsCounter) {
    setAssetPath();
    InstanceHandler handler(rate, frames);
    handler.roomPreset = 5;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    handler.checkCounter = std::numeric_limits<std::int16_t>::max();
    EXPECT_TRUE(handler.checkForChanges(rate, 2 * frames));
    EXPECT_TRUE(handler.checkForChanges(rate, 2 * frames)) << "the wrapped counter asks for a load";
    EXPECT_LT(handler.checkCounter, 0);
}

TEST_F(InstanceHandlerTest, DestroysTheEngineInUseLast) {
    setAssetPath();
    auto handler = std::make_unique<InstanceHandler>(rate, frames);
    handler->roomPreset = 5;
    ASSERT_TRUE(handler->checkForChanges(rate, frames));
    const FakeEngine* inUse = &fakeEngines().last();
    handler->instance[0] = std::make_unique<SpatialEngine>(
        "second", "", frames, &handler->azimuthCell, &handler->elevationCell,
        &handler->distanceCell, &handler->gainCell, std::int16_t{0}, &handler->engineSettings,
        &handler->mixParameters, std::int16_t{0});
    handler.reset();
    ASSERT_EQ(fakeEngines().destroyed.size(), 2u);
    EXPECT_EQ(fakeEngines().destroyed[0]->instanceName, "second");
    EXPECT_EQ(fakeEngines().destroyed[1], inUse);
}

TEST_F(InstanceHandlerTest, AFailureOfOneIsNotClearedByAnother) {
    setAssetPath();
    fakeEngines().atConstruction = [](FakeEngine& engine, LiveControls&) {
        if (engine.blocklenght == 100) {
            essError = essErrorBlockSize;
        }
    };
    InstanceHandler good(rate, frames);
    InstanceHandler bad(rate, 100);
    good.roomPreset = 5;
    bad.roomPreset = 5;
    ASSERT_TRUE(good.checkForChanges(rate, frames));
    ASSERT_TRUE(bad.checkForChanges(rate, 100));
    EXPECT_TRUE(bad.isLoaded);
    EXPECT_FALSE(bad.internalMute);
    good.roomPreset = 6;
    ASSERT_TRUE(good.checkForChanges(rate, frames));
    EXPECT_EQ(essError, essErrorBlockSize);
}

}  // namespace
}  // namespace tessaly::test
