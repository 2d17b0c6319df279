// What a response tells of the room: onset, decay of its energy, reverberation times.
#pragma once

#include <array>
#include <cstddef>
#include <optional>
#include <span>
#include <vector>

#include "data/octave_decay.h"

namespace tessaly {

/// Lowest level of decay curves, dB.
inline constexpr double decayFloorDb = -120.0;

/// What follows the onset within this time, direct sound and first reflections, does not count for
/// reverberation times: near a source it would hide the room. Seconds.
inline constexpr double directSeconds = 0.02;

/// First sample within 20 dB of the peak; 0 for a silent response.
std::size_t onsetOf(std::span<const float> response) noexcept;

/// Energy still to come at each sample, dB re all of it, not below decayFloorDb. A silent response
/// is at the floor throughout.
std::vector<double> energyDecay(std::span<const float> response);

/// Times for 60 dB; empty where the response does not show them: too little range above what is
/// left at its end, shorter than the octave's filter can tell, or hardly a room at all.
struct OctaveDecay {
    double hertz = 0.0;         ///< centre
    std::optional<double> t20;  ///< seconds, from -5 to -25 dB
    std::optional<double> t30;  ///< seconds, from -5 to -35 dB
};

/// Reverberation times of one ear in octaves from 125 Hz to 8 kHz.
/// @param response    finite samples
/// @param sampleRate  Hz
std::array<OctaveDecay, data::decayOctaves> octaveDecays(std::span<const float> response,
                                                         int sampleRate);

}  // namespace tessaly
