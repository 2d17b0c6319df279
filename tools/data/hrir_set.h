// A finished HRIR set of one rate, as the engine sees it.
#pragma once

#include <cstddef>
#include <vector>

#include "data/measurement.h"

namespace tessaly::data {

/// 2522 responses in packed order, `taps` frames of (right, left) each.
struct HrirSet {
    int sampleRate = 0;
    std::size_t taps = 0;
    std::vector<float> pairs;

    /// Sample of one ear. The right ear's comes first in a pair.
    float sample(std::size_t entry, int ear, std::size_t frame) const {
        return pairs[(entry * taps + frame) * earCount + (ear == rightEar ? 0 : 1)];
    }
    std::vector<double> response(std::size_t entry, int ear) const {
        std::vector<double> values(taps);
        for (std::size_t i = 0; i < taps; ++i) {
            values[i] = static_cast<double>(sample(entry, ear, i));
        }
        return values;
    }
};

}  // namespace tessaly::data
