// Built-in demo signals: no files, any rate, the same samples on every machine.
#pragma once

#include <cstddef>
#include <optional>
#include <string_view>
#include <vector>

namespace tessaly {

enum class DemoSound {
    Pluck,   ///< plucked string, a phrase of eight notes
    Drums,   ///< kick, snare and hat at 110 beats per minute
    Bursts,  ///< pink noise, 200 ms on, 300 ms off: the easiest to localise
};

/// @returns the signal of that name, "pluck", "drums" or "bursts", or nothing
std::optional<DemoSound> demoSoundByName(std::string_view name) noexcept;

/// Root mean square of the demo signals, linear: -12 dB below full scale.
inline constexpr double demoSoundRms = 0.25118864315095801;

/// One signal, mono, full scale 1.0, at -12 dBFS rms over its whole length. Peaks exceed full
/// scale.
/// @param sampleRate  Hz, above 0
/// @param frames      length wanted; the pattern repeats
std::vector<float> makeDemoSound(DemoSound sound, double sampleRate, std::size_t frames);

/// Root mean square of a signal; 0 for an empty one.
double rmsOf(const std::vector<float>& samples) noexcept;

}  // namespace tessaly
