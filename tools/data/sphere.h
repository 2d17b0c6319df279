// Directions on the sphere, the packed order of the HRIR grid, and interpolation weights.
#pragma once

#include <array>
#include <cstddef>
#include <optional>
#include <vector>

namespace tessaly::data {

using Vector3 = std::array<double, 3>;

/// A direction in degrees: azimuth counter-clockwise (90 is the listener's left), elevation
/// -90..90.
struct Direction {
    double azimuth = 0.0;
    double elevation = 0.0;
};

double radians(double degrees) noexcept;

/// Unit vector, x ahead, y to the left, z up.
Vector3 toVector(Direction direction) noexcept;

double dot(const Vector3& a, const Vector3& b) noexcept;

/// Angle between two unit vectors in degrees.
double angleBetween(const Vector3& a, const Vector3& b) noexcept;

/// One entry of the packed set: engine azimuth `phi` -175..180 and elevation `theta` in degrees.
/// The engine's `phi` has the sign of `Direction::azimuth`.
struct GridEntry {
    int phi = 0;
    int theta = 0;
};

/// The 2522 directions in the order in which the engine's table consumes them: the poles and the
/// front column first, then `phi` -5, -10 .. -175, 180, 175 .. 5, each from -85 to 85.
const std::vector<GridEntry>& packedOrder();

/// Number of a direction in `packedOrder`; any multiple of 5 degrees, `phi` is wrapped, poles take
/// every `phi`.
int packedIndex(int phi, int theta);

/// Number of the direction with the opposite azimuth.
int mirrorIndex(int entry);

/// Share of the sphere of each entry, not normalised: cos(theta), a pole its 2.5-degree cap.
const std::vector<double>& areaWeights();

/// A direction as a weighted sum of up to three measured ones; the weights sum to 1.
struct InterpolationWeights {
    int count = 0;
    std::array<int, 3> index{};
    std::array<double, 3> weight{};
};

/// Solves a * g0 + b * g1 + c * g2 = target.
/// @return nothing for vectors in one plane with the origin
std::optional<Vector3> barycentric(const Vector3& a,
                                   const Vector3& b,
                                   const Vector3& c,
                                   const Vector3& target) noexcept;

/// Radius of the circle through three points.
double circumradius(const Vector3& a, const Vector3& b, const Vector3& c) noexcept;

/// Weights for `target` among measured directions: one of them if it is hit, else the smallest
/// triangle among the nearest 20 that contains it.
/// @return nothing if no triangle contains it: outside the measured area
std::optional<InterpolationWeights> interpolationWeights(const std::vector<Vector3>& measured,
                                                         const Vector3& target);

}  // namespace tessaly::data
