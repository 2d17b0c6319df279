// The figures that a finished HRIR set must keep.
#pragma once

#include <limits>
#include <string>
#include <vector>

#include "data/set_analysis.h"
#include "data/target_field.h"

namespace tessaly::data {

/// Accepted values, ends included. Without ends a value is only shown; a NaN is never inside.
struct Range {
    double low = -std::numeric_limits<double>::infinity();
    double high = std::numeric_limits<double>::infinity();

    bool limited() const noexcept;
    bool contains(double value) const noexcept { return value >= low && value <= high; }
};

/// One row of the table at one rate: values that belong together, each with its range.
struct Figure {
    std::string name;
    std::vector<double> values;
    std::vector<Range> ranges;
    int decimals = 2;

    bool passed() const noexcept;
};

/// What is known about a set beside its samples.
struct SetExpectations {
    const TargetField* target = nullptr;  ///< null: comparisons with the measurement are left out
    bool reference = true;                ///< default source and options: all limits hold
    bool equalised = true;                ///< diffuse field taken out
    bool symmetric = true;                ///< sides averaged
};

/// All figures of a set, in the order of the table. Sets that are not the reference set are held
/// to the limits that every set must keep; their other figures are only shown.
std::vector<Figure> hrirFigures(const HrirSet& set,
                                const SetExpectations& expectations,
                                Progress& progress);

}  // namespace tessaly::data
