// Direction tests, clamping and stepping across the grid.
#include "engine/source_direction.h"

#include <gtest/gtest.h>

#include <cmath>

namespace tessaly::test {
namespace {

EffectiveSettings fullRange() {
    EffectiveSettings switches;
    switches.limitPhi = 180;
    switches.limitTheta = 90;
    switches.useElevation = true;
    return switches;
}

SourceDirection at(int phi, int theta) {
    SourceDirection direction;
    direction.phi = direction.phiOld = direction.phiNew = static_cast<std::int16_t>(phi);
    direction.theta = direction.thetaOld = direction.thetaNew = static_cast<std::int16_t>(theta);
    direction.indexPhi = direction.indexPhiOld = static_cast<std::int16_t>((phi + 180) / 5);
    direction.indexTheta = direction.indexThetaOld = static_cast<std::int16_t>((theta + 90) / 5);
    return direction;
}

void moveTo(SourceDirection& direction, int phi, int theta) {
    direction.phiNew = static_cast<std::int16_t>(phi);
    direction.thetaNew = static_cast<std::int16_t>(theta);
}

TEST(SourceDirectionChange, BeyondTheLimitNothingChanges) {
    EffectiveSettings switches = fullRange();
    switches.limitPhi = 90;
    SourceDirection direction = at(90, 0);
    moveTo(direction, 120, 0);
    EXPECT_FALSE(direction.changed(switches)) << "present at the limit, new beyond it";
    moveTo(direction, 90, 0);
    EXPECT_FALSE(direction.changed(switches)) << "the same value";
    moveTo(direction, -90, 0);
    EXPECT_TRUE(direction.changed(switches)) << "new value at the limit counts";
    direction = at(85, 0);
    moveTo(direction, 120, 0);
    EXPECT_TRUE(direction.changed(switches)) << "present value inside the limit counts";
}

TEST(SourceDirectionChange, ElevationCountsOnlyIfUsed) {
    EffectiveSettings switches = fullRange();
    SourceDirection direction = at(0, 0);
    moveTo(direction, 0, 10);
    EXPECT_TRUE(direction.changed(switches));
    switches.useElevation = false;
    EXPECT_FALSE(direction.changed(switches));
}

TEST(SourceDirectionUpdate, ClampsFourDegreesAboveTheLimit) {
    EffectiveSettings switches = fullRange();
    switches.limitPhi = 90;
    const struct {
        int wanted;
        int got;
    } cases[] = {{-95, -90}, {-90, -90}, {-89, -89}, {90, 90}, {93, 93}, {94, 90}, {180, 90}};
    for (const auto& c : cases) {
        SourceDirection direction = at(0, 0);
        moveTo(direction, c.wanted, 0);
        bool filterChange = false;
        direction.update(switches, filterChange);
        EXPECT_EQ(direction.phi, c.got) << c.wanted;
        EXPECT_EQ(direction.indexPhi, (c.got + 180) / 5) << c.wanted;
        EXPECT_EQ(direction.phiOld, c.got);
        EXPECT_TRUE(filterChange);
    }
}

TEST(SourceDirectionUpdate, IndicesTruncate) {
    bool filterChange = false;
    SourceDirection direction = at(0, 0);
    moveTo(direction, -177, 44);
    direction.update(fullRange(), filterChange);
    EXPECT_EQ(direction.indexPhi, 0);
    EXPECT_EQ(direction.indexTheta, 26);
    moveTo(direction, 183, -90);
    direction.update(fullRange(), filterChange);
    EXPECT_EQ(direction.indexPhi, 72) << "up to three degrees above 180 pass";
    EXPECT_EQ(direction.indexTheta, 0);
}

TEST(SourceDirectionUpdate, WithoutElevationItsFieldsStay) {
    EffectiveSettings switches = fullRange();
    switches.useElevation = false;
    SourceDirection direction = at(0, 20);
    direction.indexTheta = 7;
    moveTo(direction, 30, 60);
    bool filterChange = false;
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.theta, 20);
    EXPECT_EQ(direction.indexTheta, 7);
    EXPECT_EQ(direction.thetaStep, 0.0f);
}

TEST(SourceDirectionUpdate, SmoothStepsLimitBothAxes) {
    EffectiveSettings switches = fullRange();
    switches.qvSmoothSteps = true;
    SourceDirection direction = at(0, 0);
    bool filterChange = false;
    moveTo(direction, 40, -40);
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.phi, 5);
    EXPECT_EQ(direction.phiStep, 5.0f);
    EXPECT_EQ(direction.theta, -5);
    EXPECT_EQ(direction.thetaStep, -5.0f);
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.phi, 10) << "the next update goes on from there";
    moveTo(direction, 7, -10);
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.phi, 7) << "a step within the limit is taken as it is";
}

