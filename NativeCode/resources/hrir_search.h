// The substitute for a missing HRIR file: a neighbour that is mapped already.
#pragma once

#include <cstdint>

#include "resources/hrir_tables.h"

namespace tessaly {

/// The cell in need and the part of the grid that is being filled.
struct HrirSearch {
    int indexPhi = 0;
    int indexTheta = 0;
    int lastPhi = 0;         ///< last azimuth index that gets filled
    int lastTheta = 0;       ///< last elevation index that gets filled
    std::int16_t phi = 0;    ///< degrees as the loader left them, for the message
    std::int16_t theta = 0;  ///< degrees as the loader left them, for the message
};

/// Looks through `filterTable` for an entry to use and writes it into `cell`. No file is read.
/// Load time. The search may also end well with `cell` null: a gap of exactly one cell before a
/// filled one is left silent.
/// @return false if there is nothing to take; `essError` is -104 then
bool searchMappedHrir(HrirSlot& cell, const HrirSearch& search);

}  // namespace tessaly
