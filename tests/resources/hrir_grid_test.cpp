// Tests of the direction grid.
#include "resources/hrir_grid.h"

#include <gtest/gtest.h>

namespace tessaly {
namespace {

TEST(HrirGrid, IndicesAndDegreesAreInverse) {
    for (int i = 0; i < gridPhiCount; ++i) {
        EXPECT_EQ(indexToPhi(i), -180 + 5 * i);
        EXPECT_EQ(phiToIndex(indexToPhi(i)), i);
    }
    for (int t = 0; t < gridThetaCount; ++t) {
        EXPECT_EQ(indexToTheta(t), -90 + 5 * t);
        EXPECT_EQ(thetaToIndex(indexToTheta(t)), t);
    }
}

TEST(HrirGrid, DirectionsBetweenGridLinesGoDown) {
    EXPECT_EQ(phiToIndex(4), 36);
    EXPECT_EQ(phiToIndex(-1), 35);
    EXPECT_EQ(phiToIndex(-176), 0);
    EXPECT_EQ(phiToIndex(179), 71);
    EXPECT_EQ(thetaToIndex(4), 18);
    EXPECT_EQ(thetaToIndex(-1), 17);
    EXPECT_EQ(thetaToIndex(89), 35);
}

TEST(HrirGrid, CountsAddUp) {
    EXPECT_EQ(hrirCount, 72 * 35 + 2);
    EXPECT_EQ(gridCellCount, 73 * 37);
}

}  // namespace
}  // namespace tessaly
