// Loading of a room's records and filters, and of the fixed pair: delays, lengths, directions.
#include "engine/reflections.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "engine/hrir_table_fixture.h"
#include "support/log_capture.h"
#include "support/room_tables.h"
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
        made.qvTrackDirection = switches.qvTrackDirection;
        database = std::make_unique<HrirDatabase>(made);
        database->fileCount = hrirCount;  // as after the mapping of a whole set
        database->mappingReflections = true;
    }

    Reflections::LoadContext context() {
        const float ratio =
            sampleRate == 24000 ? 0.5442177f : (sampleRate == 48000 ? 1.0884354f : 1.0f);
        return {switches,   sampleRate,
                ratio,      static_cast<float>(sampleRate * 0.0029118863199580685),
                hpTFactive, preset,
                *database,  {phi, theta, phiNew, indexPhi, indexTheta, phiIn, thetaIn},
                controls,   tail,
                FIR_size};
    }

    void loadRoom(int number, int rate = 44100) {
        preset = static_cast<std::int16_t>(number);
        if (rate != sampleRate) {
            useDatabase(rate);
        }
        reflections.loadFlexReflections(context());
    }
    const ReflectionRecord& record(std::size_t k) const { return reflections.records[k]; }

    TempDirectory directory;
    LogCapture log;
    EffectiveSettings switches;
    int sampleRate = 44100;
    bool hpTFactive = false;
    std::int16_t preset = 0;
    std::unique_ptr<HrirDatabase> database;
    LiveControls controls;
    ReverbTail tail;
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

TEST_F(ReflectionsTest, EveryRoomBecomesItsRecords) {
    phiNew = -40;
    thetaIn = 25;
    for (const int rate : {24000, 44100, 48000}) {
        useDatabase(rate);
        const float metre = context().samplesPerMetre;
        const float ratio = context().sampleRateRatio;
        for (const RoomLine& line : readRoomLines()) {
            SCOPED_TRACE(line.preset);
            reflections = Reflections{};
            FIR_size = 1024;
            loadRoom(line.preset, rate);
            ASSERT_EQ(reflections.flexReflectionCount, line.records);
            EXPECT_EQ(reflections.earlyFlexFirSize, line.firSize);
            EXPECT_EQ(reflections.earlyPresetGain, line.gain);
            EXPECT_EQ(reflections.presetUsesFilters, line.filtersRecords);
            EXPECT_EQ(FIR_size, std::max(1024, line.firSize));
            for (std::size_t k = 0; k < line.delays.size(); ++k) {
                EXPECT_EQ(record(k).relativePhi, line.azimuths[k]);
                EXPECT_EQ(record(k).phi, line.azimuths[k] - 40);
                EXPECT_EQ(record(k).relativeTheta, line.elevations[k]);
                EXPECT_EQ(record(k).theta, line.elevations[k] + 25);
                const int delay = static_cast<int>(static_cast<float>(line.delays[k]) * ratio);
                EXPECT_EQ(record(k).presetDelaySamples, delay);
                EXPECT_EQ(record(k).delaySamples, delay);
                EXPECT_EQ(record(k).gain,
                          static_cast<float>(static_cast<double>(line.gains[k]) * 0.55));
                const float byPath = std::min(metre / static_cast<float>(delay), 1.0f);
                EXPECT_EQ(record(k).distanceGain, line.preset < 13 ? 1.0f : byPath);
                EXPECT_EQ(record(k).reflectionDistance, 1.0f);
                EXPECT_EQ(record(k).wallDistance, 0.0f) << "every wall counts as there";
                EXPECT_EQ(record(k).filterClass, line.filtersRecords ? line.classes[k] : -1);
            }
        }
    }
}

TEST_F(ReflectionsTest, EveryRoomSetsWallsCutOffsAndFilters) {
    for (const int rate : {24000, 44100, 48000}) {
        useDatabase(rate);
        for (const RoomLine& line : readRoomLines()) {
            SCOPED_TRACE(line.preset);
            tail = ReverbTail{};
            tail.hasReverbLowPass = true;
            loadRoom(line.preset, rate);
            for (std::size_t k = 0; k < 6; ++k) {
                EXPECT_EQ(controls.roomDistances[k], line.walls[k]);
            }
            EXPECT_EQ(controls.reflectionLP_Fc, line.cutOffs[0]);
            EXPECT_EQ(controls.reflectionLP2_Fc, line.cutOffs[1]);
            EXPECT_EQ(controls.reverbLP_Fc, line.cutOffs[2]);
            EXPECT_EQ(tail.hasReverbLowPass, line.filtersTail);
            const auto expectLowPass = [&](const Biquad& filter, float cutOff) {
                const Biquad expected(Biquad::lowPass, 0.0,
                                      static_cast<double>(cutOff / static_cast<float>(rate)));
                EXPECT_EQ(filter.filterType, Biquad::lowPass);
                EXPECT_EQ(filter.normalisedFrequency, expected.normalisedFrequency);
                EXPECT_EQ(filter.b0, expected.b0);
                EXPECT_EQ(filter.a2, expected.a2);
            };
            expectLowPass(reflections.reflectionFilter[0], line.cutOffs[0]);
            expectLowPass(reflections.reflectionFilter[1], line.cutOffs[1]);
            if (line.filtersTail) {
                expectLowPass(tail.reverbLowPass, line.cutOffs[2]);
            } else {
                EXPECT_EQ(tail.reverbLowPass.normalisedFrequency, 0.0) << "none is made";
            }
        }
    }
}

