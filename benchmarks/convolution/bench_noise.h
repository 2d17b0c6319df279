// Seeded noise for benchmarks: the same numbers in every run.
#pragma once

#include <cstddef>
#include <random>

namespace tessaly::bench {

/// Fills `count` floats with noise between -1 and 1.
inline void fillNoise(float* values, std::size_t count, unsigned seed = 1) {
    std::mt19937 generator(seed);
    for (std::size_t i = 0; i < count; ++i) {
        values[i] = static_cast<float>(generator() >> 8) * (2.0f / 16777216.0f) - 1.0f;
    }
}

}  // namespace tessaly::bench
