// Lane types over the registers of x86, as wide as the including source is built for.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

#if defined(__FMA__) || (defined(_MSC_VER) && defined(__AVX2__))
#define TESSALY_LANES_FUSE 1
#else
#define TESSALY_LANES_FUSE 0
#endif

struct Lanes4 {
    using Vector = __m128;
    static constexpr std::ptrdiff_t count = 4;

    static Vector load(const float* p) { return _mm_loadu_ps(p); }
    static void store(float* p, Vector a) { _mm_storeu_ps(p, a); }
    static Vector broadcast(float a) { return _mm_set1_ps(a); }
    static Vector add(Vector a, Vector b) { return _mm_add_ps(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm_sub_ps(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm_mul_ps(a, b); }
#if TESSALY_LANES_FUSE
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return _mm_fmadd_ps(a, b, c); }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) { return _mm_fmsub_ps(a, b, c); }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) { return _mm_fnmadd_ps(a, b, c); }
#else
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return add(multiply(a, b), c); }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) {
        return subtract(multiply(a, b), c);
    }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) {
        return subtract(c, multiply(a, b));
    }
#endif
    static Vector reverse(Vector a) { return _mm_shuffle_ps(a, a, _MM_SHUFFLE(0, 1, 2, 3)); }
    static void loadInterleaved(const float* p, Vector& re, Vector& im) {
        const Vector low = load(p);
        const Vector high = load(p + 4);
        re = _mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0));
        im = _mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1));
    }
    static void storeInterleaved(float* p, Vector re, Vector im) {
        store(p, _mm_unpacklo_ps(re, im));
        store(p + 4, _mm_unpackhi_ps(re, im));
    }
    static void transpose(Vector (&a)[4]) { _MM_TRANSPOSE4_PS(a[0], a[1], a[2], a[3]); }
    static void exchangeQuarters(Vector (&)[4]) {}
    static void transposeQuarters(Vector (&a)[4]) { transpose(a); }
    static Vector orBits(Vector a, Vector b) { return _mm_or_ps(a, b); }
    static bool anyBits(Vector a) {
        const __m128i zeros = _mm_cmpeq_epi32(_mm_castps_si128(a), _mm_setzero_si128());
        return _mm_movemask_epi8(zeros) != 0xffff;
    }

    static Vector evenLanes(Vector a) { return _mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 2, 0, 0)); }
    static Vector oddLanes(Vector a) { return _mm_shuffle_ps(a, a, _MM_SHUFFLE(3, 3, 1, 1)); }
    static Vector swapPairs(Vector a) { return _mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 3, 0, 1)); }
    static Vector subtractAdd(Vector a, Vector b) {
        // a + (-b) rounds as a - b does.
        return _mm_add_ps(a, _mm_xor_ps(b, _mm_set_ps(0.0f, -0.0f, 0.0f, -0.0f)));
    }
};

#if defined(__AVX2__)

struct Lanes8 {
    using Vector = __m256;
    static constexpr std::ptrdiff_t count = 8;

