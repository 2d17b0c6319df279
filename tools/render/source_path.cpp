// Path arithmetic and captions.
#include "render/source_path.h"

#include <fmt/format.h>

#include <cmath>
#include <numbers>

namespace tessaly {

namespace {

constexpr double degreesPerRadian = 180.0 / std::numbers::pi;

// Visits the kinds of path with one function each.
template <typename... Functions>
struct Overloaded : Functions... {
    using Functions::operator()...;
};
template <typename... Functions>
Overloaded(Functions...) -> Overloaded<Functions...>;

double between(double from, double to, double fraction) { return from + (to - from) * fraction; }

std::string point(const Vector3& p) { return fmt::format("({:g}, {:g}, {:g}) m", p.x, p.y, p.z); }

}  // namespace

Spherical sphericalOf(const Vector3& position) noexcept {
    const double level = std::hypot(position.x, position.z);
    Spherical result;
    result.distance = std::hypot(level, position.y);
    if (result.distance > 0.0) {
        // Adding 0 turns a negative zero into a positive one: straight behind is +180, never -180.
        result.azimuth = std::atan2(position.x + 0.0, position.z + 0.0) * degreesPerRadian;
        result.elevation = std::atan2(position.y, level) * degreesPerRadian;
    }
    return result;
}

Vector3 positionAt(const SourcePath& path, double fraction) noexcept {
    return std::visit(Overloaded{[](const FixedPath& fixed) { return fixed.position; },
                                 [&](const OrbitPath& orbit) {
                                     const double turned = 360.0 * orbit.turns * fraction *
                                                           (orbit.clockwise ? 1.0 : -1.0);
                                     return fromSpherical(orbit.startAzimuth + turned,
                                                          orbit.elevation, orbit.radius);
                                 },
                                 [&](const LinePath& line) {
                                     return Vector3{between(line.from.x, line.to.x, fraction),
                                                    between(line.from.y, line.to.y, fraction),
                                                    between(line.from.z, line.to.z, fraction)};
                                 },
                                 [&](const RisePath& rise) {
                                     const double elevation =
                                         between(rise.fromElevation, rise.toElevation, fraction);
                                     return fromSpherical(rise.azimuth, elevation, rise.radius);
                                 }},
                      path);
}

std::string describe(const SourcePath& path) {
    return std::visit(
        Overloaded{[](const FixedPath& fixed) {
                       const Spherical at = sphericalOf(fixed.position);
                       return fmt::format("fixed at {:.3g}° azimuth, {:.3g}° elevation, {:.3g} m",
                                          at.azimuth + 0.0, at.elevation + 0.0, at.distance);
                   },
                   [](const OrbitPath& orbit) {
                       std::string text =
                           fmt::format("orbit at {:g} m, {:.3g} {} {}", orbit.radius, orbit.turns,
                                       orbit.turns == 1.0 ? "turn" : "turns",
                                       orbit.clockwise ? "clockwise" : "anticlockwise");
                       if (orbit.elevation != 0.0) {
                           text += fmt::format(", {:g}° elevation", orbit.elevation);
                       }
                       return text;
                   },
                   [](const LinePath& line) {
                       return fmt::format("line from {} to {}", point(line.from), point(line.to));
                   },
                   [](const RisePath& rise) {
                       std::string text =
                           fmt::format("rise at {:g} m, elevation {:g}° to {:g}°", rise.radius,
                                       rise.fromElevation, rise.toElevation);
                       if (rise.azimuth != 0.0) {
                           text += fmt::format(", {:g}° azimuth", rise.azimuth);
                       }
                       return text;
                   }},
        path);
}

}  // namespace tessaly
