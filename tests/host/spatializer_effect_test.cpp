// Callbacks of the spatializer.
#include "host/spatializer_effect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "handler/fake_engine.h"
#include "handler/process_fixture.h"
#include "handler/process_state.h"
#include "host/debug_text_capture.h"
#include "host/host_instance.h"
#include "host/reverb_mix_buffers.h"

namespace tessaly::test {
namespace {

using namespace spatializer;

constexpr std::uint32_t rate = 48000;
constexpr std::uint32_t frames = 8;
constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

class SpatializerEffectTest : public ProcessFixture {
protected:
    SpatializerEffectTest() : host(rate, frames) {
        reverbmixbuffermap.clear();
        EXPECT_EQ(spatializerCreate(&host.state), 0);
    }
    ~SpatializerEffectTest() override {
        EXPECT_EQ(spatializerRelease(&host.state), 0);
        reverbmixbuffermap.clear();
    }

    SpatializerEffect& effect() { return *static_cast<SpatializerEffect*>(host.state.effectdata); }
    InstanceHandler& handler() { return *effect().handler; }

    void set(int index, float value) {
        EXPECT_EQ(spatializerSetFloatParameter(&host.state, index, value), 0) << index;
    }

    std::vector<float> run(std::vector<float> in,
                           int inchannels,
                           int outchannels = 2,
                           std::uint32_t length = frames) {
        std::vector<float> out(length * static_cast<std::size_t>(std::max(outchannels, 0)), 9.0f);
        EXPECT_EQ(
            spatializerProcess(&host.state, in.data(), out.data(), length, inchannels, outchannels),
            0);
        return out;
    }

    void load() {
        setAssetPath();
        set(P_ROOM_SELECTION, 0.0f);
        run(countedSamples(2 * frames), 2);
        ASSERT_TRUE(handler().isLoaded);
    }

    /// Ready to send: its own reverb off, one send of 0 dB to ID 5.
    void prepareSend() {
        changeMixId(5);
        set(P_REVERB_DISABLE, 1.0f);
        set(P_REVERB_SIZE, 1.0f);
        set(P_SEND_REVERB_ID, 5.0f);
        set(P_REVERB_SEND, 0.0f);
    }

    static void changeMixId(int id) { reverbmixbuffermap[id].fill(0.0f); }

