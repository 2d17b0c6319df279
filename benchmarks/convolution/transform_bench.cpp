// One forward and one backward real transform, of our tables and of other libraries, and those of
// the convolver's blocks: a window of as many samples to its spectrum, and back to the half that is
// heard. Names: Transform/<implementation>/<real length>; blocks_<table> are the latter.
#include <benchmark/benchmark.h>

#include <string>

#include "base/aligned_array.h"
#include "convolution/bench_noise.h"
#include "convolution/simd/kernels.h"
#include "convolution/spectral_primitives.h"

#if defined(TESSALY_BENCH_FFTW)
#include <fftw3.h>
#endif
#if defined(TESSALY_BENCH_KISSFFT)
#include <kiss_fftr.h>
#endif

namespace tessaly::bench {
namespace {

constexpr std::int32_t shortest = 256;
constexpr std::int32_t longest = 8192;

struct Arrays {
    explicit Arrays(std::int32_t length)
        : samples(static_cast<std::size_t>(length)),
          bins(static_cast<std::size_t>(length) / 2 + 1),
          result(static_cast<std::size_t>(length)) {
        fillNoise(samples.data(), samples.size());
    }
    AlignedArray<float> samples;
    AlignedArray<ComplexBin> bins;
    AlignedArray<float> result;
};

void ours(benchmark::State& state, const Kernels* kernels, std::int32_t length) {
    Arrays arrays(length);
    TransformHandle handle;
    forceKernels(kernels);
    createFFT(handle, length);
    forceKernels(nullptr);
    for (auto _ : state) {
        computeForward(handle, arrays.samples.data(), arrays.bins.data());
        computeBackward(handle, arrays.bins.data(), arrays.result.data());
        benchmark::ClobberMemory();
    }
}

void ofBlocks(benchmark::State& state, const Kernels* kernels, std::int32_t length) {
    Arrays arrays(length);
    TransformHandle handle;
    forceKernels(kernels);
    createBlockTransform(handle, length);
    forceKernels(nullptr);
    for (auto _ : state) {
        computeWindow(handle, arrays.samples.data(), arrays.bins.data());
        computeBlock(handle, arrays.bins.data(), arrays.result.data(), length / 2);
        benchmark::ClobberMemory();
    }
}

#if defined(TESSALY_BENCH_FFTW)
/// Arrays with a measured plan each way. The backward plan may use its input up, which is that
/// library's faster form; the forward one writes it anew.
struct MeasuredPlans : Arrays {
    explicit MeasuredPlans(std::int32_t length) : Arrays(length) {
        auto* const spectrum = reinterpret_cast<fftwf_complex*>(bins.data());
        forward = fftwf_plan_dft_r2c_1d(length, samples.data(), spectrum, FFTW_MEASURE);
        backward = fftwf_plan_dft_c2r_1d(length, spectrum, result.data(),
                                         FFTW_MEASURE | FFTW_DESTROY_INPUT);
        fillNoise(samples.data(), samples.size());  // measuring overwrites the arrays
    }
    ~MeasuredPlans() {
        fftwf_destroy_plan(forward);
        fftwf_destroy_plan(backward);
    }
    MeasuredPlans(const MeasuredPlans&) = delete;
    MeasuredPlans& operator=(const MeasuredPlans&) = delete;

    fftwf_plan forward = nullptr;
    fftwf_plan backward = nullptr;
};

void fftw(benchmark::State& state, std::int32_t length) {
    const MeasuredPlans plans(length);
    for (auto _ : state) {
        fftwf_execute(plans.forward);
        fftwf_execute(plans.backward);
        benchmark::ClobberMemory();
    }
}
#endif

#if defined(TESSALY_BENCH_KISSFFT)
void kissfft(benchmark::State& state, std::int32_t length) {
    Arrays arrays(length);
    auto* const bins = reinterpret_cast<kiss_fft_cpx*>(arrays.bins.data());
    const kiss_fftr_cfg forward = kiss_fftr_alloc(length, 0, nullptr, nullptr);
    const kiss_fftr_cfg backward = kiss_fftr_alloc(length, 1, nullptr, nullptr);
    for (auto _ : state) {
        kiss_fftr(forward, arrays.samples.data(), bins);
        kiss_fftri(backward, bins, arrays.result.data());
        benchmark::ClobberMemory();
    }
    kiss_fftr_free(forward);
    kiss_fftr_free(backward);
}
#endif

std::string rowName(const std::string& implementation, std::int32_t length) {
    return "Transform/" + implementation + "/" + std::to_string(length);
}

const bool registered = [] {
    for (std::int32_t length = shortest; length <= longest; length *= 2) {
        const KernelList& list = availableKernels();
        for (std::size_t i = 0; i < list.count; ++i) {
            const Kernels* const kernels = list.tables[i];
            const std::string name = rowName(std::string("tessaly_") + kernels->name, length);
            benchmark::RegisterBenchmark(name.c_str(), ours, kernels, length);
            const std::string blocks = rowName(std::string("blocks_") + kernels->name, length);
            benchmark::RegisterBenchmark(blocks.c_str(), ofBlocks, kernels, length);
        }
#if defined(TESSALY_BENCH_FFTW)
        benchmark::RegisterBenchmark(rowName("fftw", length).c_str(), fftw, length);
#endif
#if defined(TESSALY_BENCH_KISSFFT)
        benchmark::RegisterBenchmark(rowName("kissfft", length).c_str(), kissfft, length);
#endif
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
