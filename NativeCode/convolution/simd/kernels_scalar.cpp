// Plain kernels, for every CPU.
#include "convolution/simd/doubles_scalar.h"
#include "convolution/simd/kernels.h"
#include "convolution/simd/table_functions.h"

namespace tessaly {
namespace {

constexpr Kernels table =
    kernelsOver<LanesScalar>("scalar", signalKernelsOf<LanesScalar, StereoScalar, AheadScalar>);

}  // namespace

constinit const Kernels* const kernelsScalar = &table;

}  // namespace tessaly
