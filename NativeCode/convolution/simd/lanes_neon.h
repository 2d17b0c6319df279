// A lane type over the 128-bit registers of 64-bit ARM.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

struct LanesNeon {
    using Vector = float32x4_t;
    static constexpr std::ptrdiff_t count = 4;

    static Vector load(const float* p) { return vld1q_f32(p); }
    static void store(float* p, Vector a) { vst1q_f32(p, a); }
    static Vector broadcast(float a) { return vdupq_n_f32(a); }
    static Vector add(Vector a, Vector b) { return vaddq_f32(a, b); }
    static Vector subtract(Vector a, Vector b) { return vsubq_f32(a, b); }
    static Vector multiply(Vector a, Vector b) { return vmulq_f32(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return vfmaq_f32(c, a, b); }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) {
        return vfmaq_f32(vnegq_f32(c), a, b);
    }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) {
        return vfmaq_f32(c, vnegq_f32(a), b);
    }
    static Vector reverse(Vector a) {
        const Vector pairs = vrev64q_f32(a);
        return vcombine_f32(vget_high_f32(pairs), vget_low_f32(pairs));
    }
    static void loadInterleaved(const float* p, Vector& re, Vector& im) {
        const float32x4x2_t both = vld2q_f32(p);
        re = both.val[0];
        im = both.val[1];
    }
    static void storeInterleaved(float* p, Vector re, Vector im) {
        float32x4x2_t both;
        both.val[0] = re;
        both.val[1] = im;
        vst2q_f32(p, both);
    }
    static void transpose(Vector (&a)[4]) {
        const float32x4x2_t upper = vtrnq_f32(a[0], a[1]);
        const float32x4x2_t lower = vtrnq_f32(a[2], a[3]);
        a[0] = vcombine_f32(vget_low_f32(upper.val[0]), vget_low_f32(lower.val[0]));
        a[1] = vcombine_f32(vget_low_f32(upper.val[1]), vget_low_f32(lower.val[1]));
        a[2] = vcombine_f32(vget_high_f32(upper.val[0]), vget_high_f32(lower.val[0]));
        a[3] = vcombine_f32(vget_high_f32(upper.val[1]), vget_high_f32(lower.val[1]));
    }
    static void exchangeQuarters(Vector (&)[4]) {}
    static void transposeQuarters(Vector (&a)[4]) { transpose(a); }
    static Vector orBits(Vector a, Vector b) {
        return vreinterpretq_f32_u32(vorrq_u32(vreinterpretq_u32_f32(a), vreinterpretq_u32_f32(b)));
    }
    static bool anyBits(Vector a) { return vmaxvq_u32(vreinterpretq_u32_f32(a)) != 0; }

    static Vector evenLanes(Vector a) { return vtrnq_f32(a, a).val[0]; }
    static Vector oddLanes(Vector a) { return vtrnq_f32(a, a).val[1]; }
    static Vector swapPairs(Vector a) { return vrev64q_f32(a); }
    static Vector subtractAdd(Vector a, Vector b) {
        // a + (-b) rounds as a - b does.
        const uint32x4_t signs = vreinterpretq_u32_u64(vdupq_n_u64(0x80000000u));
        return vaddq_f32(a, vreinterpretq_f32_u32(veorq_u32(vreinterpretq_u32_f32(b), signs)));
    }
};

}  // namespace
}  // namespace tessaly
