// Makes a room's tail out of HRIRs: a dense rain of impulses from all around, then decay by bands.
#pragma once

#include <vector>

#include "data/hrir_set.h"
#include "data/tail_design.h"

namespace tessaly::data {

/// The tail at 48000 Hz without level: frames of (left, right), as many as are stored at that rate.
/// Equal input gives equal samples, on every machine and thread.
/// @param hrirs  the set of 48000 Hz
std::vector<double> synthesiseTail(const TailDesign& design, const HrirSet& hrirs);

}  // namespace tessaly::data
