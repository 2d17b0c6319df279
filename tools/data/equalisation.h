// Tone and level of a set: diffuse-field equalisation, both ends of the band, reference level.
#pragma once

#include <vector>

#include "data/response_field.h"

namespace tessaly::data {

/// Subtracts a curve from every response, the curve limited to 40 dB either way.
void subtractLimited(LevelCurves& levels, const std::vector<double>& curve);

/// Replaces what loudspeakers do not measure well: below 150 Hz and above 20.5 kHz the mean of
/// 150 to 300 Hz and 15 to 18 kHz of the same response, with a linear blend next to it.
void holdBandEnds(double* curve, std::size_t bins, double binHertz) noexcept;

/// Mean of the third-octave levels 200 Hz to 8 kHz of the frontal direction, both ears.
double frontalLevel(const LevelCurves& levels);

/// What was done to the levels, so that a measured curve can be compared with the set.
struct Equalisation {
    std::vector<double> subtracted;  ///< dB a bin, limited; zeros without equalisation
    double gainDb = 0.0;             ///< one gain for all directions and rates
};

/// Equalises the field in place.
/// @param diffuseField  take out the diffuse-field level
/// @param gainDb        on top of the gain that makes the frontal level 0 dB
Equalisation equalise(LevelCurves& levels, bool diffuseField, double gainDb);

}  // namespace tessaly::data
