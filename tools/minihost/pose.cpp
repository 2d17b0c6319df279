// Rotation and translation of a pose as column-major matrices, worked in double.
#include "minihost/pose.h"

#include <cmath>
#include <cstddef>
#include <numbers>

namespace tessaly {

namespace {

constexpr double radiansPerDegree = std::numbers::pi / 180.0;

struct Axes {
    Vector3 right;
    Vector3 up;
    Vector3 forward;
};

double dot(const Vector3& a, const Vector3& b) { return a.x * b.x + a.y * b.y + a.z * b.z; }

// In this left-handed frame forward x right gives up, by the usual component formula.
Vector3 cross(const Vector3& a, const Vector3& b) {
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}

Vector3 mix(const Vector3& a, double weightA, const Vector3& b, double weightB) {
    return {a.x * weightA + b.x * weightB, a.y * weightA + b.y * weightB,
            a.z * weightA + b.z * weightB};
}

Axes axesOf(const Pose& pose) {
    const double yaw = pose.yaw * radiansPerDegree;
    const double pitch = pose.pitch * radiansPerDegree;
    const double roll = pose.roll * radiansPerDegree;
    const Vector3 forward{std::sin(yaw) * std::cos(pitch), std::sin(pitch),
                          std::cos(yaw) * std::cos(pitch)};
    const Vector3 level{std::cos(yaw), 0.0, -std::sin(yaw)};
    const Vector3 above = cross(forward, level);
    return {mix(level, std::cos(roll), above, -std::sin(roll)),
            mix(above, std::cos(roll), level, std::sin(roll)), forward};
}

float narrow(double value) { return static_cast<float>(value); }

}  // namespace

Matrix4 worldToLocal(const Pose& pose) {
    const Axes axes = axesOf(pose);
    const Vector3& p = pose.position;
    Matrix4 matrix{};
    std::size_t row = 0;
    for (const Vector3* axis : {&axes.right, &axes.up, &axes.forward}) {
        matrix[row] = narrow(axis->x);
        matrix[row + 4] = narrow(axis->y);
        matrix[row + 8] = narrow(axis->z);
        matrix[row + 12] = narrow(-dot(*axis, p));
        ++row;
    }
    matrix[15] = 1.0f;
    return matrix;
}

Matrix4 localToWorld(const Pose& pose) {
    const Axes axes = axesOf(pose);
    Matrix4 matrix{};
    std::size_t column = 0;
    for (const Vector3* axis : {&axes.right, &axes.up, &axes.forward, &pose.position}) {
        matrix[4 * column] = narrow(axis->x);
        matrix[4 * column + 1] = narrow(axis->y);
        matrix[4 * column + 2] = narrow(axis->z);
        ++column;
    }
    matrix[15] = 1.0f;
    return matrix;
}

double distanceBetween(const Vector3& a, const Vector3& b) {
    const Vector3 difference = mix(a, 1.0, b, -1.0);
    return std::sqrt(dot(difference, difference));
}

Vector3 fromSpherical(double azimuth, double elevation, double distance) {
    const double level = distance * std::cos(elevation * radiansPerDegree);
    return {level * std::sin(azimuth * radiansPerDegree),
            distance * std::sin(elevation * radiansPerDegree),
            level * std::cos(azimuth * radiansPerDegree)};
}

}  // namespace tessaly
