// The kernels for 64-bit ARM as they stand, over an emulation of the instructions.
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/arm/neon.h>

#define TESSALY_EMULATED_NEON 1
#define kernelsNeon kernelsNeonEmulated
#include "convolution/simd/kernels_neon.cpp"