TEST_F(ReflectionsTest, DelaysAreTruncatedAtTheSampleRate) {
    loadRoom(1, 48000);
    EXPECT_EQ(record(0).delaySamples, 277) << "255 at 44100 Hz are 277.55";
    loadRoom(1, 24000);
    EXPECT_EQ(record(0).delaySamples, 138);
    loadRoom(1, 44100);
    EXPECT_EQ(record(0).delaySamples, 255);
    loadRoom(25, 48000);
    EXPECT_EQ(record(3).delaySamples, 16761) << "the longest of all";
}

TEST_F(ReflectionsTest, GainFollowsThePathFromThirteenOn) {
    loadRoom(15);
    EXPECT_NEAR(static_cast<double>(record(1).distanceGain), 0.533, 0.001);
    loadRoom(34);
    EXPECT_EQ(record(1).distanceGain, 1.0f) << "90 samples are less than a metre";
    loadRoom(15, 48000);
    EXPECT_EQ(record(1).distanceGain, context().samplesPerMetre / 262.0f);
    loadRoom(12);
    EXPECT_EQ(record(0).distanceGain, 1.0f);
}

TEST_F(ReflectionsTest, RoomWithoutACeilingHasASilentRecordForIt) {
    for (const int number : {29, 33}) {
        loadRoom(number);
        EXPECT_EQ(controls.roomDistances[0], -1.0f);
        EXPECT_EQ(record(0).gain, 0.0f);
    }
}

TEST_F(ReflectionsTest, ResponseIsRaisedToTheRoomAndNeverCut) {
    FIR_size = 8192;
    loadRoom(14);
    EXPECT_EQ(FIR_size, 8192);
    FIR_size = 4095;
    loadRoom(14);
    EXPECT_EQ(FIR_size, 4096);
    FIR_size = 32;
    loadRoom(7);
    EXPECT_EQ(FIR_size, 8182);
    FIR_size = 32;
    loadRoom(0);
    EXPECT_EQ(FIR_size, 32);
    loadRoom(61);
    EXPECT_EQ(FIR_size, 32);
}

TEST_F(ReflectionsTest, NoRoomLeavesWallsAndCutOffsAtTheirDefaults) {
    loadRoom(0);
    EXPECT_EQ(reflections.flexReflectionCount, 0);
    EXPECT_EQ(reflections.earlyPresetGain, 1.0f);
    EXPECT_EQ(controls.roomDistances, LiveControls{}.roomDistances);
    EXPECT_EQ(controls.reflectionLP_Fc, 20000.0f);
    EXPECT_EQ(controls.reflectionLP2_Fc, 20000.0f);
    EXPECT_EQ(controls.reverbLP_Fc, 20000.0f);
    EXPECT_FALSE(tail.hasReverbLowPass);
    EXPECT_TRUE(log.errorLines().empty());
}

TEST_F(ReflectionsTest, DirectionsWaitForTheFirstUpdateWhereTheTableIsFull) {
    phiNew = 170;
    loadRoom(1);
    EXPECT_EQ(record(1).phi, 205) << "neither turned round nor limited yet";
    EXPECT_EQ(record(1).indexPhi, 0);
    EXPECT_EQ(database->fileCount, hrirCount);
    EXPECT_EQ(phi, 170);
}

