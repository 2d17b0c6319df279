// One block of the convolver, mono to two ears, with each table of kernels.
// Names: Convolver/<still or moving>/tessaly_<table>/<block length>/<taps>. A still block
// convolves; a moving one also replaces every partition of the response and crossfades from the old
// one. All threads of the program count, since another convolver may use some.
#include <benchmark/benchmark.h>

#include <string>

#include "convolution/convolver.h"
#include "convolution/simd/kernels.h"

namespace tessaly::bench {
namespace {

void convolve(benchmark::State& state,
              const Kernels* kernels,
              bool moving,
              std::int32_t blockLength,
              std::int32_t taps) {
    forceKernels(kernels);
    Convolver convolver(blockLength, taps);
    forceKernels(nullptr);
    InputBlocks input(blockLength);
    // Until the ring is full.
    for (std::int32_t k = 0; k < taps; k += blockLength) {
        convolver.still(input.next());
    }
    for (auto _ : state) {
        if (moving) {
            convolver.moving(input.next());
        } else {
            convolver.still(input.next());
        }
        benchmark::ClobberMemory();
    }
}

void add(bool moving, const Kernels* kernels, std::int32_t blockLength, std::int32_t taps) {
    const std::string name = std::string("Convolver/") + (moving ? "moving" : "still") +
                             "/tessaly_" + kernels->name + "/" + std::to_string(blockLength) + "/" +
                             std::to_string(taps);
    benchmark::RegisterBenchmark(name.c_str(), convolve, kernels, moving, blockLength, taps)
        ->MeasureProcessCPUTime();
}

const bool registered = [] {
    const KernelList& list = availableKernels();
    for (const std::int32_t blockLength : blockLengths) {
        for (const std::int32_t taps : tapCounts) {
            for (std::size_t i = 0; i < list.count; ++i) {
                add(false, list.tables[i], blockLength, taps);
            }
            add(true, kernelsScalar, blockLength, taps);
            add(true, list.tables[list.count - 1], blockLength, taps);
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
