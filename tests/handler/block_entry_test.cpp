// One block through a handler.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdint>
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
constexpr int frames = 8;
constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

/// 1, 2, 3 ... so that every sample tells where it came from.
std::vector<float> counted(std::size_t count) {
    std::vector<float> samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        samples[i] = static_cast<float>(i + 1);
    }
    return samples;
}

class BlockEntryTest : public ProcessFixture {
protected:
    explicit BlockEntryTest(int blocklenght = frames) : handler(rate, blocklenght) {
        setAssetPath();
        handler.roomPreset = 0;
        handler.checkForChanges(rate, blocklenght);
        log.clear();
    }

    /// One stereo block of ones.
    const FakeBlock& block() {
        const std::vector<float> in(2 * static_cast<std::size_t>(handler.blocklenght), 1.0f);
        std::vector<float> out(in.size());
        handler.processBlock(in.data(), out.data(), static_cast<std::uint32_t>(handler.blocklenght),
                             2, 2);
        return fakeEngines().last().blocks.back();
    }

    std::vector<float> run(const std::vector<float>& in,
                           int inchannels,
                           int outchannels = 2,
                           std::uint32_t length = frames) {
        std::vector<float> out(length * static_cast<std::size_t>(outchannels), 9.0f);
        EXPECT_EQ(handler.processBlock(in.data(), out.data(), length, inchannels, outchannels), 1);
        return out;
    }

    InstanceHandler handler;
    LogCapture log;
};

class OcclusionTest : public BlockEntryTest {
protected:
    OcclusionTest() : BlockEntryTest(1024) {}
};

// ---- Position ----

TEST_F(BlockEntryTest, BendsTheFrontQuadrants) {
    struct Case {
        float exponent;
        float azimuth;
        int expected;
    };
    const Case cases[] = {
        {1.0f, 45.9f, 45},     {1.005f, 45.9f, 45}, {1.01f, -45.9f, -45}, {0.99f, 45.9f, 45},
        {2.0f, 45.0f, 22},     {2.0f, -45.0f, -22}, {2.0f, 120.0f, 120},  {2.0f, 90.0f, 90},
        {2.0f, -90.0f, -90},   {2.0f, 0.0f, 0},     {0.5f, 89.9f, 89},    {0.5f, -89.9f, -89},
        {2.0f, -120.7f, -120}, {10.0f, 89.0f, 80},  {10.0f, 45.0f, 0},    {0.1f, 1.0f, 57},
        {2.0f, 180.0f, 180},   {0.5f, 22.5f, 45},   {3.0f, 60.0f, 26},    {3.0f, -60.0f, -26},
    };
    for (const Case& c : cases) {
        handler.angleExponent = c.exponent;
        handler.azimuth = c.azimuth;
        EXPECT_EQ(block().phiIn, c.expected) << c.azimuth << " at exponent " << c.exponent;
    }
}

TEST_F(BlockEntryTest, ScalesTheDistanceAndTruncatesTheElevation) {
    handler.distance = 3.0f;
    handler.distanceScale = 2.5f;
    handler.elevation = -12.9f;
    EXPECT_EQ(block().distanceIn, 7.5f);
    EXPECT_EQ(block().thetaIn, -12);
}

TEST_F(BlockEntryTest, DefinesAnglesThatAreNoNumbers) {
    for (const float exponent : {1.0f, 2.0f, 100.0f, -5.0f, nan, infinity, -infinity}) {
        for (const float azimuth : {0.0f, 45.0f, -45.0f, nan, infinity, -infinity, 1e30f}) {
            handler.angleExponent = exponent;
            handler.azimuth = azimuth;
            handler.elevation = azimuth;
            block();
        }
    }
    handler.angleExponent = 1.0f;
    handler.azimuth = nan;
    handler.elevation = nan;
    EXPECT_EQ(block().phiIn, 0);
    EXPECT_EQ(block().thetaIn, 0);
    handler.azimuth = 30.0f;
    EXPECT_EQ(block().phiIn, 30);
}

