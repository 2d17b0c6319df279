// Kernels for 64-bit ARM, four lanes.
#include "convolution/simd/kernels.h"

#if defined(__aarch64__) || defined(_M_ARM64) || defined(TESSALY_EMULATED_NEON)

#if !defined(TESSALY_EMULATED_NEON)
#include <arm_neon.h>
#endif

#include "convolution/simd/doubles_neon.h"
#include "convolution/simd/lanes_neon.h"
#include "convolution/simd/lanes_scalar.h"

namespace tessaly {
namespace {

std::int32_t transformLanes(std::int32_t points) {
    if (points >= 16) {
        return 4;
    }
    return 1;
}

void forward(const TransformTables& tables, const float* input, ComplexBin* bins, float* work) {
    if (tables.lanes == 4) {
        return forwardLanes<LanesNeon>(tables, input, bins, work);
    }
    forwardLanes<LanesScalar>(tables, input, bins, work);
}

void forwardHalf(const TransformTables& tables, const float* input, ComplexBin* bins, float* work) {
    if (tables.lanes == 4) {
        return forwardHalfLanes<LanesNeon>(tables, input, bins, work);
    }
    forwardHalfLanes<LanesScalar>(tables, input, bins, work);
}

void backward(const TransformTables& tables, const ComplexBin* bins, float* output, float* work) {
    if (tables.lanes == 4) {
        return backwardLanes<LanesNeon>(tables, bins, output, work);
    }
    backwardLanes<LanesScalar>(tables, bins, output, work);
}

void backwardBlock(const TransformTables& tables,
                   const ComplexBin* bins,
                   float* output,
                   float* work,
                   float* scratch) {
    if (tables.lanes == 4) {
        return backwardBlockLanes<LanesNeon>(tables, bins, output, work, scratch);
    }
    backwardBlockLanes<LanesScalar>(tables, bins, output, work, scratch);
}

void backwardMiddle(const TransformTables& tables,
                    const ComplexBin* bins,
                    float* output,
                    float* work,
                    std::size_t samples) {
    if (tables.lanes == 4) {
        return backwardMiddleLanes<LanesNeon>(tables, bins, output, work, samples);
    }
    backwardMiddleLanes<LanesScalar>(tables, bins, output, work, samples);
}

constexpr Kernels table{.name = "neon",
                        .transformLanes = transformLanes,
                        .forward = forward,
                        .forwardHalf = forwardHalf,
                        .backward = backward,
                        .backwardMiddle = backwardMiddle,
                        .backwardBlock = backwardBlock,
                        .multiply = multiplyBins<LanesNeon>,
                        .add = addBins<LanesNeon>,
                        .ringSum = sumRing<LanesNeon>,
                        .listSum = sumList<LanesNeon>,
                        .addTaps = addTaps<LanesNeon>,
                        .signal = &signalKernelsOf<LanesNeon, StereoNeon, AheadNeon>};

}  // namespace

constinit const Kernels* const kernelsNeon = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsNeon = nullptr;

}  // namespace tessaly

#endif