    const DebugTextCapture log;
    HostInstance host;
};

const std::vector<float> silence(2 * frames, 0.0f);

// ---- Create and Release ----

TEST_F(SpatializerEffectTest, CreateStartsWithDefaultsAndNoSends) {
    EXPECT_EQ(host.spatial.distanceattenuationcallback, &spatializerDistanceAttenuation);
    EXPECT_EQ(effect().p[P_INPUT_CHANNEL], -1.0f);
    EXPECT_EQ(effect().p[P_REVERB_LP], 20000.0f);
    EXPECT_EQ(effect().p[P_ANGLE], 1.0f);
    EXPECT_EQ(effect().reverbSendCount, 0);
    EXPECT_EQ(effect().reverbSendPos, 0);
    EXPECT_EQ(handler().inputChannel, 0.0f) << "the handler keeps its own start values";
    EXPECT_TRUE(fakeEngines().built.empty());
}

TEST_F(SpatializerEffectTest, InstancesAreNumberedForEver) {
    const int first = effect().instanceNo;
    HostInstance other(rate, frames);
    spatializerCreate(&other.state);
    EXPECT_EQ(static_cast<SpatializerEffect*>(other.state.effectdata)->instanceNo, first + 1);
    spatializerRelease(&other.state);
    spatializerCreate(&other.state);
    EXPECT_EQ(static_cast<SpatializerEffect*>(other.state.effectdata)->instanceNo, first + 2);
    spatializerRelease(&other.state);
    EXPECT_EQ(other.state.effectdata, nullptr);
    EXPECT_EQ(spatializerRelease(&other.state), 0) << "a second release finds nothing";
}

TEST_F(SpatializerEffectTest, CreateTakesAHostWithoutSpatializerData) {
    HostInstance other(rate, frames);
    other.state.spatializerdata = nullptr;
    EXPECT_EQ(spatializerCreate(&other.state), 0);
    EXPECT_NE(other.state.effectdata, nullptr);
    spatializerRelease(&other.state);
}

TEST_F(SpatializerEffectTest, CreateLeavesTheDataOfOlderHostsAlone) {
    HostInstance older(rate, frames);
    older.state.hostapiversion = 0x10200;
    spatializerCreate(&older.state);
    EXPECT_EQ(older.spatial.distanceattenuationcallback, nullptr);
    spatializerRelease(&older.state);
    HostInstance small(rate, frames);
    small.state.structsize = 79;
    spatializerCreate(&small.state);
    EXPECT_EQ(small.spatial.distanceattenuationcallback, nullptr);
    spatializerRelease(&small.state);
}

TEST_F(SpatializerEffectTest, CallbacksWithoutAnEffectDoNothing) {
    HostInstance empty(rate, frames);
    float value = 7.0f;
    EXPECT_EQ(spatializerSetFloatParameter(&empty.state, 0, 1.0f), 1);
    EXPECT_EQ(spatializerGetFloatParameter(&empty.state, 0, &value, nullptr), 1);
    EXPECT_EQ(spatializerDistanceAttenuation(&empty.state, 1.0f, 1.0f, &value), 0);
    EXPECT_EQ(value, 7.0f);
    std::vector<float> in = countedSamples(2 * frames);
    std::vector<float> out(2 * frames, 9.0f);
    EXPECT_EQ(spatializerProcess(&empty.state, in.data(), out.data(), frames, 2, 2), 0);
    EXPECT_EQ(out, silence);
}

// ---- Parameters ----

TEST_F(SpatializerEffectTest, IndicesOutsideTheTableAreRefused) {
    const auto before = effect().p;
    for (const int index :
         {20, 100, -1, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
        float value = 7.0f;
        char text[2] = "x";
        EXPECT_EQ(spatializerSetFloatParameter(&host.state, index, 3.0f), 1);
        EXPECT_EQ(spatializerGetFloatParameter(&host.state, index, &value, text), 1);
        EXPECT_EQ(value, 7.0f);
        EXPECT_EQ(text[0], 'x');
    }
    EXPECT_EQ(effect().p, before);
}

TEST_F(SpatializerEffectTest, EveryParameterReadsBackAsSet) {
    for (int index = 0; index < P_COUNT; ++index) {
        const float value = static_cast<float>(index) + 0.75f;
        set(index, value);
        float read = 0.0f;
        char text[2] = "x";
        EXPECT_EQ(spatializerGetFloatParameter(&host.state, index, &read, text), 0);
        EXPECT_EQ(read, index == P_SEND_REVERB_ID ? 18.0f : value);
        EXPECT_EQ(text[0], '\0');
        EXPECT_EQ(spatializerGetFloatParameter(&host.state, index, nullptr, nullptr), 0);
    }
}

TEST_F(SpatializerEffectTest, ParametersReachTheHandler) {
    set(P_GAIN, -1.5f);
    set(P_DIRECT, -2.5f);
    set(P_EARLY, -3.5f);
    set(P_REVERB, -4.5f);
    set(P_ANGLE, 2.0f);
    set(P_DISTANCE, 0.5f);
    set(P_OCCLUSION, 0.25f);
    set(P_INPUT_CHANNEL, 0.5f);
    set(P_REFLECTION_LP, 4000.0f);
    set(P_REVERB_LP, 5000.0f);
    set(P_ROOM_SELECTION, 7.9f);
    EXPECT_EQ(handler().masterGainDb, -1.5f);
    EXPECT_EQ(handler().directGainDb, -2.5f);
    EXPECT_EQ(handler().earlyGainDb, -3.5f);
    EXPECT_EQ(handler().reverbGainDb, -4.5f);
    EXPECT_EQ(handler().angleExponent, 2.0f);
    EXPECT_EQ(handler().distanceScale, 0.5f);
    EXPECT_EQ(handler().occlusionTarget, 0.25f);
    EXPECT_EQ(handler().inputChannel, 0.5f);
    EXPECT_EQ(handler().reflectionLP, 4000.0f);
    EXPECT_EQ(handler().reverbLP, 5000.0f);
    EXPECT_EQ(handler().roomPreset, 7);
    EXPECT_EQ(effect().p[P_ROOM_SELECTION], 7.9f) << "the host sees what it set";
}

TEST_F(SpatializerEffectTest, SwitchesAreOnFromOne) {
    struct Case {
        float value;
        bool on;
    };
    for (const Case& c : {Case{0.0f, false}, Case{0.99f, false}, Case{1.0f, true}, Case{2.0f, true},
                          Case{-1.0f, false}}) {
        set(P_UNITY_DISTANCE, c.value);
        set(P_AURALIZATION, c.value);
        set(P_REVERB_DISABLE, c.value);
        set(P_BASS_BOOST, c.value);
        set(P_BYPASS, c.value);
        EXPECT_EQ(handler().unityDistance, c.on);
        EXPECT_EQ(handler().auralisation, c.on);
        EXPECT_EQ(handler().reverbActive, !c.on);
        EXPECT_EQ(handler().bassBoost, !c.on);
        EXPECT_EQ(handler().bypassExternal, c.on);
    }
}

TEST_F(SpatializerEffectTest, TheTopOfALowPassIsNotForwarded) {
    for (const int index : {static_cast<int>(P_REFLECTION_LP), static_cast<int>(P_REVERB_LP)}) {
        set(index, 5000.0f);
        set(index, 20000.0f);
        EXPECT_EQ(effect().p[static_cast<std::size_t>(index)], 20000.0f);
        set(index, nan);
    }
    EXPECT_EQ(handler().reflectionLP, 5000.0f);
    EXPECT_EQ(handler().reverbLP, 5000.0f);
}

TEST_F(SpatializerEffectTest, RoomSizeIsWorkedInDouble) {
    for (const float value : {50.0f, 75.0f, 100.0f, 63.3f, 0.0f}) {
        set(P_ROOM_SIZE, value);
        EXPECT_EQ(handler().roomSize,
                  static_cast<float>((static_cast<double>(value) - 50.0) * 0.02));
    }
    set(P_ROOM_SIZE, 75.0f);
    EXPECT_EQ(handler().roomSize, 0.5f);
}

TEST_F(SpatializerEffectTest, RoomNumbersAreDefinedForEveryValue) {
    struct Case {
        float value;
        int room;
    };
    for (const Case& c : {Case{nan, 0}, Case{infinity, std::numeric_limits<int>::max()},
                          Case{-infinity, std::numeric_limits<int>::min()},
                          Case{3e9f, std::numeric_limits<int>::max()}, Case{-0.9f, 0}}) {
        set(P_ROOM_SELECTION, c.value);
        EXPECT_EQ(handler().roomPreset, c.room);
    }
}

TEST_F(SpatializerEffectTest, SendsAreToldInTurn) {
    set(P_REVERB_SIZE, 2.0f);
    set(P_SEND_REVERB_ID, 5.0f);
    set(P_REVERB_SEND, -6.9f);
    set(P_SEND_REVERB_ID, 7.0f);
    set(P_REVERB_SEND, 0.0f);
    set(P_SEND_REVERB_ID, 9.0f);
    EXPECT_EQ(effect().reverbSendCount, 2);
    EXPECT_EQ(effect().reverbSendPos, 2);
    EXPECT_EQ(effect().reverbSendId[0], 5);
    EXPECT_EQ(effect().reverbSendDb[0], -6) << "whole decibels, toward zero";
    EXPECT_EQ(effect().reverbSendId[1], 7);
    EXPECT_EQ(effect().reverbSendDb[1], 0);
    EXPECT_EQ(effect().reverbSendId[2], 9) << "a slot that is not in use";
    EXPECT_EQ(effect().p[P_REVERB_SEND], 0.0f);
    set(P_REVERB_SIZE, 1.0f);
    EXPECT_EQ(effect().reverbSendPos, 0);
}

TEST_F(SpatializerEffectTest, SendsBeyondTheLastPlaceAreIgnored) {
    set(P_REVERB_SIZE, 100.0f);
    for (int i = 0; i < 200; ++i) {
        set(P_SEND_REVERB_ID, static_cast<float>(1000 + i));
        set(P_REVERB_SEND, static_cast<float>(-i));
    }
    EXPECT_EQ(effect().reverbSendId[49], 1049);
    EXPECT_EQ(effect().reverbSendDb[49], -49);
    EXPECT_EQ(effect().reverbSendDb[0], 0) << "what stands behind the first array is untouched";
    EXPECT_EQ(effect().reverbSendCount, 100);
    EXPECT_EQ(effect().reverbSendPos, 50);
    EXPECT_EQ(effect().p[P_SEND_REVERB_ID], 1199.0f);

    set(P_REVERB_DISABLE, 1.0f);
    changeMixId(1049);
    run(countedSamples(2 * frames), 2);
    EXPECT_NE(reverbmixbuffermap[1049][0], 0.0f) << "the first fifty are heard";
    EXPECT_EQ(effect().reverbSends.size(), 50u);
}

// ---- Distance callback ----

TEST_F(SpatializerEffectTest, TheDistanceCallbackListensOnly) {
    host.spatial.reverbzonemix = 0.3f;
    float attenuation = 0.77f;
    EXPECT_EQ(spatializerDistanceAttenuation(&host.state, 12.5f, 0.4f, &attenuation), 0);
    EXPECT_EQ(attenuation, 0.77f);
    EXPECT_EQ(handler().distance, 12.5f);
    EXPECT_EQ(handler().unityAttenuation, 0.4f);
    EXPECT_EQ(handler().unityReverbMix, 0.3f);
    EXPECT_FALSE(handler().unityDistanceMute);
    EXPECT_EQ(spatializerDistanceAttenuation(&host.state, 12.5f, 0.4f, nullptr), 0);
}

TEST_F(SpatializerEffectTest, TheHostsSilenceMutesOnlyWithItsCurve) {
    for (const float attenuation : {0.0f, -1.0f}) {
        handler().unityDistance = false;
        spatializerDistanceAttenuation(&host.state, 1.0f, attenuation, nullptr);
        EXPECT_FALSE(handler().unityDistanceMute);
        handler().unityDistance = true;
        spatializerDistanceAttenuation(&host.state, 1.0f, attenuation, nullptr);
        EXPECT_TRUE(handler().unityDistanceMute);
        spatializerDistanceAttenuation(&host.state, 1.0f, 0.01f, nullptr);
        EXPECT_FALSE(handler().unityDistanceMute);
        spatializerDistanceAttenuation(&host.state, 1.0f, nan, nullptr);
        EXPECT_FALSE(handler().unityDistanceMute);
    }
}

TEST_F(SpatializerEffectTest, TheDistanceCallbackTakesAHostWithoutData) {
    host.state.spatializerdata = nullptr;
    EXPECT_EQ(spatializerDistanceAttenuation(&host.state, 3.0f, 0.5f, nullptr), 0);
    EXPECT_EQ(handler().distance, 3.0f);
    EXPECT_EQ(handler().unityReverbMix, 1.0f);
}

// ---- Pass-through ----

TEST_F(SpatializerEffectTest, AMonoInputPassesToAllChannels) {
    load();
    const auto built = fakeEngines().last().blocks.size();
    const std::vector<float> out = run(countedSamples(frames), 1, 6);
    for (std::size_t i = 0; i < out.size(); ++i) {
        EXPECT_EQ(out[i], static_cast<float>(i / 6 + 1));
    }
    EXPECT_EQ(fakeEngines().last().blocks.size(), built) << "the handler is not asked";
}

TEST_F(SpatializerEffectTest, PassesThroughWhatSaysTooLittle) {
    struct Case {
        const char* name;
        void (*spoil)(UnityAudioEffectState&);
    };
    const Case cases[] = {
        {"data", [](UnityAudioEffectState& s) { s.spatializerdata = nullptr; }},
        {"version", [](UnityAudioEffectState& s) { s.hostapiversion = 0x102FF; }},
        {"size", [](UnityAudioEffectState& s) { s.structsize = 79; }},
    };
    setAssetPath();
    set(P_ROOM_SELECTION, 5.0f);
    prepareSend();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const UnityAudioEffectState good = host.state;
        c.spoil(host.state);
        const std::uint32_t tick = processTick;
        EXPECT_EQ(run(countedSamples(2 * frames), 2), countedSamples(2 * frames));
        EXPECT_EQ(processTick, tick + 1);
        EXPECT_TRUE(fakeEngines().built.empty()) << "no load is attempted";
        EXPECT_EQ(reverbmixbuffermap[5][0], 0.0f) << "nothing is sent";
        EXPECT_EQ(buffersizeSpat, 0);
        host.state = good;
    }
}

TEST_F(SpatializerEffectTest, APassThroughFollowsTheOutputsCount) {
    // More outputs than inputs: what exists, then zeros. Fewer: as the floats lie.
    const std::vector<float> in = countedSamples(2 * frames);
    const std::vector<float> wide = run(in, 2, 6);
    for (std::size_t i = 0; i < wide.size(); ++i) {
        ASSERT_EQ(wide[i], i < in.size() ? in[i] : 0.0f);
    }
    const std::vector<float> many = countedSamples(6 * frames);
    const std::vector<float> narrow = run(many, 6, 1);
    for (std::size_t i = 0; i < narrow.size(); ++i) {
        ASSERT_EQ(narrow[i], many[i]);
    }
    EXPECT_EQ(run({}, 0, 4), std::vector<float>(4 * frames, 0.0f));
    EXPECT_EQ(run(in, 2, 0), std::vector<float>());
    EXPECT_EQ(run(in, 2, -3), std::vector<float>());
    EXPECT_EQ(run(in, 1, -3), std::vector<float>());
}

TEST_F(SpatializerEffectTest, APassThroughTakesNullBuffers) {
    std::vector<float> in = countedSamples(6 * frames);
    std::vector<float> out(6 * frames, 9.0f);
    for (const int inchannels : {1, 2}) {
        EXPECT_EQ(spatializerProcess(&host.state, in.data(), nullptr, frames, inchannels, 6), 0);
        std::fill(out.begin(), out.end(), 9.0f);
        EXPECT_EQ(spatializerProcess(&host.state, nullptr, out.data(), frames, inchannels, 6), 0);
        EXPECT_EQ(out, std::vector<float>(6 * frames, 0.0f));
    }
}

// ---- Process ----

TEST_F(SpatializerEffectTest, IsSilentUntilAllIsKnown) {
    EXPECT_EQ(run(countedSamples(2 * frames), 2), silence) << "no path, no room";
    setAssetPath();
    EXPECT_EQ(run(countedSamples(2 * frames), 2), silence) << "no room";
    EXPECT_TRUE(fakeEngines().built.empty());
    EXPECT_TRUE(log.calls().empty()) << "waiting is quiet";
    set(P_ROOM_SELECTION, 0.0f);
    EXPECT_EQ(run(countedSamples(frames), 1)[0], 1.0f) << "loads and renders in one call";
    EXPECT_EQ(fakeEngines().built.size(), 1u);
    EXPECT_EQ(log.count("Tessaly_h: Loading instance = "), 1u);
}

TEST_F(SpatializerEffectTest, SilenceTakesANullOutput) {
    std::vector<float> in = countedSamples(2 * frames);
    EXPECT_EQ(spatializerProcess(&host.state, in.data(), nullptr, frames, 2, 2), 0);
    load();
    EXPECT_EQ(spatializerProcess(&host.state, in.data(), nullptr, frames, 2, 2), 0);
    EXPECT_EQ(spatializerProcess(&host.state, nullptr, nullptr, frames, 2, 2), 0);
}

TEST_F(SpatializerEffectTest, HandsDirectionAndDistanceOn) {
    load();
    host.place(3.0f, 0.0f, 3.0f);
    spatializerDistanceAttenuation(&host.state, 4.0f, 1.0f, nullptr);
    run(countedSamples(2 * frames), 2);
    const FakeBlock& block = fakeEngines().last().blocks.back();
    EXPECT_EQ(block.phiIn, 45);
    EXPECT_EQ(block.thetaIn, 0);
    EXPECT_EQ(block.distanceIn, 4.0f);
    EXPECT_NEAR(handler().azimuth, 45.0f, 1e-4f);
}

TEST_F(SpatializerEffectTest, TheHostsBlockSizeBeatsTheScripts) {
    setAssetPath();
    set(P_ROOM_SELECTION, 0.0f);
    buffersizeSpat = 512;
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(fakeEngines().last().blocklenght, static_cast<int>(frames));
    EXPECT_EQ(buffersizeSpat, static_cast<int>(frames));
    host.state.dspbuffersize = 0;
    buffersizeSpat = 16;
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(fakeEngines().last().blocklenght, 16) << "where the host gives none";
    EXPECT_EQ(fakeEngines().built.size(), 2u);
}

TEST_F(SpatializerEffectTest, SettingsReloadAtTheNextBlock) {
    load();
    set(P_REVERB_DISABLE, 1.0f);
    EXPECT_EQ(fakeEngines().built.size(), 1u);
    run(countedSamples(2 * frames), 2);
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(fakeEngines().built.size(), 2u);
    host.state.samplerate = 44100;
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(fakeEngines().last().settings.sampleRate, 44100);
}

TEST_F(SpatializerEffectTest, RunsBlocksWithDenormalsFlushed) {
    load();
    volatile float tiny = std::numeric_limits<float>::min();
    float inside = 1.0f;
    fakeEngines().render = [&](const float*, float* output, int) {
        inside = tiny * 0.5f;
        output[0] = 0.0f;
    };
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(inside, 0.0f);
    EXPECT_NE(tiny * 0.5f, 0.0f) << "the caller's mode is back";
}

TEST_F(SpatializerEffectTest, TakesMatricesAndDistancesThatAreNoNumbersAndRecovers) {
    load();
    for (const float value : {nan, infinity, -infinity, std::numeric_limits<float>::max()}) {
        for (int element = 0; element < 16; ++element) {
            const UnityAudioSpatializerData good = host.spatial;
            host.spatial.listenermatrix[element] = value;
            run(countedSamples(2 * frames), 2);
            host.spatial = good;
            host.spatial.sourcematrix[element] = value;
            run(countedSamples(2 * frames), 2);
            host.spatial = good;
        }
        spatializerDistanceAttenuation(&host.state, value, value, nullptr);
        run(countedSamples(2 * frames), 2);
    }
    spatializerDistanceAttenuation(&host.state, 2.0f, 1.0f, nullptr);
    host.place(1.0f, 0.0f, 0.0f);
    run(countedSamples(2 * frames), 2);
    EXPECT_EQ(fakeEngines().last().blocks.back().phiIn, 90);
    EXPECT_EQ(fakeEngines().last().blocks.back().distanceIn, 2.0f);
}

// ---- Sends ----

TEST_F(SpatializerEffectTest, SendsItsDryInput) {
    prepareSend();
    const std::vector<float> in = countedSamples(2 * frames);
    run(in, 2);
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(reverbmixbuffermap[5][2 * i], in[2 * i] + in[2 * i + 1]);
        EXPECT_EQ(reverbmixbuffermap[5][2 * i + 1], 0.0f);
    }
    EXPECT_FALSE(handler().isLoaded) << "whatever the engine's state";
}

TEST_F(SpatializerEffectTest, SendGainsMultiply) {
    prepareSend();
    load();
    fakeEngines().reverbDistanceGain = 0.3f;
    set(P_REVERB_SIZE, 1.0f);
    set(P_SEND_REVERB_ID, 5.0f);
    set(P_REVERB_SEND, -6.9f);
    set(P_REVERB, -3.0f);
    set(P_GAIN, 2.0f);
    changeMixId(5);
    run(countedSamples(frames), 1);
    const float gain = std::pow(10.0f, -6.0f * 0.05f) * std::pow(10.0f, -3.0f * 0.05f) *
                       std::pow(10.0f, 2.0f * 0.05f) * 0.3f;
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(reverbmixbuffermap[5][2 * i], static_cast<float>(i + 1) * gain);
    }
    set(P_UNITY_DISTANCE, 1.0f);
    host.spatial.reverbzonemix = 0.5f;
    spatializerDistanceAttenuation(&host.state, 1.0f, 1.0f, nullptr);
    changeMixId(5);
    run(countedSamples(frames), 1);
    EXPECT_FLOAT_EQ(reverbmixbuffermap[5][0], gain / 0.3f * 0.5f) << "the host's zone mix";
}

