// Double lanes over the registers of x86, as wide as the including source is built for.
#pragma once

#include "convolution/simd/lanes_x86.h"
#include "convolution/simd/signal_template.h"

namespace tessaly {
namespace {

/// The two floats of a pair as the lower half of a register.
TESSALY_KERNEL_INLINE __m128 loadHalf(const float* p) {
    return _mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)));
}
TESSALY_KERNEL_INLINE void storeHalf(float* p, __m128 a) {
    _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_castps_si128(a));
}
TESSALY_KERNEL_INLINE void storeUpperHalf(float* p, __m128 a) { storeHalf(p, _mm_movehl_ps(a, a)); }

struct Stereo1 {
    using Vector = __m128d;
    static constexpr int pieces = 1;

    static Vector zero() { return _mm_setzero_pd(); }
    static Vector load(const double* p) { return _mm_load_pd(p); }
    static Vector add(Vector a, Vector b) { return _mm_add_pd(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm_sub_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm_mul_pd(a, b); }
    static Vector loadPair(const float* const* inputs, std::size_t at) {
        return _mm_cvtps_pd(loadHalf(inputs[0] + at));
    }
    static void storePair(float* const* outputs, std::size_t at, Vector a) {
        storeHalf(outputs[0] + at, _mm_cvtpd_ps(a));
    }
    static void loadTwoPairs(const float* const* inputs,
                             std::size_t at,
                             Vector& first,
                             Vector& second) {
        const __m128 both = _mm_loadu_ps(inputs[0] + at);
        first = _mm_cvtps_pd(both);
        second = _mm_cvtps_pd(_mm_movehl_ps(both, both));
    }
    static void storeTwoPairs(float* const* outputs, std::size_t at, Vector first, Vector second) {
        _mm_storeu_ps(outputs[0] + at, _mm_movelh_ps(_mm_cvtpd_ps(first), _mm_cvtpd_ps(second)));
    }
};

/// Two halves of two registers, which the same code moves about as one.
struct AheadLanes2 {
    using Vector = __m128d;
    static constexpr bool looksAhead = true;
    static constexpr int lanes = 2;
    static constexpr int ahead = 4;

    static Vector load(const double* p) { return _mm_loadu_pd(p); }
    static Vector broadcast(const double* p) { return _mm_set1_pd(*p); }
    static void store(double* p, Vector a) { _mm_storeu_pd(p, a); }
    static Vector add(Vector a, Vector b) { return _mm_add_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm_mul_pd(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) {
        return _mm_add_pd(_mm_mul_pd(a, b), c);
    }
    template <int Lane>
    static Vector lane(Vector a) {
        return _mm_shuffle_pd(a, a, Lane * 3);
    }
    static Vector fromSingles(const float* p) { return _mm_cvtps_pd(loadHalf(p)); }
    static void toSingles(float* p, Vector a) { storeHalf(p, _mm_cvtpd_ps(a)); }
    static Vector rounded(Vector a) { return _mm_cvtps_pd(_mm_cvtpd_ps(a)); }
};

#if defined(__AVX2__)

struct Stereo2 {
    using Vector = __m256d;
    static constexpr int pieces = 2;

    static Vector zero() { return _mm256_setzero_pd(); }
    static Vector load(const double* p) { return _mm256_load_pd(p); }
    static Vector add(Vector a, Vector b) { return _mm256_add_pd(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm256_sub_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm256_mul_pd(a, b); }
    static Vector loadPair(const float* const* inputs, std::size_t at) {
        return _mm256_cvtps_pd(_mm_movelh_ps(loadHalf(inputs[0] + at), loadHalf(inputs[1] + at)));
    }
    static void storePair(float* const* outputs, std::size_t at, Vector a) {
        const __m128 both = _mm256_cvtpd_ps(a);
        storeHalf(outputs[0] + at, both);
        storeUpperHalf(outputs[1] + at, both);
    }
    static void loadTwoPairs(const float* const* inputs,
                             std::size_t at,
                             Vector& first,
                             Vector& second) {
        const __m128 one = _mm_loadu_ps(inputs[0] + at);
        const __m128 two = _mm_loadu_ps(inputs[1] + at);
        first = _mm256_cvtps_pd(_mm_movelh_ps(one, two));
        second = _mm256_cvtps_pd(_mm_movehl_ps(two, one));
    }
    static void storeTwoPairs(float* const* outputs, std::size_t at, Vector first, Vector second) {
        const __m128 one = _mm256_cvtpd_ps(first);
        const __m128 two = _mm256_cvtpd_ps(second);
        _mm_storeu_ps(outputs[0] + at, _mm_movelh_ps(one, two));
        _mm_storeu_ps(outputs[1] + at, _mm_movehl_ps(two, one));
    }
};

struct AheadLanes4 {
    using Vector = __m256d;
    static constexpr bool looksAhead = true;
    static constexpr int lanes = 4;
    static constexpr int ahead = 8;

