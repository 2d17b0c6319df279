// Order of the steps before synthesis.
#include "data/target_field.h"

namespace tessaly::data {

TargetField buildTarget(const Measurement& measurement,
                        const HrirOptions& options,
                        Progress& progress) {
    TargetField target;
    target.measured = analyse(measurement, progress);
    target.grid = interpolateField(measurement, target.measured, options, progress);
    progress.stage("equalising", 1);
    target.equalisation =
        equalise(target.grid.field.levels, options.diffuseFieldEqualisation, options.gainDb);
    progress.step();
    return target;
}

}  // namespace tessaly::data
