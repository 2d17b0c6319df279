// Azimuth and elevation of a source.
#include "host/source_angles.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace tessaly {

namespace {

constexpr float halfPi = 1.5707964f;
constexpr float twoPi = 6.2831855f;
constexpr float degreesPerRadian = 57.295776f;
/// Metres: nearer to the plane through both ears than this, a source is at the side.
constexpr float sidePlane = 0.001f;
/// Metres: keeps the divisor positive straight overhead.
constexpr float overheadOffset = 0.001f;

float azimuthRadians(float x, float z) noexcept TESSALY_NONBLOCKING {
    if (std::fabs(z) < sidePlane) {
        return x < 0.0f ? -halfPi : halfPi;
    }
    return std::atan2(x, z);
}

}  // namespace

SourceAngles sourceAngles(const float* listenermatrix, const float* sourcematrix) noexcept {
    const float* l = listenermatrix;
    const float* s = sourcematrix + 12;
    const float x = l[0] * s[0] + l[4] * s[1] + l[8] * s[2] + l[12];
    const float y = l[1] * s[0] + l[5] * s[1] + l[9] * s[2] + l[13];
    const float z = l[2] * s[0] + l[6] * s[1] + l[10] * s[2] + l[14];

    float radians = azimuthRadians(x, z);
    if (radians < 0.0f) {
        radians += twoPi;
    }
    const float turn = radians * degreesPerRadian;
    // Clips to 0..360.
    float azimuth = (std::fabs(turn) - std::fabs(turn - 360.0f)) * 0.5f + 180.0f;
    if (azimuth > 180.0f) {
        azimuth -= 360.0f;
    }
    const float elevation =
        std::atan2(y, std::sqrt(z * z + x * x) + overheadOffset) * degreesPerRadian;
    return {azimuth, elevation};
}

const SourceAngles& KeptSourceAngles::of(const float* listenermatrix,
                                         const float* sourcematrix) noexcept {
    const float* const position = sourcematrix + 12;
    if (!known_ || std::memcmp(position, source_.data(), sizeof source_) != 0 ||
        std::memcmp(listenermatrix, listener_.data(), sizeof listener_) != 0) {
        std::copy_n(listenermatrix, listener_.size(), listener_.begin());
        std::copy_n(position, source_.size(), source_.begin());
        angles_ = sourceAngles(listenermatrix, sourcematrix);
        known_ = true;
    }
    return angles_;
}

}  // namespace tessaly
