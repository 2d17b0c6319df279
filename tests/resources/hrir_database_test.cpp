// Tests of the packed HRIR set: loading, mapping, sharing, bypass, static filter.
#include "resources/hrir_database.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <string>
#include <vector>

#include "resources/hrir_fixture.h"
#include "resources/pan_pair.h"

namespace tessaly {
namespace {

using test::LogLine;
using test::LogStream;
using ::testing::ElementsAre;

constexpr int rates[] = {24000, 44100, 48000};

class PackedHrirSet : public test::HrirTest {
protected:
    static HrirSlot cell(int i, int t) { return filterTable[i * gridThetaCount + t]; }

    HrirDatabaseSettings bypassed(int sampleRate) const {
        HrirDatabaseSettings made = settings(sampleRate);
        made.bypass3DAudio = true;
        return made;
    }

    static std::vector<float> panPair(int hrirLength, int phi) {
        std::vector<float> pair(hrirLength * 2);
        writePanPair(pair.data(), hrirLength, static_cast<std::int16_t>(phi), 1.65f);
        return pair;
    }

    static bool allSilent(int frames) {
        return std::all_of(std::begin(hrirTable), std::end(hrirTable),
                           [&](const float* entry) { return test::isSilent(entry, frames); });
    }
};

// ---- Mapping ----

TEST_F(PackedHrirSet, EveryDirectionGetsItsHrirAtEveryRate) {
    for (const int rate : rates) {
        resetHrirTables();
        test::writePackedHrirSet(directory_.path(), rate);
        HrirDatabase database(settings(rate));
        ASSERT_TRUE(loadAsFirst(database));
        int wrongEntries = 0;
        int wrongFrames = 0;
        for (int i = 0; i < gridPhiCount; ++i) {
            for (int t = 0; t < gridThetaCount; ++t) {
                const int k = test::testHrirNumber(indexToPhi(i), indexToTheta(t));
                wrongEntries += cell(i, t) != &hrirTable[k];
                const float* pairs = hrirAt(i, t);
                ASSERT_NE(pairs, nullptr) << i << ' ' << t;
                wrongFrames += test::framesUnlike(pairs, test::testHrirTaps(rate), k);
            }
        }
        EXPECT_EQ(wrongEntries, 0) << rate;
        EXPECT_EQ(wrongFrames, 0) << rate;
        EXPECT_EQ(essError, essErrorNone);
    }
}

TEST_F(PackedHrirSet, LoadLeavesItsFieldsSet) {
    test::writePackedHrirSet(directory_.path(), 44100);
    HrirDatabase database(settings(44100));
    database.mappingReflections = true;
    database.usePackedDatabase = false;
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.fileCount, 2522);
    EXPECT_EQ(database.databaseFrames, 322816);
    EXPECT_EQ(database.databaseFileName, "/TSLdata120.dat");
    EXPECT_TRUE(database.usePackedDatabase);
    EXPECT_FALSE(database.mappingReflections);
    EXPECT_EQ(databaseBypassMode, 0);
    EXPECT_EQ(cell(36, 18), &hrirTable[18]);
    // The last direction asked for: five degrees to the left.
    EXPECT_EQ(fields_.phi, 5);
    EXPECT_EQ(fields_.theta, 85);
    EXPECT_EQ(log_.output(), "filePathIn = " + directory_.file("/TSLdata120.dat") + "\n");
    EXPECT_EQ(log_.error(), "");
}

TEST_F(PackedHrirSet, TheRearIsOneDirectionAndSoIsEachPole) {
    test::writePackedHrirSet(directory_.path(), 48000);
    HrirDatabase database(settings(48000));
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.databaseFileName, "/TSLdata121.dat");
    EXPECT_EQ(database.databaseFrames, 350558);
    for (int t = 0; t < gridThetaCount; ++t) {
        EXPECT_EQ(cell(0, t), cell(72, t)) << t;
    }
    for (int i = 0; i < gridPhiCount; ++i) {
        EXPECT_EQ(cell(i, 0), &hrirTable[0]) << i;
        EXPECT_EQ(cell(i, 36), &hrirTable[36]) << i;
    }
}

