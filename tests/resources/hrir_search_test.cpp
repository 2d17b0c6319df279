// Tests of the search that fills the cell of a missing HRIR file from its neighbours.
#include "resources/hrir_search.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "resources/hrir_fixture.h"

namespace tessaly {
namespace {

using test::LogLine;
using test::LogStream;
using ::testing::ElementsAre;

constexpr const char* searching = "File not found searching for alternatives....";
constexpr const char* phiDown = "chose next file! - phi!";
constexpr const char* phiUp = "chose next file! + phi!";
constexpr const char* thetaDown = "chose next file! - theta!";
constexpr const char* nothingPassed = "next file passed = 0";
constexpr const char* somethingPassed = "next file passed = 1";

class HrirSearchTest : public test::HrirTest {
protected:
    /// Maps a cell to an entry of its own.
    HrirSlot fill(int i, int t) {
        HrirSlot entry = &hrirTable[(i * gridThetaCount + t) % hrirCount];
        *filterTableCell(i, t) = entry;
        return entry;
    }

    /// Runs the search for a cell of the full grid, unless told otherwise.
    bool search(int i, int t, int lastPhi = 72, int lastTheta = 36) {
        log_.clear();
        const HrirSearch wanted{i, t, lastPhi, lastTheta, std::int16_t{10}, std::int16_t{-25}};
        return searchMappedHrir(*filterTableCell(i, t), wanted);
    }

    HrirSlot cell(int i, int t) { return *filterTableCell(i, t); }

