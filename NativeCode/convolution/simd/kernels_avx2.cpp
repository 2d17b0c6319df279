// Kernels for x86 with AVX2 and FMA, eight lanes.
#include "convolution/simd/kernels.h"

#if defined(__AVX2__)

#include <immintrin.h>

#include "convolution/simd/doubles_x86.h"
#include "convolution/simd/lanes_x86.h"
#include "convolution/simd/table_functions.h"

namespace tessaly {
namespace {

constexpr Kernels table =
    kernelsOver<Lanes8, Lanes4, LanesScalar>("avx2", signalKernelsOf<Lanes8, Stereo2, AheadLanes4>);

}  // namespace

constinit const Kernels* const kernelsAvx2 = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsAvx2 = nullptr;

}  // namespace tessaly

#endif
