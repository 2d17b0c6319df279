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

/// Radix of the pass that splits rings of so many rows: 2, 4 or 8. Eight at once want the registers
/// of the widest lanes.
constexpr std::int32_t ringRadix(std::int32_t lanes, std::int32_t rows) noexcept {
    if (rows <= 8) {
        return rows;
    }
    return lanes == 16 && rows == 64 ? 8 : 4;
}

/// Constants of the transform of blocks, likewise: M points as K rows of L lanes.
struct BlockTables {
    std::int32_t points = 0;   ///< M, a power of two from 2, at least L * L
    std::int32_t lanes = 0;    ///< L: 1, 4, 8 or 16
    std::int32_t columns = 0;  ///< K
    /// Passes of radix R split rings of polynomials in u with u^n = c into R each: for each pass
    /// and ring r, r^2 .. r^(R - 1), each as real, imaginary, where r^R = c. The first ring has u^M
    /// = i.
    const float* rings = nullptr;
    /// Of the first of these passes, for radix R: the powers t = 0 to R - 1 of the roots of each of
    /// its rings s, behind each other by t, then s, as real, imaginary.
    const float* first = nullptr;
    /// For four rows at a time: the powers of the rows' roots that the passes across their lanes
    /// take, each as L real parts and then L imaginary parts. Null with one lane.
    const float* across = nullptr;
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
    /// M + 1 bins to 2M reals, no scale factor; imaginary parts of the first and last bin are
    /// ignored. No array may overlap another.
    void (*backward)(const TransformTables& tables,
                     const ComplexBin* bins,
                     float* output,
                     float* work);
    /// A window of 2M reals to the M bins of a block spectrum, no scale factor. Block spectra are
    /// values of the polynomial of the samples at M roots of u^M = i, in an order and a layout of
    /// the table's own; products of them, bin by bin, belong to the products of the polynomials.
    /// The arrays must not overlap.
    void (*window)(const BlockTables& tables, const float* input, ComplexBin* bins);
    /// As `window`, of M reals that M zeros follow; the zeros are not read. `sounding` tells of
    /// more zeros, which save time where they are many: where bit k of 64 is 0, samples k M/64 to
    /// (k + 1) M/64 - 1 are zeros. With M below 64 it is not looked at.
    void (*partition)(const BlockTables& tables,
                      const float* input,
                      ComplexBin* bins,
                      std::uint64_t sounding);
    /// From a block spectrum samples M to M + `samples` - 1 of the window, 2M times, for up to M
    /// `samples`. `output` holds M floats; those behind the samples are left undefined. Likewise
    /// samples 0 to `wrappedSamples` - 1 in `wrapped`, M floats at most, rounded up to whole
    /// vectors of `lanes`; null for none. No array may overlap another.
    void (*block)(const BlockTables& tables,
                  const ComplexBin* bins,
                  float* output,
                  float* work,
                  std::size_t samples,
                  float* wrapped,
                  std::size_t wrappedSamples);
    /// sumL = baseL + input[0] * left[0] + input[1] * left[1] + ..., `count` products of `bins`
    /// bins of block spectra made with `lanes` lanes, and sumR with baseR and right. `bins` is a
    /// multiple of `lanes`. A null base is zero; a base may be its sum. Without a product nothing
    /// is written. Fused and reordered: the tables differ from each other by at most 2 (N + 2) *
    /// 2^-24 of the sum of the products' magnitudes, N products.
    void (*sumOfProducts)(std::int32_t lanes,
                          std::size_t bins,
                          std::size_t count,
                          const ComplexBin* const* input,
                          const ComplexBin* const* left,
                          const ComplexBin* const* right,
                          const ComplexBin* baseL,
                          const ComplexBin* baseR,
                          ComplexBin* sumL,
                          ComplexBin* sumR);
    /// y = a * b and y = a + b, bit for bit the same in every table; y may be a or b.
    void (*multiply)(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y);
    void (*add)(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y);
    /// sum[i] = base[i] + gain * term[i]; sum may be base or term. Fused in some tables.
    void (*addScaled)(
        std::size_t count, float gain, const float* term, const float* base, float* sum);
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