    static Vector load(const double* p) { return _mm256_loadu_pd(p); }
    static Vector broadcast(const double* p) { return _mm256_broadcast_sd(p); }
    static void store(double* p, Vector a) { _mm256_storeu_pd(p, a); }
    static Vector add(Vector a, Vector b) { return _mm256_add_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm256_mul_pd(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return _mm256_fmadd_pd(a, b, c); }
    template <int Lane>
    static Vector lane(Vector a) {
        return _mm256_permute4x64_pd(a, Lane * 0x55);
    }
    static Vector fromSingles(const float* p) { return _mm256_cvtps_pd(_mm_loadu_ps(p)); }
    static void toSingles(float* p, Vector a) { _mm_storeu_ps(p, _mm256_cvtpd_ps(a)); }
    static Vector rounded(Vector a) { return _mm256_cvtps_pd(_mm256_cvtpd_ps(a)); }
};

#endif

#if defined(__AVX512F__)

struct AheadLanes8 {
    using Vector = __m512d;
    static constexpr bool looksAhead = true;
    static constexpr int lanes = 8;
    static constexpr int ahead = 8;

    static Vector load(const double* p) { return _mm512_loadu_pd(p); }
    static Vector broadcast(const double* p) { return _mm512_set1_pd(*p); }
    static void store(double* p, Vector a) { _mm512_storeu_pd(p, a); }
    static Vector add(Vector a, Vector b) { return _mm512_add_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm512_mul_pd(a, b); }
    static Vector multiplyAdd(Vector a, Vector b, Vector c) { return _mm512_fmadd_pd(a, b, c); }
    template <int Lane>
    static Vector lane(Vector a) {
        return _mm512_permutexvar_pd(_mm512_set1_epi64(Lane), a);
    }
    static Vector fromSingles(const float* p) { return _mm512_cvtps_pd(_mm256_loadu_ps(p)); }
    static void toSingles(float* p, Vector a) { _mm256_storeu_ps(p, _mm512_cvtpd_ps(a)); }
    static Vector rounded(Vector a) { return _mm512_cvtps_pd(_mm512_cvtpd_ps(a)); }
};

struct Stereo4 {
    using Vector = __m512d;
    static constexpr int pieces = 4;

    static Vector zero() { return _mm512_setzero_pd(); }
    static Vector load(const double* p) { return _mm512_load_pd(p); }
    static Vector add(Vector a, Vector b) { return _mm512_add_pd(a, b); }
    static Vector subtract(Vector a, Vector b) { return _mm512_sub_pd(a, b); }
    static Vector multiply(Vector a, Vector b) { return _mm512_mul_pd(a, b); }
    static __m256 joined(__m128 low, __m128 high) {
        return _mm256_insertf128_ps(_mm256_castps128_ps256(low), high, 1);
    }
    static Vector loadPair(const float* const* inputs, std::size_t at) {
        return _mm512_cvtps_pd(
            joined(_mm_movelh_ps(loadHalf(inputs[0] + at), loadHalf(inputs[1] + at)),
                   _mm_movelh_ps(loadHalf(inputs[2] + at), loadHalf(inputs[3] + at))));
    }
    static void storePair(float* const* outputs, std::size_t at, Vector a) {
        const __m256 all = _mm512_cvtpd_ps(a);
        const __m128 low = _mm256_castps256_ps128(all);
        const __m128 high = _mm256_extractf128_ps(all, 1);
        storeHalf(outputs[0] + at, low);
        storeUpperHalf(outputs[1] + at, low);
        storeHalf(outputs[2] + at, high);
        storeUpperHalf(outputs[3] + at, high);
    }
    static void loadTwoPairs(const float* const* inputs,
                             std::size_t at,
                             Vector& first,
                             Vector& second) {
        const __m128 one = _mm_loadu_ps(inputs[0] + at);
        const __m128 two = _mm_loadu_ps(inputs[1] + at);
        const __m128 three = _mm_loadu_ps(inputs[2] + at);
        const __m128 four = _mm_loadu_ps(inputs[3] + at);
        first = _mm512_cvtps_pd(joined(_mm_movelh_ps(one, two), _mm_movelh_ps(three, four)));
        second = _mm512_cvtps_pd(joined(_mm_movehl_ps(two, one), _mm_movehl_ps(four, three)));
    }
    static void storeTwoPairs(float* const* outputs, std::size_t at, Vector first, Vector second) {
        const __m256 one = _mm512_cvtpd_ps(first);
        const __m256 two = _mm512_cvtpd_ps(second);
        const __m128 oneLow = _mm256_castps256_ps128(one);
        const __m128 twoLow = _mm256_castps256_ps128(two);
        const __m128 oneHigh = _mm256_extractf128_ps(one, 1);
        const __m128 twoHigh = _mm256_extractf128_ps(two, 1);
        _mm_storeu_ps(outputs[0] + at, _mm_movelh_ps(oneLow, twoLow));
        _mm_storeu_ps(outputs[1] + at, _mm_movehl_ps(twoLow, oneLow));
        _mm_storeu_ps(outputs[2] + at, _mm_movelh_ps(oneHigh, twoHigh));
        _mm_storeu_ps(outputs[3] + at, _mm_movehl_ps(twoHigh, oneHigh));
    }
};

#endif

}  // namespace
}  // namespace tessaly
