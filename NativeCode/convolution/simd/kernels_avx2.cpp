// Kernels for x86 with AVX2 and FMA, eight lanes.
#include "convolution/simd/kernels.h"

#if defined(__AVX2__)

#include <immintrin.h>

#include "convolution/simd/doubles_x86.h"
#include "convolution/simd/lanes_scalar.h"
#include "convolution/simd/lanes_x86.h"

namespace tessaly {
namespace {

std::int32_t transformLanes(std::int32_t points) {
    if (points >= 64) {
        return 8;
    }
    if (points >= 16) {
        return 4;
    }
    return 1;
}

void forward(const TransformTables& tables, const float* input, ComplexBin* bins, float* work) {
    if (tables.lanes == 8) {
        return forwardLanes<Lanes8>(tables, input, bins, work);
    }
    if (tables.lanes == 4) {
        return forwardLanes<Lanes4>(tables, input, bins, work);
    }
    forwardLanes<LanesScalar>(tables, input, bins, work);
}

void forwardHalf(const TransformTables& tables, const float* input, ComplexBin* bins, float* work) {
    if (tables.lanes == 8) {
        return forwardHalfLanes<Lanes8>(tables, input, bins, work);
    }
    if (tables.lanes == 4) {
        return forwardHalfLanes<Lanes4>(tables, input, bins, work);
    }
    forwardHalfLanes<LanesScalar>(tables, input, bins, work);
}

void backward(const TransformTables& tables, const ComplexBin* bins, float* output, float* work) {
    if (tables.lanes == 8) {
        return backwardLanes<Lanes8>(tables, bins, output, work);
    }
    if (tables.lanes == 4) {
        return backwardLanes<Lanes4>(tables, bins, output, work);
    }
    backwardLanes<LanesScalar>(tables, bins, output, work);
}

void backwardBlock(const TransformTables& tables,
                   const ComplexBin* bins,
                   float* output,
                   float* work,
                   float* scratch) {
    if (tables.lanes == 8) {
        return backwardBlockLanes<Lanes8>(tables, bins, output, work, scratch);
    }
    if (tables.lanes == 4) {
        return backwardBlockLanes<Lanes4>(tables, bins, output, work, scratch);
    }
    backwardBlockLanes<LanesScalar>(tables, bins, output, work, scratch);
}

void backwardMiddle(const TransformTables& tables,
                    const ComplexBin* bins,
                    float* output,
                    float* work,
                    std::size_t samples) {
    if (tables.lanes == 8) {
        return backwardMiddleLanes<Lanes8>(tables, bins, output, work, samples);
    }
    if (tables.lanes == 4) {
        return backwardMiddleLanes<Lanes4>(tables, bins, output, work, samples);
    }
    backwardMiddleLanes<LanesScalar>(tables, bins, output, work, samples);
}

constexpr Kernels table{.name = "avx2",
                        .transformLanes = transformLanes,
                        .forward = forward,
                        .forwardHalf = forwardHalf,
                        .backward = backward,
                        .backwardMiddle = backwardMiddle,
                        .backwardBlock = backwardBlock,
                        .multiply = multiplyBins<Lanes8>,
                        .add = addBins<Lanes8>,
                        .ringSum = sumRing<Lanes8>,
                        .listSum = sumList<Lanes8>,
                        .addTaps = addTaps<Lanes8>,
                        .signal = &signalKernelsOf<Lanes8, Stereo2, AheadFour>};

}  // namespace

constinit const Kernels* const kernelsAvx2 = &table;

}  // namespace tessaly

#else

namespace tessaly {

constinit const Kernels* const kernelsAvx2 = nullptr;

}  // namespace tessaly

#endif