TEST_F(SpatializerEffectTest, SendsToEveryReverbThatExists) {
    prepareSend();
    changeMixId(7);
    set(P_REVERB_SIZE, 3.0f);
    for (const auto& [id, level] : {std::pair{5.0f, 0.0f}, {6.0f, 0.0f}, {7.0f, 20.0f}}) {
        set(P_SEND_REVERB_ID, id);
        set(P_REVERB_SEND, level);
    }
    run(std::vector<float>(frames, 1.0f), 1);
    EXPECT_EQ(reverbmixbuffermap[5][0], 1.0f);
    EXPECT_FLOAT_EQ(reverbmixbuffermap[7][0], 10.0f);
    EXPECT_EQ(reverbmixbuffermap.size(), 2u) << "an unknown ID is not created";
}

TEST_F(SpatializerEffectTest, SendsNothingWithoutReason) {
    struct Case {
        const char* name;
        int index;
        float value;
    };
    for (const Case& c :
         {Case{"own reverb", P_REVERB_DISABLE, 0.0f}, Case{"no sends", P_REVERB_SIZE, 0.0f},
          Case{"negative sends", P_REVERB_SIZE, -1.0f}, Case{"bypass", P_BYPASS, 1.0f}}) {
        SCOPED_TRACE(c.name);
        set(P_BYPASS, 0.0f);
        prepareSend();
        set(c.index, c.value);
        run(countedSamples(2 * frames), 2);
        EXPECT_EQ(reverbmixbuffermap[5][0], 0.0f);
    }
}