TEST_F(BlockEntryTest, KeepsThePositionUpToDateWhileMuted) {
    handler.internalMute = true;
    handler.azimuth = 30.0f;
    handler.elevation = 10.0f;
    handler.distance = 2.0f;
    handler.directGainDb = -20.0f;
    const std::vector<float> in(2 * frames, 1.0f);
    run(in, 2);
    EXPECT_EQ(handler.azimuthIn, 30);
    EXPECT_EQ(handler.elevationIn, 10);
    EXPECT_EQ(handler.distanceIn, 2.0f);
    EXPECT_EQ(handler.mixParameters.directGain, 1.0f) << "mix values wait for the end of the load";
}

// ---- Mix values ----

TEST_F(BlockEntryTest, TurnsLevelsIntoGains) {
    handler.directGainDb = -6.0f;
    handler.earlyGainDb = -96.0f;
    handler.reverbGainDb = 20.0f;
    handler.masterGainDb = 3.0f;
    const FakeBlock& b = block();
    EXPECT_EQ(b.mix.directGain, std::pow(10.0f, -6.0f * 0.05f));
    EXPECT_EQ(b.mix.earlyGain, std::pow(10.0f, -96.0f * 0.05f));
    EXPECT_NEAR(b.mix.reverbGain, 10.0f, 1e-5f);
    EXPECT_EQ(b.gainDb, 3.0f);
    EXPECT_EQ(b.mix.unityDistance, 0);
}

TEST_F(OcclusionTest, MovesByOneStepABlock) {
    handler.occlusionTarget = 1.0f;
    handler.masterGainDb = -2.0f;
    const FakeBlock b = block();
    // 1024 frames of 48000 Hz in 0.55 s.
    EXPECT_NEAR(handler.occlusion, 0.0388, 0.00005);
    ASSERT_EQ(fakeEngines().last().occlusionLevels.size(), 1u);
    EXPECT_EQ(fakeEngines().last().occlusionLevels[0], handler.occlusion);
    EXPECT_EQ(b.gainDb, -2.0f - 24.0f * handler.occlusion);
}

TEST_F(OcclusionTest, LandsOnTheTargetAfterTwentySixBlocks) {
    handler.occlusionTarget = 1.0f;
    for (int i = 0; i < 25; ++i) {
        block();
    }
    EXPECT_LT(handler.occlusion, 1.0f);
    EXPECT_GT(handler.occlusion, 0.96f);
    block();
    EXPECT_EQ(handler.occlusion, 1.0f);
    EXPECT_EQ(block().gainDb, -24.0f);
    EXPECT_EQ(fakeEngines().last().occlusionLevels.size(), 27u) << "set anew in every block";
}

TEST_F(OcclusionTest, ReachingZeroLeavesTheLowPassWhereItWas) {
    handler.occlusionTarget = 1.0f;
    for (int i = 0; i < 30; ++i) {
        block();
    }
    handler.occlusionTarget = 0.0f;
    for (int i = 0; i < 25; ++i) {
        block();
    }
    ASSERT_GT(handler.occlusion, 0.0f);
    const auto& levels = fakeEngines().last().occlusionLevels;
    const std::size_t calls = levels.size();
    EXPECT_EQ(levels.back(), handler.occlusion);
    EXPECT_EQ(block().gainDb, 0.0f);
    EXPECT_EQ(handler.occlusion, 0.0f);
    EXPECT_EQ(levels.size(), calls);
    EXPECT_GT(levels.back(), 0.0f);
}

TEST_F(OcclusionTest, TheStepFollowsBlockLengthAndRate) {
    for (const auto& [hostRate, hostFrames] : {std::pair{24000, 256}, {44100, 512}, {48000, 64}}) {
        handler.occlusion = 0.0f;
        handler.checkForChanges(hostRate, hostFrames);
        handler.occlusionTarget = 1.0f;
        block();
        EXPECT_NEAR(handler.occlusion, hostFrames / (hostRate * 0.55), 1e-6);
    }
}