TEST_F(ReflectionsTest, FixedDirectionFetchesEveryReflection) {
    switches.qvTrackDirection = false;
    useDatabase(44100);
    database->usePackedDatabase = false;
    phiNew = -30;
    thetaIn = 60;
    std::vector<float> pairs(256);
    for (std::size_t i = 0; i < pairs.size(); ++i) {
        pairs[i] = 0.003f * static_cast<float>(i + 1);
    }
    // The ninth record of room 1 alone has a file: azimuth -50 - 30, elevation 0 + 60.
    writeWavForReader(directory.file("/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_128_A280_B150.wav"), 2,
                      44100, pairs);
    loadRoom(1);
    // Room 1 has azimuths -30 35 -10 15 -70 75 -90 85 -50 45, elevations 25 20 -20 -25 -5 5 0 ...
    const int azimuths[] = {-60, 5, -40, -15, -100, 45, -120, 55, -80, 15};
    const int elevations[] = {75, 75, 40, 35, 55, 65, 60, 60, 60, 60};
    for (std::size_t k = 0; k < 10; ++k) {
        EXPECT_EQ(record(k).phi, azimuths[k]) << k;
        EXPECT_EQ(record(k).theta, elevations[k]) << k << ": 75 is the steepest";
        EXPECT_EQ(record(k).indexPhi, (azimuths[k] + 180) / 5) << k;
        EXPECT_EQ(record(k).indexTheta, (elevations[k] + 90) / 5) << k;
    }
    for (int i = 0; i < gridPhiCount; ++i) {
        for (int j = 0; j < gridThetaCount; ++j) {
            EXPECT_EQ(hrirAt(i, j) != nullptr, i == 20 && j == 30) << i << " " << j;
        }
    }
    ASSERT_NE(hrirAt(20, 30), nullptr);
    for (int i = 0; i < 256; ++i) {
        EXPECT_EQ(hrirAt(20, 30)[i], pairs[static_cast<std::size_t>(i)]);
    }
    EXPECT_EQ(phi, -30) << "back at the source";
    EXPECT_EQ(theta, 60);
}

TEST_F(ReflectionsTest, FixedDirectionsAreTurnedRoundAtTheBack) {
    switches.qvTrackDirection = false;
    const struct {
        int source;
        int relative;  // of the last record but one of room 7, then of the last: -180 and 180
        std::size_t k;
        int expected;
        int index;
    } cases[] = {{0, -180, 12, 180, 72},  {0, 180, 13, 180, 72},  {5, 180, 13, -175, 1},
                 {-5, -180, 12, 175, 71}, {1, -180, 12, -179, 0}, {-180, 180, 13, 0, 36}};
    for (const auto& c : cases) {
        phiNew = static_cast<std::int16_t>(c.source);
        loadRoom(7);
        EXPECT_EQ(record(c.k).relativePhi, c.relative);
        EXPECT_EQ(record(c.k).phi, c.expected) << c.source;
        EXPECT_EQ(record(c.k).indexPhi, c.index) << c.source;
    }
}

TEST_F(ReflectionsTest, FixedElevationsStopAtSeventyFive) {
    switches.qvTrackDirection = false;
    for (const int source : {-90, 90}) {
        thetaIn = static_cast<std::int16_t>(source);
        loadRoom(11);
        for (std::size_t k = 2; k < 5; ++k) {
            EXPECT_EQ(record(k).theta, source < 0 ? -75 : 75);
            EXPECT_EQ(record(k).indexTheta, source < 0 ? 3 : 33);
        }
    }
}

TEST_F(ReflectionsTest, PackedSetGivesItsNextHrirsWhateverTheDirection) {
    switches.qvTrackDirection = false;
    database->fileCount = hrirCount - 3;
    for (int i = hrirCount - 3; i < hrirCount; ++i) {
        hrirTable[static_cast<std::size_t>(i)] = *storeLoose();
    }
    float* const first = hrirTable[hrirCount - 3];
    loadRoom(1);
    EXPECT_EQ(database->fileCount, hrirCount);
    EXPECT_EQ(hrirAt(record(0).indexPhi, record(0).indexTheta), first);
    EXPECT_EQ(hrirAt(record(2).indexPhi, record(2).indexTheta), hrirTable[hrirCount - 1]);
    EXPECT_EQ(hrirAt(record(3).indexPhi, record(3).indexTheta), nullptr) << "the set has ended";
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(ReflectionsTest, HostDirectionsOutsideTheGridFetchNothingOutsideTheTable) {
    switches.qvTrackDirection = false;
    for (const int source : {-32768, -1000, 1000, 32767}) {
        phiNew = static_cast<std::int16_t>(source);
        thetaIn = static_cast<std::int16_t>(source);
        loadRoom(10);
        EXPECT_EQ(reflections.flexReflectionCount, 14);
        EXPECT_EQ(phi, phiNew);
        EXPECT_GE(record(0).indexTheta, 3);
        EXPECT_LE(record(0).indexTheta, 33);
    }
}

}  // namespace
}  // namespace tessaly::test
