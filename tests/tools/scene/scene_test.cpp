// Where sources and listener are in a scene.
#include "scene/scene.h"

#include <gtest/gtest.h>

#include <cmath>

namespace tessaly {
namespace {

constexpr double tiny = 1.0e-9;  // metres; degrees of a few roundings

TEST(Scene, APathTakesTheWholeDuration) {
    const ScenePath path = SourcePath(LinePath{{-2.0, 0.0, 1.0}, {2.0, 0.0, 1.0}});
    EXPECT_NEAR(positionAt(path, 0.0, 8.0).x, -2.0, tiny);
    EXPECT_NEAR(positionAt(path, 2.0, 8.0).x, -1.0, tiny);
    EXPECT_NEAR(positionAt(path, 8.0, 8.0).x, 2.0, tiny);
}

TEST(Scene, APathStaysAtItsEndInTheTail) {
    const ScenePath path = SourcePath(OrbitPath{2.0, 0.25, 0.0, 0.0, true});
    const Vector3 at = positionAt(path, 11.0, 8.0);
    EXPECT_NEAR(at.x, 2.0, tiny);
    EXPECT_NEAR(at.z, 0.0, tiny);
}

TEST(Scene, KeyframesCountInSecondsOfTheScene) {
    const ScenePath path =
        PositionTrack{{{1.0, {0.0, 0.0, 1.0}}, {3.0, {2.0, 0.0, 1.0}}}, Interpolation::Linear};
    EXPECT_NEAR(positionAt(path, 1.5, 100.0).x, 0.5, tiny);
}

TEST(Scene, ASourceStandsAheadUnlessTold) {
    const Vector3 at = positionAt(SceneSource{}.path, 3.0, 8.0);
    EXPECT_EQ(at.x, 0.0);
    EXPECT_EQ(at.y, 0.0);
    EXPECT_EQ(at.z, 1.0);
}

TEST(Scene, TheListenerMovesAndTurns) {
    SceneListener listener;
    listener.position = {{{0.0, {}}, {2.0, {0.0, 0.0, 4.0}}}, Interpolation::Linear};
    listener.yaw = {{{0.0, 0.0}, {2.0, 90.0}}, Interpolation::Linear};
    listener.pitch = constantTrack(10.0);
    listener.roll = constantTrack(-5.0);
    const Pose pose = listenerAt(listener, 1.0);
    EXPECT_NEAR(pose.position.z, 2.0, tiny);
    EXPECT_NEAR(pose.yaw, 45.0, tiny);
    EXPECT_EQ(pose.pitch, 10.0);
    EXPECT_EQ(pose.roll, -5.0);
}

}  // namespace
}  // namespace tessaly
