// Values between keyframes.
#include "scene/track.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace tessaly {
namespace {

constexpr double tiny = 1.0e-12;  // a few roundings of numbers near 1

ScalarTrack unevenTrack(Interpolation interpolation) {
    return {{{0.5, 2.0}, {1.0, -1.0}, {3.0, 4.0}, {3.25, 4.5}}, interpolation};
}

TEST(Track, HoldsItsFirstAndLastValueOutside) {
    for (const Interpolation interpolation :
         {Interpolation::Step, Interpolation::Linear, Interpolation::Spline}) {
        const ScalarTrack track = unevenTrack(interpolation);
        EXPECT_EQ(valueAt(track, -std::numeric_limits<double>::infinity()), 2.0);
        EXPECT_EQ(valueAt(track, 0.0), 2.0);
        EXPECT_EQ(valueAt(track, 7.0), 4.5);
        EXPECT_EQ(valueAt(track, std::numeric_limits<double>::infinity()), 4.5);
        EXPECT_EQ(valueAt(track, std::numeric_limits<double>::quiet_NaN()), 2.0);
    }
}

TEST(Track, IsExactAtItsKeyframes) {
    for (const Interpolation interpolation :
         {Interpolation::Step, Interpolation::Linear, Interpolation::Spline}) {
        const ScalarTrack track = unevenTrack(interpolation);
        for (const Keyframe<double>& key : track.keys) {
            EXPECT_EQ(valueAt(track, key.time), key.value);
        }
    }
}

TEST(Track, StepKeepsTheLastKeyframe) {
    const ScalarTrack track = unevenTrack(Interpolation::Step);
    EXPECT_EQ(valueAt(track, 0.999), 2.0);
    EXPECT_EQ(valueAt(track, 2.999), -1.0);
    EXPECT_EQ(valueAt(track, 3.2), 4.0);
}

TEST(Track, LinearIsStraight) {
    const ScalarTrack track = unevenTrack(Interpolation::Linear);
    EXPECT_NEAR(valueAt(track, 0.75), 0.5, tiny);
    EXPECT_NEAR(valueAt(track, 1.5), 0.25, tiny);
    EXPECT_NEAR(valueAt(track, 2.0), 1.5, tiny);
}

TEST(Track, SplineOfTwoKeyframesIsStraight) {
    const ScalarTrack track{{{1.0, 3.0}, {5.0, -5.0}}, Interpolation::Spline};
    EXPECT_NEAR(valueAt(track, 2.0), 1.0, tiny);
    EXPECT_NEAR(valueAt(track, 4.5), -4.0, tiny);
}

// Central differences over two equal steps give a parabola's slope exactly, and a cubic with right
// values and slopes at both ends is the parabola.
TEST(Track, SplineFollowsAParabolaBetweenInnerKeyframes) {
    const auto parabola = [](double t) { return 0.5 * t * t - 2.0 * t + 3.0; };
    ScalarTrack track{{}, Interpolation::Spline};
    for (int i = 0; i < 5; ++i) {
        track.keys.push_back({i * 0.5, parabola(i * 0.5)});
    }
    for (double t = 0.5; t <= 1.5; t += 0.0625) {
        EXPECT_NEAR(valueAt(track, t), parabola(t), tiny) << t;
    }
}

// The value of the definition, worked out by hand at the middle of the segment from 1 to 3:
// (p1 + p2) / 2 + h (m1 - m2) / 8.
TEST(Track, SplineTakesSlopesAcrossUnevenNeighbours) {
    const ScalarTrack track = unevenTrack(Interpolation::Spline);
    const double slopeAtOne = (4.0 - 2.0) / (3.0 - 0.5);
    const double slopeAtThree = (4.5 - -1.0) / (3.25 - 1.0);
    EXPECT_NEAR(valueAt(track, 2.0), 1.5 + 2.0 * (slopeAtOne - slopeAtThree) / 8.0, tiny);
}

TEST(Track, SplineLeavesAnEndAlongItsOnlyNeighbour) {
    const ScalarTrack track = unevenTrack(Interpolation::Spline);
    const double step = 1.0e-6;
    EXPECT_NEAR((valueAt(track, 0.5 + step) - 2.0) / step, -6.0, 1.0e-4);
    EXPECT_NEAR((4.5 - valueAt(track, 3.25 - step)) / step, 2.0, 1.0e-4);
}

TEST(Track, SplineHasNoCornerAtAKeyframe) {
    const ScalarTrack track = unevenTrack(Interpolation::Spline);
    const double step = 1.0e-6;
    for (const double at : {1.0, 3.0}) {
        const double before = (valueAt(track, at) - valueAt(track, at - step)) / step;
        const double after = (valueAt(track, at + step) - valueAt(track, at)) / step;
        EXPECT_NEAR(before, after, 1.0e-4) << at;
    }
}

TEST(Track, PositionsMoveOnAllAxesAlone) {
    const PositionTrack track{{{0.0, {0.0, 1.0, -2.0}}, {2.0, {4.0, 1.0, 2.0}}},
                              Interpolation::Linear};
    const Vector3 at = valueAt(track, 0.5);
    EXPECT_NEAR(at.x, 1.0, tiny);
    EXPECT_NEAR(at.y, 1.0, tiny);
    EXPECT_NEAR(at.z, -1.0, tiny);
}

TEST(Track, OneKeyframeIsAConstant) {
    const ScalarTrack track = constantTrack(0.25);
    EXPECT_TRUE(track.constant());
    EXPECT_EQ(valueAt(track, -1.0), 0.25);
    EXPECT_EQ(valueAt(track, 1.0), 0.25);
    EXPECT_FALSE(unevenTrack(Interpolation::Step).constant());
}

}  // namespace
}  // namespace tessaly
