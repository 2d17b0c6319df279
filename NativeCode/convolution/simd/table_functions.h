// The entries of a table of kernels, over the lane types that its instruction set has.
#pragma once

#include "convolution/simd/bins_template.h"
#include "convolution/simd/cyclic_template.h"
#include "convolution/simd/kernels.h"
#include "convolution/simd/lanes_scalar.h"
#include "convolution/simd/negacyclic_template.h"
#include "convolution/simd/products_template.h"

namespace tessaly {
namespace {

/// `Widths` are the lane types of a table, widest first, one lane last.
template <class... Widths>
struct TransformsOver {
    static std::int32_t lanes(std::int32_t points) {
        std::int32_t chosen = 0;
        const auto offer = [&](std::ptrdiff_t count) {
            if (chosen == 0 && count * count <= points) {
                chosen = static_cast<std::int32_t>(count);
            }
        };
        (offer(Widths::count), ...);
        return chosen == 0 ? 1 : chosen;
    }

    static void forward(const TransformTables& tables,
                        const float* input,
                        ComplexBin* bins,
                        float* work) {
        with(tables.lanes, [&]<class Lanes>() { forwardLanes<Lanes>(tables, input, bins, work); });
    }
    static void backward(const TransformTables& tables,
                         const ComplexBin* bins,
                         float* output,
                         float* work) {
        with(tables.lanes,
             [&]<class Lanes>() { backwardLanes<Lanes>(tables, bins, output, work); });
    }
    static void window(const BlockTables& tables, const float* input, ComplexBin* bins) {
        with(tables.lanes, [&]<class Lanes>() { windowLanes<Lanes>(tables, input, bins); });
    }
    static void partition(const BlockTables& tables,
                          const float* input,
                          ComplexBin* bins,
                          std::uint64_t sounding) {
        with(tables.lanes,
             [&]<class Lanes>() { partitionLanes<Lanes>(tables, input, bins, sounding); });
    }
    static void block(const BlockTables& tables,
                      const ComplexBin* bins,
                      float* output,
                      float* work,
                      std::size_t samples,
                      float* wrapped,
                      std::size_t wrappedSamples) {
        with(tables.lanes, [&]<class Lanes>() {
            blockLanes<Lanes>(tables, bins, output, work, samples, wrapped, wrappedSamples);
        });
    }
    static void sumOfProducts(std::int32_t lanes,
                              std::size_t bins,
                              std::size_t count,
                              const ComplexBin* const* input,
                              const ComplexBin* const* left,
                              const ComplexBin* const* right,
                              const ComplexBin* baseL,
                              const ComplexBin* baseR,
                              ComplexBin* sumL,
                              ComplexBin* sumR) {
        with(lanes, [&]<class Lanes>() {
            sumProducts<Lanes>(bins, count, input, left, right, baseL, baseR, sumL, sumR);
        });
    }

private:
    template <class Run>
    static void with(std::int32_t lanes, const Run& run) {
        static_cast<void>(
            ((lanes == Widths::count && (run.template operator()<Widths>(), true)) || ...));
    }
};

/// A table over these lane types.
template <class Widest, class... Narrower>
constexpr Kernels kernelsOver(const char* name, const SignalKernels& signal) {
    using Transforms = TransformsOver<Widest, Narrower...>;
    return {.name = name,
            .transformLanes = Transforms::lanes,
            .forward = Transforms::forward,
            .backward = Transforms::backward,
            .window = Transforms::window,
            .partition = Transforms::partition,
            .block = Transforms::block,
            .sumOfProducts = Transforms::sumOfProducts,
            .multiply = multiplyBins<Widest>,
            .add = addBins<Widest>,
            .addScaled = addScaled<Widest>,
            .addTaps = addTaps<Widest>,
            .signal = &signal};
}

}  // namespace
}  // namespace tessaly