TEST_F(OcclusionTest, HoldsOnATargetThatIsNoNumberAndRecovers) {
    handler.occlusionTarget = 0.5f;
    for (int i = 0; i < 30; ++i) {
        block();
    }
    handler.occlusionTarget = nan;
    block();
    EXPECT_EQ(handler.occlusion, 0.5f);
    handler.occlusionTarget = infinity;
    block();
    EXPECT_TRUE(std::isfinite(handler.occlusion));
    handler.occlusionTarget = 0.5f;
    block();
    block();
    EXPECT_EQ(handler.occlusion, 0.5f);
}

TEST_F(BlockEntryTest, TakesTheHostsAttenuation) {
    handler.unityDistance = true;
    handler.unityAttenuation = 0.075f;
    handler.unityReverbMix = 0.25f;
    const FakeBlock b = block();
    EXPECT_EQ(b.mix.unityDistance, 1);
    EXPECT_EQ(b.mix.unityAttenuation, 0.075f);
    EXPECT_EQ(b.mix.directGain, 0.075f);
    EXPECT_FLOAT_EQ(b.mix.earlyGain, 0.5f);
    EXPECT_EQ(b.mix.reverbGain, 0.25f);

    handler.unityAttenuation = 0.15f;
    EXPECT_EQ(block().mix.earlyGain, 1.0f) << "reflections fade only below the threshold";
    handler.unityAttenuation = 0.9f;
    EXPECT_EQ(block().mix.earlyGain, 1.0f);

    handler.unityDistance = false;
    const FakeBlock off = block();
    EXPECT_EQ(off.mix.unityDistance, 0);
    EXPECT_EQ(off.mix.unityAttenuation, 0.9f) << "the last value stays in the record";
    EXPECT_EQ(off.mix.directGain, 1.0f);
    EXPECT_EQ(off.mix.reverbGain, 1.0f);
}

TEST_F(BlockEntryTest, WritesTheLiveControls) {
    handler.reflectionLP = 8000.0f;
    handler.reverbLP = 5000.0f;
    handler.bassBoost = false;
    handler.roomSize = 0.4f;
    const FakeBlock b = block();
    EXPECT_EQ(b.controls.reflectionLP_Fc, 8000.0f);
    EXPECT_EQ(b.controls.reflectionLP2_Fc, 4000.0f);
    EXPECT_EQ(b.controls.reverbLP_Fc, 5000.0f);
    EXPECT_FALSE(b.controls.bassBoost);
    EXPECT_EQ(b.controls.roomSizeFactor, 0.4f);
    EXPECT_EQ(b.mix.reverbCutoff, 20000.0f);
    EXPECT_EQ(b.mix.roomSize, 1.0f);
    handler.bassBoost = true;
    EXPECT_TRUE(block().controls.bassBoost);
}

TEST_F(BlockEntryTest, AReverbHandlerKeepsTheComparedValuesUpToDate) {
    handler.alwaysUpdateFilter = false;
    handler.reverbLP = 5000.0f;
    handler.roomSize = 0.4f;
    const FakeBlock b = block();
    EXPECT_EQ(b.mix.reverbCutoff, 5000.0f);
    EXPECT_EQ(b.mix.roomSize, 0.4f);
}

