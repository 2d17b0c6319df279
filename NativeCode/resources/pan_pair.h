// The synthetic substitute for an HRIR when 3D rendering is bypassed: one tap per ear.
#pragma once

#include <cstdint>

namespace tessaly {

/// Overwrites one HRIR with a pair of single taps: a level and a time difference by azimuth.
/// Load time.
/// @param pair        `hrirLength` frames of (right, left) floats
/// @param hrirLength  frames
/// @param phi         azimuth in degrees, positive to the listener's left
/// @param panGain     gain of a tap at full pan, 1.65
void writePanPair(float* pair, int hrirLength, std::int16_t phi, float panGain) noexcept;

}  // namespace tessaly
