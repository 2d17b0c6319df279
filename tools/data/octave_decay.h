// How a response decays in octaves: energy over time, and the line through it.
#pragma once

#include <cstddef>
#include <span>
#include <vector>

namespace tessaly::data {

inline constexpr std::size_t decayOctaves = 7;  ///< 125 to 8000 Hz
inline constexpr double lowestDecayHertz = 125.0;

/// An octave's skirts end at its centre times this, and divided by it: 2^-0.75.
inline constexpr double lowestInOctave = 0.59460355750136051;

/// Centre in hertz.
double octaveCentre(std::size_t octave) noexcept;

/// Flat to a quarter octave either side, 3 dB down at half an octave, zero at three quarters.
double octaveWeight(double octaves) noexcept;

/// Adds the squares of a response seen through each octave's filter, which delays nothing.
/// @param response    samples
/// @param sampleRate  Hz
/// @param energies    decayOctaves vectors; each is brought to the response's length first
void addOctaveEnergies(std::span<const double> response,
                       int sampleRate,
                       std::span<std::vector<double>> energies);

/// Turns energy over time into what is still to come at each moment.
/// @param from  moments before this one stay as they are
void integrateBackwards(std::vector<double>& energy, std::size_t from) noexcept;

/// The line through a decay curve between two levels below its begin.
/// @param energy          equally spaced
/// @param spacingSeconds  from one value to the next
/// @param fitFrom         dB, e.g. -5
/// @param fitTo           dB, e.g. -25
/// @return seconds for 60 dB, 0 if the curve does not reach the end of the range
double fittedTime(std::span<const double> energy,
                  double spacingSeconds,
                  double fitFrom,
                  double fitTo) noexcept;

}  // namespace tessaly::data
