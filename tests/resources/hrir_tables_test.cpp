// Tests of the process-wide HRIR tables and of the memory behind them.
#include "resources/hrir_tables.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "resources/hrir_fixture.h"

namespace tessaly {
namespace {

using test::isSilent;

class HrirTables : public test::HrirTest {};

TEST_F(HrirTables, CellsAreIndexedByAzimuthThenElevation) {
    EXPECT_EQ(filterTableCell(0, 0), &filterTable[0]);
    EXPECT_EQ(filterTableCell(36, 18), &filterTable[36 * 37 + 18]);
    EXPECT_EQ(filterTableCell(72, 36), &filterTable[73 * 37 - 1]);
}

TEST_F(HrirTables, ThereAreNoCellsOffTheGrid) {
    for (const auto& [i, t] : {std::pair{-1, 0}, {73, 0}, {0, -1}, {0, 37}, {-1, 37}, {32767, 0}}) {
        EXPECT_EQ(filterTableCell(i, t), nullptr) << i << ' ' << t;
        EXPECT_EQ(hrirAt(i, t), nullptr) << i << ' ' << t;
    }
}

TEST_F(HrirTables, NullCellsAndNullEntriesHaveNoHrir) {
    EXPECT_EQ(hrirAt(36, 18), nullptr);
    filterTable[36 * 37 + 18] = &hrirTable[5];
    EXPECT_EQ(hrirAt(36, 18), nullptr);
    float pairs[2] = {};
    hrirTable[5] = pairs;
    EXPECT_EQ(hrirAt(36, 18), pairs);
    EXPECT_EQ(hrirOf(nullptr), nullptr);
}

TEST_F(HrirTables, EntriesLieOneStrideApart) {
    replaceHrirStream(139);
    ASSERT_NE(HRTFStream, nullptr);
    for (int k = 0; k < hrirCount; ++k) {
        ASSERT_EQ(hrirTable[k], HRTFStream + static_cast<std::ptrdiff_t>(k) * 139 * 2) << k;
    }
}

TEST_F(HrirTables, TheLongestHrirCanBeReadFromEveryEntry) {
    for (const int length : {70, 128, 139, 256}) {
        replaceHrirStream(length);
        EXPECT_TRUE(isSilent(hrirTable[0], hrirMaxLength)) << length;
        EXPECT_TRUE(isSilent(hrirTable[hrirCount - 1], length + hrirMaxLength)) << length;
    }
}

TEST_F(HrirTables, ReplacingMovesOlderReadersToTheNewSet) {
    replaceHrirStream(128);
    hrirTable[7][3] = 1.0f;
    filterTable[100] = &hrirTable[7];
    replaceHrirStream(70);
    ASSERT_NE(hrirOf(filterTable[100]), nullptr);
    EXPECT_EQ(hrirOf(filterTable[100]), HRTFStream + 7 * 70 * 2);
    EXPECT_TRUE(isSilent(hrirOf(filterTable[100]), hrirMaxLength));
}

TEST_F(HrirTables, ASetOfNoLengthIsStillReadable) {
    for (const int length : {0, -3}) {
        replaceHrirStream(length);
        EXPECT_TRUE(isSilent(hrirTable[hrirCount - 1], hrirMaxLength));
    }
}

TEST_F(HrirTables, AppendedHrirsHaveMemoryOfTheirOwn) {
    HrirSlot first = appendHrir(70);
    HrirSlot second = appendHrir(128);
    EXPECT_EQ(first, &hrirTable[0]);
    EXPECT_EQ(second, &hrirTable[1]);
    EXPECT_EQ(nextFreeHrir, 2);
    EXPECT_TRUE(isSilent(*first, hrirMaxLength));
    std::fill_n(*first, hrirMaxLength * 2, 1.0f);
    EXPECT_TRUE(isSilent(*second, hrirMaxLength));
}

TEST_F(HrirTables, AppendingEndsWithTheTable) {
    for (int k = 0; k < hrirCount; ++k) {
        ASSERT_EQ(appendHrir(1), &hrirTable[k]);
    }
    const std::vector<float*> before(std::begin(hrirTable), std::end(hrirTable));
    EXPECT_EQ(appendHrir(1), nullptr);
    EXPECT_EQ(nextFreeHrir, hrirCount);
    EXPECT_TRUE(std::equal(before.begin(), before.end(), std::begin(hrirTable)));
}

TEST_F(HrirTables, ResetRestoresTheStartValues) {
    replaceHrirStream(70);
    appendHrir(70);
    filterTable[3] = &hrirTable[1];
    databaseBypassMode = 1;
    resetHrirTables();
    EXPECT_EQ(HRTFStream, nullptr);
    EXPECT_EQ(nextFreeHrir, 0);
    EXPECT_EQ(databaseBypassMode, 0);
    EXPECT_TRUE(std::all_of(std::begin(hrirTable), std::end(hrirTable),
                            [](const float* entry) { return entry == nullptr; }));
    EXPECT_TRUE(std::all_of(std::begin(filterTable), std::end(filterTable),
                            [](HrirSlot slot) { return slot == nullptr; }));
}

}  // namespace
}  // namespace tessaly
