// What the two ears receive over time: level, level difference, time difference.
#pragma once

#include <cstddef>
#include <optional>
#include <span>
#include <vector>

namespace tessaly {

/// Differences are positive where the right ear is ahead: louder or earlier.
struct BinauralPoint {
    double time = 0.0;                      ///< seconds, middle of the window
    double leftDb = 0.0;                    ///< dBFS rms, not below silenceDb
    double rightDb = 0.0;                   ///< dBFS rms, not below silenceDb
    std::optional<double> levelDifference;  ///< dB; empty where it is too quiet to tell
    std::optional<double> timeDifference;   ///< milliseconds; empty where too quiet or unclear
};

/// Level shown for silence.
inline constexpr double silenceDb = -120.0;

/// Largest time difference looked for, milliseconds.
inline constexpr double longestTimeDifference = 1.0;

/// Time by which the right ear is ahead, from the highest cross-correlation of the band 500 to
/// 3000 Hz within +-1 ms, refined by a parabola.
/// @param stereo      interleaved, left first
/// @param sampleRate  Hz
/// @returns milliseconds, or nothing if the ears are silent or too unlike for an answer
std::optional<double> interauralTime(std::span<const float> stereo, double sampleRate);

/// Measures in raised-cosine windows of 60 ms. Windows quieter than the loudest by more than 25 dB
/// have no differences.
/// @param hopSeconds  distance of the windows' middles
std::vector<BinauralPoint> measureBinaural(std::span<const float> stereo,
                                           double sampleRate,
                                           double hopSeconds);

}  // namespace tessaly