TEST_F(PackedHrirSet, NarrowAzimuthsTakeTheFileInItsOrder) {
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabaseSettings narrow = settings(24000);
    narrow.limitPhi = 90;
    narrow.phiSteps = 36;
    HrirDatabase database(narrow);
    ASSERT_TRUE(loadAsFirst(database));
    // Rows 18 down to 1, then 36 with the pole behind it, then 35 down to 19.
    EXPECT_EQ(cell(18, 1), &hrirTable[1]);
    EXPECT_EQ(cell(17, 1), &hrirTable[36]);
    EXPECT_EQ(cell(1, 35), &hrirTable[18 * 35]);
    EXPECT_EQ(cell(36, 1), &hrirTable[18 * 35 + 1]);
    EXPECT_EQ(cell(36, 36), &hrirTable[19 * 35 + 1]);
    EXPECT_EQ(cell(35, 1), &hrirTable[19 * 35 + 2]);
    EXPECT_EQ(cell(19, 35), &hrirTable[36 * 35 + 1]);
    EXPECT_EQ(database.fileCount, 36 * 35 + 2);
    for (int t = 0; t < gridThetaCount; ++t) {
        EXPECT_EQ(cell(0, t), cell(36, t)) << t;
        EXPECT_EQ(cell(37, t), nullptr) << t;
        EXPECT_EQ(hrirAt(72, t), nullptr) << t;
    }
}

TEST_F(PackedHrirSet, WithoutElevationOnlyThePolesAreMapped) {
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabaseSettings level = settings(24000);
    level.limitTheta = 0;
    level.thetaSteps = 0;
    level.useElevation = false;
    level.thetaLimited = true;
    HrirDatabase database(level);
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.fileCount, 2);
    for (int i = 0; i < gridPhiCount; ++i) {
        EXPECT_EQ(cell(i, 0), &hrirTable[0]);
        EXPECT_EQ(cell(i, 18), nullptr);
        EXPECT_EQ(cell(i, 36), &hrirTable[1]);
    }
}

TEST_F(PackedHrirSet, WithoutAnAzimuthRangeOneCellIsMapped) {
    test::writePackedHrirSet(directory_.path(), 24000);
    for (const int phiSteps : {0, -2}) {
        resetHrirTables();
        HrirDatabaseSettings none = settings(24000);
        none.limitPhi = 0;
        none.phiSteps = static_cast<std::int16_t>(phiSteps);
        HrirDatabase database(none);
        ASSERT_TRUE(loadAsFirst(database));
        EXPECT_EQ(database.fileCount, 1);
        EXPECT_EQ(cell(36, 0), &hrirTable[0]);
        EXPECT_EQ(cell(0, 0), nullptr);
    }
}

TEST_F(PackedHrirSet, StepsBeyondTheGridStayInsideTheTable) {
    test::writePackedHrirSet(directory_.path(), 24000);
    for (const auto& [phiSteps, thetaSteps] : {std::pair{200, 100}, {73, 37}, {1, 1}, {3, -4}}) {
        resetHrirTables();
        HrirDatabaseSettings wide = settings(24000);
        wide.phiSteps = static_cast<std::int16_t>(phiSteps);
        wide.thetaSteps = static_cast<std::int16_t>(thetaSteps);
        HrirDatabase database(wide);
        EXPECT_TRUE(loadAsFirst(database));
        EXPECT_LE(database.fileCount, hrirCount);
    }
}

