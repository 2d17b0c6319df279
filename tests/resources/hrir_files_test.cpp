// Tests of the set with one file a direction: names, limits, missing files, full tables.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <iomanip>
#include <sstream>
#include <string>
#include <vector>

#include "resources/hrir_fixture.h"

namespace tessaly {
namespace {

using test::LogStream;
using ::testing::ElementsAre;

/// The name of a direction's file, spelled out by hand: azimuth counted to the right.
std::string fileName(int phi, int theta, int sampleRate, int taps = 128) {
    std::ostringstream name;
    name << "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_" << taps << "_A" << std::setfill('0')
         << std::setw(3) << (360 - phi) % 360 << "_B" << std::setw(3) << theta + 90;
    name << (sampleRate == 24000 ? "_001" : (sampleRate == 48000 ? "_48000" : ""));
    return name.str();
}

class HrirFiles : public test::HrirTest {
protected:
    void writeFileOf(int phi, int theta, int sampleRate = 44100, int taps = 128) {
        const int k = test::testHrirNumber(phi, theta);
        const int frames = taps == 256 ? 256 : test::testHrirTaps(sampleRate);
        std::vector<float> samples;
        for (int n = 0; n < frames; ++n) {
            samples.push_back(test::testHrirSample(k, n, 0));
            samples.push_back(test::testHrirSample(k, n, 1));
        }
        test::writeWavForReader(directory_.file(fileName(phi, theta, sampleRate, taps) + ".wav"), 2,
                                sampleRate, samples);
    }
    void removeFileOf(int phi, int theta) {
        ASSERT_EQ(std::remove(directory_.file(fileName(phi, theta, 44100) + ".wav").c_str()), 0);
    }

    HrirDatabase database(HrirDatabaseSettings settings) const {
        HrirDatabase made(std::move(settings));
        made.usePackedDatabase = false;
        return made;
    }

    /// `limitPhi` and `limitTheta` as the engine derives its fields from them.
    HrirDatabaseSettings limited(int limitPhi, int limitTheta) const {
        HrirDatabaseSettings made = settings(44100);
        made.limitPhi = static_cast<std::int16_t>(limitPhi);
        made.limitTheta = static_cast<std::int16_t>(limitTheta);
        made.phiSteps = static_cast<std::int16_t>(2 * limitPhi / 5);
        made.useElevation = limitTheta > 0;
        made.thetaSteps = static_cast<std::int16_t>(made.useElevation ? 2 * limitTheta / 5 : 0);
        made.thetaCentreIndex = static_cast<std::int16_t>(made.useElevation ? 0 : 18);
        made.thetaLimited = limitTheta != 90;
        return made;
    }

    /// Loads one direction and returns whether it is there.
    bool loadOne(HrirDatabase& from, int phi, int theta, HrirSlot& slot) {
        fields_.phi = static_cast<std::int16_t>(phi);
        fields_.theta = static_cast<std::int16_t>(theta);
        return from.loadFilterFile(slot, fields_.request());
    }

