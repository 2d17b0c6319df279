// Where the source is at each moment: fixed, on an orbit, on a straight line, rising overhead.
#pragma once

#include <string>
#include <variant>

#include "minihost/pose.h"

namespace tessaly {

/// A direction and distance seen by the listener, who stands at the origin and looks along +z.
struct Spherical {
    double azimuth = 0.0;    ///< degrees in (-180, 180], 0 in front, positive to the right
    double elevation = 0.0;  ///< degrees, 0 level, 90 overhead
    double distance = 0.0;   ///< metres
};

/// Direction and distance of a position. The origin itself is in front, level, at 0 metres.
Spherical sphericalOf(const Vector3& position) noexcept;

struct FixedPath {
    Vector3 position;
};

/// Circle round the listener at one elevation, even speed.
struct OrbitPath {
    double radius = 1.5;        ///< metres from the head
    double turns = 1.0;         ///< in the whole duration
    double elevation = 0.0;     ///< degrees
    double startAzimuth = 0.0;  ///< degrees
    bool clockwise = true;      ///< seen from above: front, right, back, left
};

/// Straight line at even speed.
struct LinePath {
    Vector3 from;
    Vector3 to;
};

/// Arc over the head in the upright plane of one azimuth; beyond 90 degrees the far side is
/// reached.
struct RisePath {
    double radius = 1.5;         ///< metres from the head
    double azimuth = 0.0;        ///< degrees
    double fromElevation = 0.0;  ///< degrees
    double toElevation = 90.0;   ///< degrees
};

using SourcePath = std::variant<FixedPath, OrbitPath, LinePath, RisePath>;

/// @param fraction  0 at the start of the sound, 1 at its end
Vector3 positionAt(const SourcePath& path, double fraction) noexcept;

/// One line for a caption, e.g. "orbit at 1.5 m, 1 turn clockwise".
std::string describe(const SourcePath& path);

}  // namespace tessaly
