// What all reference engines, handlers and effects of one process share.
#pragma once

#include <array>
#include <cstdint>
#include <map>
#include <vector>

#include "support/reference/reference_hrir.h"

namespace tessaly::reference {

/// One process. Every engine, handler and effect is given one and must not outlive it; a fresh
/// object is a freshly started process.
struct Process {
    HrirSource hrirSource;  ///< where the first engine loads the set from; empty: no file there

    // Values of the engines.
    int essError = 1;
    int engineCount = 0;
    std::uint32_t blockCounter = 0;
    bool filterChangeAll = true;
    bool forceUpdateAll = true;
    HrirTables hrirs;

    // Values of handlers and effects.
    bool assetPathSet = true;
    bool bypass3DAudio = false;
    bool roomDistancesSet = false;
    std::array<float, 6> roomDistances{1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};
    int buffersizeSpat = 0;
    std::map<int, std::vector<double>> mixBuffers;  ///< 8192 values each, signal on even slots
};

}  // namespace tessaly::reference
