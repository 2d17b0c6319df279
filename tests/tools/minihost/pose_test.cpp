// Matrices of poses: the frame is left-handed, +x right, +y up, +z forward.
#include "minihost/pose.h"

#include <gtest/gtest.h>

namespace tessaly {
namespace {

constexpr double tolerance = 1e-6;  // a few roundings to float at unit scale

Vector3 transformed(const Matrix4& m, const Vector3& p) {
    const auto row = [&](int r) {
        return static_cast<double>(m[r]) * p.x + static_cast<double>(m[r + 4]) * p.y +
               static_cast<double>(m[r + 8]) * p.z + static_cast<double>(m[r + 12]);
    };
    return {row(0), row(1), row(2)};
}

void expectNear(const Vector3& got, const Vector3& wanted) {
    EXPECT_NEAR(got.x, wanted.x, tolerance);
    EXPECT_NEAR(got.y, wanted.y, tolerance);
    EXPECT_NEAR(got.z, wanted.z, tolerance);
}

TEST(Pose, ListenerAtRestIsTheIdentity) {
    const Matrix4 matrix = worldToLocal(Pose{});
    for (int i = 0; i < 16; ++i) {
        EXPECT_EQ(matrix[i], i % 5 == 0 ? 1.0f : 0.0f) << i;
    }
}

TEST(Pose, SourceMatrixCarriesThePositionInElements12To14) {
    Pose source;
    source.position = {1.0, 2.0, 3.0};
    source.yaw = 35.0;
    const Matrix4 matrix = localToWorld(source);
    EXPECT_EQ(matrix[12], 1.0f);
    EXPECT_EQ(matrix[13], 2.0f);
    EXPECT_EQ(matrix[14], 3.0f);
    EXPECT_EQ(matrix[15], 1.0f);
}

TEST(Pose, ListenerTurnedRightHasTheFrontOnTheLeft) {
    Pose listener;
    listener.yaw = 90.0;
    expectNear(transformed(worldToLocal(listener), {0.0, 0.0, 2.0}), {-2.0, 0.0, 0.0});
    expectNear(transformed(worldToLocal(listener), {2.0, 0.0, 0.0}), {0.0, 0.0, 2.0});
}

TEST(Pose, ListenerLookingUpHasTheFrontBelow) {
    Pose listener;
    listener.pitch = 90.0;
    expectNear(transformed(worldToLocal(listener), {0.0, 0.0, 1.0}), {0.0, -1.0, 0.0});
    expectNear(transformed(worldToLocal(listener), {0.0, 1.0, 0.0}), {0.0, 0.0, 1.0});
}

TEST(Pose, RollLowersTheRightSide) {
    Pose listener;
    listener.roll = 90.0;
    expectNear(transformed(worldToLocal(listener), {0.0, -1.0, 0.0}), {1.0, 0.0, 0.0});
}

TEST(Pose, WorldToLocalUndoesLocalToWorld) {
    Pose pose;
    pose.position = {0.3, -1.2, 2.5};
    pose.yaw = 33.0;
    pose.pitch = -20.0;
    pose.roll = 11.0;
    const Vector3 point{0.7, 0.2, -0.4};
    expectNear(transformed(worldToLocal(pose), transformed(localToWorld(pose), point)), point);
}

TEST(Pose, DirectionsAreClockwiseFromTheFront) {
    expectNear(fromSpherical(0.0, 0.0, 2.0), {0.0, 0.0, 2.0});
    expectNear(fromSpherical(90.0, 0.0, 2.0), {2.0, 0.0, 0.0});
    expectNear(fromSpherical(180.0, 0.0, 2.0), {0.0, 0.0, -2.0});
    expectNear(fromSpherical(-90.0, 0.0, 2.0), {-2.0, 0.0, 0.0});
    expectNear(fromSpherical(40.0, 90.0, 2.0), {0.0, 2.0, 0.0});
}

TEST(Pose, ElevationBeyondTheTopReachesTheFarSide) {
    expectNear(fromSpherical(0.0, 180.0, 1.5), {0.0, 0.0, -1.5});
    expectNear(fromSpherical(90.0, 135.0, 1.0), fromSpherical(-90.0, 45.0, 1.0));
}

TEST(Pose, DistanceIsEuclidean) {
    EXPECT_DOUBLE_EQ(distanceBetween({1.0, 2.0, 3.0}, {4.0, 6.0, 15.0}), 13.0);
}

}  // namespace
}  // namespace tessaly
