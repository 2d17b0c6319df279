// Loading of the fixed pair: delays, lengths, directions; and a room without rows.
#include "engine/reflections.h"

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "engine/hrir_table_fixture.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr int cell1st = 18 * 37 + 18;
constexpr int cell2nd = 53 * 37 + 18;

class ReflectionsTest : public HrirTableTest {
protected:
    ReflectionsTest() {
        essError = essErrorNone;
        switches.limitPhi = 180;
        switches.limitTheta = 90;
        switches.hrirLength = 128;
        switches.qvTrackDirection = true;
        useDatabase(44100);
    }
    ~ReflectionsTest() override { essError = essErrorNone; }

    void useDatabase(int rate) {
        sampleRate = rate;
        HrirDatabaseSettings made;
        made.bundleBasePath = directory.path();
        made.sampleRate = rate;
        made.hrirLength = switches.hrirLength;
        database = std::make_unique<HrirDatabase>(made);
        database->fileCount = hrirCount;  // as after the mapping of a whole set
        database->mappingReflections = true;
    }

    Reflections::LoadContext context() {
        return {switches,   sampleRate,
                1.0f,       128.4f,
                hpTFactive, preset,
                *database,  {phi, theta, phiNew, indexPhi, indexTheta, phiIn, thetaIn},
                controls,   FIR_size};
    }

    TempDirectory directory;
    LogCapture log;
    EffectiveSettings switches;
    int sampleRate = 44100;
    bool hpTFactive = false;
    std::int16_t preset = 0;
    std::unique_ptr<HrirDatabase> database;
    LiveControls controls;
    int FIR_size = 4096;
    std::int16_t phi = 3;
    std::int16_t theta = 4;
    std::int16_t phiNew = 5;
    std::int16_t indexPhi = 6;
    std::int16_t indexTheta = 7;
    std::int16_t phiIn = -8;
    std::int16_t thetaIn = 9;
    Reflections reflections;
};

TEST_F(ReflectionsTest, FixedPairTakesItsSlotsFromTheTable) {
    float* const first = store(18, 18);
    float* const second = store(53, 18);
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefFilter_1st, filterTable[cell1st]);
    EXPECT_EQ(reflections.earlyRefFilter_2nd, filterTable[cell2nd]);
    EXPECT_EQ(*reflections.earlyRefFilter_1st, first);
    EXPECT_EQ(*reflections.earlyRefFilter_2nd, second);
    EXPECT_EQ(reflections.earlyRefPhi, (std::array<std::int16_t, 2>{-90, 85}));
    EXPECT_EQ(reflections.earlyRefTheta, (std::array<std::int16_t, 2>{0, 0}));
    EXPECT_EQ(indexPhi, 53);
    EXPECT_EQ(indexTheta, 18);
    EXPECT_EQ(phi, 3) << "left alone where the table holds the direction";
    EXPECT_EQ(theta, 4);

    float* const reloaded = *storeLoose();
    *filterTable[cell1st] = reloaded;
    EXPECT_EQ(hrirOf(reflections.earlyRefFilter_1st), reloaded) << "a slot follows a reload";
}

TEST_F(ReflectionsTest, FixedPairKeepsItsDelayInALongResponse) {
    for (const std::int16_t hrirLength : std::array<std::int16_t, 4>{70, 128, 139, 256}) {
        switches.hrirLength = hrirLength;
        FIR_size = 664 + hrirLength;
        reflections.loadEarlyReflections(context());
        EXPECT_EQ(reflections.erOffset1, 0);
        EXPECT_EQ(reflections.erOffset2, 0);
        EXPECT_EQ(reflections.earlyRefDelay_1st, 664);
        EXPECT_EQ(reflections.earlyRefDelay_2nd, 664);
        EXPECT_EQ(reflections.earlyRefLength_1st, hrirLength);
        EXPECT_EQ(reflections.earlyRefLength_2nd, hrirLength);
    }
}

TEST_F(ReflectionsTest, FixedPairIsPulledForwardToTheEndOfAShortResponse) {
    for (const std::int16_t hrirLength : std::array<std::int16_t, 3>{70, 128, 139}) {
        switches.hrirLength = hrirLength;
        for (const int size : {256, 512, 664 + hrirLength - 1}) {
            FIR_size = size;
            reflections.loadEarlyReflections(context());
            EXPECT_EQ(reflections.erOffset1, hrirLength - size + 664);
            EXPECT_EQ(reflections.earlyRefDelay_1st, size - hrirLength);
            EXPECT_EQ(reflections.earlyRefDelay_2nd, size - hrirLength);
            EXPECT_EQ(reflections.earlyRefLength_1st, hrirLength);
            EXPECT_EQ(reflections.earlyRefLength_2nd, hrirLength);
        }
    }
}

