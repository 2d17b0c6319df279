// Positions and orientations of listener and source, and the matrices the host makes of them.
#pragma once

#include <array>

namespace tessaly {

/// Metres; +x right, +y up, +z forward, left-handed.
struct Vector3 {
    double x = 0.0;
    double y = 0.0;
    double z = 0.0;
};

/// Where something stands and how it is turned, degrees. Zero looks along +z with +y up; yaw turns
/// to the right, pitch raises the view, roll lowers the right side.
struct Pose {
    Vector3 position;
    double yaw = 0.0;
    double pitch = 0.0;
    double roll = 0.0;
};

/// Column-major 4 by 4, translation in elements 12 to 14.
using Matrix4 = std::array<float, 16>;

/// Maps world space into the frame of the pose: what a host hands over for the listener.
Matrix4 worldToLocal(const Pose& pose);

/// Maps the frame of the pose into world space: what a host hands over for a source.
Matrix4 localToWorld(const Pose& pose);

/// Metres between two positions.
double distanceBetween(const Vector3& a, const Vector3& b);

/// Position from a direction seen by a listener at the origin that looks along +z.
/// @param azimuth    degrees, 0 in front, positive to the right
/// @param elevation  degrees, 0 level, 90 overhead; beyond 90 the far side is reached over the top
/// @param distance   metres
Vector3 fromSpherical(double azimuth, double elevation, double distance);

}  // namespace tessaly
