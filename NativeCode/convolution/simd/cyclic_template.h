// The real transform, written once over a lane type.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

// ---- Where the first pass reads from ----

/// Real samples, pairs of them taken as complex points.
template <class Lanes>
struct SampleSource {
    const float* samples;

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index j) const {
        Complex<Lanes> value{};
        Lanes::loadInterleaved(samples + 2 * Lanes::count * j, value.re, value.im);
        return value;
    }
};

template <class Lanes>
struct GroupSource {
    const float* groups;

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index j) const {
        return loadGroup<Lanes>(groups, j);
    }
};

/// Bins of a real block, folded into M points on the way in. Real and imaginary parts change
/// places, so that the forward passes make the backward transform.
template <class Lanes>
struct BinSource {
    static constexpr Index count = Lanes::count;

    const float* bins;
    const float* split;
    Index points;
    float first[2 * count]{};  // bins 0 .. L - 1 and M - L + 1 .. M without the imaginary parts of
    float last[2 * count]{};   // bins 0 and M

    BinSource(const TransformTables& tables, const ComplexBin* source)
        : bins(floats(source)), split(tables.split), points(tables.points) {
        for (Index i = 0; i < 2 * count; ++i) {
            first[i] = bins[i];
            last[i] = bins[2 * (points - count + 1) + i];
        }
        first[1] = 0.0f;
        last[2 * count - 1] = 0.0f;
    }

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index j) const {
        const float* near = j == 0 ? first : bins + 2 * count * j;
        const float* far = j == 0 ? last : bins + 2 * (points - count * j - (count - 1));
        Complex<Lanes> x{};
        Complex<Lanes> mirrored{};
        Lanes::loadInterleaved(near, x.re, x.im);
        Lanes::loadInterleaved(far, mirrored.re, mirrored.im);
        mirrored.re = Lanes::reverse(mirrored.re);
        mirrored.im = Lanes::reverse(mirrored.im);
        const Complex<Lanes> root = loadGroup<Lanes>(split, j);
        const Complex<Lanes> sum = {Lanes::add(x.re, mirrored.re),
                                    Lanes::subtract(x.im, mirrored.im)};
        Complex<Lanes> difference = {Lanes::subtract(x.re, mirrored.re),
                                     Lanes::add(x.im, mirrored.im)};
        difference = difference + difference;
        const auto re = Lanes::multiplyAdd(root.re, difference.re,
                                           Lanes::multiplyAdd(root.im, difference.im, sum.re));
        const auto im = Lanes::negateMultiplyAdd(
            root.im, difference.re, Lanes::multiplyAdd(root.re, difference.im, sum.im));
        return {im, re};
    }
};

// ---- Passes down the columns (decimation in frequency, self-sorting) ----

/// Splits transforms of n rows into four of n / 4; `stride` interleaved transforms run at once.
template <class Lanes, class Source>
void pass4(const Source& source, float* out, Index n, Index stride, const float* roots) {
    const Index quarter = n / 4;
    const Index step = quarter * stride;
    for (Index p = 0; p < quarter; ++p) {
        const Complex<Lanes> root1 = broadcastRoot<Lanes>(roots);
        const Complex<Lanes> root2 = broadcastRoot<Lanes>(roots + 2);
        const Complex<Lanes> root3 = broadcastRoot<Lanes>(roots + 4);
        roots += 6;
        for (Index q = 0; q < stride; ++q) {
            const Index from = q + stride * p;
            const Index to = q + stride * 4 * p;
            Complex<Lanes> a = source(from);
            Complex<Lanes> b = source(from + step);
            Complex<Lanes> c = source(from + 2 * step);
            Complex<Lanes> d = source(from + 3 * step);
            transform4(a, b, c, d);
            storeGroup(out, to, a);
            storeGroup(out, to + stride, b * root1);
            storeGroup(out, to + 2 * stride, c * root2);
            storeGroup(out, to + 3 * stride, d * root3);
        }
    }
}

template <class Lanes, class Source>
void lastPass2(const Source& source, float* out) {
    const Complex<Lanes> a = source(0);
    const Complex<Lanes> b = source(1);
    storeGroup(out, 0, a + b);
    storeGroup(out, 1, a - b);
}

template <class Lanes, class Source>
void lastPass4(const Source& source, float* out, Index stride) {
    for (Index q = 0; q < stride; ++q) {
        Complex<Lanes> a = source(q);
        Complex<Lanes> b = source(q + stride);
        Complex<Lanes> c = source(q + 2 * stride);
        Complex<Lanes> d = source(q + 3 * stride);
        transform4(a, b, c, d);
        storeGroup(out, q, a);
        storeGroup(out, q + stride, b);
        storeGroup(out, q + 2 * stride, c);
        storeGroup(out, q + 3 * stride, d);
    }
}

template <class Lanes, class Source>
void lastPass8(const Source& source, float* out, Index stride) {
    for (Index q = 0; q < stride; ++q) {
        Complex<Lanes> x[8] = {source(q),
                               source(q + stride),
                               source(q + 2 * stride),
                               source(q + 3 * stride),
                               source(q + 4 * stride),
                               source(q + 5 * stride),
                               source(q + 6 * stride),
                               source(q + 7 * stride)};
        transform8(x);
        storeGroup(out, q, x[0]);
        storeGroup(out, q + stride, x[1]);
        storeGroup(out, q + 2 * stride, x[2]);
        storeGroup(out, q + 3 * stride, x[3]);
        storeGroup(out, q + 4 * stride, x[4]);
        storeGroup(out, q + 5 * stride, x[5]);
        storeGroup(out, q + 6 * stride, x[6]);
        storeGroup(out, q + 7 * stride, x[7]);
    }
}

