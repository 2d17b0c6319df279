// The 5-degree direction grid of the HRIR set.
#pragma once

#include <cstdint>

namespace tessaly {

inline constexpr int gridStepDegrees = 5;
inline constexpr int gridPhiCount = 73;    ///< azimuth indices 0..72; 0 and 72 are one direction
inline constexpr int gridThetaCount = 37;  ///< elevation indices 0..36; 0 and 36 are the poles
inline constexpr int gridPhiFront = 36;    ///< index of azimuth 0
inline constexpr int gridThetaLevel = 18;  ///< index of elevation 0
inline constexpr int gridCellCount = gridPhiCount * gridThetaCount;
inline constexpr int hrirCount = 2522;     ///< 72 azimuths * 35 elevations and the two poles
inline constexpr int hrirMaxLength = 256;  ///< longest HRIR of any set, frames

/// Index of an azimuth in degrees, -180..180 to 0..72; truncating integer division.
constexpr std::int16_t phiToIndex(int phi) noexcept {
    return static_cast<std::int16_t>((phi + 180) / gridStepDegrees);
}

/// Index of an elevation in degrees, -90..90 to 0..36; truncating integer division.
constexpr std::int16_t thetaToIndex(int theta) noexcept {
    return static_cast<std::int16_t>((theta + 90) / gridStepDegrees);
}

/// Azimuth of an index in degrees, engine sign (positive to the listener's left).
constexpr std::int16_t indexToPhi(int indexPhi) noexcept {
    return static_cast<std::int16_t>((indexPhi - gridPhiFront) * gridStepDegrees);
}

/// Elevation of an index in degrees.
constexpr std::int16_t indexToTheta(int indexTheta) noexcept {
    return static_cast<std::int16_t>((indexTheta - gridThetaLevel) * gridStepDegrees);
}

}  // namespace tessaly
