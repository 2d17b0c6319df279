// The transform and the vector operations, written once over a lane type.
//
// Everything here stays in an unnamed namespace: each kernel source gets copies of its own, built
// with its own flags, and none can become the one that the linker gives to an older machine. A
// lane type offers
//   Vector, count (L), load, store, broadcast, add, subtract, multiply,
//   multiplyAdd(a, b, c) = a b + c, multiplySubtract = a b - c, negateMultiplyAdd = c - a b,
//   reverse, loadInterleaved / storeInterleaved (2 L floats to and from L real, L imaginary parts),
//   transpose (L vectors of L),
// and for the operations on bins, where a vector holds L / 2 of them, real part first,
//   evenLanes, oddLanes (each value twice), swapPairs, subtractAdd (- on even lanes, + on odd).
#pragma once

#include "convolution/simd/kernels.h"

#if defined(_MSC_VER) && !defined(__clang__)
#define TESSALY_KERNEL_INLINE __forceinline
#define TESSALY_KERNEL_UNROLL
#else
#define TESSALY_KERNEL_INLINE [[gnu::always_inline]] inline
#define TESSALY_KERNEL_UNROLL _Pragma("GCC unroll 16")
#endif

namespace tessaly {
namespace {

using Index = std::ptrdiff_t;

inline const float* floats(const ComplexBin* bins) { return &bins->re; }
inline float* floats(ComplexBin* bins) { return &bins->re; }

/// L complex values: a real and an imaginary vector.
template <class Lanes>
struct Complex {
    using Vector = typename Lanes::Vector;
    Vector re;
    Vector im;
};

template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> operator+(const Complex<Lanes>& a, const Complex<Lanes>& b) {
    return {Lanes::add(a.re, b.re), Lanes::add(a.im, b.im)};
}

template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> operator-(const Complex<Lanes>& a, const Complex<Lanes>& b) {
    return {Lanes::subtract(a.re, b.re), Lanes::subtract(a.im, b.im)};
}

template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> operator*(const Complex<Lanes>& a, const Complex<Lanes>& b) {
    return {Lanes::multiplySubtract(a.re, b.re, Lanes::multiply(a.im, b.im)),
            Lanes::multiplyAdd(a.re, b.im, Lanes::multiply(a.im, b.re))};
}

/// a * -i.
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> minusI(const Complex<Lanes>& a) {
    return {a.im, Lanes::subtract(Lanes::broadcast(0.0f), a.re)};
}

/// a - i b and a + i b, without negating anything.
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> minusITimes(const Complex<Lanes>& a, const Complex<Lanes>& b) {
    return {Lanes::add(a.re, b.im), Lanes::subtract(a.im, b.re)};
}
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> plusITimes(const Complex<Lanes>& a, const Complex<Lanes>& b) {
    return {Lanes::subtract(a.re, b.im), Lanes::add(a.im, b.re)};
}

/// Intermediate results lie in groups of L real and L imaginary parts, group j at 2 L j: one
/// stream of memory for both.
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> loadGroup(const float* groups, Index j) {
    const float* group = groups + 2 * Lanes::count * j;
    return {Lanes::load(group), Lanes::load(group + Lanes::count)};
}
template <class Lanes>
TESSALY_KERNEL_INLINE void storeGroup(float* groups, Index j, const Complex<Lanes>& value) {
    float* group = groups + 2 * Lanes::count * j;
    Lanes::store(group, value.re);
    Lanes::store(group + Lanes::count, value.im);
}

template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> broadcastRoot(const float* root) {
    return {Lanes::broadcast(root[0]), Lanes::broadcast(root[1])};
}

// ---- Short transforms over named values, in place, natural order, e^(-i ...) ----

template <class Lanes>
TESSALY_KERNEL_INLINE void transform4(Complex<Lanes>& a,
                                      Complex<Lanes>& b,
                                      Complex<Lanes>& c,
                                      Complex<Lanes>& d) {
    const Complex<Lanes> evenSum = a + c;
    const Complex<Lanes> evenDifference = a - c;
    const Complex<Lanes> oddSum = b + d;
    const Complex<Lanes> oddDifference = b - d;
    a = evenSum + oddSum;
    b = minusITimes(evenDifference, oddDifference);
    c = evenSum - oddSum;
    d = plusITimes(evenDifference, oddDifference);
}

inline constexpr float sqrtHalf = 0.70710678118654752f;
inline constexpr float cosEighth = 0.92387953251128676f;  // cos(pi / 8)
inline constexpr float sinEighth = 0.38268343236508977f;  // sin(pi / 8)

/// a * e^(-i pi / 4) and a * e^(-3 i pi / 4).
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> turnEighth(const Complex<Lanes>& a) {
    const typename Lanes::Vector half = Lanes::broadcast(sqrtHalf);
    return {Lanes::multiply(Lanes::add(a.re, a.im), half),
            Lanes::multiply(Lanes::subtract(a.im, a.re), half)};
}
template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> turnThreeEighths(const Complex<Lanes>& a) {
    const typename Lanes::Vector half = Lanes::broadcast(sqrtHalf);
    const typename Lanes::Vector minusHalf = Lanes::broadcast(-sqrtHalf);
    return {Lanes::multiply(Lanes::subtract(a.im, a.re), half),
            Lanes::multiply(Lanes::add(a.re, a.im), minusHalf)};
}

template <class Lanes>
TESSALY_KERNEL_INLINE Complex<Lanes> turn(const Complex<Lanes>& a, float re, float im) {
    return a * Complex<Lanes>{Lanes::broadcast(re), Lanes::broadcast(im)};
}

template <class Lanes>
TESSALY_KERNEL_INLINE void transform8(Complex<Lanes> (&x)[8]) {
    transform4(x[0], x[2], x[4], x[6]);
    transform4(x[1], x[3], x[5], x[7]);
    const Complex<Lanes> odd1 = turnEighth(x[3]);
    const Complex<Lanes> odd3 = turnThreeEighths(x[7]);
    const Complex<Lanes> odd0 = x[1];
    const Complex<Lanes> odd2 = x[5];
    const Complex<Lanes> even1 = x[2];
    const Complex<Lanes> even2 = x[4];
    const Complex<Lanes> even3 = x[6];
    x[4] = x[0] - odd0;
    x[0] = x[0] + odd0;
    x[1] = even1 + odd1;
    x[5] = even1 - odd1;
    x[2] = minusITimes(even2, odd2);
    x[6] = plusITimes(even2, odd2);
    x[3] = even3 + odd3;
    x[7] = even3 - odd3;
}

template <class Lanes>
TESSALY_KERNEL_INLINE void transform16(Complex<Lanes> (&x)[16]) {
    transform4(x[0], x[4], x[8], x[12]);
    transform4(x[1], x[5], x[9], x[13]);
    transform4(x[2], x[6], x[10], x[14]);
    transform4(x[3], x[7], x[11], x[15]);
    // x[r + 4 q] now holds bin q of residue r; it takes the root r q of 16.
    x[5] = turn(x[5], cosEighth, -sinEighth);
    x[6] = turnEighth(x[6]);
    x[7] = turn(x[7], sinEighth, -cosEighth);
    x[9] = turnEighth(x[9]);
    x[10] = minusI(x[10]);
    x[11] = turnThreeEighths(x[11]);
    x[13] = turn(x[13], sinEighth, -cosEighth);
    x[14] = turnThreeEighths(x[14]);
    x[15] = turn(x[15], -cosEighth, sinEighth);
    transform4(x[0], x[1], x[2], x[3]);
    transform4(x[4], x[5], x[6], x[7]);
    transform4(x[8], x[9], x[10], x[11]);
    transform4(x[12], x[13], x[14], x[15]);
    // Bin q + 4 d stands at x[4 q + d].
    const Complex<Lanes> y[16] = {x[0], x[4], x[8],  x[12], x[1], x[5], x[9],  x[13],
                                  x[2], x[6], x[10], x[14], x[3], x[7], x[11], x[15]};
    TESSALY_KERNEL_UNROLL
    for (int i = 0; i < 16; ++i) {
        x[i] = y[i];
    }
}

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

/// As SampleSource, of M samples that M zeros follow.
template <class Lanes>
struct HalfSource {
    const float* samples;
    Index half;  // groups that hold samples

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index j) const {
        Complex<Lanes> value{Lanes::broadcast(0.0f), Lanes::broadcast(0.0f)};
        if (j < half) {
            Lanes::loadInterleaved(samples + 2 * Lanes::count * j, value.re, value.im);
        }
        return value;
    }
};
template <class Source>
inline constexpr bool secondHalfIsZero = false;
template <class Lanes>
inline constexpr bool secondHalfIsZero<HalfSource<Lanes>> = true;

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
            Complex<Lanes> c{};
            Complex<Lanes> d{};
            if constexpr (secondHalfIsZero<Source>) {
                c = a - b;
                d = plusITimes(a, b);
                const Complex<Lanes> second = minusITimes(a, b);
                a = a + b;
                b = second;
            } else {
                c = source(from + 2 * step);
                d = source(from + 3 * step);
                transform4(a, b, c, d);
            }
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

/// Rows of the result that are wanted: all of them, or those below `end` at least.
struct WantedRows {
    Index end;