TEST_F(BlockEntryTest, PassesWallsOnOnlyWithAuralisation) {
    const std::array<float, 6> walls = {2.0f, 3.0f, 4.0f, 5.0f, 6.0f, 7.0f};
    const std::array<float, 6> presets = LiveControls{}.roomDistances;
    roomDistances = walls;
    EXPECT_EQ(block().controls.roomDistances, presets);
    roomDistancesSet = true;
    EXPECT_EQ(block().controls.roomDistances, presets);
    handler.auralisation = true;
    EXPECT_EQ(block().controls.roomDistances, walls);
    roomDistances[2] = 8.0f;
    EXPECT_EQ(block().controls.roomDistances[2], 8.0f) << "on every block";
    roomDistancesSet = false;
    roomDistances[2] = 9.0f;
    EXPECT_EQ(block().controls.roomDistances[2], 8.0f);
}

// ---- Render ----

TEST_F(BlockEntryTest, AMonoInputFillsTheEvenSlots) {
    for (int round = 0; round < 3; ++round) {
        const std::vector<float> out = run(counted(frames), 1);
        const FakeBlock& b = fakeEngines().last().blocks.back();
        for (std::size_t i = 0; i < frames; ++i) {
            ASSERT_EQ(b.input[2 * i], static_cast<float>(i + 1));
            ASSERT_EQ(b.input[2 * i + 1], 0.0f);
        }
        EXPECT_EQ(out, b.input) << "the engine's block goes to the host";
    }
}

TEST_F(BlockEntryTest, TheLeftChannelIsCopiedWithItsNeighbour) {
    handler.inputChannel = -1.0f;
    const std::vector<float> in = counted(2 * frames);
    run(in, 2);
    EXPECT_EQ(fakeEngines().last().blocks.back().input, in);
}

TEST_F(BlockEntryTest, ChannelsAreBlended) {
    struct Case {
        float channel;
        float left;
        float right;
    };
    for (const Case& c : {Case{0.0f, 0.5f, 0.5f}, Case{1.0f, 0.0f, 1.0f}, Case{-0.5f, 0.75f, 0.25f},
                          Case{3.0f, -1.0f, 2.0f}}) {
        SCOPED_TRACE(c.channel);
        handler.inputChannel = c.channel;
        const std::vector<float> in = counted(2 * frames);
        run(in, 2);
        const FakeBlock& b = fakeEngines().last().blocks.back();
        for (std::size_t i = 0; i < frames; ++i) {
            ASSERT_EQ(b.input[2 * i], in[2 * i] * c.left + in[2 * i + 1] * c.right);
            ASSERT_EQ(b.input[2 * i + 1], 0.0f);
        }
    }
}

TEST_F(BlockEntryTest, AnInputChannelThatIsNoNumberTakesTheLeft) {
    for (const float channel : {nan, infinity, -infinity, 3e38f}) {
        handler.inputChannel = channel;
        const std::vector<float> in = counted(2 * frames);
        run(in, 2);
        EXPECT_EQ(fakeEngines().last().blocks.back().input, in);
    }
}

TEST_F(BlockEntryTest, ManyChannelsAreReadAsTwo) {
    // Flat, as they lie: the second frame comes from channels 2 and 3 of the first.
    const std::vector<float> in = counted(6 * frames);
    handler.inputChannel = -1.0f;
    run(in, 6);
    const auto& blocks = fakeEngines().last().blocks;
    for (std::size_t i = 0; i < 2 * frames; ++i) {
        ASSERT_EQ(blocks.back().input[i], in[i]);
    }
    handler.inputChannel = 1.0f;
    run(in, 6);
    EXPECT_EQ(blocks.back().input[2], in[3]);
}

TEST_F(BlockEntryTest, NoInputIsSilence) {
    run(counted(2 * frames), 2);
    const std::vector<float> one(1, 7.0f);
    const float* none = one.data() + one.size();  // not null, and nothing to read there
    std::vector<float> out(2 * frames, 9.0f);
    for (const float channel : {-1.0f, 0.0f}) {
        for (const int inchannels : {0, -2}) {
            handler.inputChannel = channel;
            handler.processBlock(none, out.data(), frames, inchannels, 2);
            EXPECT_EQ(fakeEngines().last().blocks.back().input,
                      std::vector<float>(2 * frames, 0.0f));
            run(counted(2 * frames), 2);
        }
        for (const int inchannels : {1, 2, 6}) {
            handler.processBlock(nullptr, out.data(), frames, inchannels, 2);
            EXPECT_EQ(fakeEngines().last().blocks.back().input,
                      std::vector<float>(2 * frames, 0.0f));
            run(counted(2 * frames), 2);
        }
    }
}

