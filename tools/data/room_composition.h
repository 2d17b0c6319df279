// The late sound of a room as the engine composes it: reflections and tail, without the direct
// sound.
#pragma once

#include <vector>

#include "data/hrir_set.h"
#include "data/tail_design.h"

namespace tessaly::data {

/// Response of a room for a source ahead at 1 m, mix gains 0 dB.
/// @param hrirs  of the rate
/// @param tail   stored samples of that rate, (left, right)
/// @return interleaved (left, right)
std::vector<double> composeRoom(const TailDesign& design,
                                const HrirSet& hrirs,
                                const std::vector<float>& tail);

}  // namespace tessaly::data