TEST_F(SpatializerEffectTest, AMutedSourceStillSends) {
    prepareSend();
    load();
    changeMixId(5);
    essError = -110;
    EXPECT_EQ(run(std::vector<float>(2 * frames, 0.5f), 2), silence);
    EXPECT_EQ(reverbmixbuffermap[5][0], 1.0f);
}

TEST_F(SpatializerEffectTest, ALevelThatIsNoNumberDoesNotReachTheReverb) {
    // 770 dB is a finite factor of 3e38: it would overflow one step further on.
    for (const float value : {nan, infinity, 770.0f}) {
        for (const int index : {static_cast<int>(P_GAIN), static_cast<int>(P_REVERB),
                                static_cast<int>(P_REVERB_SEND)}) {
            SCOPED_TRACE(index);
            prepareSend();
            set(P_REVERB_SIZE, 1.0f);
            set(P_SEND_REVERB_ID, 5.0f);
            set(P_REVERB_SEND, 0.0f);
            set(P_REVERB_SIZE, 1.0f);
            set(index, value);
            run(countedSamples(2 * frames), 2);
            for (const float sample : reverbmixbuffermap[5]) {
                ASSERT_LT(std::fabs(sample), 1e6f);
            }
            set(P_GAIN, 0.0f);
            set(P_REVERB, 0.0f);
        }
    }
    prepareSend();
    run(std::vector<float>(2 * frames, 0.5f), 2);
    EXPECT_EQ(reverbmixbuffermap[5][0], 1.0f) << "sends again with proper levels";
}

