// The AVX-512 kernels as they stand, over an emulation of the instructions beyond AVX2 and FMA.
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/x86/avx2.h>
#include <simde/x86/avx512.h>
#include <simde/x86/fma.h>

// What the emulation leaves out.
#define _mm512_moveldup_ps(a) simde_mm512_shuffle_ps(a, a, 0xA0)
#define _mm512_movehdup_ps(a) simde_mm512_shuffle_ps(a, a, 0xF5)
#define _mm512_permute_ps(a, order) simde_mm512_shuffle_ps(a, a, order)
#define _mm512_shuffle_f32x4(a, b, order) simde_mm512_shuffle_f32x4(a, b, order)

namespace {

simde__m512d widened(__m256 a) {
    double wide[8];
    _mm256_storeu_pd(wide, _mm256_cvtps_pd(_mm256_castps256_ps128(a)));
    _mm256_storeu_pd(wide + 4, _mm256_cvtps_pd(_mm256_extractf128_ps(a, 1)));
    return simde_mm512_loadu_pd(wide);
}

__m256 narrowed(simde__m512d a) {
    double wide[8];
    simde_mm512_storeu_pd(wide, a);
    const __m128 low = _mm256_cvtpd_ps(_mm256_loadu_pd(wide));
    const __m128 high = _mm256_cvtpd_ps(_mm256_loadu_pd(wide + 4));
    return _mm256_insertf128_ps(_mm256_castps128_ps256(low), high, 1);
}

}  // namespace

#define _mm512_cvtps_pd(a) widened(a)
#define _mm512_cvtpd_ps(a) narrowed(a)

#define __AVX512F__ 1
#define kernelsAvx512 kernelsAvx512Emulated
#include "convolution/simd/kernels_avx512.cpp"
