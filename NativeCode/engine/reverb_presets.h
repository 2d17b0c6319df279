// The tail table: gain, length and name of every room's measured tail.
#pragma once

#include <cstdint>

namespace tessaly {

struct ReverbPreset {
    int number;
    float reverbPresetGain;
    int length48000;   ///< frames at 48000 Hz; 0: a room without a tail
    const char* name;  ///< file name of a tail in a file of its own, without rate and extension
};

inline constexpr int reverbPresetCount = 60;

/// The row of a preset, 1 to 60; null for any other number.
const ReverbPreset* findReverbPreset(int preset) noexcept;

/// Frames of a tail at a rate, in single precision, truncated: at 48000 Hz this can be one below
/// the table's length.
std::int32_t reverbFramesAt(int sampleRate, int length48000) noexcept;

}  // namespace tessaly
