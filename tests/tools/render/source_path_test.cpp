// Paths: azimuth 0 ahead (+z), positive to the right (+x), elevation positive up (+y).
#include "render/source_path.h"

#include <gtest/gtest.h>

namespace tessaly {
namespace {

constexpr double tolerance = 1e-9;

void expectNear(const Vector3& got, const Vector3& wanted) {
    EXPECT_NEAR(got.x, wanted.x, tolerance);
    EXPECT_NEAR(got.y, wanted.y, tolerance);
    EXPECT_NEAR(got.z, wanted.z, tolerance);
}

TEST(SourcePath, DirectionsOfTheAxes) {
    EXPECT_NEAR(sphericalOf({0.0, 0.0, 2.0}).azimuth, 0.0, tolerance);
    EXPECT_NEAR(sphericalOf({2.0, 0.0, 0.0}).azimuth, 90.0, tolerance);
    EXPECT_NEAR(sphericalOf({-2.0, 0.0, 0.0}).azimuth, -90.0, tolerance);
    EXPECT_NEAR(sphericalOf({0.0, 0.0, -2.0}).azimuth, 180.0, tolerance);
    EXPECT_NEAR(sphericalOf({-0.0, 0.0, -2.0}).azimuth, 180.0, tolerance);
    EXPECT_NEAR(sphericalOf({0.0, 3.0, 0.0}).elevation, 90.0, tolerance);
    EXPECT_NEAR(sphericalOf({0.0, -3.0, 4.0}).elevation, -36.86989764584402, tolerance);
    EXPECT_NEAR(sphericalOf({0.0, -3.0, 4.0}).distance, 5.0, tolerance);
    EXPECT_EQ(sphericalOf({0.0, 0.0, 0.0}).distance, 0.0);
    EXPECT_EQ(sphericalOf({0.0, 0.0, 0.0}).azimuth, 0.0);
}

TEST(SourcePath, ClockwiseOrbitGoesByTheRight) {
    const SourcePath path = OrbitPath{.radius = 2.0};
    expectNear(positionAt(path, 0.0), {0.0, 0.0, 2.0});
    expectNear(positionAt(path, 0.25), {2.0, 0.0, 0.0});
    expectNear(positionAt(path, 0.5), {0.0, 0.0, -2.0});
    expectNear(positionAt(path, 0.75), {-2.0, 0.0, 0.0});
    expectNear(positionAt(path, 1.0), {0.0, 0.0, 2.0});
}

TEST(SourcePath, AnticlockwiseOrbitGoesByTheLeft) {
    const SourcePath path = OrbitPath{.radius = 2.0, .clockwise = false};
    expectNear(positionAt(path, 0.25), {-2.0, 0.0, 0.0});
}

TEST(SourcePath, OrbitKeepsRadiusAndElevationOverManyTurns) {
    const SourcePath path =
        OrbitPath{.radius = 3.0, .turns = 2.5, .elevation = 40.0, .startAzimuth = -90.0};
    for (int i = 0; i <= 100; ++i) {
        const Spherical at = sphericalOf(positionAt(path, i / 100.0));
        EXPECT_NEAR(at.distance, 3.0, tolerance);
        EXPECT_NEAR(at.elevation, 40.0, tolerance);
    }
    EXPECT_NEAR(sphericalOf(positionAt(path, 0.0)).azimuth, -90.0, tolerance);
    EXPECT_NEAR(sphericalOf(positionAt(path, 1.0)).azimuth, 90.0, 1e-6);
}

TEST(SourcePath, LineIsEven) {
    const SourcePath path = LinePath{{-1.0, 0.0, 1.0}, {3.0, 2.0, -1.0}};
    expectNear(positionAt(path, 0.0), {-1.0, 0.0, 1.0});
    expectNear(positionAt(path, 0.5), {1.0, 1.0, 0.0});
    expectNear(positionAt(path, 1.0), {3.0, 2.0, -1.0});
}

TEST(SourcePath, RiseGoesOverTheTopToTheFarSide) {
    const SourcePath path = RisePath{.radius = 2.0, .fromElevation = 0.0, .toElevation = 180.0};
    expectNear(positionAt(path, 0.0), {0.0, 0.0, 2.0});
    expectNear(positionAt(path, 0.5), {0.0, 2.0, 0.0});
    expectNear(positionAt(path, 1.0), {0.0, 0.0, -2.0});
    const SourcePath side = RisePath{.radius = 1.0, .azimuth = 90.0};
    expectNear(positionAt(side, 0.0), {1.0, 0.0, 0.0});
}

TEST(SourcePath, FixedStays) {
    const SourcePath path = FixedPath{{1.0, 2.0, 3.0}};
    expectNear(positionAt(path, 0.0), {1.0, 2.0, 3.0});
    expectNear(positionAt(path, 0.7), {1.0, 2.0, 3.0});
}

TEST(SourcePath, CaptionsNameThePath) {
    EXPECT_EQ(describe(OrbitPath{}), "orbit at 1.5 m, 1 turn clockwise");
    EXPECT_EQ(describe(OrbitPath{.turns = 2.0, .elevation = 30.0, .clockwise = false}),
              "orbit at 1.5 m, 2 turns anticlockwise, 30° elevation");
    EXPECT_EQ(describe(LinePath{{-1.0, 0.0, 1.0}, {1.0, 0.0, 1.0}}),
              "line from (-1, 0, 1) m to (1, 0, 1) m");
    EXPECT_EQ(describe(RisePath{.fromElevation = -30.0}), "rise at 1.5 m, elevation -30° to 90°");
    EXPECT_EQ(describe(FixedPath{{2.0, 0.0, 0.0}}), "fixed at 90° azimuth, 0° elevation, 2 m");
}

}  // namespace
}  // namespace tessaly
