// Grid order, weights and triangles.
#include "data/sphere.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

#include "resources/hrir_grid.h"

namespace tessaly::data {
namespace {

TEST(PackedOrder, StartsAtThePoleAndTurnsRight) {
    const std::vector<GridEntry>& order = packedOrder();
    ASSERT_EQ(order.size(), 2522u);
    const auto expect = [&order](std::size_t entry, int phi, int theta) {
        EXPECT_EQ(order[entry].phi, phi) << entry;
        EXPECT_EQ(order[entry].theta, theta) << entry;
    };
    expect(0, 0, -90);
    expect(1, 0, -85);
    expect(18, 0, 0);
    expect(35, 0, 85);
    expect(36, 0, 90);
    expect(37, -5, -85);
    expect(71, -5, 85);
    expect(649, -90, 0);
    expect(1261, -175, 85);
    expect(1262, 180, -85);
    expect(2521, 5, 85);
}

TEST(PackedOrder, IndexFindsEveryEntryAndWrapsAzimuths) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const GridEntry& at = packedOrder()[entry];
        for (const int turn : {-720, -360, 0, 360, 720}) {
            EXPECT_EQ(packedIndex(at.phi + turn, at.theta), static_cast<int>(entry));
        }
    }
    EXPECT_EQ(packedIndex(-180, 10), packedIndex(180, 10));
    EXPECT_EQ(packedIndex(75, 90), 36);
    EXPECT_EQ(packedIndex(75, -90), 0);
}

TEST(PackedOrder, MirrorsHaveTheOppositeAzimuth) {
    EXPECT_EQ(mirrorIndex(packedIndex(90, 0)), packedIndex(-90, 0));
    EXPECT_EQ(mirrorIndex(packedIndex(180, 45)), packedIndex(180, 45));
    EXPECT_EQ(mirrorIndex(0), 0);
    EXPECT_EQ(mirrorIndex(36), 36);
}

TEST(Sphere, AreaWeightsSumToTheSphere) {
    double sum = 0.0;
    for (const double weight : areaWeights()) {
        sum += weight;
    }
    // A cell of weight w covers w * step * 2 sin(step / 2): the rings between the caps and the
    // caps together are exactly 4 pi.
    const double step = radians(5.0);
    EXPECT_NEAR(sum * step * 2.0 * std::sin(0.5 * step), 4.0 * std::numbers::pi, 1e-9);
    EXPECT_EQ(areaWeights()[0], areaWeights()[36]);
    EXPECT_EQ(areaWeights()[18], 1.0);
}

TEST(Sphere, VectorsPointAheadLeftAndUp) {
    EXPECT_NEAR(toVector({0.0, 0.0})[0], 1.0, 1e-15);
    EXPECT_NEAR(toVector({90.0, 0.0})[1], 1.0, 1e-15);
    EXPECT_NEAR(toVector({200.0, 90.0})[2], 1.0, 1e-15);
    EXPECT_NEAR(angleBetween(toVector({10.0, 0.0}), toVector({10.001, 0.0})), 0.001, 1e-12);
}

std::vector<Vector3> ringGrid(int step) {
    std::vector<Vector3> grid;
    for (int elevation = -30; elevation <= 30; elevation += step) {
        for (int azimuth = 0; azimuth < 360; azimuth += step) {
            grid.push_back(
                toVector({static_cast<double>(azimuth), static_cast<double>(elevation)}));
        }
    }
    return grid;
}

TEST(Triangles, AMeasuredDirectionIsTakenAlone) {
    const std::vector<Vector3> grid = ringGrid(10);
    const auto weights = interpolationWeights(grid, toVector({20.0004, 10.0}));
    ASSERT_TRUE(weights.has_value());
    EXPECT_EQ(weights->count, 1);
    EXPECT_EQ(weights->index[0], 36 * 4 + 2);
    EXPECT_EQ(weights->weight[0], 1.0);
}

TEST(Triangles, WeightsReproduceTheTargetFromNearbyDirections) {
    const std::vector<Vector3> grid = ringGrid(10);
    for (const Direction target : {Direction{13.0, 4.0}, {97.0, -17.0}, {356.0, 22.0}}) {
        const auto weights = interpolationWeights(grid, toVector(target));
        ASSERT_TRUE(weights.has_value());
        ASSERT_EQ(weights->count, 3);
        Vector3 sum{};
        double total = 0.0;
        for (std::size_t i = 0; i < 3; ++i) {
            const Vector3& corner = grid[static_cast<std::size_t>(weights->index[i])];
            EXPECT_LT(angleBetween(corner, toVector(target)), 14.2);
            EXPECT_GE(weights->weight[i], -1e-7);
            total += weights->weight[i];
            for (std::size_t axis = 0; axis < 3; ++axis) {
                sum[axis] += weights->weight[i] * corner[axis];
            }
        }
        EXPECT_NEAR(total, 1.0, 1e-12);
        const double length = std::sqrt(dot(sum, sum));
        EXPECT_NEAR(dot(sum, toVector(target)) / length, 1.0, 1e-12);
    }
}

TEST(Triangles, TheCentreOfATriangleWeighsItsCornersEqually) {
    const std::vector<Vector3> corners = {toVector({0.0, 0.0}), toVector({20.0, 0.0}),
                                          toVector({10.0, 17.0})};
    Vector3 centre{};
    for (const Vector3& corner : corners) {
        for (std::size_t axis = 0; axis < 3; ++axis) {
            centre[axis] += corner[axis];
        }
    }
    const double length = std::sqrt(dot(centre, centre));
    for (double& value : centre) {
        value /= length;
    }
    const auto weights = interpolationWeights(corners, centre);
    ASSERT_TRUE(weights.has_value());
    for (const double weight : weights->weight) {
        EXPECT_NEAR(weight, 1.0 / 3.0, 1e-12);
    }
}

TEST(Triangles, OutsideTheMeasuredAreaThereIsNone) {
    EXPECT_FALSE(interpolationWeights(ringGrid(10), toVector({20.0, 60.0})).has_value());
    EXPECT_FALSE(interpolationWeights({}, toVector({0.0, 0.0})).has_value());
    EXPECT_FALSE(interpolationWeights({toVector({5.0, 0.0})}, toVector({0.0, 0.0})).has_value());
}

TEST(Triangles, VectorsInOnePlaneHaveNoSolution) {
    EXPECT_FALSE(barycentric(toVector({0.0, 0.0}), toVector({40.0, 0.0}), toVector({80.0, 0.0}),
                             toVector({20.0, 5.0}))
                     .has_value());
}

TEST(Triangles, CircumradiusOfARightTriangleIsHalfItsHypotenuse) {
    EXPECT_NEAR(circumradius({0, 0, 0}, {3, 0, 0}, {0, 4, 0}), 2.5, 1e-12);
}

}  // namespace
}  // namespace tessaly::data
