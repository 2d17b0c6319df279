// Kernels for x86 with SSE2, four lanes.
#include "convolution/simd/kernels.h"

#if defined(__SSE2__) || defined(_M_X64)

#include <emmintrin.h>

#include "convolution/simd/doubles_x86.h"
#include "convolution/simd/lanes_x86.h"
#include "convolution/simd/table_functions.h"

namespace tessaly {
namespace {

constexpr Kernels table =
    kernelsOver<Lanes4, LanesScalar>("sse2", signalKernelsOf<Lanes4, Stereo1, AheadLanes2>);

}  // namespace

constinit const Kernels* const kernelsSse2 = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsSse2 = nullptr;

}  // namespace tessaly

#endif
