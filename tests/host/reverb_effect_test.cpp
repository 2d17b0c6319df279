// Callbacks of the reverb.
#include "host/reverb_effect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <vector>

#include "base/ess_error.h"
#include "handler/fake_engine.h"
#include "handler/process_fixture.h"
#include "handler/process_state.h"
#include "host/debug_text_capture.h"
#include "host/host_instance.h"
#include "host/reverb_mix_buffers.h"
#include "host/spatializer_effect.h"

namespace tessaly::test {
namespace {

using namespace reverb;

constexpr std::uint32_t rate = 48000;
constexpr std::uint32_t frames = 8;

class ReverbEffectTest : public ProcessFixture {
protected:
    ReverbEffectTest() : host(rate, frames) {
        reverbmixbuffermap.clear();
        EXPECT_EQ(reverbCreate(&host.state), 0);
    }
    ~ReverbEffectTest() override {
        EXPECT_EQ(reverbRelease(&host.state), 0);
        reverbmixbuffermap.clear();
    }

    ReverbEffect& effect() { return *static_cast<ReverbEffect*>(host.state.effectdata); }
    InstanceHandler& handler() { return *effect().handler; }

    void set(int index, float value) {
        EXPECT_EQ(reverbSetFloatParameter(&host.state, index, value), 0) << index;
    }

    std::vector<float> run(std::vector<float> in,
                           int inchannels = 2,
                           int outchannels = 2,
                           std::uint32_t length = frames) {
        std::vector<float> out(length * static_cast<std::size_t>(std::max(outchannels, 0)), 9.0f);
        EXPECT_EQ(
            reverbProcess(&host.state, in.data(), out.data(), length, inchannels, outchannels), 0);
        return out;
    }

    /// Loads an engine for a reverb with ID 5.
    void load(std::uint32_t blocklenght = frames) {
        setAssetPath();
        host.state.dspbuffersize = blocklenght;
        set(P_ROOM_SELECTION, 9.0f);
        set(P_REVERB_ID, 5.0f);
        run(countedSamples(2 * blocklenght), 2, 2, blocklenght);
        ASSERT_TRUE(handler().isLoaded);
    }

