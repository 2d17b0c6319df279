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

#define __AVX512F__ 1
#define kernelsAvx512 kernelsAvx512Emulated
#include "convolution/simd/kernels_avx512.cpp"