TEST_F(SpatializerEffectTest, SendsFollowEveryChangeOfLevelsAndInput) {
    prepareSend();
    changeMixId(7);
    const std::vector<float> sound = countedSamples(frames);
    const std::vector<float> nothing(2 * frames, 0.0f);
    std::vector<float> late = nothing;
    late.back() = 1.0f;
    for (const float db : {0.0f, -12.0f, -12.0f, 3.0f, 0.0f}) {
        SCOPED_TRACE(db);
        set(P_REVERB_SIZE, 2.0f);
        for (const auto& [id, level] : {std::pair{5.0f, db}, {7.0f, -db}}) {
            set(P_SEND_REVERB_ID, id);
            set(P_REVERB_SEND, level);
        }
        set(P_GAIN, db * 0.5f);
        const auto gainOf = [&](float level) {
            return std::pow(10.0f, level * 0.05f) * std::pow(10.0f, 0.0f * 0.05f) *
                   std::pow(10.0f, db * 0.5f * 0.05f) * 1.0f;
        };
        changeMixId(5);
        changeMixId(7);
        run(sound, 1);
        run(nothing, 2);
        run(nothing, 1);
        run(late, 2);
        run(sound, 1);
        for (const auto& [id, level] : {std::pair{5, db}, {7, -db}}) {
            const float gain = gainOf(level);
            for (std::size_t i = 0; i < frames; ++i) {
                float wanted = 0.0f;
                wanted += sound[i] * gain;
                wanted += (late[2 * i] + late[2 * i + 1]) * gain;
                wanted += sound[i] * gain;
                EXPECT_EQ(reverbmixbuffermap[id][2 * i], wanted) << id << " at " << i;
                EXPECT_EQ(reverbmixbuffermap[id][2 * i + 1], 0.0f);
            }
        }
    }
}