    void expectCell(int i, int t) { expectCellLike(i, t, i, t); }
    void expectCellLike(int i, int t, int likePhi, int likeTheta) {
        const float* pairs = hrirAt(i, t);
        ASSERT_NE(pairs, nullptr) << i << ' ' << t;
        const int k = test::testHrirNumber((likePhi - 36) * 5, (likeTheta - 18) * 5);
        EXPECT_EQ(test::framesUnlike(pairs, 128, k), 0) << i << ' ' << t;
    }
};

// ---- Names ----

TEST_F(HrirFiles, NamesHoldRateLengthAndDirection) {
    for (const int rate : {24000, 44100, 48000}) {
        for (const int taps : {128, 256}) {
            HrirDatabaseSettings made = settings(rate);
            made.qvUse256HRIR = taps == 256;
            HrirDatabase files = database(made);
            for (int phi = -180; phi <= 180; phi += 5) {
                for (const int theta : {-90, -85, -45, 0, 5, 10, 90}) {
                    HrirSlot slot = nullptr;
                    EXPECT_FALSE(loadOne(files, phi, theta, slot));
                    EXPECT_EQ(files.filterFileName, fileName(phi, theta, rate, taps));
                }
            }
        }
    }
}

TEST_F(HrirFiles, NameOfTheFrontIsBuiltOfItsParts) {
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = nullptr;
    loadOne(files, 0, 0, slot);
    EXPECT_EQ(files.fileNameHead, "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_128_A");
    EXPECT_EQ(files.fileNameTail, "000_B090");
    EXPECT_EQ(files.filterFileName, files.fileNameHead + files.fileNameTail);
    EXPECT_EQ(files.fileAzimuth, 0);
    EXPECT_EQ(files.fileElevation, 90);
}

TEST_F(HrirFiles, TheSignOfTheAzimuthFlipsFirstAndStaysFlipped) {
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = nullptr;
    loadOne(files, -5, 10, slot);
    EXPECT_EQ(files.fileNameTail, "005_B100");
    EXPECT_EQ(fields_.phi, 5);
    EXPECT_EQ(fields_.theta, 10);
    loadOne(files, 180, 0, slot);
    EXPECT_EQ(files.fileAzimuth, 180);
    EXPECT_EQ(fields_.phi, -180);
}

TEST_F(HrirFiles, WithoutTrackingTheSignStaysAndTheDirectionEndsAtZero) {
    HrirDatabaseSettings made = settings(48000);
    made.qvTrackDirection = false;
    HrirDatabase files = database(made);
    fields_.phiIn = -5;
    fields_.thetaIn = 20;
    HrirSlot slot = nullptr;
    EXPECT_FALSE(loadOne(files, 77, 78, slot));
    EXPECT_EQ(files.fileNameTail, "355_B110_48000");
    EXPECT_EQ(fields_.phi, 0);
    EXPECT_EQ(fields_.theta, 0);
    EXPECT_EQ(fields_.phiNew, -5);
    EXPECT_EQ(log_.outputLines().front(), "Load Static-FilterFile with phi = -5 and theta = 20");
}

TEST_F(HrirFiles, DirectionsOffTheGridAreDefined) {
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = nullptr;
    for (const int phi : {-32768, -400, -181, 181, 32767}) {
        EXPECT_FALSE(loadOne(files, phi, phi, slot));
        EXPECT_LT(std::abs(files.fileAzimuth), 360);
    }
    loadOne(files, -32768, 0, slot);
    EXPECT_EQ(fields_.phi, -32768);
}

// ---- One file ----

TEST_F(HrirFiles, AFileIsReadIntoAnEntryOfItsOwn) {
    for (const int rate : {24000, 44100, 48000}) {
        writeFileOf(-30, 15, rate);
        HrirDatabase files = database(settings(rate));
        const int entry = nextFreeHrir;
        HrirSlot slot = nullptr;
        ASSERT_TRUE(loadOne(files, -30, 15, slot));
        EXPECT_TRUE(files.filterFound);
        EXPECT_EQ(slot, &hrirTable[entry]);
        EXPECT_EQ(nextFreeHrir, entry + 1);
        EXPECT_EQ(files.fileCount, 0);
        const int taps = test::testHrirTaps(rate);
        EXPECT_EQ(test::framesUnlike(*slot, taps, test::testHrirNumber(-30, 15)), 0) << rate;
        EXPECT_TRUE(test::isSilent(*slot + 2 * taps, hrirMaxLength - taps)) << rate;
    }
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(HrirFiles, AMissingFileLeavesTheSlot) {
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = nullptr;
    EXPECT_FALSE(loadOne(files, 0, 0, slot));
    EXPECT_EQ(slot, nullptr);
    EXPECT_FALSE(files.filterFound);
    EXPECT_EQ(nextFreeHrir, 0);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log_.output(), "");
}

TEST_F(HrirFiles, AnUnreadableFileIsMappedAsSilence) {
    test::writeWav(directory_.file(fileName(0, 0, 44100) + ".wav"), 1, 44100, 32,
                   std::vector<float>(128, 0.5f));
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = nullptr;
    EXPECT_TRUE(loadOne(files, 0, 0, slot));
    EXPECT_EQ(essError, essErrorWavChannels);
    ASSERT_NE(slot, nullptr);
    EXPECT_TRUE(test::isSilent(*slot, hrirMaxLength));
}

TEST_F(HrirFiles, AFilledSlotIsKeptUnlessReflectionsLoad) {
    writeFileOf(0, 0);
    HrirDatabase files = database(settings(44100));
    HrirSlot slot = &hrirTable[2000];
    EXPECT_TRUE(loadOne(files, 0, 0, slot));
    EXPECT_EQ(slot, &hrirTable[2000]);
    EXPECT_EQ(nextFreeHrir, 0);
    files.mappingReflections = true;
    EXPECT_TRUE(loadOne(files, 0, 0, slot));
    EXPECT_EQ(slot, &hrirTable[0]);
}

TEST_F(HrirFiles, WithBypassThereIsNoEntryToWriteTo) {
    HrirDatabaseSettings made = settings(44100);
    made.bypass3DAudio = true;
    HrirDatabase files = database(made);
    HrirSlot slot = nullptr;
    EXPECT_FALSE(loadOne(files, 0, 0, slot));
    EXPECT_EQ(slot, nullptr);
    EXPECT_EQ(log_.output(), "file with fileCount = 0 doesn't exist!!\n");
}

// ---- Without elevation ----

TEST_F(HrirFiles, WithoutElevationTheHorizontalPlaneIsLoaded) {
    for (int phi = -180; phi <= 180; phi += 5) {
        writeFileOf(phi, 0);
    }
    HrirDatabase files = database(limited(180, 0));
    files.LoadDataBase(fields_.request());
    for (int i = 0; i <= 72; ++i) {
        expectCell(i, 18);
        EXPECT_EQ(hrirAt(i, 17), nullptr);
        EXPECT_EQ(hrirAt(i, 19), nullptr);
    }
    EXPECT_EQ(nextFreeHrir, 73);
    EXPECT_EQ(fields_.indexPhi, 72);
    EXPECT_EQ(fields_.indexTheta, 18);
    EXPECT_EQ(log_.outputLines().front(), "LoadDataBase without Elevation!");
}

TEST_F(HrirFiles, WithoutElevationTheAzimuthBelowStandsIn) {
    for (const int i : {34, 35, 37}) {
        writeFileOf((i - 36) * 5, 0);
    }
    HrirDatabase files = database(limited(10, 0));
    files.LoadDataBase(fields_.request());
    expectCell(34, 18);
    expectCell(35, 18);
    expectCellLike(36, 18, 35, 18);
    expectCell(37, 18);
    expectCellLike(38, 18, 37, 18);
    EXPECT_EQ(hrirAt(33, 18), nullptr);
    EXPECT_EQ(hrirAt(39, 18), nullptr);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log_.count(LogStream::output,
                         "File existiert nicht, daher auf letzten gemappte mit "
                         "indexPhi = 35"),
              1u);
    EXPECT_EQ(log_.count(LogStream::output, "mit indexPhi = 37"), 1u);
}

TEST_F(HrirFiles, WithoutElevationNothingStandsInForTheFirst) {
    writeFileOf(-170, 0);
    HrirDatabase files = database(limited(180, 0));
    files.LoadDataBase(fields_.request());
    EXPECT_EQ(hrirAt(0, 18), nullptr);
    EXPECT_EQ(hrirAt(1, 18), nullptr);
    expectCell(2, 18);
    expectCellLike(72, 18, 2, 18);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log_.outputLines()[1],
              "File existiert nicht, daher auf letzten gemappte mit indexPhi = -1");
}

