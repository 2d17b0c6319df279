// Ranges of what a scene may ask for.
#pragma once

#include <cstddef>

namespace tessaly::scene_limits {

inline constexpr double shortest = 0.01;       ///< seconds
inline constexpr double longest = 3600.0;      ///< seconds
inline constexpr double longestTail = 60.0;    ///< seconds
inline constexpr double farthest = 1000.0;     ///< metres, on each axis
inline constexpr double nearest = 0.01;        ///< metres, of a radius
inline constexpr double nearestWall = 0.1;     ///< metres
inline constexpr double farthestWall = 100.0;  ///< metres: delays are 16-bit sample counts
inline constexpr double quietest = -96.0;      ///< dB
inline constexpr double loudest = 24.0;        ///< dB
inline constexpr double mostTurns = 10000.0;   ///< of an orbit
inline constexpr double widestAngle = 3600.0;  ///< degrees, of the listener's turning
inline constexpr int smallestBlock = 32;       ///< frames
inline constexpr int largestBlock = 4096;      ///< frames
inline constexpr int headphoneBlock = 1024;    ///< frames that headphone filters need
inline constexpr std::size_t mostKeyframes = 10000;
inline constexpr std::size_t mostSends = 50;                   ///< of one source
inline constexpr int highestId = 100;                          ///< of a return
inline constexpr std::size_t largestFile = 10u * 1024 * 1024;  ///< bytes of a scene's text

}  // namespace tessaly::scene_limits