TEST_F(PackedHrirSet, ADirectionThatIsNotMappedIsLoggedAndTheNextOneTried) {
    replaceHrirStream(70);
    hrirTable[hrirCount - 1] = nullptr;
    HrirDatabase database(settings(24000));
    database.fileCount = hrirCount - 2;
    database.LoadDataBase(fields_.request());
    // The pole takes the last one left, the front all round finds none.
    EXPECT_EQ(database.fileCount, hrirCount - 1);
    EXPECT_EQ(cell(36, 0), &hrirTable[hrirCount - 2]);
    EXPECT_EQ(cell(36, 1), nullptr);
    EXPECT_EQ(log_.outputLines()[0], "file with fileCount = 2521 doesn't exist!!");
    EXPECT_EQ(log_.outputLines()[1], "not working!!! phi(0) Index 36 theta(-85) Index 1");
    EXPECT_EQ(log_.count(LogStream::output, "not working!!! phi("), 72u * 35u);
    EXPECT_EQ(log_.count(LogStream::output, "not working!!! phi(180) Index 72 theta(85) Index 35"),
              1u);
    EXPECT_EQ(essError, essErrorNone);
}

// ---- The file ----

TEST_F(PackedHrirSet, TheRateFieldDecidesThePolarityNotTheName) {
    for (const auto& [rate, name, field, sign] :
         {std::tuple{44100, "/TSLdata120.dat", 48000, -1.0f},
          std::tuple{48000, "/TSLdata121.dat", 44100, 1.0f}}) {
        resetHrirTables();
        const int taps = test::testHrirTaps(rate);
        std::vector<float> samples(static_cast<std::size_t>(taps) * hrirCount * 2, 0.25f);
        test::writeWav(directory_.file(name), 2, field, 32, samples);
        HrirDatabase database(settings(rate));
        ASSERT_TRUE(loadAsFirst(database));
        EXPECT_EQ(hrirAt(36, 18)[0], sign * 0.25f) << rate;
        EXPECT_EQ(hrirTable[hrirCount - 1][2 * taps - 1], sign * 0.25f) << rate;
    }
}

TEST_F(PackedHrirSet, MayHoldSixteenBitSamples) {
    std::vector<float> samples(70 * hrirCount * 2, -0.5f);
    test::writeWav(directory_.file("/TSLdata122.dat"), 2, 24000, 16, samples);
    HrirDatabase database(settings(24000));
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.databaseFrames, 176540);
    EXPECT_EQ(hrirAt(10, 10)[5], -0.5f);
}

TEST_F(PackedHrirSet, LongHrirsComeFromTheFileOfTheSameName) {
    test::writePackedHrirSet(directory_.path(), 48000, 256);
    HrirDatabaseSettings longOnes = settings(48000);
    longOnes.hrirLength = 256;
    longOnes.qvUse256HRIR = true;
    HrirDatabase database(longOnes);
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.databaseFrames, 645632);
    EXPECT_EQ(test::framesUnlike(hrirAt(18, 18), 256, test::testHrirNumber(-90, 0)), 0);
    EXPECT_EQ(test::framesUnlike(hrirTable[hrirCount - 1], 256, hrirCount - 1), 0);
}

TEST_F(PackedHrirSet, AMissingFileStopsTheLoad) {
    HrirDatabase database(settings(48000));
    EXPECT_FALSE(loadAsFirst(database));
    EXPECT_EQ(essError, essErrorDatabaseMissing);
    const std::string path = directory_.file("/TSLdata121.dat");
    EXPECT_THAT(log_.lines(),
                ElementsAre(LogLine{LogStream::output, "Tessaly_e ERROR: database-file " + path +
                                                           " not available!!! Exit..."},
                            LogLine{LogStream::output, "Tessaly_e ERROR: file not found " + path}));
    EXPECT_EQ(cell(36, 18), nullptr);
}

TEST_F(PackedHrirSet, AnUnreadableFileLeavesSilence) {
    struct Row {
        int channels, bits, frames, code;
    };
    constexpr Row rows[] = {
        {1, 32, 70 * hrirCount * 2, essErrorWavChannels},
        {2, 24, 70 * hrirCount * 2, essErrorWavBitDepth},
        {2, 32, 70 * hrirCount - 1, essErrorWavTooShort},
    };
    for (const Row& row : rows) {
        resetHrirTables();
        std::vector<float> samples(static_cast<std::size_t>(row.frames) * row.channels, 0.5f);
        test::writeWav(directory_.file("/TSLdata122.dat"), row.channels, 24000, row.bits, samples);
        HrirDatabase database(settings(24000));
        EXPECT_TRUE(loadAsFirst(database)) << row.code;
        EXPECT_EQ(essError, row.code);
        EXPECT_EQ(database.fileCount, hrirCount);
        EXPECT_TRUE(allSilent(hrirMaxLength)) << row.code;
        EXPECT_EQ(cell(36, 18), &hrirTable[18]);
    }
}