TEST_F(BlockEntryTest, RendersWithoutAnOutput) {
    const std::vector<float> in = counted(2 * frames);
    EXPECT_EQ(handler.processBlock(in.data(), nullptr, frames, 2, 2), 1);
    EXPECT_EQ(fakeEngines().last().blocks.size(), 1u);
}

TEST_F(BlockEntryTest, AShorterBlockLeavesTheRestOfTheInputBlock) {
    handler.inputChannel = -1.0f;
    run(counted(2 * frames), 2);
    const std::vector<float> in(2 * 3, -1.0f);
    const std::vector<float> out = run(in, 2, 2, 3);
    std::vector<float> expected = counted(2 * frames);
    std::fill_n(expected.begin(), 6, -1.0f);
    EXPECT_EQ(fakeEngines().last().blocks.back().input, expected);
    EXPECT_EQ(out, in);
}

TEST_F(BlockEntryTest, ALongerBlockIsSilentAndReportedOnceAnEngine) {
    const std::vector<float> in = counted(4 * frames);
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(run(in, 2, 2, 2 * frames), std::vector<float>(4 * frames, 0.0f));
        EXPECT_EQ(run(in, 1, 2, frames + 1), std::vector<float>(2 * frames + 2, 0.0f));
    }
    EXPECT_TRUE(fakeEngines().last().blocks.empty());
    EXPECT_EQ(log.errorLines(),
              (std::vector<std::string>{
                  "Tessaly_h: ERROR block of 16 frames is longer than blocklenght 8"}));
    EXPECT_EQ(log.output(), "");

    handler.roomPreset = 5;
    ASSERT_TRUE(handler.checkForChanges(rate, frames));
    run(in, 2, 2, 2 * frames);
    EXPECT_EQ(log.errorLines().size(), 2u);
    EXPECT_EQ(block().input.size(), 2u * frames) << "a block of the right length sounds again";
}

TEST_F(BlockEntryTest, AnEmptyBlockTouchesNothing) {
    std::vector<float> out(2, 9.0f);
    handler.processBlock(nullptr, out.data(), 0, 2, 2);
    handler.processBlock(nullptr, nullptr, 0, 1, 2);
    EXPECT_EQ(out, std::vector<float>(2, 9.0f));
}

TEST_F(BlockEntryTest, OtherOutputCountsAreReportedAndCopiedFlat) {
    handler.inputChannel = -1.0f;
    const std::vector<float> in = counted(2 * frames);
    const std::vector<float> wide = run(in, 2, 6);
    EXPECT_EQ(log.errorLines(),
              (std::vector<std::string>{"ERROR:getNumInputChannels() != 0 !!!!"}));
    for (std::size_t i = 0; i < wide.size(); ++i) {
        ASSERT_EQ(wide[i], i < in.size() ? in[i] : 0.0f) << "what exists, then zeros";
    }
    const std::vector<float> narrow = run(in, 2, 1);
    for (std::size_t i = 0; i < narrow.size(); ++i) {
        ASSERT_EQ(narrow[i], in[i]);
    }
    std::vector<float> untouched(4, 9.0f);
    handler.processBlock(in.data(), untouched.data(), frames, 2, 0);
    handler.processBlock(in.data(), untouched.data(), frames, 2, -4);
    EXPECT_EQ(untouched, std::vector<float>(4, 9.0f));
}

