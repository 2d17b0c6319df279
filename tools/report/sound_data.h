// A rendered sound in the form in which the page carries it.
#pragma once

#include <cstddef>
#include <span>
#include <vector>

namespace tessaly {

/// What stands in place of samples that are no numbers, and how many there were.
struct CleanSound {
    std::vector<float> stereo;   ///< interleaved, left first, all finite, whole frames
    std::size_t notNumbers = 0;  ///< samples replaced by silence
};
CleanSound cleaned(std::span<const float> stereo);

/// Length of interleaved stereo samples in seconds.
double secondsOf(std::span<const float> stereo, int sampleRate) noexcept;

/// FLAC, 16 bit. 0 frames give an empty file.
struct SoundData {
    std::vector<unsigned char> flac;
    double loweredDb = 0.0;  ///< by how much peaks above full scale were brought down, 0 or more
};

/// @param stereo      interleaved, left first, finite
/// @param sampleRate  Hz
/// @throws std::runtime_error with one line if the encoder refuses
SoundData encodeFlac(std::span<const float> stereo, int sampleRate);

}  // namespace tessaly