    Index rows(Index stride) const { return (end + stride - 1) / stride; }
    Index within(Index stride) const { return end < stride ? end : stride; }
};

/// The last pass without the rows that nobody wants.
template <class Lanes, Index Rows, class Source>
void lastPass8Rows(const Source& source, float* out, Index stride, Index within) {
    for (Index q = 0; q < within; ++q) {
        Complex<Lanes> x[8] = {source(q),
                               source(q + stride),
                               source(q + 2 * stride),
                               source(q + 3 * stride),
                               source(q + 4 * stride),
                               source(q + 5 * stride),
                               source(q + 6 * stride),
                               source(q + 7 * stride)};
        transform8(x);
        TESSALY_KERNEL_UNROLL
        for (Index r = 0; r < Rows; ++r) {
            storeGroup(out, q + r * stride, x[r]);
        }
    }
}

template <class Lanes, class Source>
void lastPass(const Source& source, float* out, Index n, Index stride, WantedRows wanted) {
    const Index rows = wanted.rows(stride);
    if (n == 8 && rows <= 1) {
        return lastPass8Rows<Lanes, 1>(source, out, stride, wanted.within(stride));
    }
    if (n == 8 && rows <= 2) {
        return lastPass8Rows<Lanes, 2>(source, out, stride, stride);
    }
    if (n == 8 && rows <= 4) {
        return lastPass8Rows<Lanes, 4>(source, out, stride, stride);
    }
    if (n == 8) {
        lastPass8<Lanes>(source, out, stride);
    } else if (n == 4) {
        lastPass4<Lanes>(source, out, stride);
    } else {
        lastPass2<Lanes>(source, out);
    }
}

/// Transforms all columns; passes go to and fro between two buffers and end in `result`. Rows that
/// are not wanted may be left out.
template <class Lanes, class Source>
void transformColumns(const TransformTables& tables,
                      const Source& source,
                      float* result,
                      float* other,
                      WantedRows wanted) {
    Index passes = 1;
    for (Index rest = tables.columns; rest > 8; rest /= 4) {
        ++passes;
    }
    float* out = passes % 2 == 1 ? result : other;
    Index n = tables.columns;
    if (n <= 8) {
        lastPass<Lanes>(source, out, n, 1, wanted);
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
    lastPass<Lanes>(GroupSource<Lanes>{in}, out, n, stride, wanted);
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

/// Transforms across the lanes, L rows at a time: sink(k0, x) gets rows k0 + columns * d as x[d].
template <class Lanes, class Sink>
TESSALY_KERNEL_INLINE void acrossRows(const TransformTables& tables,
                                      const float* in,
                                      Index groups,
                                      const Sink& sink) {
    constexpr Index count = Lanes::count;
    const float* roots = tables.across;
    for (Index k0 = 0; k0 < groups * count; k0 += count) {
        typename Lanes::Vector re[count];
        typename Lanes::Vector im[count];
        TESSALY_KERNEL_UNROLL
        for (Index j = 0; j < count; ++j) {
            const Complex<Lanes> value = loadGroup<Lanes>(in, k0 + j);
            re[j] = value.re;
            im[j] = value.im;
        }
        Lanes::transpose(re);
        Lanes::transpose(im);
        Complex<Lanes> x[count];
        x[0] = {re[0], im[0]};
        TESSALY_KERNEL_UNROLL
        for (Index c = 1; c < count; ++c) {
            x[c] = Complex<Lanes>{re[c], im[c]} * loadGroup<Lanes>(roots, c - 1);
        }
        roots += 2 * count * (count - 1);
        if constexpr (count == 4) {
            transform4(x[0], x[1], x[2], x[3]);
        } else if constexpr (count == 8) {
            transform8(x);
        } else {
            transform16(x);
        }
        sink(k0, x);
    }
}

template <class Lanes, class Sink>
void transformAcross(const TransformTables& tables, const float* in, const Sink& sink) {
    constexpr Index count = Lanes::count;
    const Index columns = tables.columns;
    if constexpr (count == 1) {
        for (Index k = 0; k < columns; ++k) {
            sink(k, loadGroup<Lanes>(in, k));
        }
    } else {
        acrossRows<Lanes>(tables, in, columns / count,
                          [&](Index k0, const Complex<Lanes>(&x)[count]) {
                              TESSALY_KERNEL_UNROLL
                              for (Index d = 0; d < count; ++d) {
                                  sink(k0 + columns * d, x[d]);
                              }
                          });
    }
}

// ---- The real transform ----

template <class Lanes, class Source>
void forwardFrom(const TransformTables& tables,
                 const Source& source,
                 ComplexBin* bins,
                 float* work) {
    constexpr Index count = Lanes::count;
    const Index points = tables.points;
    float* out = floats(bins);
    float* re = work;
    float* im = work + points + 16;
    transformColumns<Lanes>(tables, source, out, work, WantedRows{tables.columns});
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
void forwardLanes(const TransformTables& tables,
                  const float* input,
                  ComplexBin* bins,
                  float* work) {
    forwardFrom<Lanes>(tables, SampleSource<Lanes>{input}, bins, work);
}

template <class Lanes>
void forwardHalfLanes(const TransformTables& tables,
                      const float* input,
                      ComplexBin* bins,
                      float* work) {
    const Index groups = tables.columns;
    if (groups < 2) {
        // A single group holds all of the points: there is no half of groups to leave out.
        float padded[4 * Lanes::count]{};
        for (Index i = 0; i < tables.points; ++i) {
            padded[i] = input[i];
        }
        return forwardLanes<Lanes>(tables, padded, bins, work);
    }
    forwardFrom<Lanes>(tables, HalfSource<Lanes>{input, groups / 2}, bins, work);
}

template <class Lanes>
void backwardLanes(const TransformTables& tables,
                   const ComplexBin* bins,
                   float* output,
                   float* work) {
    transformColumns<Lanes>(tables, BinSource<Lanes>(tables, bins), work, output,
                            WantedRows{tables.columns});
    transformAcross<Lanes>(tables, work, SampleSink<Lanes>{output});
}

/// The samples from the middle on are those that the middle lane of the pass across gives, from the
/// first row on: the other lanes and the other rows are left out.
template <class Lanes>
void backwardMiddleLanes(const TransformTables& tables,
                         const ComplexBin* bins,
                         float* output,
                         float* work,
                         std::size_t samples) {
    constexpr Index count = Lanes::count;
    // Whole lanes of them, which the pass across reads.
    const Index rows = ((static_cast<Index>(samples) + 1) / 2 + count - 1) / count * count;
    if (count == 1 || rows > tables.columns) {
        return backwardLanes<Lanes>(tables, bins, output, work);
    }
    if constexpr (count > 1) {
        transformColumns<Lanes>(tables, BinSource<Lanes>(tables, bins), work, output,
                                WantedRows{rows});
        const Index middle = tables.points;
        acrossRows<Lanes>(tables, work, rows / count,
                          [&](Index k0, const Complex<Lanes>(&x)[count]) {
                              SampleSink<Lanes>{output + middle}(k0, x[count / 2]);
                          });
    }
}

/// Only the second half of the samples, to `output` on: `M` floats. `scratch` is as large as
/// `work`.
template <class Lanes>
void backwardBlockLanes(const TransformTables& tables,
                        const ComplexBin* bins,
                        float* output,
                        float* work,
                        float* scratch) {
    constexpr Index count = Lanes::count;
    transformColumns<Lanes>(tables, BinSource<Lanes>(tables, bins), work, scratch,
                            WantedRows{tables.columns});
    const SampleSink<Lanes> sink{output};
    const Index middle = tables.points / 2;
    if constexpr (count == 1) {
        for (Index k = middle; k < tables.points; ++k) {
            sink(k - middle, loadGroup<Lanes>(work, k));
        }
    } else {
        const Index columns = tables.columns;
        acrossRows<Lanes>(tables, work, columns / count,
                          [&](Index k0, const Complex<Lanes>(&x)[count]) {
                              TESSALY_KERNEL_UNROLL
                              for (Index d = count / 2; d < count; ++d) {
                                  sink(k0 + columns * d - middle, x[d]);
                              }
                          });
    }
}

// ---- Operations on bins ----

TESSALY_KERNEL_INLINE ComplexBin product(ComplexBin a, ComplexBin b) {
    return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
}
TESSALY_KERNEL_INLINE ComplexBin sum(ComplexBin a, ComplexBin b) {
    return {a.re + b.re, a.im + b.im};
}

template <class Lanes>
void multiplyBins(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    constexpr std::size_t step = Lanes::count / 2;
    std::size_t i = 0;
    for (; i + step <= bins; i += step) {
        const auto left = Lanes::load(floats(a + i));
        const auto right = Lanes::load(floats(b + i));
        Lanes::store(
            floats(y + i),
            Lanes::subtractAdd(Lanes::multiply(Lanes::evenLanes(left), right),
                               Lanes::multiply(Lanes::oddLanes(left), Lanes::swapPairs(right))));
    }
    for (; i < bins; ++i) {
        y[i] = product(a[i], b[i]);
    }
}

template <class Lanes>
void addBins(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    constexpr std::size_t step = Lanes::count / 2;
    std::size_t i = 0;
    for (; i + step <= bins; i += step) {
        Lanes::store(floats(y + i),
                     Lanes::add(Lanes::load(floats(a + i)), Lanes::load(floats(b + i))));
    }
    for (; i < bins; ++i) {
        y[i] = sum(a[i], b[i]);
    }
}

/// Adds `Group` partitions to the sums, or starts the sums with them. The products by real and by
/// imaginary parts of the input are summed apart and combined once a group.
template <class Lanes, int Group, bool Start>
void sumGroup(std::size_t bins,
              const ComplexBin* const (&input)[Group],
              const ComplexBin* const (&left)[Group],
              const ComplexBin* const (&right)[Group],
              ComplexBin* sumL,
              ComplexBin* sumR) {
    constexpr std::size_t step = Lanes::count / 2;
    std::size_t i = 0;
    for (; i + step <= bins; i += step) {
        auto x = Lanes::load(floats(input[0] + i));
        auto real = Lanes::evenLanes(x);
        auto imaginary = Lanes::oddLanes(x);
        auto h = Lanes::load(floats(left[0] + i));
        auto realL = Lanes::multiply(real, h);
        auto imaginaryL = Lanes::multiply(imaginary, h);
        h = Lanes::load(floats(right[0] + i));
        auto realR = Lanes::multiply(real, h);
        auto imaginaryR = Lanes::multiply(imaginary, h);
        TESSALY_KERNEL_UNROLL
        for (int g = 1; g < Group; ++g) {
            x = Lanes::load(floats(input[g] + i));
            real = Lanes::evenLanes(x);
            imaginary = Lanes::oddLanes(x);
            h = Lanes::load(floats(left[g] + i));
            realL = Lanes::multiplyAdd(real, h, realL);
            imaginaryL = Lanes::multiplyAdd(imaginary, h, imaginaryL);
            h = Lanes::load(floats(right[g] + i));
            realR = Lanes::multiplyAdd(real, h, realR);
            imaginaryR = Lanes::multiplyAdd(imaginary, h, imaginaryR);
        }
        auto productL = Lanes::subtractAdd(realL, Lanes::swapPairs(imaginaryL));
        auto productR = Lanes::subtractAdd(realR, Lanes::swapPairs(imaginaryR));
        if constexpr (!Start) {
            productL = Lanes::add(productL, Lanes::load(floats(sumL + i)));
            productR = Lanes::add(productR, Lanes::load(floats(sumR + i)));
        }
        Lanes::store(floats(sumL + i), productL);
        Lanes::store(floats(sumR + i), productR);
    }
    for (; i < bins; ++i) {
        ComplexBin totalL = Start ? ComplexBin{0.0f, 0.0f} : sumL[i];
        ComplexBin totalR = Start ? ComplexBin{0.0f, 0.0f} : sumR[i];
        TESSALY_KERNEL_UNROLL
        for (int g = 0; g < Group; ++g) {
            totalL = sum(product(input[g][i], left[g][i]), totalL);
            totalR = sum(product(input[g][i], right[g][i]), totalR);
        }
        sumL[i] = totalL;
        sumR[i] = totalR;
    }
}

/// Partitions are taken four at a time: twelve streams of memory keep the prefetchers busy, and
/// the sums, which stay in the nearest cache, are touched once for four products.
/// @param next  gives the pointers of one product after the other
template <class Lanes, class Next>
TESSALY_KERNEL_INLINE void sumProducts(std::size_t bins,
                                       std::size_t count,
                                       bool onto,
                                       const Next& next,
                                       ComplexBin* sumL,
                                       ComplexBin* sumR) {
    constexpr int group = 4;
    const auto take = [&]<int Group, bool Start>() {
        const ComplexBin* x[Group];
        const ComplexBin* l[Group];
        const ComplexBin* r[Group];
        TESSALY_KERNEL_UNROLL
        for (int g = 0; g < Group; ++g) {
            next(x[g], l[g], r[g]);
        }
        sumGroup<Lanes, Group, Start>(bins, x, l, r, sumL, sumR);
    };
    const auto takeUpTo4 = [&]<bool Start>(std::size_t products) {
        switch (products) {
            case 1:
                take.template operator()<1, Start>();
                break;
            case 2:
                take.template operator()<2, Start>();
                break;
            case 3:
                take.template operator()<3, Start>();
                break;
            default:
                take.template operator()<group, Start>();
                break;
        }
    };
    std::size_t left = count;
    if (!onto && left > 0) {
        const std::size_t products = left < group ? left : group;
        takeUpTo4.template operator()<true>(products);
        left -= products;
    }
    for (; left >= group; left -= group) {
        take.template operator()<group, false>();
    }
    if (left > 0) {
        takeUpTo4.template operator()<false>(left);
    }
}

template <class Lanes>
void sumRing(std::size_t bins,
             std::size_t partitions,
             std::size_t newest,
             const ComplexBin* const* ring,
             const ComplexBin* const* left,
             const ComplexBin* const* right,
             ComplexBin* sumL,
             ComplexBin* sumR) {
    std::size_t slot = newest;
    std::size_t part = 0;
    const auto next = [&](const ComplexBin*& x, const ComplexBin*& l, const ComplexBin*& r) {
        x = ring[slot];
        l = left[part];
        r = right[part];
        slot = slot + 1 == partitions ? 0 : slot + 1;
        part = part == 0 ? partitions - 1 : part - 1;
    };
    sumProducts<Lanes>(bins, partitions, false, next, sumL, sumR);
}

template <class Lanes>
void sumList(std::size_t bins,
             std::size_t count,
             const ComplexBin* const* input,
             const ComplexBin* const* left,
             const ComplexBin* const* right,
             bool onto,
             ComplexBin* sumL,
             ComplexBin* sumR) {
    std::size_t k = 0;
    const auto next = [&](const ComplexBin*& x, const ComplexBin*& l, const ComplexBin*& r) {
        x = input[k];
        l = left[k];
        r = right[k];
        ++k;
    };
    sumProducts<Lanes>(bins, count, onto, next, sumL, sumR);
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
