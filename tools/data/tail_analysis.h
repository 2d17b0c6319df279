// Measures a stored tail.
#pragma once

#include <array>
#include <vector>

#include "data/hrir_set.h"
#include "data/octave_decay.h"
#include "data/tail_design.h"

namespace tessaly::data {

/// Octaves from 100 Hz up to 12.8 kHz, of which those below half the rate count.
inline constexpr std::size_t coherenceBands = 7;
inline constexpr double lowestCoherenceHertz = 100.0;

/// Interaural coherence in octaves, real part.
using Coherence = std::array<double, coherenceBands>;

/// Coherence of a diffuse field of a set.
/// @param weights  share of each direction
Coherence diffuseCoherence(const HrirSet& hrirs, const std::vector<double>& weights);

/// Coherence of the late part of a tail.
Coherence tailCoherence(const std::vector<float>& tail, int sampleRate, double fromSeconds);

/// Decay times in seconds by a line through the backward integral from -5 to -25 dB.
using OctaveTimes = std::array<double, decayOctaves>;

/// Measured from the onset on. 0 where the decay does not reach that far.
OctaveTimes measuredTimes(const std::vector<float>& tail, int sampleRate, const TailDesign& design);

/// The same line through the decay that the design asks for.
OctaveTimes designedTimes(std::size_t frames, int sampleRate, const TailDesign& design);

/// Share of samples beyond one standard deviation in short windows, over that of Gaussian noise:
/// mean from twice the onset to the decay time, and the value at half the onset.
struct EchoDensity {
    double late = 0.0;
    double early = 0.0;
};
EchoDensity echoDensity(const std::vector<float>& tail, int sampleRate, const TailDesign& design);

/// The plain properties of the samples.
struct TailSamplesCheck {
    int notFinite = 0;
    double sumDecibels = 0.0;  ///< sum of a channel re square root of its energy, larger one
    int soundingBefore = 0;    ///< samples other than 0 before the start
    double last = 0.0;         ///< largest magnitude of the last frame
    double lastJump = 0.0;     ///< largest step in the last 60 frames re peak
    double peak = 0.0;
};
TailSamplesCheck checkTailSamples(const std::vector<float>& tail,
                                  int sampleRate,
                                  const TailDesign& design);

}  // namespace tessaly::data
