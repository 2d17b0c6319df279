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
    using Pair = float64x2_t;
    struct Four {
        Pair low;
        Pair high;
    };
    static constexpr bool looksAhead = true;

    static Pair loadPair(const double* p) { return vld1q_f64(p); }
    static void storePair(double* p, Pair a) { vst1q_f64(p, a); }
    static Pair multiply(Pair a, Pair b) { return vmulq_f64(a, b); }
    static Pair add(Pair a, Pair b) { return vaddq_f64(a, b); }
    static Pair multiplyAdd(Pair a, Pair b, Pair c) { return vfmaq_f64(c, a, b); }
    static Pair swapped(Pair a) { return vextq_f64(a, a, 1); }

    static Four loadFour(const double* p) { return {vld1q_f64(p), vld1q_f64(p + 2)}; }
    static Four singles(const float* p) {
        const float32x4_t four = vld1q_f32(p);
        return {vcvt_f64_f32(vget_low_f32(four)), vcvt_f64_f32(vget_high_f32(four))};
    }
    static void storeSingles(float* p, Four a) {
        vst1q_f32(p, vcombine_f32(vcvt_f32_f64(a.low), vcvt_f32_f64(a.high)));
    }
    static Four rounded(Four a) {
        return {vcvt_f64_f32(vcvt_f32_f64(a.low)), vcvt_f64_f32(vcvt_f32_f64(a.high))};
    }
    static Pair low(Four a) { return a.low; }
    static Four lowTwice(Four a) { return {a.low, a.low}; }
    static Four highTwice(Four a) { return {a.high, a.high}; }
    static Four twice(Pair a) { return {a, a}; }
    static Four swapped(Four a) { return {swapped(a.low), swapped(a.high)}; }
    static Four add(Four a, Four b) { return {add(a.low, b.low), add(a.high, b.high)}; }
    static Four multiply(Four a, Four b) {
        return {multiply(a.low, b.low), multiply(a.high, b.high)};
    }
    static Four multiplyAdd(Four a, Four b, Four c) {
        return {multiplyAdd(a.low, b.low, c.low), multiplyAdd(a.high, b.high, c.high)};
    }
};

}  // namespace
}  // namespace tessaly