TEST_F(SpatializerEffectTest, ASendOfALongBlockStaysInItsBuffer) {
    prepareSend();
    const std::uint32_t tooLong = 5000;
    run(std::vector<float>(2 * tooLong, 0.5f), 2, 2, tooLong);
    EXPECT_EQ(reverbmixbuffermap[5][2 * 4095], 1.0f);
}

TEST_F(SpatializerEffectTest, ASourceWithOneBufferForBothDirectionsSendsWhatItRendered) {
    prepareSend();
    load();
    changeMixId(5);
    // A response that rings on in silence.
    fakeEngines().render = [](const float*, float* output, int blocklenght) {
        std::fill_n(output, 2 * blocklenght, 3.0f);
    };
    std::vector<float> both(2 * frames, 0.0f);
    EXPECT_EQ(spatializerProcess(&host.state, both.data(), both.data(), frames, 2, 2), 0);
    EXPECT_EQ(both[0], 3.0f);
    EXPECT_EQ(reverbmixbuffermap[5][0], 6.0f);
}

TEST_F(SpatializerEffectTest, ASendWithoutInputAddsNothing) {
    prepareSend();
    std::vector<float> out(2 * frames, 9.0f);
    EXPECT_EQ(spatializerProcess(&host.state, nullptr, out.data(), frames, 2, 2), 0);
    EXPECT_EQ(reverbmixbuffermap[5][0], 0.0f);
    EXPECT_EQ(out, silence);
}

TEST_F(SpatializerEffectTest, EveryParameterTakesValuesThatAreNoNumbers) {
    load();
    prepareSend();
    for (const float value : {nan, infinity, -infinity, std::numeric_limits<float>::max(),
                              std::numeric_limits<float>::lowest()}) {
        for (int index = 0; index < P_COUNT; ++index) {
            set(index, value);
            run(countedSamples(2 * frames), 2);
        }
    }
    EXPECT_EQ(essError, essErrorNone);
}

}  // namespace
}  // namespace tessaly::test
