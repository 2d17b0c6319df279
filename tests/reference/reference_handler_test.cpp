// The reference's handler and effect against worked examples: angles, occlusion, levels, reloads.
#include "support/reference/reference_handler.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "support/reference/reference_spatializer.h"

namespace tessaly::reference {
namespace {

double oneTap(int, int frame, int ear) { return frame == 0 ? 1.0 + ear : 0.0; }

struct HandlerRig {
    Process process;
    Handler handler{process};
    std::vector<double> out;

    HandlerRig() { process.hrirSource = setOf(oneTap); }

    void play(int blockSize = 1024, int rate = 48000) {
        const std::vector<double> input(static_cast<std::size_t>(2 * blockSize), 0.25);
        handler.checkForChanges(rate, blockSize);
        handler.processBlock(std::span<const double>(input), blockSize, 2, out);
    }
};

TEST(ReferenceHandler, AngleBendsTheFrontQuadrantsOnly) {
    HandlerRig rig;
    const auto bent = [&](float azimuth, float exponent) {
        rig.handler.azimuth = azimuth;
        rig.handler.angleExponent = exponent;
        rig.play();
        return rig.handler.inputs().azimuth;
    };
    rig.handler.roomPreset = 0;
    EXPECT_EQ(bent(45.0f, 2.0f), 22);
    EXPECT_EQ(bent(-45.0f, 2.0f), -22);
    EXPECT_EQ(bent(120.0f, 2.0f), 120);
    EXPECT_EQ(bent(90.0f, 2.0f), 90);
    EXPECT_EQ(bent(89.9f, 0.5f), 89);
    EXPECT_EQ(bent(45.9f, 1.005f), 45);
    EXPECT_EQ(bent(-45.9f, 1.0f), -45);
}

TEST(ReferenceHandler, FullOcclusionTakesTwentySixBlocks) {
    HandlerRig rig;
    rig.handler.roomPreset = 0;
    rig.handler.occlusionTarget = 1.0f;
    rig.play();
    EXPECT_NEAR(rig.handler.occlusion, 0.0388, 1e-4);
    int blocks = 1;
    while (rig.handler.occlusion < 1.0f && blocks < 100) {
        rig.play();
        ++blocks;
    }
    EXPECT_EQ(blocks, 26);
    EXPECT_EQ(rig.handler.inputs().gainDb, -24.0f);
    rig.handler.occlusionTarget = 0.0f;
    for (int i = 0; i < 26; ++i) {
        rig.play();
    }
    EXPECT_EQ(rig.handler.inputs().gainDb, 0.0f);
}

TEST(ReferenceHandler, HostDistanceReplacesTheLaw) {
    HandlerRig rig;
    rig.handler.roomPreset = 0;
    rig.handler.unityDistance = true;
    rig.handler.unityAttenuation = 0.075f;
    rig.handler.unityReverbMix = 0.25f;
    rig.play();
    EXPECT_NEAR(rig.handler.mix().direct, 0.075, 1e-7);
    EXPECT_NEAR(rig.handler.mix().early, 0.5, 1e-6);
    EXPECT_NEAR(rig.handler.mix().reverb, 0.25, 1e-12);
    EXPECT_EQ(rig.handler.engine()->directGain(), 1.0);
}

TEST(ReferenceHandler, RoomsByTable) {
    EXPECT_EQ(roomPresetOf(0), 0);
    EXPECT_EQ(roomPresetOf(2), 11);
    EXPECT_EQ(roomPresetOf(5), 16);
    EXPECT_EQ(roomPresetOf(51), 50);
    EXPECT_EQ(roomPresetOf(52), 0);
    EXPECT_EQ(roomPresetOf(53), 0);
    EXPECT_EQ(roomPresetOf(-1), 0);
}

TEST(ReferenceHandler, ReloadsOnAChangeAndKeepsTheStoredSet) {
    HandlerRig rig;
    rig.play();
    EXPECT_FALSE(rig.handler.isLoaded());
    rig.handler.roomPreset = 0;
    rig.play();
    ASSERT_TRUE(rig.handler.isLoaded());
    EXPECT_EQ(rig.handler.engine()->instanceNumber(), 0);
    EXPECT_EQ(rig.process.hrirs.stride, 139);
    rig.play(512, 24000);
    EXPECT_EQ(rig.handler.engine()->instanceNumber(), 1);
    EXPECT_EQ(rig.handler.engine()->hrirLength(), 70);
    EXPECT_EQ(rig.process.hrirs.stride, 139);
    EXPECT_EQ(rig.process.engineCount, 1);
    EXPECT_FALSE(rig.handler.checkForChanges(24000, 512));
    rig.handler.reverbActive = false;
    EXPECT_TRUE(rig.handler.checkForChanges(24000, 512));
}

TEST(ReferenceHandler, RendersBypassesAndFallsSilent) {
    HandlerRig rig;
    rig.handler.roomPreset = 0;
    rig.handler.distance = 1.0f;
    rig.play();
    double peak = 0.0;
    for (const double x : rig.out) {
        peak = std::max(peak, std::abs(x));
    }
    EXPECT_GT(peak, 0.05);
    rig.handler.bypassExternal = true;
    rig.play();
    EXPECT_EQ(rig.out, std::vector<double>(2048, 0.25));
    rig.process.essError = -110;
    rig.play();
    EXPECT_EQ(rig.out, std::vector<double>(2048, 0.0));
}

TEST(ReferenceSpatializer, DirectionFromMatrices) {
    std::array<float, 16> listener{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1};
    std::array<float, 16> source = listener;
    const auto at = [&](float x, float y, float z) {
        source[12] = x;
        source[13] = y;
        source[14] = z;
        return directionOf(listener, source);
    };
    EXPECT_NEAR(at(0.0f, 0.0f, 0.0f).azimuth, 90.0f, 1e-4f);
    EXPECT_EQ(at(0.0f, 0.0f, 0.0f).elevation, 0.0f);
    EXPECT_NEAR(at(-1.0f, 0.0f, 0.0005f).azimuth, -90.0f, 1e-4f);
    EXPECT_NEAR(at(1.0f, 0.0f, 1.0f).azimuth, 45.0f, 1e-4f);
    EXPECT_NEAR(at(0.0f, 0.0f, -1.0f).azimuth, 180.0f, 1e-4f);
    EXPECT_GT(at(0.0f, 5.0f, 0.0f).elevation, 89.9f);
    EXPECT_LT(at(0.0f, 5.0f, 0.0f).elevation, 90.0f);
    listener[12] = 3.0f;  // the listener's frame lies 3 metres to the left of the world's
    EXPECT_NEAR(at(0.0f, 0.0f, 3.0f).azimuth, 45.0f, 1e-4f);
}

TEST(ReferenceSpatializer, SendsCutLevelsToWholeDecibelsAndOnlyFillEvenSlots) {
    Process process;
    process.hrirSource = setOf(oneTap);
    process.mixBuffers[5].assign(8192, 0.0);
    process.mixBuffers[7].assign(8192, 0.0);
    Spatializer effect(process);
    effect.setParameter(17, 2.0f);
    effect.setParameter(18, 5.0f);
    effect.setParameter(19, -6.9f);
    effect.setParameter(18, 7.0f);
    effect.setParameter(19, 0.0f);
    effect.setParameter(18, 9.0f);
    const std::array<float, 16> unit{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1};
    const std::vector<float> input(128, 0.5f);
    std::vector<double> out;
    effect.process(unit, unit, input, 64, 2, 48000, 64, out);
    EXPECT_EQ(process.mixBuffers[5][0], 0.0);  // its own reverb is on
    effect.setParameter(10, 1.0f);
    effect.process(unit, unit, input, 64, 2, 48000, 64, out);
    EXPECT_NEAR(process.mixBuffers[5][126], std::pow(10.0, -0.3), 1e-12);
    EXPECT_NEAR(process.mixBuffers[7][0], 1.0, 1e-12);
    EXPECT_EQ(process.mixBuffers[7][1], 0.0);
    EXPECT_EQ(process.mixBuffers[7][128], 0.0);
}

}  // namespace
}  // namespace tessaly::reference