TEST_F(BlockEntryTest, AFlatCopyOfTheInputEndsWithInputAndBlock) {
    handler.inputChannel = -1.0f;
    // Six outputs ask for 24 floats of a short stereo input that has 8 ...
    const std::vector<float> shortIn(8, 2.0f);
    run(shortIn, 2, 6, 4);
    EXPECT_EQ(fakeEngines().last().blocks.back().input[7], 2.0f);
    EXPECT_EQ(fakeEngines().last().blocks.back().input[8], 0.0f);
    // ... and for 48 of a block that holds 16.
    run(counted(6 * frames), 6, 6);
    EXPECT_EQ(fakeEngines().last().blocks.back().input, counted(2 * frames));
}

TEST_F(BlockEntryTest, AnEmptySlotLeavesTheOutputAndSaysSo) {
    const auto engine = std::move(handler.instance[1]);
    const std::vector<float> out = run(counted(2 * frames), 2);
    EXPECT_EQ(out, std::vector<float>(2 * frames, 9.0f));
    EXPECT_EQ(log.outputLines(),
              (std::vector<std::string>{"ERROR(essCore_plugins): called essCore-Instance 0 not "
                                        "existing (yet) cause pluginIDinc is 0"}));
    handler.occlusionTarget = 1.0f;
    run(counted(2 * frames), 2);
    handler.activeInstance = 7;
    run(counted(2 * frames), 2);
    EXPECT_EQ(log.outputLines().size(), 3u);
    handler.activeInstance = 1;
}

TEST_F(BlockEntryTest, PassesTheActiveSlot) { EXPECT_EQ(block().slot, 1); }

// ---- Bypass ----

TEST_F(BlockEntryTest, ABypassedMonoInputGoesToBothEars) {
    handler.bypassExternal = true;
    const std::vector<float> out = run(counted(frames), 1);
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(out[2 * i], static_cast<float>(i + 1));
        EXPECT_EQ(out[2 * i + 1], static_cast<float>(i + 1));
    }
    EXPECT_TRUE(fakeEngines().last().blocks.empty()) << "the engine rests";
}

TEST_F(BlockEntryTest, ABypassedMonoInputLeavesFurtherChannels) {
    handler.bypassExternal = true;
    const std::vector<float> out = run(counted(frames), 1, 4);
    for (std::size_t i = 0; i < frames; ++i) {
        EXPECT_EQ(out[4 * i], static_cast<float>(i + 1));
        EXPECT_EQ(out[4 * i + 1], static_cast<float>(i + 1));
        EXPECT_EQ(out[4 * i + 2], 9.0f);
        EXPECT_EQ(out[4 * i + 3], 9.0f);
    }
    EXPECT_EQ(run(counted(frames), 1, 1), counted(frames)) << "nor anything past a single one";
    std::vector<float> untouched(1, 9.0f);
    handler.processBlock(counted(frames).data(), untouched.data(), frames, 1, 0);
    EXPECT_EQ(untouched[0], 9.0f);
}

TEST_F(BlockEntryTest, ABypassedStereoInputIsCopied) {
    handler.bypassExternal = true;
    EXPECT_EQ(run(counted(2 * frames), 2), counted(2 * frames));
    // Longer than the engine's block: the engine is not asked.
    EXPECT_EQ(run(counted(8 * frames), 2, 2, 4 * frames), counted(8 * frames));
    EXPECT_EQ(log.error(), "");
}

TEST_F(BlockEntryTest, ABypassReadsNoMoreThanThereIs) {
    handler.bypassExternal = true;
    const std::vector<float> in = counted(2 * frames);
    const std::vector<float> out = run(in, 2, 6);
    for (std::size_t i = 0; i < out.size(); ++i) {
        ASSERT_EQ(out[i], i < in.size() ? in[i] : 0.0f);
    }
    EXPECT_EQ(run({}, 0), std::vector<float>(2 * frames, 0.0f));
    std::vector<float> silent(2 * frames, 9.0f);
    handler.processBlock(nullptr, silent.data(), frames, 1, 2);
    EXPECT_EQ(silent, std::vector<float>(2 * frames, 0.0f));
    handler.processBlock(in.data(), nullptr, frames, 1, 2);
    handler.processBlock(in.data(), nullptr, frames, 2, 2);
}

