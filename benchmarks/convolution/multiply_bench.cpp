// Multiply-accumulate of both ears over a ring: our tables, fused, and plain separate passes.
// Names: Mac/<table or plain>/<block length>/<partitions>.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/bench_noise.h"
#include "convolution/simd/kernels.h"
#include "support/plain_spectral.h"

namespace tessaly::bench {
namespace {

/// N spectra in one block, a cache line more than B bins apart, as the convolver has them.
class Spectra {
public:
    Spectra(std::size_t blockLength, std::size_t partitions, unsigned seed)
        : memory_((blockLength + 8) * partitions) {
        for (std::size_t i = 0; i < partitions; ++i) {
            entries_.push_back(memory_.data() + i * (blockLength + 8));
            fillNoise(&entries_.back()->re, 2 * (blockLength + 1), seed + static_cast<unsigned>(i));
        }
    }
    const ComplexBin* const* data() const { return entries_.data(); }

private:
    AlignedArray<ComplexBin> memory_;
    std::vector<ComplexBin*> entries_;
};

void multiply(benchmark::State& state,
              const Kernels* kernels,
              std::size_t blockLength,
              std::size_t partitions) {
    const std::size_t bins = blockLength + 1;
    const Spectra ring(blockLength, partitions, 1);
    const Spectra left(blockLength, partitions, 1001);
    const Spectra right(blockLength, partitions, 2001);
    AlignedArray<ComplexBin> sumL(bins);
    AlignedArray<ComplexBin> sumR(bins);
    AlignedArray<ComplexBin> scratch(bins);
    std::size_t newest = 0;
    for (auto _ : state) {
        if (kernels != nullptr) {
            kernels->ringSum(bins, partitions, newest, ring.data(), left.data(), right.data(),
                             sumL.data(), sumR.data());
        } else {
            test::plainRing(bins, partitions, newest, ring.data(), left.data(), scratch.data(),
                            sumL.data());
            test::plainRing(bins, partitions, newest, ring.data(), right.data(), scratch.data(),
                            sumR.data());
        }
        benchmark::ClobberMemory();
        newest = (newest + 1) % partitions;
    }
}

const bool registered = [] {
    for (const std::size_t blockLength : {256u, 1024u}) {
        for (const std::size_t partitions : {1u, 8u, 46u, 216u}) {
            const std::string tail =
                "/" + std::to_string(blockLength) + "/" + std::to_string(partitions);
            const KernelList& list = availableKernels();
            for (std::size_t i = 0; i < list.count; ++i) {
                const std::string name = std::string("Mac/") + list.tables[i]->name + tail;
                benchmark::RegisterBenchmark(name.c_str(), multiply, list.tables[i], blockLength,
                                             partitions);
            }
            benchmark::RegisterBenchmark(("Mac/plain" + tail).c_str(), multiply,
                                         static_cast<const Kernels*>(nullptr), blockLength,
                                         partitions);
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