    void expectFailure(int i, int t) {
        EXPECT_EQ(essError, essErrorHrirMissing);
        EXPECT_EQ(cell(i, t), nullptr);
        const std::string text =
            "Tessaly_e ERROR: no corresponding HRIR-found for phi 10 and theta -25found!";
        ASSERT_GE(log_.lines().size(), 2u);
        EXPECT_EQ(log_.lines()[log_.lines().size() - 2], (LogLine{LogStream::output, text}));
        EXPECT_EQ(log_.lines().back(), (LogLine{LogStream::error, text}));
        EXPECT_EQ(log_.errorLines().size(), 1u);
    }
};

TEST_F(HrirSearchTest, TakesTheNeighbourOneAzimuthBelow) {
    HrirSlot neighbour = fill(39, 20);
    fill(41, 20);
    fill(40, 21);
    EXPECT_TRUE(search(40, 20));
    EXPECT_EQ(cell(40, 20), neighbour);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_THAT(log_.outputLines(),
                ElementsAre(searching, phiDown, somethingPassed, "found it! :-) 39\t20"));
    EXPECT_EQ(log_.error(), "");
}

TEST_F(HrirSearchTest, AFilledCellBehindAnEmptyOneEndsItWithNothing) {
    fill(38, 20);
    fill(41, 20);
    EXPECT_TRUE(search(40, 20));
    EXPECT_EQ(cell(40, 20), nullptr);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_THAT(log_.outputLines(), ElementsAre(searching, phiDown, nothingPassed));
}

TEST_F(HrirSearchTest, AFilledCellFarBelowEndsItOneStepBeforeThat) {
    fill(30, 20);
    EXPECT_TRUE(search(40, 20));
    EXPECT_EQ(cell(40, 20), nullptr);
    EXPECT_EQ(log_.count(LogStream::output, phiDown), 9u);
}

TEST_F(HrirSearchTest, AtTheFirstAzimuthTheNextOneIsTaken) {
    HrirSlot neighbour = fill(1, 20);
    EXPECT_TRUE(search(0, 20));
    EXPECT_EQ(cell(0, 20), neighbour);
    // The place is told as if the step had gone down.
    EXPECT_THAT(log_.outputLines(), ElementsAre(searching, phiDown, nothingPassed, phiUp,
                                                somethingPassed, "found it! :-) -1\t20"));
}

TEST_F(HrirSearchTest, WithNothingBelowTheNextOneAboveIsTaken) {
    HrirSlot neighbour = fill(4, 20);
    EXPECT_TRUE(search(3, 20));
    EXPECT_EQ(cell(3, 20), neighbour);
    EXPECT_EQ(log_.count(LogStream::output, phiDown), 4u);
    EXPECT_EQ(log_.outputLines().back(), "found it! :-) 2\t20");
}

TEST_F(HrirSearchTest, FailsWhenNoAzimuthIsMapped) {
    for (const int i : {0, 1, 2, 36, 71}) {
        essError = essErrorNone;
        EXPECT_FALSE(search(i, 20)) << i;
        expectFailure(i, 20);
        // Once down to the edge, up, and down to the edge again.
        EXPECT_EQ(log_.count(LogStream::output, phiUp), 1u) << i;
    }
}

TEST_F(HrirSearchTest, OnlyTheDirectNeighbourAboveIsLookedAt) {
    fill(5, 20);
    EXPECT_FALSE(search(3, 20));
    expectFailure(3, 20);
}

TEST_F(HrirSearchTest, AtTheLastAzimuthTheElevationAboveIsTaken) {
    HrirSlot above = fill(72, 21);
    fill(72, 19);
    EXPECT_TRUE(search(72, 20));
    EXPECT_EQ(cell(72, 20), above);
    const std::vector<std::string> lines = log_.outputLines();
    ASSERT_GE(lines.size(), 5u);
    EXPECT_THAT(std::vector<std::string>(lines.end() - 5, lines.end()),
                ElementsAre(phiUp, nothingPassed, "chose next file! + theta! (countFail = 1",
                            somethingPassed, "found it! :-) 72\t21"));
}

TEST_F(HrirSearchTest, TheWalkGoesUpUntilItFinds) {
    HrirSlot above = fill(72, 24);
    EXPECT_TRUE(search(72, 20));
    EXPECT_EQ(cell(72, 20), above);
    EXPECT_EQ(log_.count(LogStream::output, "chose next file! + theta! (countFail = "), 4u);
    EXPECT_EQ(log_.outputLines().back(), "found it! :-) 72\t24");
}

TEST_F(HrirSearchTest, AboveTheRangeTheElevationBelowIsTaken) {
    HrirSlot below = fill(72, 35);
    EXPECT_TRUE(search(72, 36));
    EXPECT_EQ(cell(72, 36), below);
    const std::vector<std::string> lines = log_.outputLines();
    ASSERT_GE(lines.size(), 5u);
    // The place is told as if the step had gone up.
    EXPECT_THAT(std::vector<std::string>(lines.end() - 5, lines.end()),
                ElementsAre("chose next file! + theta! (countFail = 1", nothingPassed, thetaDown,
                            somethingPassed, "found it! :-) 72\t37"));
}

TEST_F(HrirSearchTest, ACellAboveTheRangeIsNotTaken) {
    fill(38, 27);
    HrirSlot below = fill(38, 25);
    EXPECT_TRUE(search(38, 26, 38, 26));
    EXPECT_EQ(cell(38, 26), below);
}

TEST_F(HrirSearchTest, AtTheLowestElevationTheWalkFails) {
    EXPECT_FALSE(search(72, 0, 72, 0));
    expectFailure(72, 0);
    EXPECT_EQ(log_.count(LogStream::output, "chose next file! + theta!"), 1u);
}

TEST_F(HrirSearchTest, TheWalkGivesUpAfter201Turns) {
    EXPECT_FALSE(search(72, 20));
    expectFailure(72, 20);
    EXPECT_EQ(log_.count(LogStream::output, "chose next file! + theta! (countFail = "), 201u);
    EXPECT_EQ(log_.count(LogStream::output, "(countFail = 201"), 1u);
    EXPECT_EQ(log_.count(LogStream::output, phiUp), 1u);
}

TEST_F(HrirSearchTest, AFilledElevationBehindAnEmptyOneEndsTheWalkAndThenTheSearch) {
    fill(72, 18);
    EXPECT_FALSE(search(72, 20));
    expectFailure(72, 20);
    EXPECT_EQ(log_.count(LogStream::output, "chose next file! + theta!"), 1u);
    // Back among the azimuths it goes on two below and arrives at the edge once more.
    EXPECT_EQ(log_.count(LogStream::output, phiDown), 73u + 72u);
}

TEST_F(HrirSearchTest, NarrowLimitsMoveTheEdges) {
    HrirSlot above = fill(38, 21);
    EXPECT_TRUE(search(38, 20, 38, 22));
    EXPECT_EQ(cell(38, 20), above);
    // Within wider limits the azimuth above would be asked first.
    *filterTableCell(38, 20) = nullptr;
    HrirSlot next = fill(39, 20);
    EXPECT_TRUE(search(38, 20, 72, 36));
    EXPECT_EQ(cell(38, 20), next);
}

}  // namespace
}  // namespace tessaly
