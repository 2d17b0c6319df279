// Levels over time and frequency.
#pragma once

#include <span>
#include <vector>

#include "report/png_image.h"

namespace tessaly {

inline constexpr double lowestShownHertz = 50.0;
inline constexpr double highestShownHertz = 20000.0;

/// One ear's levels on a logarithmic axis from 50 Hz to 20 kHz.
struct Spectrogram {
    int columns = 0;              ///< over the whole time, each about its middle
    int rows = 0;                 ///< from above, the highest frequencies first
    std::vector<float> decibels;  ///< columns * rows, row by row; 0: a full-scale sine
};

/// @param stereo      interleaved, left first, finite; one frame or more
/// @param ear         0 left, 1 right
/// @param sampleRate  Hz
Spectrogram spectrogramOf(std::span<const float> stereo, int ear, int sampleRate);

/// Highest level of all; silenceDb if there is nothing above it.
double loudestOf(const Spectrogram& spectrogram) noexcept;

/// Levels as colour indices, dark at lowDb and below, bright at highDb and above.
IndexedImage imageOf(const Spectrogram& spectrogram, double lowDb, double highDb);

}  // namespace tessaly
