// The reference's HRIR tables: order of the set, own file reader, mapping at full and narrow
// limits.
#include "support/reference/reference_hrir.h"

#include <gtest/gtest.h>

#include <set>

#include "support/reference/reference_engine.h"
#include "support/test_data.h"

namespace tessaly::reference {
namespace {

double marked(int k, int frame, int ear) { return k + frame * 1e-4 + ear * 0.5; }

EngineOptions smallOptions() {
    EngineOptions options;
    options.blockLength = 64;
    return options;
}

TEST(ReferenceHrir, OrderOfTheSet) {
    EXPECT_EQ(hrirNumber(0, -90), 0);
    EXPECT_EQ(hrirNumber(0, -85), 1);
    EXPECT_EQ(hrirNumber(0, 0), 18);
    EXPECT_EQ(hrirNumber(0, 85), 35);
    EXPECT_EQ(hrirNumber(75, 90), 36);
    EXPECT_EQ(hrirNumber(-5, -85), 37);
    EXPECT_EQ(hrirNumber(-5, 85), 71);
    EXPECT_EQ(hrirNumber(-90, 0), 649);
    EXPECT_EQ(hrirNumber(-175, 85), 1261);
    EXPECT_EQ(hrirNumber(180, -85), 1262);
    EXPECT_EQ(hrirNumber(-180, -85), 1262);
    EXPECT_EQ(hrirNumber(5, 85), 2521);
    std::set<int> all;
    for (int phi = -175; phi <= 180; phi += 5) {
        for (int theta = -90; theta <= 90; theta += 5) {
            all.insert(hrirNumber(phi, theta));
        }
    }
    EXPECT_EQ(all.size(), static_cast<std::size_t>(hrirCount));
}

TEST(ReferenceHrir, FullMappingFollowsTheOrder) {
    Process process;
    process.hrirSource = setOf(marked);
    SourceInputs inputs;
    MixLevels mix;
    const Engine engine(process, inputs, mix, smallOptions());
    EXPECT_EQ(process.essError, 1);
    for (int row = 0; row < azimuthRows; ++row) {
        for (int column = 0; column < elevationColumns; ++column) {
            ASSERT_EQ(process.hrirs.at(row, column), hrirNumber((row - 36) * 5, (column - 18) * 5))
                << row << " " << column;
        }
    }
}

TEST(ReferenceHrir, NarrowLimitsMapFewerRowsAndTheWrongOnes) {
    Process process;
    process.hrirSource = setOf(marked);
    SourceInputs inputs;
    MixLevels mix;
    EngineOptions options = smallOptions();
    options.qualityValue = 6;  // 90 degrees either side, all elevations
    const Engine engine(process, inputs, mix, options);
    // Rows 18 down to 1, then 36 down to 19, take the HRIRs in file order.
    EXPECT_EQ(process.hrirs.at(18, 1), 1);
    EXPECT_EQ(process.hrirs.at(17, 1), 36);
    EXPECT_EQ(process.hrirs.at(1, 1), 1 + 17 * 35);
    EXPECT_EQ(process.hrirs.at(36, 1), 1 + 18 * 35);
    EXPECT_EQ(process.hrirs.at(36, 36), 1 + 19 * 35);
    EXPECT_EQ(process.hrirs.at(35, 1), 2 + 19 * 35);
    EXPECT_EQ(process.hrirs.at(0, 18), process.hrirs.at(36, 18));
    EXPECT_EQ(process.hrirs.at(37, 18), noHrir);
    EXPECT_EQ(process.hrirs.sample(noHrir, 3, 0), 0.0);
}

TEST(ReferenceHrir, ReaderGivesTheSamplesOfTheFileAtEveryRate) {
    const test::TempDirectory directory;
    for (const int rate : {24000, 44100, 48000}) {
        test::writePackedHrirSet(directory.path(), rate);
        const int taps = hrirFrames(rate, false);
        const HrirFile file = packedFilesIn(directory.path())(rate, taps * hrirCount);
        ASSERT_EQ(file.error, 1);
        for (const int k : {0, 18, 649, 2521}) {
            for (int frame = 0; frame < taps; ++frame) {
                for (int ear = 0; ear < 2; ++ear) {
                    ASSERT_EQ(file.samples[2 * (k * taps + frame) + ear],
                              static_cast<double>(test::testHrirSample(k, frame, ear)));
                }
            }
        }
    }
    EXPECT_EQ(packedFilesIn(directory.path())(44100, 256 * hrirCount).error, -108);
    EXPECT_EQ(packedFilesIn(directory.path() + "/none")(44100, 128).error, -103);
}

TEST(ReferenceHrir, LengthsByRate) {
    EXPECT_EQ(hrirFrames(24000, false), 70);
    EXPECT_EQ(hrirFrames(44100, false), 128);
    EXPECT_EQ(hrirFrames(48000, false), 139);
    EXPECT_EQ(hrirFrames(48000, true), 256);
}

TEST(ReferenceHrir, PanPairPutsOneTapPerEar) {
    Process process;
    process.hrirSource = setOf(marked);
    SourceInputs inputs;
    MixLevels mix;
    EngineOptions options = smallOptions();
    options.sampleRate = 44100;
    options.bypass3DAudio = true;
    const Engine engine(process, inputs, mix, options);
    // Straight ahead: both ears alike, at a quarter of the HRIR's length.
    const int front = process.hrirs.at(36, 18);
    const double even = 1.65 * 0.5 * 0.6 + 0.4;
    for (int i = 0; i < 128; ++i) {
        ASSERT_NEAR(process.hrirs.sample(front, i, 0), i == 32 ? even : 0.0, 1e-12) << i;
        ASSERT_NEAR(process.hrirs.sample(front, i, 1), i == 32 ? even : 0.0, 1e-12) << i;
    }
    // Fully to the right (phi -90): the right ear at once and loud, the left late and soft.
    const int right = process.hrirs.at(18, 18);
    EXPECT_NEAR(process.hrirs.sample(right, 0, 0), 1.65 * 0.6 + 0.4, 1e-6);
    EXPECT_NEAR(process.hrirs.sample(right, 64, 1), 0.4, 1e-6);
}

}  // namespace
}  // namespace tessaly::reference
