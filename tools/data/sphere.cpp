// Grid order, area weights and triangle search.
#include "data/sphere.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <numeric>

#include "resources/hrir_grid.h"

namespace tessaly::data {

namespace {

constexpr std::size_t neighbourCount = 20;
constexpr double exactHitDot = 1.0 - 1e-10;  // within 0.0008 degrees
constexpr double insideTolerance = -1e-7;    // of a weight: targets on an edge count as inside
constexpr double smallestDeterminant = 1e-9;
constexpr double largestCircumradius = 0.42;  // about 25 degrees: wider triangles span a gap

Vector3 cross(const Vector3& a, const Vector3& b) noexcept {
    return {a[1] * b[2] - a[2] * b[1], a[2] * b[0] - a[0] * b[2], a[0] * b[1] - a[1] * b[0]};
}

Vector3 difference(const Vector3& a, const Vector3& b) noexcept {
    return {a[0] - b[0], a[1] - b[1], a[2] - b[2]};
}

double norm(const Vector3& a) noexcept { return std::sqrt(dot(a, a)); }

std::vector<GridEntry> makePackedOrder() {
    std::vector<GridEntry> order;
    order.reserve(hrirCount);
    const auto addColumn = [&order](int phi) {
        for (int index = 1; index < gridThetaCount - 1; ++index) {
            order.push_back({phi, indexToTheta(index)});
        }
    };
    order.push_back({0, -90});
    addColumn(0);
    order.push_back({0, 90});
    for (int phi = -gridStepDegrees; phi > -180; phi -= gridStepDegrees) {
        addColumn(phi);
    }
    for (int phi = 180; phi > 0; phi -= gridStepDegrees) {
        addColumn(phi);
    }
    return order;
}

}  // namespace

double radians(double degrees) noexcept { return degrees * (std::numbers::pi / 180.0); }

Vector3 toVector(Direction direction) noexcept {
    const double azimuth = radians(direction.azimuth);
    const double elevation = radians(direction.elevation);
    return {std::cos(elevation) * std::cos(azimuth), std::cos(elevation) * std::sin(azimuth),
            std::sin(elevation)};
}

double dot(const Vector3& a, const Vector3& b) noexcept {
    return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
}

double angleBetween(const Vector3& a, const Vector3& b) noexcept {
    // The arc sine of the chord keeps its digits at small angles, where the arc cosine loses them.
    const double chord = std::min(norm(difference(a, b)), 2.0);
    return 2.0 * std::asin(0.5 * chord) * (180.0 / std::numbers::pi);
}

const std::vector<GridEntry>& packedOrder() {
    static const std::vector<GridEntry> order = makePackedOrder();
    return order;
}

int packedIndex(int phi, int theta) {
    if (theta <= -90) {
        return 0;
    }
    constexpr int perColumn = gridThetaCount - 2;
    if (theta >= 90) {
        return perColumn + 1;
    }
    const int row = thetaToIndex(theta) - 1;
    const int turn = ((-phi % 360 + 360) % 360) / gridStepDegrees;  // 0 ahead, 18 right, 36 behind
    return turn == 0 ? 1 + row : perColumn + 2 + (turn - 1) * perColumn + row;
}

int mirrorIndex(int entry) {
    const GridEntry& direction = packedOrder()[static_cast<std::size_t>(entry)];
    return packedIndex(-direction.phi, direction.theta);
}

const std::vector<double>& areaWeights() {
    static const std::vector<double> weights = [] {
        const double halfStep = radians(0.5 * gridStepDegrees);
        const double cap = 72.0 * (1.0 - std::cos(halfStep)) / (2.0 * std::sin(halfStep));
        std::vector<double> values;
        for (const GridEntry& entry : packedOrder()) {
            values.push_back(std::abs(entry.theta) == 90 ? cap : std::cos(radians(entry.theta)));
        }
        return values;
    }();
    return weights;
}

std::optional<Vector3> barycentric(const Vector3& a,
                                   const Vector3& b,
                                   const Vector3& c,
                                   const Vector3& target) noexcept {
    const double determinant = dot(a, cross(b, c));
    if (std::abs(determinant) < smallestDeterminant) {
        return std::nullopt;
    }
    return Vector3{dot(target, cross(b, c)) / determinant, dot(a, cross(target, c)) / determinant,
                   dot(a, cross(b, target)) / determinant};
}

double circumradius(const Vector3& a, const Vector3& b, const Vector3& c) noexcept {
    const Vector3 ab = difference(b, a);
    const Vector3 ac = difference(c, a);
    const double area2 = norm(cross(ab, ac));
    return norm(ab) * norm(ac) * norm(difference(c, b)) / (2.0 * area2);
}

std::optional<InterpolationWeights> interpolationWeights(const std::vector<Vector3>& measured,
                                                         const Vector3& target) {
    std::vector<double> closeness(measured.size());
    std::transform(measured.begin(), measured.end(), closeness.begin(),
                   [&target](const Vector3& direction) { return dot(direction, target); });
    std::vector<int> nearest(measured.size());
    std::iota(nearest.begin(), nearest.end(), 0);
    const std::size_t count = std::min(neighbourCount, nearest.size());
    std::partial_sort(nearest.begin(), nearest.begin() + static_cast<std::ptrdiff_t>(count),
                      nearest.end(), [&closeness](int a, int b) {
                          const double closeA = closeness[static_cast<std::size_t>(a)];
                          const double closeB = closeness[static_cast<std::size_t>(b)];
                          return closeA != closeB ? closeA > closeB : a < b;
                      });
    nearest.resize(count);
    if (nearest.empty()) {
        return std::nullopt;
    }
    if (closeness[static_cast<std::size_t>(nearest[0])] > exactHitDot) {
        return InterpolationWeights{1, {nearest[0], 0, 0}, {1.0, 0.0, 0.0}};
    }

    std::optional<InterpolationWeights> best;
    double bestRadius = largestCircumradius;
    for (std::size_t i = 0; i + 2 < count; ++i) {
        for (std::size_t j = i + 1; j + 1 < count; ++j) {
            for (std::size_t k = j + 1; k < count; ++k) {
                const Vector3& a = measured[static_cast<std::size_t>(nearest[i])];
                const Vector3& b = measured[static_cast<std::size_t>(nearest[j])];
                const Vector3& c = measured[static_cast<std::size_t>(nearest[k])];
                const std::optional<Vector3> weights = barycentric(a, b, c, target);
                if (!weights ||
                    *std::min_element(weights->begin(), weights->end()) < insideTolerance) {
                    continue;
                }
                const double radius = circumradius(a, b, c);
                if (radius < bestRadius) {
                    bestRadius = radius;
                    const double sum = (*weights)[0] + (*weights)[1] + (*weights)[2];
                    best = InterpolationWeights{
                        3,
                        {nearest[i], nearest[j], nearest[k]},
                        {(*weights)[0] / sum, (*weights)[1] / sum, (*weights)[2] / sum}};
                }
            }
        }
    }
    return best;
}

}  // namespace tessaly::data