// ---- With elevation ----

TEST_F(HrirFiles, WithElevationTheLimitsAreLoaded) {
    for (int phi = -10; phi <= 10; phi += 5) {
        for (int theta = -10; theta <= 10; theta += 5) {
            writeFileOf(phi, theta);
        }
    }
    HrirDatabase files = database(limited(10, 10));
    files.LoadDataBase(fields_.request());
    for (int i = 0; i < gridPhiCount; ++i) {
        for (int t = 0; t < gridThetaCount; ++t) {
            if (i >= 34 && i <= 38 && t >= 16 && t <= 20) {
                expectCell(i, t);
            } else {
                EXPECT_EQ(hrirAt(i, t), nullptr) << i << ' ' << t;
            }
        }
    }
    EXPECT_EQ(nextFreeHrir, 25);
    EXPECT_EQ(essError, essErrorNone);
    const std::vector<std::string> lines = log_.outputLines();
    ASSERT_GE(lines.size(), 3u);
    EXPECT_THAT(std::vector<std::string>(lines.begin(), lines.begin() + 3),
                ElementsAre("LoadDataBase with Elevation!.....", "startIndexPhi = 34",
                            "startIndexTheta = 16"));
    EXPECT_EQ(log_.count(LogStream::output, "load top and down!"), 0u);
}

TEST_F(HrirFiles, WithElevationTheFullGridRunsOutOfEntries) {
    for (int k = 0; k < hrirCount; ++k) {
        const test::TestDirection direction = test::testHrirDirection(k);
        writeFileOf(direction.phi, direction.theta);
    }
    HrirDatabase files = database(limited(180, 90));
    files.LoadDataBase(fields_.request());
    EXPECT_EQ(log_.count(LogStream::output, "load top and down!"), 1u);
    EXPECT_EQ(nextFreeHrir, hrirCount);
    EXPECT_EQ(essError, essErrorNone);
    // Two poles and 34 rows of 73 fit, then 38 cells of the lowest row; the 35 others take the
    // last entry from their neighbour.
    for (int i = 0; i < gridPhiCount; ++i) {
        EXPECT_EQ(filterTable[i * gridThetaCount + 36], &hrirTable[0]);
        EXPECT_EQ(filterTable[i * gridThetaCount], &hrirTable[1]);
        expectCellLike(i, 36, 36, 36);
        expectCellLike(i, 0, 36, 0);
        for (int t = 2; t < 36; ++t) {
            expectCell(i, t);
        }
        expectCellLike(i, 1, std::min(i, 37), 1);
    }
    EXPECT_EQ(log_.count(LogStream::output, "File not found searching"), 35u);
}

