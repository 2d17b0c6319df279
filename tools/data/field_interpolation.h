// From measured directions to the grid: triangles, the unmeasured caps, smooth time differences.
#pragma once

#include "data/hrir_options.h"
#include "data/progress.h"
#include "data/response_field.h"

namespace tessaly::data {

/// Levels of the measured responses, and their time differences.
struct MeasuredField {
    LevelCurves levels;  ///< a measured direction each
    std::vector<double> itdSeconds;
};

/// Analyses each measured pair: transform of 4096 (longer at high rates), excess-phase estimate.
MeasuredField analyse(const Measurement& measurement, Progress& progress);

/// The measured field on the packed grid.
struct GridField {
    ResponseField field;
    std::vector<int> measuredAt;  ///< a grid entry: the measured direction it hits, or -1
    int lowestElevation = -90;    ///< grid elevation from which up the measurement is closed
    int highestElevation = 90;
    bool symmetric = false;       ///< left and right were averaged
    double mirrorDecibels = 0.0;  ///< rms difference to the mirrored set, 200 Hz to 16 kHz
};

/// Interpolates, fills the caps that were not measured, smooths the time differences and, if
/// wanted or if the set is nearly symmetric, averages both sides.
/// @throws DataError if the measurement does not close around the head
GridField interpolateField(const Measurement& measurement,
                           const MeasuredField& measured,
                           const HrirOptions& options,
                           Progress& progress);

}  // namespace tessaly::data
