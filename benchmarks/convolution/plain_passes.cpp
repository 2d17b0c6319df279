// The plain form of multiply-accumulate, built at -O2 and without vectorisation.
#include "convolution/plain_passes.h"

#include "support/plain_spectral.h"

namespace tessaly::bench {

namespace {

// Two functions that stay two: one pass each, as a library of vector operations offers them.
[[gnu::noinline]] void multiplyPass(std::size_t bins,
                                    const ComplexBin* a,
                                    const ComplexBin* b,
                                    ComplexBin* y) {
    test::plainMultiply(bins, a, b, y);
}
[[gnu::noinline]] void addPass(std::size_t bins,
                               const ComplexBin* a,
                               const ComplexBin* b,
                               ComplexBin* y) {
    test::plainAdd(bins, a, b, y);
}

}  // namespace

void plainRingSum(std::size_t bins,
                  std::size_t partitions,
                  std::size_t newest,
                  const ComplexBin* const* ring,
                  const ComplexBin* const* parts,
                  ComplexBin* scratch,
                  ComplexBin* sum) {
    for (std::size_t i = 0; i < bins; ++i) {
        sum[i] = {0.0f, 0.0f};
    }
    for (std::size_t i = 0; i < partitions; ++i) {
        const std::size_t slot = (newest + i) % partitions;
        const std::size_t part = (partitions - i) % partitions;
        multiplyPass(bins, ring[slot], parts[part], scratch);
        addPass(bins, scratch, sum, sum);
    }
}

}  // namespace tessaly::bench
