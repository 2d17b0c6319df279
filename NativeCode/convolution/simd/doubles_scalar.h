// Double lanes without vectors: one stereo pair, and no look-ahead.
#pragma once

#include "convolution/simd/signal_template.h"

namespace tessaly {
namespace {

struct StereoScalar {
    struct Vector {
        double even;
        double odd;
    };
    static constexpr int pieces = 1;

    static Vector zero() { return {0.0, 0.0}; }
    static Vector load(const double* p) { return {p[0], p[1]}; }
    static Vector add(Vector a, Vector b) { return {a.even + b.even, a.odd + b.odd}; }
    static Vector subtract(Vector a, Vector b) { return {a.even - b.even, a.odd - b.odd}; }
    static Vector multiply(Vector a, Vector b) { return {a.even * b.even, a.odd * b.odd}; }
    static Vector loadPair(const float* const* inputs, std::size_t at) {
        return {static_cast<double>(inputs[0][at]), static_cast<double>(inputs[0][at + 1])};
    }
    static void storePair(float* const* outputs, std::size_t at, Vector a) {
        outputs[0][at] = static_cast<float>(a.even);
        outputs[0][at + 1] = static_cast<float>(a.odd);
    }
    static void loadTwoPairs(const float* const* inputs,
                             std::size_t at,
                             Vector& first,
                             Vector& second) {
        first = loadPair(inputs, at);
        second = loadPair(inputs, at + 2);
    }
    static void storeTwoPairs(float* const* outputs, std::size_t at, Vector first, Vector second) {
        storePair(outputs, at, first);
        storePair(outputs, at + 2, second);
    }
};

struct AheadScalar {
    static constexpr bool looksAhead = false;
};

}  // namespace
}  // namespace tessaly
