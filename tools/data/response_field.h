// Level curves and time differences of both ears on the packed grid.
#pragma once

#include <cstddef>
#include <vector>

#include "data/measurement.h"
#include "resources/hrir_grid.h"

namespace tessaly::data {

/// Level curves of pairs of ears for a list of directions.
struct LevelCurves {
    double binHertz = 0.0;
    std::size_t bins = 0;
    std::vector<double> decibels;  ///< direction by direction, left then right, `bins` each

    void resize(std::size_t directions) { decibels.resize(directions * earCount * bins); }
    double* curve(std::size_t direction, int ear) {
        return decibels.data() + (direction * earCount + static_cast<std::size_t>(ear)) * bins;
    }
    const double* curve(std::size_t direction, int ear) const {
        return decibels.data() + (direction * earCount + static_cast<std::size_t>(ear)) * bins;
    }
};

/// What the synthesis turns into a set: the 2522 directions in packed order.
struct ResponseField {
    LevelCurves levels;
    std::vector<double> itdSeconds;  ///< positive: left ear first
};

/// Level of a curve at any frequency, linear in dB between bins, held beyond the last one.
double levelAt(const double* curve, std::size_t bins, double binHertz, double hertz) noexcept;

/// Third-octave bands around 1000 Hz * 2^(band / 3).
double bandCentre(int band) noexcept;
inline constexpr int lowestBand = -6;  ///< 250 Hz, the first centre above 200 Hz
inline constexpr int band8kHz = 9;     ///< also the last centre below 10 kHz
inline constexpr int band16kHz = 12;

/// Power mean of a curve over one third-octave band in dB.
double bandLevel(const double* curve, std::size_t bins, double binHertz, int band) noexcept;

/// 10^(decibels / 10).
double powerOf(double decibels) noexcept;

/// 10 log10 of the area-weighted power mean over all directions and both ears, a value a bin.
std::vector<double> diffuseLevel(const LevelCurves& levels);

}  // namespace tessaly::data