TEST_F(PackedHrirSet, AFileCutShortIsSilentFromThereOn) {
    test::writePackedHrirSet(directory_.path(), 24000);
    const std::string path = directory_.file("/TSLdata122.dat");
    std::vector<float> samples;
    for (int n = 0; n < 70; ++n) {
        samples.push_back(test::testHrirSample(0, n, 0));
        samples.push_back(test::testHrirSample(0, n, 1));
    }
    std::vector<char> bytes = test::wavBytes(2, 24000, 32, samples);
    // The size tells of a whole set.
    const std::int32_t size = 70 * hrirCount * 8;
    std::copy_n(reinterpret_cast<const char*>(&size), 4, bytes.begin() + 40);
    test::writeFile(path, bytes);
    HrirDatabase database(settings(24000));
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(test::framesUnlike(hrirTable[0], 70, 0), 0);
    EXPECT_TRUE(test::isSilent(hrirTable[1], 70 * (hrirCount - 1)));
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(PackedHrirSet, OtherRatesHaveNoFile) {
    for (const int rate : {0, 22050, 96000, -44100}) {
        essError = essErrorNone;
        HrirDatabase database(settings(rate));
        EXPECT_FALSE(loadAsFirst(database)) << rate;
        EXPECT_EQ(essError, essErrorSampleRate) << rate;
        EXPECT_EQ(HRTFStream, nullptr) << rate;
    }
}

TEST_F(PackedHrirSet, AnOlderMissingHrirStopsTheLoadAfterTheMapping) {
    test::writePackedHrirSet(directory_.path(), 24000);
    essError = essErrorHrirMissing;
    HrirDatabase database(settings(24000));
    EXPECT_FALSE(loadAsFirst(database));
    EXPECT_EQ(database.fileCount, hrirCount);
    // Other old errors do not.
    resetHrirTables();
    essError = essErrorWavUnreadable;
    HrirDatabase second(settings(24000));
    EXPECT_TRUE(loadAsFirst(second));
}

// ---- Sharing and loading again ----

TEST_F(PackedHrirSet, LaterEnginesShareWhatIsThere) {
    test::writePackedHrirSet(directory_.path(), 44100);
    HrirDatabase first(settings(44100));
    ASSERT_TRUE(loadAsFirst(first));
    const float* stream = HRTFStream;
    for (const int rate : rates) {
        log_.clear();
        HrirDatabase later(settings(rate));
        EXPECT_TRUE(later.load(1, fields_.request()));
        EXPECT_EQ(log_.output(), "Database already loaded!\n");
        EXPECT_EQ(later.fileCount, 0);
        EXPECT_EQ(later.databaseFrames, 0);
        EXPECT_EQ(HRTFStream, stream);
    }
    EXPECT_EQ(test::framesUnlike(hrirAt(36, 18), 128, 18), 0);
}

TEST_F(PackedHrirSet, SharingWithoutAnyLoadFindsNothing) {
    HrirDatabase later(settings(44100));
    EXPECT_TRUE(later.load(1, fields_.request()));
    EXPECT_EQ(hrirAt(36, 18), nullptr);
    EXPECT_EQ(later.staticFilter, nullptr);
}

TEST_F(PackedHrirSet, ANewFirstEngineReadsAgainAndKeepsTheMapping) {
    test::writePackedHrirSet(directory_.path(), 44100);
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabase first(settings(44100));
    ASSERT_TRUE(loadAsFirst(first));
    const std::vector<HrirSlot> mapped(std::begin(filterTable), std::end(filterTable));
    log_.clear();
    HrirDatabase second(settings(24000));
    ASSERT_TRUE(loadAsFirst(second));
    EXPECT_EQ(log_.output(),
              "Deleted HRTFSTream!\nfilePathIn = " + directory_.file("/TSLdata122.dat") + "\n");
    // Filled cells are protected, so nothing was taken from the new set.
    EXPECT_EQ(second.fileCount, 0);
    EXPECT_TRUE(std::equal(mapped.begin(), mapped.end(), std::begin(filterTable)));
    EXPECT_EQ(test::framesUnlike(hrirAt(20, 7), 70, test::testHrirNumber(-80, -55)), 0);
}

TEST_F(PackedHrirSet, HrirsLongerThanTheStoredOnesCanBeReadFromEveryCell) {
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabase database(settings(24000));
    ASSERT_TRUE(loadAsFirst(database));
    // An engine of 256 frames runs on into the next HRIR; behind the last one there is silence.
    const float* front = hrirAt(36, 18);
    EXPECT_EQ(test::framesUnlike(front + 2 * 70, 70, 19), 0);
    const float* last = hrirAt(37, 35);
    ASSERT_EQ(last, hrirTable[hrirCount - 1]);
    EXPECT_TRUE(test::isSilent(last + 2 * 70, hrirMaxLength - 70));
}

// ---- 3D bypass ----

TEST_F(PackedHrirSet, BypassMapsPanPairs) {
    for (const int rate : rates) {
        resetHrirTables();
        test::writePackedHrirSet(directory_.path(), rate);
        HrirDatabase database(bypassed(rate));
        ASSERT_TRUE(loadAsFirst(database));
        EXPECT_EQ(databaseBypassMode, 1);
        EXPECT_EQ(database.fileCount, hrirCount);
        const int taps = test::testHrirTaps(rate);
        for (int i = 1; i < gridPhiCount; ++i) {
            const std::vector<float> expected = panPair(taps, indexToPhi(i));
            for (int t = 1; t < gridThetaCount - 1; ++t) {
                ASSERT_TRUE(std::equal(expected.begin(), expected.end(), hrirAt(i, t)))
                    << i << ' ' << t;
            }
        }
        EXPECT_EQ(cell(0, 18), cell(72, 18));
        const std::vector<float> pole = panPair(taps, 0);
        EXPECT_TRUE(std::equal(pole.begin(), pole.end(), hrirAt(3, 36)));
    }
}

TEST_F(PackedHrirSet, ABypassChangeRebuildsTheSetUnderOlderReaders) {
    test::writePackedHrirSet(directory_.path(), 44100);
    HrirDatabase first(settings(44100));
    ASSERT_TRUE(loadAsFirst(first));
    HrirSlot reader = cell(18, 18);
    const int k = test::testHrirNumber(-90, 0);
    ASSERT_EQ(test::framesUnlike(hrirOf(reader), 128, k), 0);

    log_.clear();
    HrirDatabase second(bypassed(44100));
    ASSERT_TRUE(second.load(1, fields_.request()));
    EXPECT_EQ(log_.outputLines().front(), "Deleted HRTFSTream!");
    EXPECT_EQ(databaseBypassMode, 1);
    EXPECT_EQ(second.fileCount, hrirCount);
    EXPECT_EQ(cell(18, 18), reader);
    const std::vector<float> expected = panPair(128, -90);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), hrirOf(reader)));

    HrirDatabase third(settings(44100));
    ASSERT_TRUE(third.load(2, fields_.request()));
    EXPECT_EQ(databaseBypassMode, 0);
    EXPECT_EQ(third.fileCount, hrirCount);
    EXPECT_EQ(cell(18, 18), reader);
    EXPECT_EQ(test::framesUnlike(hrirOf(reader), 128, k), 0);
}

