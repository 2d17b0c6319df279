// Operations on bins, and sums over samples, written once over a lane type.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

TESSALY_KERNEL_INLINE ComplexBin product(ComplexBin a, ComplexBin b) {
    return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
}
TESSALY_KERNEL_INLINE ComplexBin sum(ComplexBin a, ComplexBin b) {
    return {a.re + b.re, a.im + b.im};
}

template <class Lanes>
void multiplyBins(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    std::size_t i = 0;
    if constexpr (Lanes::count > 1) {
        constexpr std::size_t step = Lanes::count / 2;
        for (; i + step <= bins; i += step) {
            const auto left = Lanes::load(floats(a + i));
            const auto right = Lanes::load(floats(b + i));
            Lanes::store(floats(y + i),
                         Lanes::subtractAdd(
                             Lanes::multiply(Lanes::evenLanes(left), right),
                             Lanes::multiply(Lanes::oddLanes(left), Lanes::swapPairs(right))));
        }
    }
    for (; i < bins; ++i) {
        y[i] = product(a[i], b[i]);
    }
}

template <class Lanes>
void addBins(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    std::size_t i = 0;
    if constexpr (Lanes::count > 1) {
        constexpr std::size_t step = Lanes::count / 2;
        for (; i + step <= bins; i += step) {
            Lanes::store(floats(y + i),
                         Lanes::add(Lanes::load(floats(a + i)), Lanes::load(floats(b + i))));
        }
    }
    for (; i < bins; ++i) {
        y[i] = sum(a[i], b[i]);
    }
}

/// sum = base + gain * term.
template <class Lanes>
void addScaled(std::size_t count, float gain, const float* term, const float* base, float* sum) {
    constexpr std::size_t lanes = Lanes::count;
    const auto factor = Lanes::broadcast(gain);
    std::size_t i = 0;
    for (; i + lanes <= count; i += lanes) {
        Lanes::store(sum + i,
                     Lanes::multiplyAdd(factor, Lanes::load(term + i), Lanes::load(base + i)));
    }
    for (; i < count; ++i) {
        sum[i] = gain * term[i] + base[i];
    }
}

// ---- Few taps in the time domain ----

/// `Vectors` vectors of outputs of both ears at once.
template <class Lanes, int Vectors>
TESSALY_KERNEL_INLINE void addTapsAt(std::size_t taps,
                                     const float* left,
                                     const float* right,
                                     const float* input,
                                     float* sumL,
                                     float* sumR) {
    typename Lanes::Vector l[Vectors];
    typename Lanes::Vector r[Vectors];
    TESSALY_KERNEL_UNROLL
    for (int v = 0; v < Vectors; ++v) {
        l[v] = Lanes::load(sumL + v * Lanes::count);
        r[v] = Lanes::load(sumR + v * Lanes::count);
    }
    for (std::size_t k = 0; k < taps; ++k) {
        const auto tapL = Lanes::broadcast(left[k]);
        const auto tapR = Lanes::broadcast(right[k]);
        TESSALY_KERNEL_UNROLL
        for (int v = 0; v < Vectors; ++v) {
            const auto x = Lanes::load(input - k + v * Lanes::count);
            l[v] = Lanes::multiplyAdd(tapL, x, l[v]);
            r[v] = Lanes::multiplyAdd(tapR, x, r[v]);
        }
    }
    TESSALY_KERNEL_UNROLL
    for (int v = 0; v < Vectors; ++v) {
        Lanes::store(sumL + v * Lanes::count, l[v]);
        Lanes::store(sumR + v * Lanes::count, r[v]);
    }
}

template <class Lanes>
void addTaps(std::size_t samples,
             std::size_t taps,
             const float* left,
             const float* right,
             const float* input,
             float* sumL,
             float* sumR) {
    constexpr std::size_t lanes = Lanes::count;
    constexpr int vectors = 4;
    std::size_t n = 0;
    for (; n + vectors * lanes <= samples; n += vectors * lanes) {
        addTapsAt<Lanes, vectors>(taps, left, right, input + n, sumL + n, sumR + n);
    }
    for (; n + lanes <= samples; n += lanes) {
        addTapsAt<Lanes, 1>(taps, left, right, input + n, sumL + n, sumR + n);
    }
    for (; n < samples; ++n) {
        for (std::size_t k = 0; k < taps; ++k) {
            sumL[n] += left[k] * input[static_cast<Index>(n) - static_cast<Index>(k)];
            sumR[n] += right[k] * input[static_cast<Index>(n) - static_cast<Index>(k)];
        }
    }
}

}  // namespace
}  // namespace tessaly