TEST_F(BlockEntryTest, ABypassGoesOnUpdatingTheMixValues) {
    handler.bypassExternal = true;
    handler.directGainDb = -6.0f;
    run(counted(2 * frames), 2);
    EXPECT_EQ(handler.mixParameters.directGain, std::pow(10.0f, -6.0f * 0.05f));
}

// ---- Silence ----

TEST_F(BlockEntryTest, EachReasonMutesAndBeatsTheBypass) {
    const std::string message =
        "Tessaly_h: WARNING internalMute this buffer due to ErrorCode: 1outbuffer-size 16 length  "
        "8 outchannels 2 sizeof(float)4";
    struct Reason {
        const char* name;
        void (*set)(InstanceHandler&);
        std::string text;
    };
    const Reason reasons[] = {
        {"host attenuation", [](InstanceHandler& h) { h.unityDistanceMute = true; }, message},
        {"load", [](InstanceHandler& h) { h.internalMute = true; }, message},
        {"nothing loaded", [](InstanceHandler& h) { h.isLoaded = false; }, message},
        {"error", [](InstanceHandler&) { essError = -110; },
         "Tessaly_h: WARNING internalMute this buffer due to ErrorCode: -110outbuffer-size 16 "
         "length  8 outchannels 2 sizeof(float)4"},
        {"odd state", [](InstanceHandler&) { essError = 0; },
         "Tessaly_h: WARNING internalMute this buffer due to ErrorCode: 0outbuffer-size 16 "
         "length  8 outchannels 2 sizeof(float)4"},
    };
    for (const bool bypass : {false, true}) {
        for (const Reason& reason : reasons) {
            SCOPED_TRACE(reason.name);
            handler.bypassExternal = bypass;
            reason.set(handler);
            log.clear();
            for (int round = 0; round < 2; ++round) {
                EXPECT_EQ(run(counted(2 * frames), 2), std::vector<float>(2 * frames, 0.0f));
            }
            EXPECT_EQ(log.outputLines(), (std::vector<std::string>{reason.text, reason.text}))
                << "in every muted block";
            EXPECT_EQ(log.error(), "");
            handler.unityDistanceMute = false;
            handler.internalMute = false;
            handler.isLoaded = true;
            essError = essErrorNone;
        }
    }
    EXPECT_TRUE(fakeEngines().last().blocks.empty());
}

TEST_F(BlockEntryTest, AMuteWithoutOutputSaysSo) {
    handler.unityDistanceMute = true;
    handler.processBlock(nullptr, nullptr, frames, 2, 2);
    ASSERT_EQ(log.outputLines().size(), 2u);
    EXPECT_EQ(log.outputLines()[1], "couldn't mute buffer cause outbuffer == NULL");
}

TEST_F(BlockEntryTest, AMuteZeroesAllChannelsOfAnyLength) {
    handler.unityDistanceMute = true;
    EXPECT_EQ(run({}, 2, 6, 100), std::vector<float>(600, 0.0f));
    EXPECT_EQ(log.count(LogStream::output, "length  100 outchannels 6"), 1u);
}

TEST_F(BlockEntryTest, AHalfBuiltEngineTakesOcclusion) {
    fakeEngines().atConstruction = [](FakeEngine&, LiveControls&) { essError = -101; };
    handler.checkForChanges(rate, 100);
    handler.occlusionTarget = 1.0f;
    EXPECT_EQ(run(counted(2 * frames), 2), std::vector<float>(2 * frames, 0.0f));
    EXPECT_EQ(fakeEngines().last().occlusionLevels.size(), 1u);
}

}  // namespace
}  // namespace tessaly::test
