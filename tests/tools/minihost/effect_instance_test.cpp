// One instance driven block by block, against the stand-in library.
#include "minihost/effect_instance.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <vector>

#include "minihost/plugin_library.h"

namespace tessaly {
namespace {

constexpr std::uint32_t blockLength = 64;

class EffectInstanceTest : public ::testing::Test {
protected:
    const PluginLibrary library{TESSALY_MOCK_PLUGIN};
    EffectInstance instance{library.effect("Tessaly Engine"), 48000, blockLength};
    std::vector<float> in = std::vector<float>(2 * blockLength, 0.5f);
    std::vector<float> out = std::vector<float>(2 * blockLength, -1.0f);

    float attenuationSeenByEffect() {
        using Query = float (*)(const UnityAudioEffectState*);
        const auto query = reinterpret_cast<Query>(library.findSymbol("MockAttenuation"));
        return query(&instance.state());
    }

    void placeAt(double x, double y, double z) {
        Pose source;
        source.position = {x, y, z};
        instance.place(Pose{}, source);
    }
};

TEST_F(EffectInstanceTest, StateDescribesTheHost) {
    const UnityAudioEffectState& state = instance.state();
    EXPECT_EQ(state.structsize, sizeof(UnityAudioEffectState));
    EXPECT_GE(state.structsize, 80u);
    EXPECT_EQ(state.samplerate, 48000u);
    EXPECT_EQ(state.dspbuffersize, blockLength);
    EXPECT_EQ(state.hostapiversion, 0x10300u);
    EXPECT_EQ(state.spatializerdata, &instance.spatializerData());
}

TEST_F(EffectInstanceTest, EffectOfAMixerGroupHasNoSpatializerRecord) {
    EffectInstance group(library.effect("Tessaly Reverb"), 48000, blockLength);
    EXPECT_EQ(group.state().spatializerdata, nullptr);
    EXPECT_EQ(group.processBlock(in.data(), out.data(), blockLength), 0);
    EXPECT_EQ(out[0], 0.5f);
}

TEST_F(EffectInstanceTest, ParametersGoByIndexAndByName) {
    EXPECT_EQ(instance.setParameter(0, -6.0f), 0);
    EXPECT_EQ(instance.parameter("Gain"), -6.0f);
    EXPECT_EQ(instance.setParameter("Direct", -3.0f), 0);
    EXPECT_EQ(instance.parameter(1), -3.0f);
    EXPECT_EQ(instance.setParameter(5, 0.0f), 1);
    EXPECT_EQ(instance.setParameter(-1, 0.0f), 1);
    EXPECT_FALSE(instance.parameter(5).has_value());
    EXPECT_THROW(instance.setParameter("No Such", 0.0f), std::runtime_error);
    EXPECT_THROW(instance.parameter("No Such"), std::runtime_error);
}

TEST_F(EffectInstanceTest, DefaultsAreTheDeclaredOnes) {
    instance.setParameter("Input Channel", 0.5f);
    instance.setParameter("Gain", 3.0f);
    instance.setDefaults();
    EXPECT_EQ(instance.parameter("Input Channel"), -1.0f);
    EXPECT_EQ(instance.parameter("Gain"), 0.0f);
}

TEST_F(EffectInstanceTest, BlockIsProcessedAndTheClockMovesOn) {
    EXPECT_EQ(instance.processBlock(in.data(), out.data(), blockLength), 0);
    EXPECT_EQ(out, in);
    EXPECT_EQ(instance.state().currdsptick, blockLength);
    EXPECT_EQ(instance.state().prevdsptick, 0u);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(instance.state().currdsptick, 2 * blockLength);
    EXPECT_EQ(instance.state().prevdsptick, blockLength);
}

TEST_F(EffectInstanceTest, SourceOnTheRightReachesTheRightEarFirst) {
    placeAt(1.0, 0.0, 0.0);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(out[0], 0.0f);
    EXPECT_EQ(out[1], 0.5f);
    EXPECT_EQ(out[2 * 40], 0.125f);
}

TEST_F(EffectInstanceTest, ListenerTurnedAwayMovesTheSource) {
    Pose listener;
    listener.yaw = 180.0;
    Pose source;
    source.position = {1.0, 0.0, 0.0};
    instance.place(listener, source);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(out[0], 0.5f);
    EXPECT_EQ(out[1], 0.0f);
}

TEST_F(EffectInstanceTest, DistanceCallbackIsAskedBeforeEachBlock) {
    placeAt(0.0, 3.0, 4.0);
    EXPECT_FLOAT_EQ(instance.distance(), 5.0f);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_FLOAT_EQ(attenuationSeenByEffect(), 0.2f);
    EXPECT_FLOAT_EQ(instance.attenuation(), 0.2f);
    placeAt(0.0, 0.0, 0.5);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(attenuationSeenByEffect(), 1.0f);
    placeAt(0.0, 0.0, 8.0);
    instance.setMinimumDistance(2.0f);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(attenuationSeenByEffect(), 0.25f);
}

TEST_F(EffectInstanceTest, AttenuationDoesNotTouchTheAudio) {
    placeAt(0.0, 0.0, 10.0);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(out, in);
}

TEST_F(EffectInstanceTest, CleanBlockAllocatesNothing) {
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(instance.blockAllocations(), 0u);
    EXPECT_EQ(instance.blockReleases(), 0u);
}

TEST_F(EffectInstanceTest, AllocationsInsideTheLibraryAreCounted) {
    instance.setParameter("Misbehave", 1.0f);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(instance.blockAllocations(), 2u);
    EXPECT_EQ(instance.blockReleases(), 2u);
    instance.setParameter("Misbehave", 0.0f);
    instance.processBlock(in.data(), out.data(), blockLength);
    EXPECT_EQ(instance.blockAllocations(), 0u);
}

}  // namespace
}  // namespace tessaly