template <class Lanes, class Source>
void lastPass(const Source& source, float* out, Index n, Index stride) {
    if (n == 8) {
        lastPass8<Lanes>(source, out, stride);
    } else if (n == 4) {
        lastPass4<Lanes>(source, out, stride);
    } else {
        lastPass2<Lanes>(source, out);
    }
}

/// Transforms all columns; passes go to and fro between two buffers and end in `result`.
template <class Lanes, class Source>
void transformColumns(const TransformTables& tables,
                      const Source& source,
                      float* result,
                      float* other) {
    Index passes = 1;
    for (Index rest = tables.columns; rest > 8; rest /= 4) {
        ++passes;
    }
    float* out = passes % 2 == 1 ? result : other;
    Index n = tables.columns;
    if (n <= 8) {
        lastPass<Lanes>(source, out, n, 1);
        return;
    }
    const float* roots = tables.passes;
    pass4<Lanes>(source, out, n, 1, roots);
    Index stride = 4;
    roots += n / 4 * 6;
    n /= 4;
    float* in = out;
    out = in == result ? other : result;
    for (; n > 8; n /= 4) {
        pass4<Lanes>(GroupSource<Lanes>{in}, out, n, stride, roots);
        roots += n / 4 * 6;
        stride *= 4;
        float* const written = out;
        out = in;
        in = written;
    }
    lastPass<Lanes>(GroupSource<Lanes>{in}, out, n, stride);
}

// ---- The pass across the lanes ----

/// Real and imaginary parts in separate rows, each followed by a copy of its first value, which
/// makes the row periodic for the mirrored reads.
template <class Lanes>
struct SplitSink {
    float* re;
    float* im;

    TESSALY_KERNEL_INLINE void operator()(Index k, const Complex<Lanes>& value) const {
        Lanes::store(re + k, value.re);
        Lanes::store(im + k, value.im);
    }
};

/// Real samples of a backward transform; real and imaginary parts change places back.
template <class Lanes>
struct SampleSink {
    float* samples;

    TESSALY_KERNEL_INLINE void operator()(Index k, const Complex<Lanes>& value) const {
        Lanes::storeInterleaved(samples + 2 * k, value.im, value.re);
    }
};

/// Transforms across the lanes, L rows at a time; rows k0 + columns * d come as lane d.
template <class Lanes, class Sink>
void transformAcross(const TransformTables& tables, const float* in, const Sink& sink) {
    constexpr Index count = Lanes::count;
    const Index columns = tables.columns;
    if constexpr (count == 1) {
        for (Index k = 0; k < columns; ++k) {
            sink(k, loadGroup<Lanes>(in, k));
        }
    } else {
        const float* roots = tables.across;
        for (Index k0 = 0; k0 < columns; k0 += count) {
            Complex<Lanes> x[count];
            loadTransposed(in, k0, x);
            TESSALY_KERNEL_UNROLL
            for (Index c = 1; c < count; ++c) {
                x[c] = x[c] * loadGroup<Lanes>(roots, c - 1);
            }
            roots += 2 * count * (count - 1);
            transformLanesOf(x);
            TESSALY_KERNEL_UNROLL
            for (Index d = 0; d < count; ++d) {
                sink(k0 + columns * d, x[d]);
            }
        }
    }
}

// ---- The real transform ----

template <class Lanes>
void forwardLanes(const TransformTables& tables,
                  const float* input,
                  ComplexBin* bins,
                  float* work) {
    constexpr Index count = Lanes::count;
    const Index points = tables.points;
    float* out = floats(bins);
    float* re = work;
    float* im = work + points + 16;
    transformColumns<Lanes>(tables, SampleSource<Lanes>{input}, out, work);
    transformAcross<Lanes>(tables, out, SplitSink<Lanes>{re, im});
    re[points] = re[0];
    im[points] = im[0];
    // Even and odd samples part: bins k and M - k come from the points k and M - k.
    const typename Lanes::Vector half = Lanes::broadcast(0.5f);
    for (Index k = 0; k < points / 2; k += count) {
        const Index mirror = points - k - (count - 1);
        const Complex<Lanes> z = {Lanes::load(re + k), Lanes::load(im + k)};
        const Complex<Lanes> mirrored = {Lanes::reverse(Lanes::load(re + mirror)),
                                         Lanes::reverse(Lanes::load(im + mirror))};
        const Complex<Lanes> root = loadGroup<Lanes>(tables.split, k / count);
        const Complex<Lanes> sum = {Lanes::add(z.re, mirrored.re),
                                    Lanes::subtract(z.im, mirrored.im)};
        const Complex<Lanes> difference = {Lanes::subtract(z.re, mirrored.re),
                                           Lanes::add(z.im, mirrored.im)};
        const Complex<Lanes> odd = difference * root;
        Lanes::storeInterleaved(out + 2 * k, Lanes::multiplyAdd(half, sum.re, odd.re),
                                Lanes::multiplyAdd(half, sum.im, odd.im));
        Lanes::storeInterleaved(out + 2 * mirror,
                                Lanes::reverse(Lanes::multiplySubtract(half, sum.re, odd.re)),
                                Lanes::reverse(Lanes::negateMultiplyAdd(half, sum.im, odd.im)));
    }
    bins[points / 2] = {re[points / 2], -im[points / 2]};
}

template <class Lanes>
void backwardLanes(const TransformTables& tables,
                   const ComplexBin* bins,
                   float* output,
                   float* work) {
    transformColumns<Lanes>(tables, BinSource<Lanes>(tables, bins), work, output);
    transformAcross<Lanes>(tables, work, SampleSink<Lanes>{output});
}

}  // namespace
}  // namespace tessaly