    const DebugTextCapture log;
    HostInstance host;
};

const std::vector<float> silence(2 * frames, 0.0f);

TEST_F(ReverbEffectTest, CreateMakesAReturn) {
    EXPECT_EQ(effect().p[P_REVERB_ID], 0.0f);
    EXPECT_EQ(effect().p[P_REVERB_LP], 20000.0f);
    EXPECT_EQ(effect().p[P_ROOM_SIZE], 100.0f);
    EXPECT_FALSE(handler().fading);
    EXPECT_EQ(handler().earlyGainDb, -96.0f);
    EXPECT_EQ(handler().directGainDb, -96.0f);
    EXPECT_FALSE(handler().auralisation);
    EXPECT_TRUE(handler().reverbActive);
    EXPECT_EQ(handler().azimuthIn, 0);
    EXPECT_EQ(handler().distanceIn, 1.0f);
    EXPECT_FALSE(handler().alwaysUpdateFilter);
    EXPECT_EQ(handler().distance, 9.0f);
    EXPECT_EQ(host.spatial.distanceattenuationcallback, nullptr);
    EXPECT_TRUE(fakeEngines().built.empty());
    EXPECT_TRUE(reverbmixbuffermap.empty());
}

TEST_F(ReverbEffectTest, CountsItsInstancesApart) {
    const int first = effect().instanceNo;
    HostInstance other(rate, frames);
    reverbCreate(&other.state);
    EXPECT_EQ(static_cast<ReverbEffect*>(other.state.effectdata)->instanceNo, first + 1);
    EXPECT_EQ(reverbInstanceCount, first + 2);
    reverbRelease(&other.state);
    EXPECT_EQ(reverbInstanceCount, first + 2);
    EXPECT_EQ(reverbRelease(&other.state), 0) << "a second release finds nothing";
}

TEST_F(ReverbEffectTest, IndicesOutsideTheTableAreRefused) {
    for (const int index : {9, 100, -1, std::numeric_limits<int>::min()}) {
        float value = 7.0f;
        EXPECT_EQ(reverbSetFloatParameter(&host.state, index, 3.0f), 1);
        EXPECT_EQ(reverbGetFloatParameter(&host.state, index, &value, nullptr), 1);
        EXPECT_EQ(value, 7.0f);
    }
}

TEST_F(ReverbEffectTest, ParametersReachTheHandlerAndReadBack) {
    set(P_GAIN, -1.5f);
    set(P_REVERB, -2.5f);
    set(P_ROOM_SELECTION, 7.9f);
    set(P_REVERB_LP, 5000.0f);
    set(P_REVERB_LP, 20000.0f);
    set(P_ROOM_SIZE, 75.0f);
    EXPECT_EQ(handler().masterGainDb, -1.5f);
    EXPECT_EQ(handler().reverbGainDb, -2.5f);
    EXPECT_EQ(handler().roomPreset, 7);
    EXPECT_EQ(handler().reverbLP, 5000.0f);
    EXPECT_EQ(handler().roomSize, 0.5f);
    for (const float value : {0.0f, 0.99f, 1.0f, 2.0f}) {
        set(P_MUTE, value);
        set(P_BASS_BOOST, value);
        set(P_BYPASS, value);
        EXPECT_EQ(handler().reverbActive, value < 1.0f);
        EXPECT_EQ(handler().bassBoost, value < 1.0f);
        EXPECT_EQ(handler().bypassExternal, value >= 1.0f);
    }
    for (int index = 0; index < P_COUNT; ++index) {
        const float value = static_cast<float>(index) + 0.75f;
        set(index, value);
        float read = 0.0f;
        char text[2] = "x";
        EXPECT_EQ(reverbGetFloatParameter(&host.state, index, &read, text), 0);
        EXPECT_EQ(read, index == P_REVERB_ID ? 8.0f : value);
        EXPECT_EQ(text[0], '\0');
    }
}

TEST_F(ReverbEffectTest, AnIdMakesMovesAndErasesItsBuffer) {
    set(P_REVERB_ID, 5.7f);
    EXPECT_EQ(effect().p[P_REVERB_ID], 5.0f);
    ASSERT_NE(findMixBuffer(5), nullptr);
    findMixBuffer(5)->front() = 1.0f;
    set(P_REVERB_ID, 5.2f);
    EXPECT_EQ(findMixBuffer(5)->front(), 1.0f);
    set(P_REVERB_ID, 6.0f);
    EXPECT_EQ(findMixBuffer(5), nullptr);
    EXPECT_EQ(findMixBuffer(6)->front(), 1.0f);
    set(P_REVERB_ID, 0.9f);
    EXPECT_TRUE(reverbmixbuffermap.empty());
    EXPECT_EQ(effect().p[P_REVERB_ID], 0.0f);
}

TEST_F(ReverbEffectTest, AnIdIsDefinedForEveryValue) {
    const float infinity = std::numeric_limits<float>::infinity();
    for (const float value :
         {3e9f, -3e9f, infinity, -infinity, 16777217.0f, std::numeric_limits<float>::quiet_NaN()}) {
        set(P_REVERB_ID, value);
        EXPECT_LE(reverbmixbuffermap.size(), 1u) << "the one before is always found again";
    }
    EXPECT_TRUE(reverbmixbuffermap.empty()) << "no number is no ID";
}

TEST_F(ReverbEffectTest, EitherReleaseOfASharedIdErasesIt) {
    HostInstance other(rate, frames);
    reverbCreate(&other.state);
    set(P_REVERB_ID, 5.0f);
    findMixBuffer(5)->front() = 1.0f;
    reverbSetFloatParameter(&other.state, P_REVERB_ID, 5.0f);
    EXPECT_EQ(findMixBuffer(5)->front(), 0.0f) << "the second one clears it";
    reverbRelease(&other.state);
    EXPECT_EQ(findMixBuffer(5), nullptr);
    load();
    set(P_REVERB_ID, 5.0f);
    EXPECT_EQ(run(countedSamples(2 * frames)), silence);
}

TEST_F(ReverbEffectTest, TheFirstTakersReleaseErasesASharedIdUnderTheSecond) {
    auto first = std::make_unique<HostInstance>(rate, frames);
    reverbCreate(&first->state);
    reverbSetFloatParameter(&first->state, P_REVERB_ID, 5.0f);
    load();
    set(P_REVERB_ID, 5.0f);
    reverbRelease(&first->state);
    first.reset();
    EXPECT_EQ(findMixBuffer(5), nullptr);
    EXPECT_EQ(run(countedSamples(2 * frames)), silence) << "the second one has lost its buffer";
    set(P_REVERB_ID, 6.0f);
    ASSERT_NE(findMixBuffer(6), nullptr) << "a new ID is a new buffer";
    EXPECT_EQ(findMixBuffer(5), nullptr);
}

TEST_F(ReverbEffectTest, OtherChannelCountsAreCopiedFlat) {
    load();
    findMixBuffer(5)->front() = 1.0f;
    const std::size_t blocks = fakeEngines().last().blocks.size();
    const std::vector<float> mono = run(countedSamples(frames), 1);
    for (std::size_t i = 0; i < mono.size(); ++i) {
        ASSERT_EQ(mono[i], i < frames ? static_cast<float>(i + 1) : 0.0f);
    }
    EXPECT_EQ(run(countedSamples(6 * frames), 6, 6), countedSamples(6 * frames));
    const std::vector<float> wide = run(countedSamples(2 * frames), 2, 4);
    EXPECT_EQ(wide[2 * frames - 1], static_cast<float>(2 * frames));
    EXPECT_EQ(wide[2 * frames], 0.0f);
    EXPECT_EQ(run({}, 0), silence);
    EXPECT_EQ(run(countedSamples(2 * frames), 2, -1), std::vector<float>());
    EXPECT_EQ(fakeEngines().last().blocks.size(), blocks);
    EXPECT_EQ(findMixBuffer(5)->front(), 1.0f) << "the buffer is left to fill up";
}

TEST_F(ReverbEffectTest, NullBuffersAreTaken) {
    EXPECT_EQ(reverbProcess(&host.state, nullptr, nullptr, frames, 2, 2), 0);
    EXPECT_EQ(reverbProcess(&host.state, nullptr, nullptr, frames, 1, 6), 0);
    load();
    EXPECT_EQ(reverbProcess(&host.state, nullptr, nullptr, frames, 2, 2), 0);
    std::vector<float> out(2 * frames, 9.0f);
    EXPECT_EQ(reverbProcess(&host.state, nullptr, out.data(), frames, 2, 2), 0);
    EXPECT_EQ(out, silence);
}

TEST_F(ReverbEffectTest, RendersTheSendsAtHalfLevelAndEmptiesTheBuffer) {
    load();
    ReverbMixBuffer& mix = *findMixBuffer(5);
    for (std::size_t i = 0; i < frames; ++i) {
        mix[2 * i] = static_cast<float>(i + 1);
    }
    mix[2 * frames] = 77.0f;
    const std::vector<float> out = run(std::vector<float>(2 * frames, 1000.0f));
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(out[2 * i], 0.5f * static_cast<float>(i + 1)) << "the host's input is ignored";
        EXPECT_EQ(mix[2 * i], 0.0f);
    }
    EXPECT_EQ(mix[2 * frames], 77.0f) << "only the block that was taken";
    EXPECT_EQ(effect().lastResult, 1);
}

TEST_F(ReverbEffectTest, EmptiesTheBufferWhateverWasInItBefore) {
    load();
    const auto heard = [&] { return fakeEngines().last().blocks.back().input; };
    ReverbMixBuffer& mix = *findMixBuffer(5);
    for (const int round : {0, 1, 2}) {
        SCOPED_TRACE(round);
        for (const std::size_t slot : {0u, 1u, 2 * frames - 2, 2 * frames - 1}) {
            EXPECT_EQ(run(countedSamples(2 * frames)), silence) << "nobody sends";
            EXPECT_EQ(heard(), silence);
            mix[slot] = 1.0f;
            run(countedSamples(2 * frames));
            EXPECT_EQ(heard()[slot - slot % 2], 0.5f) << slot;
            EXPECT_EQ(mix, ReverbMixBuffer{}) << slot;
        }
        mix[0] = -0.0f;
        run(countedSamples(2 * frames));
        EXPECT_FALSE(std::signbit(mix[0]));
    }
}

TEST_F(ReverbEffectTest, TheRoomStaysNineMetresAhead) {
    load();
    run(countedSamples(2 * frames));
    const FakeBlock& block = fakeEngines().last().blocks.back();
    EXPECT_EQ(block.distanceIn, 9.0f);
    EXPECT_EQ(block.phiIn, 0);
    EXPECT_EQ(block.thetaIn, 0);
    EXPECT_EQ(block.mix.directGain, std::pow(10.0f, -96.0f * 0.05f));
    EXPECT_EQ(block.mix.earlyGain, std::pow(10.0f, -96.0f * 0.05f));
    EXPECT_EQ(block.mix.reverbGain, 1.0f);
    EXPECT_EQ(fakeEngines().last().settings.alwaysUpdateFilter, 0);
    EXPECT_EQ(fakeEngines().last().settings.fading, 0);
    EXPECT_EQ(fakeEngines().last().settings.qvReverb, 25);
}

TEST_F(ReverbEffectTest, WithoutEngineOrIdItIsSilentAndKeepsTheBuffer) {
    set(P_REVERB_ID, 5.0f);
    findMixBuffer(5)->front() = 1.0f;
    EXPECT_EQ(run(countedSamples(2 * frames)), silence) << "not loaded";
    EXPECT_EQ(findMixBuffer(5)->front(), 1.0f);
    load();
    reverbmixbuffermap.erase(5);
    EXPECT_EQ(run(countedSamples(2 * frames)), silence) << "its entry is gone";
    set(P_REVERB_ID, 0.0f);
    EXPECT_EQ(run(countedSamples(2 * frames)), silence) << "no ID";
}

TEST_F(ReverbEffectTest, AMuteLoadsARoomWithoutTail) {
    load();
    set(P_MUTE, 1.0f);
    run(countedSamples(2 * frames));
    EXPECT_EQ(fakeEngines().built.size(), 2u);
    EXPECT_EQ(fakeEngines().last().settings.qvReverb, 0);
    EXPECT_EQ(fakeEngines().last().settings.earlyFlexRefPreset, 25);
}

TEST_F(ReverbEffectTest, ABypassPassesTheSendsOn) {
    load();
    set(P_BYPASS, 1.0f);
    (*findMixBuffer(5))[0] = 3.0f;
    const std::vector<float> out = run(countedSamples(2 * frames));
    EXPECT_EQ(out[0], 3.0f);
    EXPECT_EQ(out[1], 0.0f);
    EXPECT_EQ((*findMixBuffer(5))[0], 0.0f);
}

TEST_F(ReverbEffectTest, AnErrorSilencesItAndEmptiesTheBuffer) {
    load();
    (*findMixBuffer(5))[0] = 3.0f;
    essError = -105;
    EXPECT_EQ(run(countedSamples(2 * frames)), silence);
    EXPECT_EQ((*findMixBuffer(5))[0], 0.0f);
}

TEST_F(ReverbEffectTest, TheHostsBlockSizeBeatsTheScripts) {
    buffersizeReverb = 512;
    buffersizeSpat = 256;
    load();
    EXPECT_EQ(buffersizeReverb, static_cast<int>(frames));
    EXPECT_EQ(buffersizeSpat, 256);
    host.state.dspbuffersize = 0;
    buffersizeReverb = 16;
    run(countedSamples(2 * frames));
    EXPECT_EQ(fakeEngines().last().blocklenght, 16);
}

TEST_F(ReverbEffectTest, TheLargestBlockUsesTheWholeBuffer) {
    constexpr std::uint32_t largest = 4096;
    load(largest);
    findMixBuffer(5)->fill(2.0f);
    const std::vector<float> out = run(std::vector<float>(2 * largest), 2, 2, largest);
    EXPECT_EQ(out[0], 2.0f);
    EXPECT_EQ(out[2 * largest - 2], 2.0f);
    EXPECT_TRUE(std::all_of(findMixBuffer(5)->begin(), findMixBuffer(5)->end(),
                            [](float s) { return s == 0.0f; }));
}

TEST_F(ReverbEffectTest, ALongerBlockIsSilent) {
    constexpr std::uint32_t tooLong = 8192;
    load(tooLong);
    findMixBuffer(5)->fill(2.0f);
    EXPECT_EQ(run(std::vector<float>(2 * tooLong), 2, 2, tooLong),
              std::vector<float>(2 * tooLong, 0.0f));
    EXPECT_TRUE(fakeEngines().last().blocks.empty());
}

TEST_F(ReverbEffectTest, SourcesSendIntoTheRoom) {
    load();
    HostInstance source(rate, frames);
    spatializerCreate(&source.state);
    spatializerSetFloatParameter(&source.state, spatializer::P_REVERB_DISABLE, 1.0f);
    spatializerSetFloatParameter(&source.state, spatializer::P_REVERB_SIZE, 1.0f);
    spatializerSetFloatParameter(&source.state, spatializer::P_SEND_REVERB_ID, 5.0f);
    spatializerSetFloatParameter(&source.state, spatializer::P_REVERB_SEND, 0.0f);
    std::vector<float> in = countedSamples(2 * frames);
    std::vector<float> out(2 * frames);
    for (int twice = 0; twice < 2; ++twice) {
        spatializerProcess(&source.state, in.data(), out.data(), frames, 2, 2);
    }
    const std::vector<float> heard = run(std::vector<float>(2 * frames));
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(heard[2 * i], in[2 * i] + in[2 * i + 1]) << "two sends, half level";
    }
    EXPECT_EQ(run(std::vector<float>(2 * frames)), silence);
    spatializerRelease(&source.state);
    EXPECT_NE(findMixBuffer(5), nullptr) << "a source's end leaves the buffers";
}

TEST_F(ReverbEffectTest, EveryParameterTakesValuesThatAreNoNumbers) {
    load();
    const float infinity = std::numeric_limits<float>::infinity();
    for (const float value : {std::numeric_limits<float>::quiet_NaN(), infinity, -infinity}) {
        for (int index = 0; index < P_COUNT; ++index) {
            set(index, value);
            run(countedSamples(2 * frames));
        }
    }
}

TEST_F(ReverbEffectTest, CallbacksWithoutAnEffectDoNothing) {
    HostInstance empty(rate, frames);
    float value = 7.0f;
    EXPECT_EQ(reverbSetFloatParameter(&empty.state, 0, 1.0f), 1);
    EXPECT_EQ(reverbGetFloatParameter(&empty.state, 0, &value, nullptr), 1);
    std::vector<float> in = countedSamples(2 * frames);
    std::vector<float> out(2 * frames);
    EXPECT_EQ(reverbProcess(&empty.state, in.data(), out.data(), frames, 2, 2), 0);
    EXPECT_EQ(out, in);
}

}  // namespace
}  // namespace tessaly::test
