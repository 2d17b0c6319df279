// A small set of HRIRs for tests of tails: cheap, different in every direction and ear.
#pragma once

#include <cmath>

#include "data/hrir_set.h"
#include "data/sphere.h"

namespace tessaly::data {

/// Two taps a response; the ears get independent signs, so that their coherence is near 0.
inline HrirSet tailTestSet(int sampleRate) {
    HrirSet set;
    set.sampleRate = sampleRate;
    set.taps = 2;
    set.pairs.resize(packedOrder().size() * set.taps * earCount);
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        float* pair = set.pairs.data() + entry * set.taps * earCount;
        pair[0] = entry % 2 == 0 ? 1.0f : -1.0f;
        pair[1] = entry % 3 == 0 ? 1.0f : -0.5f;
        pair[2] = entry % 5 == 0 ? 0.5f : 0.0f;
        pair[3] = 0.0f;
    }
    return set;
}

}  // namespace tessaly::data
