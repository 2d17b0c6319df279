// Sums of products of block spectra (negacyclic_template.h), written once over a lane type.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

/// Adds `Group` products to what `base` holds, or to nothing.
template <class Lanes, int Group>
void sumRows(std::size_t rows,
             const float* const (&input)[Group],
             const float* const (&left)[Group],
             const float* const (&right)[Group],
             const float* baseL,
             const float* baseR,
             float* sumL,
             float* sumR) {
    for (std::size_t k = 0; k < rows; ++k) {
        const auto j = static_cast<Index>(k);
        const auto zero = Complex<Lanes>{Lanes::broadcast(0.0f), Lanes::broadcast(0.0f)};
        Complex<Lanes> l = baseL != nullptr ? loadGroup<Lanes>(baseL, j) : zero;
        Complex<Lanes> r = baseR != nullptr ? loadGroup<Lanes>(baseR, j) : zero;
        TESSALY_KERNEL_UNROLL
        for (int g = 0; g < Group; ++g) {
            const Complex<Lanes> x = loadGroup<Lanes>(input[g], j);
            const auto add = [&x](Complex<Lanes>& sum, const Complex<Lanes>& h) {
                sum.re = Lanes::multiplyAdd(x.re, h.re, sum.re);
                sum.im = Lanes::multiplyAdd(x.re, h.im, sum.im);
                sum.re = Lanes::negateMultiplyAdd(x.im, h.im, sum.re);
                sum.im = Lanes::multiplyAdd(x.im, h.re, sum.im);
            };
            add(l, loadGroup<Lanes>(left[g], j));
            add(r, loadGroup<Lanes>(right[g], j));
        }
        storeGroup(sumL, j, l);
        storeGroup(sumR, j, r);
    }
}

/// Products are taken four at a time: twelve streams of memory keep the prefetchers busy, and the
/// sums, which stay in the nearest cache, are touched once for four products.
template <class Lanes>
void sumProducts(std::size_t bins,
                 std::size_t count,
                 const ComplexBin* const* input,
                 const ComplexBin* const* left,
                 const ComplexBin* const* right,
                 const ComplexBin* baseL,
                 const ComplexBin* baseR,
                 ComplexBin* sumL,
                 ComplexBin* sumR) {
    constexpr std::size_t group = 4;
    const std::size_t rows = bins / static_cast<std::size_t>(Lanes::count);
    const float* fromL = baseL != nullptr ? floats(baseL) : nullptr;
    const float* fromR = baseR != nullptr ? floats(baseR) : nullptr;
    float* const toL = floats(sumL);
    float* const toR = floats(sumR);
    const auto take = [&]<int Group>() {
        const float* x[Group];
        const float* l[Group];
        const float* r[Group];
        TESSALY_KERNEL_UNROLL
        for (int g = 0; g < Group; ++g) {
            x[g] = floats(input[g]);
            l[g] = floats(left[g]);
            r[g] = floats(right[g]);
        }
        sumRows<Lanes, Group>(rows, x, l, r, fromL, fromR, toL, toR);
        input += Group;
        left += Group;
        right += Group;
        fromL = toL;
        fromR = toR;
    };
    for (; count >= group; count -= group) {
        take.template operator()<4>();
    }
    if (count == 3) {
        take.template operator()<3>();
    } else if (count == 2) {
        take.template operator()<2>();
    } else if (count == 1) {
        take.template operator()<1>();
    }
}

}  // namespace
}  // namespace tessaly
