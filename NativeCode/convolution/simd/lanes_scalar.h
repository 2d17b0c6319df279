// A lane type of one lane, for the lengths too short for wider ones and for the plain table.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

struct LanesScalar {
    using Vector = float;
    static constexpr std::ptrdiff_t count = 1;

    static Vector load(const float* p) { return *p; }
    static void store(float* p, Vector a) { *p = a; }
    static Vector broadcast(float a) { return a; }
    static Vector add(Vector a, Vector b) { return a + b; }
    static Vector subtract(Vector a, Vector b) { return a - b; }
    static Vector multiply(Vector a, Vector b) { return a * b; }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return a * b + c; }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) { return a * b - c; }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) { return c - a * b; }
    static Vector reverse(Vector a) { return a; }
    static Vector orBits(Vector a, Vector b) {
        return __builtin_bit_cast(float, bitsOf(a) | bitsOf(b));
    }
    static bool anyBits(Vector a) { return bitsOf(a) != 0; }
    static void loadInterleaved(const float* p, Vector& re, Vector& im) {
        re = p[0];
        im = p[1];
    }
    static void storeInterleaved(float* p, Vector re, Vector im) {
        p[0] = re;
        p[1] = im;
    }
};

}  // namespace
}  // namespace tessaly
