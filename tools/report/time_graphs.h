// What the ears receive over time: levels, differences, spectra.
#pragma once

#include <span>
#include <string>

namespace tessaly {

/// Levels, time difference and level difference as three graphs with one time axis.
/// @param stereo      interleaved, left first, finite; one frame or more
/// @param sampleRate  Hz
std::string binauralGraphs(std::span<const float> stereo, int sampleRate);

/// A spectrogram of each ear, both with the same colours.
std::string spectrumGraphs(std::span<const float> stereo, int sampleRate);

}  // namespace tessaly
