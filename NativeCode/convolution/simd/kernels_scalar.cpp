// Plain kernels, for every CPU.
#include "convolution/simd/doubles_scalar.h"
#include "convolution/simd/kernels.h"
#include "convolution/simd/lanes_scalar.h"

namespace tessaly {
namespace {

std::int32_t transformLanes(std::int32_t) { return 1; }

void multiply(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    for (std::size_t i = 0; i < bins; ++i) {
        y[i] = product(a[i], b[i]);
    }
}

void add(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    for (std::size_t i = 0; i < bins; ++i) {
        y[i] = sum(a[i], b[i]);
    }
}

void ringSum(std::size_t bins,
             std::size_t partitions,
             std::size_t newest,
             const ComplexBin* const* ring,
             const ComplexBin* const* left,
             const ComplexBin* const* right,
             ComplexBin* sumL,
             ComplexBin* sumR) {
    std::size_t slot = newest;
    std::size_t part = 0;
    for (std::size_t n = 0; n < partitions; ++n) {
        const ComplexBin* x = ring[slot];
        const ComplexBin* l = left[part];
        const ComplexBin* r = right[part];
        for (std::size_t i = 0; i < bins; ++i) {
            sumL[i] = n == 0 ? product(x[i], l[i]) : sum(product(x[i], l[i]), sumL[i]);
            sumR[i] = n == 0 ? product(x[i], r[i]) : sum(product(x[i], r[i]), sumR[i]);
        }
        slot = slot + 1 == partitions ? 0 : slot + 1;
        part = part == 0 ? partitions - 1 : part - 1;
    }
}

void listSum(std::size_t bins,
             std::size_t count,
             const ComplexBin* const* input,
             const ComplexBin* const* left,
             const ComplexBin* const* right,
             bool onto,
             ComplexBin* sumL,
             ComplexBin* sumR) {
    for (std::size_t n = 0; n < count; ++n) {
        for (std::size_t i = 0; i < bins; ++i) {
            const ComplexBin l = product(input[n][i], left[n][i]);
            const ComplexBin r = product(input[n][i], right[n][i]);
            sumL[i] = n == 0 && !onto ? l : sum(l, sumL[i]);
            sumR[i] = n == 0 && !onto ? r : sum(r, sumR[i]);
        }
    }
}

constexpr Kernels table{.name = "scalar",
                        .transformLanes = transformLanes,
                        .forward = forwardLanes<LanesScalar>,
                        .forwardHalf = forwardHalfLanes<LanesScalar>,
                        .backward = backwardLanes<LanesScalar>,
                        .backwardMiddle = backwardMiddleLanes<LanesScalar>,
                        .backwardBlock = backwardBlockLanes<LanesScalar>,
                        .multiply = multiply,
                        .add = add,
                        .ringSum = ringSum,
                        .listSum = listSum,
                        .addTaps = addTaps<LanesScalar>,
                        .signal = &signalKernelsOf<LanesScalar, StereoScalar, AheadScalar>};

}  // namespace

constinit const Kernels* const kernelsScalar = &table;

}  // namespace tessaly