TEST_F(PackedHrirSet, ABypassChangeMayChangeTheStride) {
    test::writePackedHrirSet(directory_.path(), 48000);
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabase first(settings(48000));
    ASSERT_TRUE(loadAsFirst(first));
    HrirSlot reader = cell(37, 35);
    HrirDatabase second(bypassed(24000));
    ASSERT_TRUE(second.load(1, fields_.request()));
    // The older engine goes on with 139 frames of a set that has 70 of them.
    const std::vector<float> expected = panPair(70, 5);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), hrirOf(reader)));
    EXPECT_TRUE(test::isSilent(hrirOf(reader) + 2 * 70, 139 - 70));
}

TEST_F(PackedHrirSet, AFailedRebuildLeavesOlderReadersWithSilence) {
    test::writePackedHrirSet(directory_.path(), 44100);
    HrirDatabase first(settings(44100));
    ASSERT_TRUE(loadAsFirst(first));
    HrirSlot reader = cell(18, 18);
    ASSERT_EQ(std::remove(directory_.file("/TSLdata120.dat").c_str()), 0);
    HrirDatabase second(bypassed(44100));
    EXPECT_FALSE(second.load(1, fields_.request()));
    EXPECT_EQ(essError, essErrorDatabaseMissing);
    EXPECT_EQ(databaseBypassMode, 0);
    EXPECT_EQ(cell(18, 18), reader);
    EXPECT_TRUE(test::isSilent(hrirOf(reader), 128));
}

