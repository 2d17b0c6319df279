// Double lanes over the registers of 64-bit Arm.
#pragma once

#include "convolution/simd/lanes_neon.h"
#include "convolution/simd/signal_template.h"

namespace tessaly {
namespace {

struct StereoNeon {
    using Vector = float64x2_t;
    static constexpr int pieces = 1;

    static Vector zero() { return vdupq_n_f64(0.0); }
    static Vector load(const double* p) { return vld1q_f64(p); }
    static Vector add(Vector a, Vector b) { return vaddq_f64(a, b); }
    static Vector subtract(Vector a, Vector b) { return vsubq_f64(a, b); }
    static Vector multiply(Vector a, Vector b) { return vmulq_f64(a, b); }
    static Vector loadPair(const float* const* inputs, std::size_t at) {
        return vcvt_f64_f32(vld1_f32(inputs[0] + at));
    }
    static void storePair(float* const* outputs, std::size_t at, Vector a) {
        vst1_f32(outputs[0] + at, vcvt_f32_f64(a));
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

struct AheadNeon {
    using Vector = float64x2_t;
    static constexpr bool looksAhead = true;
    static constexpr int lanes = 2;
    static constexpr int ahead = 4;

    static Vector load(const double* p) { return vld1q_f64(p); }
    static Vector broadcast(const double* p) { return vld1q_dup_f64(p); }
    static void store(double* p, Vector a) { vst1q_f64(p, a); }
    static Vector add(Vector a, Vector b) { return vaddq_f64(a, b); }
    static Vector multiply(Vector a, Vector b) { return vmulq_f64(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return vfmaq_f64(c, a, b); }
    template <int Lane>
    static Vector lane(Vector a) {
        return vdupq_laneq_f64(a, Lane);
    }
    static Vector fromSingles(const float* p) { return vcvt_f64_f32(vld1_f32(p)); }
    static void toSingles(float* p, Vector a) { vst1_f32(p, vcvt_f32_f64(a)); }
    static Vector rounded(Vector a) { return vcvt_f64_f32(vcvt_f32_f64(a)); }
};

}  // namespace
}  // namespace tessaly
