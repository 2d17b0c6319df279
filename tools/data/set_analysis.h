// Measures a finished HRIR set: levels, time differences, energies.
#pragma once

#include <utility>
#include <vector>

#include "data/hrir_set.h"
#include "data/progress.h"
#include "data/response_field.h"

namespace tessaly::data {

/// Mean, 95th percentile and largest of a list of values.
struct Spread {
    double mean = 0.0;
    double percentile95 = 0.0;
    double largest = 0.0;
};
/// @param values  not empty
Spread spreadOf(std::vector<double> values);

/// What all figures of a set are worked out from.
struct SetAnalysis {
    LevelCurves levels;              ///< transform of 4096
    std::vector<double> itdSeconds;  ///< excess-phase estimate
    double sideItdSeconds = 0.0;     ///< at phi 90, searched 1 ms either way: shows swapped ears
    std::vector<std::vector<double>> energies;  ///< an ear: sum of squares of each direction
    double preOnsetDecibels = 0.0;              ///< energy before the onsets, of all energy
    double worstPreOnsetDecibels = 0.0;         ///< the same of the worst response
    int negativeTaps = 0;                       ///< responses whose largest tap is negative
    double frontalTap = 0.0;                    ///< largest by magnitude, worse ear
    double largestTap = 0.0;
    double largestTapSum = 0.0;  ///< of absolute values
    double frontalDcGain = 0.0;  ///< mean of both ears
    double mirrorError = 0.0;    ///< largest difference of a mirrored sample
    int notFinite = 0;           ///< samples that are no numbers
    int silentResponses = 0;
};

/// A set with samples that are no numbers or with silent responses is only counted: the rest of
/// the analysis is then empty.
SetAnalysis analyseSet(const HrirSet& set, Progress& progress);

/// Frequencies with equal steps on a logarithmic axis, both ends included.
std::vector<double> logSpaced(double fromHertz, double toHertz, int points);

}  // namespace tessaly::data