TEST_F(PackedHrirSet, ALongerPanPairOfASharingEngineStaysInsideTheSet) {
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabase first(bypassed(24000));
    ASSERT_TRUE(loadAsFirst(first));
    HrirDatabaseSettings longer = bypassed(48000);
    longer.hrirLength = 256;
    HrirDatabase second(longer);
    ASSERT_TRUE(second.load(1, fields_.request()));
    second.mappingReflections = true;
    second.fileCount = hrirCount - 1;
    HrirSlot slot = nullptr;
    fields_.phi = 90;
    EXPECT_TRUE(second.loadFilterFile(slot, fields_.request()));
    const std::vector<float> expected = panPair(256, 90);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), hrirOf(slot)));
}

// ---- Single loads ----

TEST_F(PackedHrirSet, NothingIsLeftAfterTheMapping) {
    test::writePackedHrirSet(directory_.path(), 24000);
    for (const bool bypass : {false, true}) {
        resetHrirTables();
        HrirDatabase database(bypass ? bypassed(24000) : settings(24000));
        ASSERT_TRUE(loadAsFirst(database));
        database.mappingReflections = true;
        log_.clear();
        HrirSlot slot = nullptr;
        EXPECT_FALSE(database.loadFilterFile(slot, fields_.request()));
        EXPECT_EQ(slot, nullptr);
        EXPECT_EQ(database.fileCount, hrirCount);
        EXPECT_EQ(log_.output(), "file with fileCount = 2522 doesn't exist!!\n");
    }
}

TEST_F(PackedHrirSet, CountsOutsideOfTheTableFindNothing) {
    replaceHrirStream(70);
    for (const bool bypass : {false, true}) {
        HrirDatabase database(bypass ? bypassed(24000) : settings(24000));
        for (const int count : {-1, -1000000, hrirCount, 1000000}) {
            database.fileCount = count;
            HrirSlot slot = nullptr;
            EXPECT_FALSE(database.loadFilterFile(slot, fields_.request())) << count;
            EXPECT_EQ(slot, nullptr);
            EXPECT_EQ(database.fileCount, count);
        }
    }
}

TEST_F(PackedHrirSet, ASharingEngineStartsWithTheFirstHrir) {
    test::writePackedHrirSet(directory_.path(), 24000);
    HrirDatabase first(settings(24000));
    ASSERT_TRUE(loadAsFirst(first));
    HrirDatabase later(settings(24000));
    ASSERT_TRUE(later.load(1, fields_.request()));
    later.mappingReflections = true;
    HrirSlot slots[2] = {};
    for (HrirSlot& slot : slots) {
        fields_.phi = 35;
        fields_.theta = 20;
        EXPECT_TRUE(later.loadFilterFile(slot, fields_.request()));
    }
    EXPECT_EQ(slots[0], &hrirTable[0]);
    EXPECT_EQ(slots[1], &hrirTable[1]);
}