    static Vector load(const float* p) { return _mm256_loadu_ps(p); }
    static void store(float* p, Vector a) { _mm256_storeu_ps(p, a); }
    static Vector broadcast(float a) { return _mm256_set1_ps(a); }
    static Vector add(Vector a, Vector b) { return _mm256_add_ps(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm256_sub_ps(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm256_mul_ps(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return _mm256_fmadd_ps(a, b, c); }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) {
        return _mm256_fmsub_ps(a, b, c);
    }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) {
        return _mm256_fnmadd_ps(a, b, c);
    }
    static Vector reverse(Vector a) {
        const Vector halves = _mm256_permute2f128_ps(a, a, 1);
        return _mm256_permute_ps(halves, _MM_SHUFFLE(0, 1, 2, 3));
    }
    static void loadInterleaved(const float* p, Vector& re, Vector& im) {
        // Quarters 0 and 2, 1 and 3: the shuffles then leave the lanes in order.
        const Vector even = pair(p, p + 8);
        const Vector odd = pair(p + 4, p + 12);
        re = _mm256_shuffle_ps(even, odd, _MM_SHUFFLE(2, 0, 2, 0));
        im = _mm256_shuffle_ps(even, odd, _MM_SHUFFLE(3, 1, 3, 1));
    }
    static void storeInterleaved(float* p, Vector re, Vector im) {
        const Vector low = _mm256_unpacklo_ps(re, im);
        const Vector high = _mm256_unpackhi_ps(re, im);
        store(p, _mm256_permute2f128_ps(low, high, 0x20));
        store(p + 8, _mm256_permute2f128_ps(low, high, 0x31));
    }
    static void transpose(Vector (&a)[8]) {
        const Vector t0 = _mm256_unpacklo_ps(a[0], a[1]);
        const Vector t1 = _mm256_unpackhi_ps(a[0], a[1]);
        const Vector t2 = _mm256_unpacklo_ps(a[2], a[3]);
        const Vector t3 = _mm256_unpackhi_ps(a[2], a[3]);
        const Vector t4 = _mm256_unpacklo_ps(a[4], a[5]);
        const Vector t5 = _mm256_unpackhi_ps(a[4], a[5]);
        const Vector t6 = _mm256_unpacklo_ps(a[6], a[7]);
        const Vector t7 = _mm256_unpackhi_ps(a[6], a[7]);
        const Vector u0 = _mm256_shuffle_ps(t0, t2, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector u1 = _mm256_shuffle_ps(t0, t2, _MM_SHUFFLE(3, 2, 3, 2));
        const Vector u2 = _mm256_shuffle_ps(t1, t3, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector u3 = _mm256_shuffle_ps(t1, t3, _MM_SHUFFLE(3, 2, 3, 2));
        const Vector u4 = _mm256_shuffle_ps(t4, t6, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector u5 = _mm256_shuffle_ps(t4, t6, _MM_SHUFFLE(3, 2, 3, 2));
        const Vector u6 = _mm256_shuffle_ps(t5, t7, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector u7 = _mm256_shuffle_ps(t5, t7, _MM_SHUFFLE(3, 2, 3, 2));
        a[0] = _mm256_permute2f128_ps(u0, u4, 0x20);
        a[1] = _mm256_permute2f128_ps(u1, u5, 0x20);
        a[2] = _mm256_permute2f128_ps(u2, u6, 0x20);
        a[3] = _mm256_permute2f128_ps(u3, u7, 0x20);
        a[4] = _mm256_permute2f128_ps(u0, u4, 0x31);
        a[5] = _mm256_permute2f128_ps(u1, u5, 0x31);
        a[6] = _mm256_permute2f128_ps(u2, u6, 0x31);
        a[7] = _mm256_permute2f128_ps(u3, u7, 0x31);
    }

    static void exchangeQuarters(Vector (&a)[4]) {
        exchangeHalves(a[0], a[1]);
        exchangeHalves(a[2], a[3]);
    }
    static void transposeQuarters(Vector (&a)[4]) {
        const Vector low01 = _mm256_unpacklo_ps(a[0], a[1]);
        const Vector high01 = _mm256_unpackhi_ps(a[0], a[1]);
        const Vector low23 = _mm256_unpacklo_ps(a[2], a[3]);
        const Vector high23 = _mm256_unpackhi_ps(a[2], a[3]);
        a[0] = _mm256_shuffle_ps(low01, low23, _MM_SHUFFLE(1, 0, 1, 0));
        a[1] = _mm256_shuffle_ps(low01, low23, _MM_SHUFFLE(3, 2, 3, 2));
        a[2] = _mm256_shuffle_ps(high01, high23, _MM_SHUFFLE(1, 0, 1, 0));
        a[3] = _mm256_shuffle_ps(high01, high23, _MM_SHUFFLE(3, 2, 3, 2));
    }

    static Vector orBits(Vector a, Vector b) { return _mm256_or_ps(a, b); }
    static bool anyBits(Vector a) {
        return _mm256_testz_si256(_mm256_castps_si256(a), _mm256_castps_si256(a)) == 0;
    }

    static Vector evenLanes(Vector a) { return _mm256_moveldup_ps(a); }
    static Vector oddLanes(Vector a) { return _mm256_movehdup_ps(a); }
    static Vector swapPairs(Vector a) { return _mm256_permute_ps(a, _MM_SHUFFLE(2, 3, 0, 1)); }
    static Vector subtractAdd(Vector a, Vector b) { return _mm256_addsub_ps(a, b); }

private:
    static void exchangeHalves(Vector& a, Vector& b) {
        const Vector low = _mm256_permute2f128_ps(a, b, 0x20);
        b = _mm256_permute2f128_ps(a, b, 0x31);
        a = low;
    }
    static Vector pair(const float* low, const float* high) {
        return _mm256_insertf128_ps(_mm256_castps128_ps256(_mm_loadu_ps(low)), _mm_loadu_ps(high),
                                    1);
    }
};

#endif

#if defined(__AVX512F__)

struct Lanes16 {
    using Vector = __m512;
    static constexpr std::ptrdiff_t count = 16;

    static Vector load(const float* p) { return _mm512_loadu_ps(p); }
    static void store(float* p, Vector a) { _mm512_storeu_ps(p, a); }
    static Vector broadcast(float a) { return _mm512_set1_ps(a); }
    static Vector add(Vector a, Vector b) { return _mm512_add_ps(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm512_sub_ps(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm512_mul_ps(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return _mm512_fmadd_ps(a, b, c); }
    static Vector multiplySubtract(Vector a, Vector b, Vector c) {
        return _mm512_fmsub_ps(a, b, c);
    }
    static Vector negateMultiplyAdd(Vector a, Vector b, Vector c) {
        return _mm512_fnmadd_ps(a, b, c);
    }
    static Vector reverse(Vector a) {
        return _mm512_permutexvar_ps(
            _mm512_setr_epi32(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0), a);
    }
    static void loadInterleaved(const float* p, Vector& re, Vector& im) {
        const Vector low = load(p);
        const Vector high = load(p + 16);
        re = _mm512_permutex2var_ps(
            low, _mm512_setr_epi32(0, 2, 4, 6, 8, 10, 12, 14, 16, 18, 20, 22, 24, 26, 28, 30),
            high);
        im = _mm512_permutex2var_ps(
            low, _mm512_setr_epi32(1, 3, 5, 7, 9, 11, 13, 15, 17, 19, 21, 23, 25, 27, 29, 31),
            high);
    }
    static void storeInterleaved(float* p, Vector re, Vector im) {
        store(p, _mm512_permutex2var_ps(
                     re, _mm512_setr_epi32(0, 16, 1, 17, 2, 18, 3, 19, 4, 20, 5, 21, 6, 22, 7, 23),
                     im));
        store(p + 16, _mm512_permutex2var_ps(re,
                                             _mm512_setr_epi32(8, 24, 9, 25, 10, 26, 11, 27, 12, 28,
                                                               13, 29, 14, 30, 15, 31),
                                             im));
    }
    /// 4 by 4 within the quarters of each register, then the quarters as 4 by 4.
    static void transpose(Vector (&a)[16]) {
        transposeQuarters(a[0], a[1], a[2], a[3]);
        transposeQuarters(a[4], a[5], a[6], a[7]);
        transposeQuarters(a[8], a[9], a[10], a[11]);
        transposeQuarters(a[12], a[13], a[14], a[15]);
        exchangeQuarters(a[0], a[4], a[8], a[12]);
        exchangeQuarters(a[1], a[5], a[9], a[13]);
        exchangeQuarters(a[2], a[6], a[10], a[14]);
        exchangeQuarters(a[3], a[7], a[11], a[15]);
    }

    static void exchangeQuarters(Vector (&a)[4]) { exchangeQuarters(a[0], a[1], a[2], a[3]); }
    static void transposeQuarters(Vector (&a)[4]) { transposeQuarters(a[0], a[1], a[2], a[3]); }

    static Vector orBits(Vector a, Vector b) {
        return _mm512_castsi512_ps(_mm512_or_si512(_mm512_castps_si512(a), _mm512_castps_si512(b)));
    }
    static bool anyBits(Vector a) {
        return _mm512_cmpeq_epi32_mask(_mm512_castps_si512(a), _mm512_setzero_si512()) != 0xffff;
    }

    static Vector evenLanes(Vector a) { return _mm512_moveldup_ps(a); }
    static Vector oddLanes(Vector a) { return _mm512_movehdup_ps(a); }
    static Vector swapPairs(Vector a) { return _mm512_permute_ps(a, _MM_SHUFFLE(2, 3, 0, 1)); }
    static Vector subtractAdd(Vector a, Vector b) {
        return _mm512_mask_sub_ps(_mm512_add_ps(a, b), 0x5555, a, b);
    }

private:
    static void transposeQuarters(Vector& a, Vector& b, Vector& c, Vector& d) {
        const Vector abLow = _mm512_unpacklo_ps(a, b);
        const Vector abHigh = _mm512_unpackhi_ps(a, b);
        const Vector cdLow = _mm512_unpacklo_ps(c, d);
        const Vector cdHigh = _mm512_unpackhi_ps(c, d);
        a = _mm512_shuffle_ps(abLow, cdLow, _MM_SHUFFLE(1, 0, 1, 0));
        b = _mm512_shuffle_ps(abLow, cdLow, _MM_SHUFFLE(3, 2, 3, 2));
        c = _mm512_shuffle_ps(abHigh, cdHigh, _MM_SHUFFLE(1, 0, 1, 0));
        d = _mm512_shuffle_ps(abHigh, cdHigh, _MM_SHUFFLE(3, 2, 3, 2));
    }
    static void exchangeQuarters(Vector& a, Vector& b, Vector& c, Vector& d) {
        const Vector abLow = _mm512_shuffle_f32x4(a, b, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector abHigh = _mm512_shuffle_f32x4(a, b, _MM_SHUFFLE(3, 2, 3, 2));
        const Vector cdLow = _mm512_shuffle_f32x4(c, d, _MM_SHUFFLE(1, 0, 1, 0));
        const Vector cdHigh = _mm512_shuffle_f32x4(c, d, _MM_SHUFFLE(3, 2, 3, 2));
        a = _mm512_shuffle_f32x4(abLow, cdLow, _MM_SHUFFLE(2, 0, 2, 0));
        b = _mm512_shuffle_f32x4(abLow, cdLow, _MM_SHUFFLE(3, 1, 3, 1));
        c = _mm512_shuffle_f32x4(abHigh, cdHigh, _MM_SHUFFLE(2, 0, 2, 0));
        d = _mm512_shuffle_f32x4(abHigh, cdHigh, _MM_SHUFFLE(3, 1, 3, 1));
    }
};

#endif

}  // namespace
}  // namespace tessaly
