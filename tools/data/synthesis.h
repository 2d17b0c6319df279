// Makes short minimum-phase responses with exact delays from level curves.
#pragma once

#include "data/hrir_set.h"
#include "data/progress.h"
#include "data/response_field.h"

namespace tessaly::data {

/// Start of the earliest possible ear in seconds.
inline constexpr double preDelaySeconds = 0.25e-3;

/// Synthesises all directions at one rate. The frequency axis is sampled for the rate, which
/// resamples with the right gain.
HrirSet synthesise(const ResponseField& field,
                   int sampleRate,
                   std::size_t taps,
                   Progress& progress);

/// One response of one direction, as `synthesise` makes it.
std::vector<double> synthesiseResponse(
    const ResponseField& field, int sampleRate, std::size_t taps, std::size_t entry, int ear);

/// Fades the first 3 samples in and the last 0.36 ms out.
/// @param response  `taps` samples, changed in place
void applyWindow(double* response, std::size_t taps, int sampleRate) noexcept;

}  // namespace tessaly::data
