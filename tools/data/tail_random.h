// Random numbers that are the same on every machine.
#pragma once

#include <cmath>
#include <cstdint>
#include <random>

namespace tessaly::data {

/// The standard's generator with transforms of our own: the library's distributions differ between
/// compilers.
class TailRandom {
public:
    explicit TailRandom(std::uint64_t seed) : generator_(seed) {}

    /// 0 included, 1 not; 53 bits.
    double uniform() { return static_cast<double>(generator_() >> 11) * 0x1p-53; }
    /// Exponential with mean 1.
    double exponential() { return -std::log(1.0 - uniform()); }
    /// -1 or 1.
    double sign() { return generator_() >> 63 != 0 ? -1.0 : 1.0; }

private:
    std::mt19937_64 generator_;
};

}  // namespace tessaly::data
