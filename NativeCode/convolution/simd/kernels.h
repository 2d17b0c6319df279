// The convolver's inner loops: one table of function pointers for each instruction set.
#pragma once

#include <cstddef>
#include <cstdint>

#include "convolution/complex_bin.h"
#include "convolution/simd/signal_kernels.h"

namespace tessaly {

/// Constants of one transform length, laid out for one lane count. Immutable, shared by all plans.
/// The real block of 2M samples is taken as M complex points, and these as K = M / L rows of L:
/// K-point transforms run down the columns, a lane a column; L-point ones finish across them.
struct TransformTables {
    std::int32_t points = 0;   ///< M, a power of two from 2, at least L * L
    std::int32_t lanes = 0;    ///< L: 1, 4, 8 or 16
    std::int32_t columns = 0;  ///< K
    /// For each radix-4 pass with twiddles, n = K, K/4, ... above 8, and p = 0 .. n/4 - 1:
    /// e^(-2 pi i p r / n), r = 1, 2, 3, each as real, imaginary.
    const float* passes = nullptr;
    /// For each k0 = 0, L, ... below K and each column c = 1 .. L - 1: e^(-2 pi i c k / M) for
    /// k = k0 .. k0 + L - 1, L real parts and then L imaginary parts.
    const float* across = nullptr;
    /// -i/2 e^(-pi i k / M) for k = 0 .. M - 1, in groups of L real, L imaginary parts.
    const float* split = nullptr;
};

/// Floats of work memory that a transform of M points needs, 64-byte aligned.
constexpr std::size_t transformWorkFloats(std::int32_t points) noexcept {
    return 2 * (static_cast<std::size_t>(points) + 16);
}

/// All functions are block time and take any alignment; 64 bytes is fastest.
struct Kernels {
    const char* name;
    /// Lane count that the transform of this table wants for M points.
    std::int32_t (*transformLanes)(std::int32_t points);
    /// 2M reals to M + 1 bins, no scale factor. No array may overlap another.
    void (*forward)(const TransformTables& tables,
                    const float* input,
                    ComplexBin* bins,
                    float* work);
    /// As `forward`, of M samples that M zeros follow; the zeros are not read.
    void (*forwardHalf)(const TransformTables& tables,
                        const float* input,
                        ComplexBin* bins,
                        float* work);
    /// M + 1 bins to 2M reals, no scale factor; imaginary parts of the first and last bin are
    /// ignored. No array may overlap another.
    void (*backward)(const TransformTables& tables,
                     const ComplexBin* bins,
                     float* output,
                     float* work);
    /// As `backward`, of which only `samples` samples from the middle on, M to M + samples - 1, are
    /// wanted: `output` holds 2M floats all the same, and the others are left undefined.
    void (*backwardMiddle)(const TransformTables& tables,
                           const ComplexBin* bins,
                           float* output,
                           float* work,
                           std::size_t samples);
    /// As `backward`, of which only samples M to 2M - 1 are made: `output` holds M floats.
    /// `scratch` is as large as `work`, and apart from it.
    void (*backwardBlock)(const TransformTables& tables,
                          const ComplexBin* bins,
                          float* output,
                          float* work,
                          float* scratch);
    /// y = a * b and y = a + b, bit for bit the same in every table; y may be a or b.
    void (*multiply)(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y);
    void (*add)(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y);
    /// sumL = ring[newest] * left[0] + ring[newest + i mod N] * left[N - i] for i = 1 .. N - 1, and
    /// sumR with right; the sums are overwritten. Fused and reordered: the tables differ from each
    /// other by at most 2 (N + 2) * 2^-24 of the sum of the products' magnitudes.
    void (*ringSum)(std::size_t bins,
                    std::size_t partitions,
                    std::size_t newest,
                    const ComplexBin* const* ring,
                    const ComplexBin* const* left,
                    const ComplexBin* const* right,
                    ComplexBin* sumL,
                    ComplexBin* sumR);
    /// sumL = input[0] * left[0] + input[1] * left[1] + ..., `count` products, and sumR with right;
    /// with `onto` they are added to what the sums hold. The tables differ as those of `ringSum`.
    void (*listSum)(std::size_t bins,
                    std::size_t count,
                    const ComplexBin* const* input,
                    const ComplexBin* const* left,
                    const ComplexBin* const* right,
                    bool onto,
                    ComplexBin* sumL,
                    ComplexBin* sumR);
    /// sumL[n] += left[0] * input[n] + left[1] * input[n - 1] + ..., `taps` products, for n below
    /// `samples`, and sumR with right. `input` has `taps` - 1 samples before its first. The tables
    /// differ from each other by at most 2 (taps + 1) * 2^-24 of the sum of the products'
    /// magnitudes.
    void (*addTaps)(std::size_t samples,
                    std::size_t taps,
                    const float* left,
                    const float* right,
                    const float* input,
                    float* sumL,
                    float* sumR);
    /// Loops over samples.
    const SignalKernels* signal;
};

/// One table a source; null where the source was built for another architecture.
extern const Kernels* const kernelsScalar;
extern const Kernels* const kernelsSse2;
extern const Kernels* const kernelsAvx2;
extern const Kernels* const kernelsAvx512;
extern const Kernels* const kernelsNeon;

/// Tables that this CPU can run, plainest first; `count` of them.
struct KernelList {
    const Kernels* tables[5];
    std::size_t count;
};
const KernelList& availableKernels() noexcept;

/// The last of `availableKernels()`, asked once, unless a table was forced. Load time.
const Kernels& selectKernels() noexcept;
/// Makes plans and convolvers built from now on use `kernels`; null ends it. For tests and
/// benchmarks.
void forceKernels(const Kernels* kernels) noexcept;

}  // namespace tessaly
