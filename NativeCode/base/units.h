// Constants and conversions that more than one folder shares.
#pragma once

#include <cmath>

namespace tessaly {

/// Inverse of the speed of sound, 343.42 m/s: samples per metre and hertz of sample rate.
inline constexpr double samplesPerMetrePerHertz = 0.0029118863199580685;

/// Level in dB to a linear factor, 10^(dB / 20), in single precision throughout.
inline float decibelsToLinear(float levelDb) noexcept { return std::pow(10.0f, levelDb * 0.05f); }

}  // namespace tessaly
