// Rooms of the reference, held to what can be worked out by hand.
#include "support/reference/reference_rooms.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>

#include "support/test_data.h"

namespace tessaly::reference {
namespace {

WallScene ordinaryRoom() {
    WallScene scene;
    scene.distance = 1.0f;
    scene.samplesPerMetre = 140.0f;
    scene.earlyFlexRefPreset = 15;
    scene.roomDistances = {2.8f, 1.8f, 3.2f, 2.1f, 2.5f, 3.0f};
    return scene;
}

TEST(ReferenceRooms, RowsAreThoseOfTheLists) {
    const PresetRow row = presetRowOf(15);
    EXPECT_EQ(row.delay, (std::vector<int>{466, 241, 500, 860, 397, 512}));
    EXPECT_EQ(row.earlyPresetGain, 6.5f);
    EXPECT_EQ(row.roomDistances, (std::array<float, 6>{2.8f, 1.8f, 3.2f, 2.1f, 2.5f, 3.0f}));
    EXPECT_TRUE(row.presetUsesFilters);
    EXPECT_EQ(presetRowOf(46).filterClass, (std::vector<int>{0, 0, 0, 0, 0, 0, 0, 0}));
    EXPECT_EQ(presetRowOf(14).filterClass, (std::vector<int>{0, 0, 0, 0, 0, 0, 1, 1, 1, 1}));
    EXPECT_TRUE(presetRowOf(0).delay.empty());
    EXPECT_TRUE(presetRowOf(61).delay.empty());
}

TEST(ReferenceRooms, TailsHaveTheirLengthAndGain) {
    const Tail tail = tailOf(20, 44100, test::testTailSample);
    EXPECT_EQ(tail.pairs.size(), 2u * 3763);
    EXPECT_EQ(tail.presetGain, 0.037648f);
    EXPECT_EQ(tail.pairs[2 * 100 + 1], test::testTailSample(20, 100, 1));
    EXPECT_EQ(tailOf(2, 48000, test::testTailSample).pairs, (std::vector<float>{0.0f, 0.0f}));
    EXPECT_TRUE(tailOf(0, 48000, test::testTailSample).pairs.empty());
}

TEST(ReferenceRooms, TailsOfAFileStandWhereItsIndexSays) {
    const test::TempDirectory directory;
    for (const int rate : {24000, 44100, 48000}) {
        test::writePackedTails(directory.path(), rate, {53, 20});
        for (const int preset : {20, 53}) {
            const Tail read = packedTailOf(directory.path(), preset, rate);
            const Tail made = tailOf(preset, rate, test::testTailSample);
            EXPECT_EQ(read.pairs, made.pairs) << preset;
            EXPECT_EQ(read.presetGain, made.presetGain);
        }
    }
    // Behind the file's end.
    const Tail missing = packedTailOf(directory.path(), 41, 48000);
    EXPECT_EQ(missing.pairs, std::vector<float>(2 * 12784, 0.0f));
}

TEST(ReferenceRooms, SourceAheadIsReflectedFromAllSides) {
    const WallScene scene = ordinaryRoom();
    // Path beyond the direct one, and the whole path; the front wall's is told without the direct.
    const double excess[] = {
        2.0 * std::sqrt(2.8 * 2.8 + 0.25) - 1.0, 2.0 * std::sqrt(1.8 * 1.8 + 0.25) - 1.0, 5.4, 5.2,
        2.0 * std::sqrt(2.5 * 2.5 + 0.25) - 1.0, 2.0 * std::sqrt(3.0 * 3.0 + 0.25) - 1.0};
    const int azimuths[] = {1, 1, 0, -180, 78, -80};
    for (int k = 0; k < 6; ++k) {
        ReflectionRecord record;
        record.phi = 1;
        EXPECT_TRUE(reflectAtWall(record, k, scene));
        EXPECT_EQ(record.delaySamples, static_cast<int>(140.0 * excess[k])) << k;
        const double path = k == 2 ? excess[k] : excess[k] + 1.0;
        EXPECT_NEAR(static_cast<double>(record.reflectionDistance), path, 1e-6) << k;
        EXPECT_NEAR(static_cast<double>(record.distanceGain), 1.0 / path, 1e-6) << k;
        EXPECT_EQ(record.phi, azimuths[k]) << k;
    }
}

TEST(ReferenceRooms, SourceBeyondAWallAndMissingWallsAreFinished) {
    WallScene scene = ordinaryRoom();
    scene.distance = 3.2f;
    ReflectionRecord record;
    record.delaySamples = 77;
    EXPECT_FALSE(reflectAtWall(record, 2, scene));
    EXPECT_EQ(record.wallDistance, -1.0f);
    EXPECT_EQ(record.delaySamples, 77);
    EXPECT_EQ(record.distanceGain, 0.000001f);
    scene.roomDistances[2] = -1.0f;
    EXPECT_FALSE(reflectAtWall(record, 2, scene));
    scene.roomDistances[2] = 0.0f;
    EXPECT_TRUE(reflectAtWall(record, 2, scene));
    EXPECT_EQ(record.delaySamples, 77);
}

}  // namespace
}  // namespace tessaly::reference
