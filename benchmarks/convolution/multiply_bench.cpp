// Multiply-accumulate of both ears over a ring: our tables, fused, on their block spectra, the
// pairs of partition and slot collected as the convolver does; plain separate scalar passes;
// and nothing but reading the same spectra, which bounds them all. Names: Mac/<table, plain or
// read>/<block length>/<partitions>.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/bench_noise.h"
#include "convolution/plain_passes.h"
#include "convolution/read_limit.h"
#include "convolution/simd/kernels.h"

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

enum class Form { fused, plain, read };

void multiply(benchmark::State& state,
              Form form,
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
    std::vector<const ComplexBin*> slots(partitions);
    const std::int32_t lanes =
        kernels != nullptr ? kernels->transformLanes(static_cast<std::int32_t>(blockLength)) : 1;
    std::size_t newest = 0;
    for (auto _ : state) {
        if (form == Form::fused) {
            for (std::size_t i = 0; i < partitions; ++i) {
                slots[i] = ring.data()[(newest + partitions - i) % partitions];
            }
            kernels->sumOfProducts(lanes, blockLength, partitions, slots.data(), left.data(),
                                   right.data(), nullptr, nullptr, sumL.data(), sumR.data());
        } else if (form == Form::plain) {
            plainRingSum(bins, partitions, newest, ring.data(), left.data(), scratch.data(),
                         sumL.data());
            plainRingSum(bins, partitions, newest, ring.data(), right.data(), scratch.data(),
                         sumR.data());
        } else {
            for (std::size_t i = 0; i < partitions; ++i) {
                benchmark::DoNotOptimize(readStreams(2 * bins, &ring.data()[i]->re,
                                                     &left.data()[i]->re, &right.data()[i]->re));
            }
        }
        benchmark::ClobberMemory();
        newest = (newest + 1) % partitions;
    }
}

void add(const char* name,
         Form form,
         const Kernels* kernels,
         std::size_t blockLength,
         std::size_t partitions) {
    const std::string row = std::string("Mac/") + name + "/" + std::to_string(blockLength) + "/" +
                            std::to_string(partitions);
    benchmark::RegisterBenchmark(row.c_str(), multiply, form, kernels, blockLength, partitions);
}

const bool registered = [] {
    for (const std::size_t blockLength : {256u, 1024u}) {
        for (const std::size_t partitions : {1u, 16u, 73u, 216u}) {
            const KernelList& list = availableKernels();
            for (std::size_t i = 0; i < list.count; ++i) {
                add(list.tables[i]->name, Form::fused, list.tables[i], blockLength, partitions);
            }
            add("plain", Form::plain, nullptr, blockLength, partitions);
            add("read", Form::read, nullptr, blockLength, partitions);
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
