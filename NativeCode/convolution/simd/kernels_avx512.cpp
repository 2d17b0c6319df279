// Kernels for x86 with AVX-512 (foundation only), sixteen lanes.
#include "convolution/simd/kernels.h"

#if defined(__AVX512F__)

#include <immintrin.h>

#include "convolution/simd/doubles_x86.h"
#include "convolution/simd/lanes_x86.h"
#include "convolution/simd/table_functions.h"

namespace tessaly {
namespace {

constexpr Kernels table = kernelsOver<Lanes16, Lanes8, Lanes4, LanesScalar>(
    "avx512", signalKernelsOf<Lanes16, Stereo4, AheadLanes8>);

}  // namespace

constinit const Kernels* const kernelsAvx512 = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsAvx512 = nullptr;

}  // namespace tessaly

#endif