TEST_F(HrirFiles, AMissingFileTakesTheAzimuthBelow) {
    for (int phi = -10; phi <= 10; phi += 5) {
        for (int theta = -10; theta <= 10; theta += 5) {
            writeFileOf(phi, theta);
        }
    }
    removeFileOf(5, 0);
    removeFileOf(10, 0);
    HrirDatabase files = database(limited(10, 10));
    files.LoadDataBase(fields_.request());
    expectCellLike(37, 18, 36, 18);
    expectCellLike(38, 18, 36, 18);
    expectCell(37, 17);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(log_.count(LogStream::output, "found it! :-) 36\t18"), 1u);
    EXPECT_EQ(log_.count(LogStream::output, "found it! :-) 37\t18"), 1u);
}

TEST_F(HrirFiles, AMissingFileAtTheFirstAzimuthFails) {
    // The azimuth above, which could stand in, is not mapped yet.
    for (int phi = -10; phi <= 10; phi += 5) {
        for (int theta = -10; theta <= 10; theta += 5) {
            writeFileOf(phi, theta);
        }
    }
    removeFileOf(-10, 5);
    HrirDatabase files = database(limited(10, 10));
    files.LoadDataBase(fields_.request());
    EXPECT_EQ(essError, essErrorHrirMissing);
    // The azimuth is told as the file names have it.
    const std::string text =
        "Tessaly_e ERROR: no corresponding HRIR-found for phi 10 and theta 5found!";
    EXPECT_EQ(log_.outputLines().back(), text);
    EXPECT_THAT(log_.errorLines(), ElementsAre(text));
    // The rows above it are loaded, those below are not.
    expectCell(38, 20);
    EXPECT_EQ(hrirAt(34, 19), nullptr);
    EXPECT_EQ(hrirAt(35, 19), nullptr);
    EXPECT_EQ(hrirAt(34, 18), nullptr);
}

TEST_F(HrirFiles, AnEmptyDirectoryFailsAtTheFirstCell) {
    for (const int limit : {180, 90, 10, 5}) {
        essError = essErrorNone;
        log_.clear();
        HrirDatabase files = database(limited(limit, 90));
        files.LoadDataBase(fields_.request());
        EXPECT_EQ(essError, essErrorHrirMissing) << limit;
        EXPECT_EQ(log_.errorLines().size(), 1u) << limit;
        EXPECT_EQ(nextFreeHrir, 0);
    }
}

TEST_F(HrirFiles, MissingPolesStayEmpty) {
    writeFileOf(0, -90);
    HrirDatabase files = database(limited(5, 90));
    files.LoadDataBase(fields_.request());
    for (int i = 35; i <= 37; ++i) {
        EXPECT_EQ(hrirAt(i, 36), nullptr);
        expectCellLike(i, 0, 36, 0);
    }
    EXPECT_EQ(hrirAt(34, 0), nullptr);
    EXPECT_EQ(hrirAt(38, 0), nullptr);
}

TEST_F(HrirFiles, LimitsBeyondTheGridStayInsideTheTable) {
    writeFileOf(0, 0);
    for (const auto& [phi, theta] : {std::pair{-5, -5}, {400, 400}, {-400, 45}, {0, 0}, {0, 5}}) {
        HrirDatabaseSettings made = limited(phi, theta);
        for (const bool useElevation : {false, true}) {
            made.useElevation = useElevation;
            resetHrirTables();
            HrirDatabase files = database(made);
            files.LoadDataBase(fields_.request());
            EXPECT_LE(nextFreeHrir, 1) << phi << ' ' << theta;
        }
    }
}

TEST_F(HrirFiles, LoadingAgainKeepsWhatIsMapped) {
    for (int phi = -5; phi <= 5; phi += 5) {
        for (int theta = -5; theta <= 5; theta += 5) {
            writeFileOf(phi, theta);
        }
    }
    HrirDatabase files = database(limited(5, 5));
    files.LoadDataBase(fields_.request());
    const std::vector<HrirSlot> before(std::begin(filterTable), std::end(filterTable));
    HrirDatabase second = database(limited(5, 5));
    second.LoadDataBase(fields_.request());
    EXPECT_TRUE(std::equal(before.begin(), before.end(), std::begin(filterTable)));
    EXPECT_EQ(nextFreeHrir, 9);
}

}  // namespace
}  // namespace tessaly