TEST(SourceDirectionUpdate, AJumpAcrossTheBackIsNotLimited) {
    EffectiveSettings switches = fullRange();
    switches.qvSmoothSteps = true;
    bool filterChange = false;
    SourceDirection direction = at(-135, 0);
    moveTo(direction, 135, 0);
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.phi, 135);
    EXPECT_EQ(direction.phiStep, 270.0f);
    direction = at(-134, 0);
    moveTo(direction, 135, 0);
    direction.update(switches, filterChange);
    EXPECT_EQ(direction.phi, -129) << "269 degrees are limited";
}

class Bookkeeping : public ::testing::Test {
protected:
    Bookkeeping() {
        switches.interpolateAngles = true;
        direction.angleStep = 1;
    }
    /// One update with bookkeeping to a new direction.
    void go(int phi, int theta) {
        moveTo(direction, phi, theta);
        filterChange = false;
        direction.filterUpdatePending = false;
        direction.holdInterpPair = false;
        direction.update(switches, filterChange);
        filterChange = false;
        direction.bookkeepSteps(switches, filterChange);
    }
    EffectiveSettings switches = fullRange();
    SourceDirection direction = at(0, 0);
    bool filterChange = false;
};

TEST_F(Bookkeeping, FirstDegreeUpAsksForTheNextFilter) {
    go(1, 0);
    EXPECT_TRUE(direction.filterUpdatePending);
    EXPECT_TRUE(filterChange);
    EXPECT_EQ(direction.indexPhi, 37);
    EXPECT_EQ(direction.indexPhiOld, 36);
    EXPECT_EQ(direction.interpAngleOffset, 1.0f);
    EXPECT_EQ(direction.phiStepMoved, 1.0f);
    EXPECT_EQ(direction.phiStep, 0.0f) << "cleared at the end";
}

TEST_F(Bookkeeping, DegreesInBetweenAskForNothing) {
    go(1, 0);
    go(2, 0);
    EXPECT_FALSE(direction.filterUpdatePending);
    EXPECT_FALSE(filterChange);
    EXPECT_EQ(direction.interpAngleOffset, 2.0f);
}

TEST_F(Bookkeeping, FiveDegreesReachTheNextGridPoint) {
    for (int phi = 1; phi <= 5; ++phi) {
        go(phi, 0);
    }
    EXPECT_TRUE(direction.filterUpdatePending);
    EXPECT_EQ(direction.phiMoved, 0.0f);
    EXPECT_EQ(direction.indexPhiOld, direction.indexPhi);
    EXPECT_EQ(direction.interpAngleOffset, 0.0f);
    EXPECT_FALSE(direction.holdInterpPair);
}

TEST_F(Bookkeeping, BackAtTheGridPointHoldsThePair) {
    go(1, 0);
    go(0, 0);
    EXPECT_TRUE(direction.filterUpdatePending);
    EXPECT_TRUE(direction.holdInterpPair);
    EXPECT_EQ(direction.phiMoved, 0.0f);
}

TEST_F(Bookkeeping, FirstDegreeDownKeepsTheIndexOfTheUpdate) {
    go(-1, 0);
    EXPECT_TRUE(direction.filterUpdatePending);
    EXPECT_EQ(direction.indexPhi, 35);
    EXPECT_EQ(direction.interpAngleOffset, -1.0f);
}

TEST_F(Bookkeeping, BothAxesCombineAsTheDiagonal) {
    go(2, 3);
    EXPECT_EQ(direction.thetaMoved, 3.0f);
    EXPECT_EQ(direction.interpAngleOffset,
              static_cast<float>(std::sqrt(13.0) * 0.7071067811865475));
    go(2, 4);
    EXPECT_EQ(direction.interpAngleOffset, 4.0f) << "elevation alone";
    go(3, 4);
    EXPECT_EQ(direction.interpAngleOffset, 3.0f) << "azimuth alone";
    go(3, 4);
    EXPECT_EQ(direction.interpAngleOffset, 3.0f) << "no step: azimuth's bookkeeping stands";
}

TEST_F(Bookkeeping, AStepDownFromOneAboveIsNotAFirstDegree) {
    go(2, 0);
    go(1, 0);
    EXPECT_FALSE(direction.filterUpdatePending) << "moved is 1 but the step went down";
}

}  // namespace
}  // namespace tessaly::test