TEST_F(ReflectionsTest, HeadphoneFilterNeedsTwoHundredFiftySixFramesMore) {
    hpTFactive = true;
    FIR_size = 1024;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.erOffset1, 128 - 1024 + 920);
    EXPECT_EQ(reflections.earlyRefDelay_1st, 1024 - 256 - 128);
    EXPECT_EQ(reflections.earlyRefLength_1st, 128);
    FIR_size = 920 + 128;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefDelay_2nd, 664);
}

TEST_F(ReflectionsTest, ResponseShorterThanAnHrirGivesANegativeDelay) {
    FIR_size = 32;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefDelay_1st, 32 - 128);
    EXPECT_EQ(reflections.earlyRefLength_1st, 128);
}

TEST_F(ReflectionsTest, LengthIsStoredInSixteenBits) {
    FIR_size = 664 + 40000;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefLength_1st, static_cast<std::int16_t>(40000 - 65536));
    FIR_size = 664 + 65536 + 100;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefLength_2nd, 100);
    FIR_size = 664 + 65536 + 1000;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefLength_2nd, 128);
}

TEST_F(ReflectionsTest, EmptyCellsLeaveTheFixedPairSilent) {
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(reflections.earlyRefFilter_1st, nullptr);
    EXPECT_EQ(reflections.earlyRefFilter_2nd, nullptr);
}

TEST_F(ReflectionsTest, DirectionsBeyondTheLimitsComeFromTheirOwnFiles) {
    store(18, 18);
    store(53, 18);
    switches.limitPhi = 80;
    database->usePackedDatabase = false;
    std::vector<float> first(256);
    std::vector<float> second(256);
    for (std::size_t i = 0; i < 256; ++i) {
        first[i] = 0.001f * static_cast<float>(i);
        second[i] = -0.001f * static_cast<float>(i);
    }
    // File names count azimuths to the right, the engine to the left.
    const std::string head = "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_128_A";
    writeWavForReader(directory.file(head + "090_B090.wav"), 2, 44100, first);
    writeWavForReader(directory.file(head + "275_B090.wav"), 2, 44100, second);
    reflections.loadEarlyReflections(context());
    ASSERT_NE(hrirOf(reflections.earlyRefFilter_1st), nullptr);
    ASSERT_NE(hrirOf(reflections.earlyRefFilter_2nd), nullptr);
    EXPECT_NE(reflections.earlyRefFilter_1st, filterTable[cell1st]);
    EXPECT_NE(reflections.earlyRefFilter_2nd, reflections.earlyRefFilter_1st);
    for (int i = 0; i < 256; ++i) {
        EXPECT_EQ(hrirOf(reflections.earlyRefFilter_1st)[i], first[static_cast<std::size_t>(i)]);
        EXPECT_EQ(hrirOf(reflections.earlyRefFilter_2nd)[i], second[static_cast<std::size_t>(i)]);
    }
    EXPECT_EQ(indexPhi, 6) << "no index is set on this path";
    EXPECT_EQ(theta, 0);
}

TEST_F(ReflectionsTest, LimitBetweenTheTwoSplitsThePair) {
    float* const second = store(53, 18);
    store(18, 18);
    switches.limitPhi = 85;
    reflections.loadEarlyReflections(context());
    EXPECT_EQ(hrirOf(reflections.earlyRefFilter_1st), nullptr)
        << "a packed set that is mapped to its end has no more to give";
    EXPECT_EQ(hrirOf(reflections.earlyRefFilter_2nd), second);
    EXPECT_EQ(phi, -90);
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(ReflectionsTest, RoomResetsTheDirectionAndDesignsItsFilters) {
    for (const int rate : {24000, 44100, 48000}) {
        useDatabase(rate);
        reflections.reflectionFilter[0].z1 = 3.0;
        reflections.loadFlexReflections(context());
        EXPECT_EQ(phi, phiNew);
        EXPECT_EQ(theta, thetaIn);
        EXPECT_EQ(reflections.flexReflectionCount, 0);
        for (const Biquad& filter : reflections.reflectionFilter) {
            EXPECT_EQ(filter.filterType, Biquad::lowPass);
            EXPECT_EQ(filter.normalisedFrequency,
                      Biquad::boundFrequency(Biquad::normalise(20000.0f, rate)));
            EXPECT_EQ(filter.z1, 0.0);
        }
    }
    EXPECT_EQ(FIR_size, 4096);
    EXPECT_TRUE(log.errorLines().empty());
}

TEST_F(ReflectionsTest, UnknownRoomIsReported) {
    for (const std::int16_t unknown : std::array<std::int16_t, 3>{61, -1, 32767}) {
        log.clear();
        preset = unknown;
        reflections.loadFlexReflections(context());
        EXPECT_EQ(log.errorLines(), std::vector<std::string>{"ERROR: ER-Preset doesn't exist!"});
        EXPECT_EQ(reflections.flexReflectionCount, 0);
    }
    EXPECT_EQ(essError, essErrorNone);
}

}  // namespace
}  // namespace tessaly::test
