// The way from a checked measurement to the field that every rate is synthesised from.
#pragma once

#include "data/equalisation.h"
#include "data/field_interpolation.h"

namespace tessaly::data {

/// All that a set is made from, and what it is judged against.
struct TargetField {
    MeasuredField measured;
    GridField grid;  ///< interpolated and equalised
    Equalisation equalisation;
};

/// @throws DataError if the measurement does not close around the head
TargetField buildTarget(const Measurement& measurement,
                        const HrirOptions& options,
                        Progress& progress);

}  // namespace tessaly::data