TEST_F(PackedHrirSet, FilledCellsAreProtectedUnlessReflectionsLoadOrBypassIsInPlay) {
    struct Row {
        bool bypass, mapping;
        int tablesBypass;
        bool replaced;
    };
    constexpr Row rows[] = {
        {false, false, 0, false}, {false, false, 1, true}, {false, true, 0, true},
        {true, false, 0, true},   {true, false, 1, true},  {true, true, 1, true},
    };
    for (const Row& row : rows) {
        replaceHrirStream(70);
        HrirDatabase database(row.bypass ? bypassed(24000) : settings(24000));
        database.mappingReflections = row.mapping;
        database.fileCount = 5;
        databaseBypassMode = static_cast<std::uint8_t>(row.tablesBypass);
        HrirSlot slot = &hrirTable[9];
        EXPECT_TRUE(database.loadFilterFile(slot, fields_.request()));
        EXPECT_EQ(slot, row.replaced ? &hrirTable[5] : &hrirTable[9])
            << row.bypass << row.mapping << row.tablesBypass;
        EXPECT_EQ(database.fileCount, row.replaced ? 6 : 5);
    }
}

// ---- Static filter ----

class StaticHrir : public PackedHrirSet {
protected:
    StaticHrir() {
        test::writePackedHrirSet(directory_.path(), 44100);
        fields_.phiIn = -40;
        fields_.thetaIn = 15;
    }
    HrirDatabaseSettings still(bool bypass) const {
        HrirDatabaseSettings made = bypass ? bypassed(44100) : settings(44100);
        made.qvTrackDirection = false;
        made.limitPhi = 0;
        made.limitTheta = 0;
        made.phiSteps = 0;
        made.thetaSteps = 0;
        return made;
    }
};

TEST_F(StaticHrir, TakesTheFirstHrirWhateverTheDirection) {
    HrirDatabase database(still(false));
    ASSERT_TRUE(loadAsFirst(database));
    EXPECT_EQ(database.staticFilter, &hrirTable[0]);
    EXPECT_EQ(database.fileCount, 1);
    EXPECT_EQ(fields_.phi, -40);
    EXPECT_EQ(fields_.phiNew, -40);
    EXPECT_EQ(fields_.theta, 15);
    EXPECT_EQ(hrirAt(36, 18), nullptr);
    EXPECT_EQ(log_.outputLines().back(), "Load Static-FilterFile with phi = -40 and theta = 15");
    EXPECT_EQ(databaseBypassMode, 0);
}

TEST_F(StaticHrir, IsAPanPairOfTheHostsAzimuthUnderBypass) {
    HrirDatabase database(still(true));
    ASSERT_TRUE(loadAsFirst(database));
    const std::vector<float> expected = panPair(128, -40);
    ASSERT_NE(hrirOf(database.staticFilter), nullptr);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), hrirOf(database.staticFilter)));
    EXPECT_EQ(databaseBypassMode, 1);
}

TEST_F(StaticHrir, IsNotLoadedByASharingEngine) {
    HrirDatabase first(settings(44100));
    ASSERT_TRUE(loadAsFirst(first));
    HrirDatabase later(still(false));
    ASSERT_TRUE(later.load(1, fields_.request()));
    EXPECT_EQ(later.staticFilter, nullptr);
    EXPECT_EQ(hrirOf(later.staticFilter), nullptr);
}

TEST_F(StaticHrir, ReflectionsTakeTheDirectionAskedFor) {
    HrirDatabase database(still(true));
    ASSERT_TRUE(loadAsFirst(database));
    database.mappingReflections = true;
    fields_.phi = 75;
    HrirSlot slot = nullptr;
    ASSERT_TRUE(database.loadFilterFile(slot, fields_.request()));
    EXPECT_EQ(slot, &hrirTable[1]);
    EXPECT_EQ(fields_.phi, 75);
    const std::vector<float> expected = panPair(128, 75);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), hrirOf(slot)));
}

}  // namespace
}  // namespace tessaly
