// Kernels for 64-bit ARM, four lanes.
#include "convolution/simd/kernels.h"

#if defined(__aarch64__) || defined(_M_ARM64) || defined(TESSALY_EMULATED_NEON)

#if !defined(TESSALY_EMULATED_NEON)
#include <arm_neon.h>
#endif

#include "convolution/simd/doubles_neon.h"
#include "convolution/simd/lanes_neon.h"
#include "convolution/simd/table_functions.h"

namespace tessaly {
namespace {

constexpr Kernels table =
    kernelsOver<LanesNeon, LanesScalar>("neon", signalKernelsOf<LanesNeon, StereoNeon, AheadNeon>);

}  // namespace

constinit const Kernels* const kernelsNeon = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsNeon = nullptr;

}  // namespace tessaly

#endif
