// The transform of overlap-save blocks, written once over a lane type.
//
// Only the second half of a block's result is heard, so it may be made by any product of
// polynomials that leaves this half alone: with u^M = i in place of u^(2M) = 1 a window of 2M reals
// is M complex points, first half + i second half, and its spectrum the values at the M roots: the
// right-angle convolution of Crandall and Fagin, "Discrete weighted transforms and large-integer
// arithmetic", Math. Comp. 62, 1994. Points need no packing and bins no parting, and bins stay in
// the order in which the passes leave them.
//
// The points lie in K = M / L rows of L lanes. Passes down the rows split the ring u^M - c into
// rings of a quarter of the degree, until each row is one of degree L; a pass across the lanes ends
// each of them. A ring is split by multiplying with powers of a root of c before the butterfly: a
// constant for all of it, no factor for each point.
#pragma once

#include "convolution/simd/complex_lanes.h"
#include "convolution/simd/sparse_pass_template.h"

namespace tessaly {
namespace {

/// A window of 2M samples, row by row.
template <class Lanes>
struct WindowSource {
    static constexpr bool real = false;
    const float* samples;
    Index points;

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index row) const {
        const float* at = samples + Lanes::count * row;
        return {Lanes::load(at), Lanes::load(at + points)};
    }
};

/// M samples that M zeros follow: no imaginary parts.
template <class Lanes>
struct StartSource {
    static constexpr bool real = true;
    const float* samples;

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index row) const {
        return {Lanes::load(samples + Lanes::count * row), Lanes::broadcast(0.0f)};
    }
};

template <class Lanes>
struct RowSource {
    static constexpr bool real = false;
    const float* rows;

    TESSALY_KERNEL_INLINE Complex<Lanes> operator()(Index row) const {
        return loadGroup<Lanes>(rows, row);
    }
};

template <class Lanes, Index Radix>
TESSALY_KERNEL_INLINE void transformRows(Complex<Lanes> (&x)[Radix]) {
    if constexpr (Radix == 2) {
        transform2(x[0], x[1]);
    } else if constexpr (Radix == 4) {
        transform4(x[0], x[1], x[2], x[3]);
    } else {
        transform8(x);
    }
}

/// A ring's root and its powers, from 1 on. @return the roots of the next ring
template <class Lanes, Index Radix>
TESSALY_KERNEL_INLINE const float* broadcastRoots(const float* roots,
                                                  Complex<Lanes> (&root)[Radix]) {
    TESSALY_KERNEL_UNROLL
    for (Index t = 1; t < Radix; ++t) {
        root[t] = broadcastRoot<Lanes>(roots + 2 * (t - 1));
    }
    return roots + 2 * (Radix - 1);
}

/// Splits each of `rings` rings of n rows into `Radix`. In place, but for the first pass.
template <class Lanes, Index Radix, class Source>
TESSALY_KERNEL_INLINE void splitRings(
    const Source& source, float* rows, Index n, Index rings, const float* roots) {
    const Index step = n / Radix;
    for (Index ring = 0; ring < rings; ++ring) {
        Complex<Lanes> root[Radix];
        roots = broadcastRoots(roots, root);
        for (Index p = ring * n; p < ring * n + step; ++p) {
            Complex<Lanes> x[Radix];
            x[0] = source(p);
            TESSALY_KERNEL_UNROLL
            for (Index t = 1; t < Radix; ++t) {
                const Complex<Lanes> value = source(p + t * step);
                if constexpr (Source::real) {
                    x[t] = {Lanes::multiply(value.re, root[t].re),
                            Lanes::multiply(value.re, root[t].im)};
                } else {
                    x[t] = value * root[t];
                }
            }
            transformRows<Lanes, Radix>(x);
            TESSALY_KERNEL_UNROLL
            for (Index t = 0; t < Radix; ++t) {
                storeGroup(rows, p + t * step, x[t]);
            }
        }
    }
}

template <class Lanes, class Source>
TESSALY_KERNEL_INLINE void splitBy(
    Index radix, const Source& source, float* rows, Index n, Index rings, const float* roots) {
    if (radix == 8) {
        splitRings<Lanes, 8>(source, rows, n, rings, roots);
    } else if (radix == 4) {
        splitRings<Lanes, 4>(source, rows, n, rings, roots);
    } else {
        splitRings<Lanes, 2>(source, rows, n, rings, roots);
    }
}

/// The passes down the rows: rings of n rows each, `count` of them, by radix R and with their
/// roots.
struct RingPasses {
    struct Pass {
        Index radix;
        Index n;
        Index rings;
        const float* roots;
    };
    Pass passes[16];
    int count = 0;

    explicit RingPasses(const BlockTables& tables) {
        Index rings = 1;
        const float* roots = tables.rings;
        for (Index n = tables.columns; n > 1;) {
            const Index radix = ringRadix(tables.lanes, static_cast<std::int32_t>(n));
            passes[count++] = {radix, n, rings, roots};
            roots += 2 * (radix - 1) * rings;
            rings *= radix;
            n /= radix;
        }
    }
};

/// All but the first pass.
template <class Lanes>
TESSALY_KERNEL_INLINE void splitRest(const RingPasses& all, float* rows) {
    for (int k = 1; k < all.count; ++k) {
        const RingPasses::Pass& pass = all.passes[k];
        splitBy<Lanes>(pass.radix, RowSource<Lanes>{rows}, rows, pass.n, pass.rings, pass.roots);
    }
}

template <class Lanes, class Source>
void splitAll(const BlockTables& tables, const Source& source, float* rows) {
    const RingPasses all(tables);
    const RingPasses::Pass& first = all.passes[0];
    splitBy<Lanes>(first.radix, source, rows, first.n, first.rings, first.roots);
    splitRest<Lanes>(all, rows);
}

template <class Lanes>
void splitPartition(const BlockTables& tables,
                    const float* samples,
                    std::uint64_t parts,
                    float* rows) {
    const RingPasses all(tables);
    const RingPasses::Pass& first = all.passes[0];
    if (tables.points < 64 || !isSparse(parts)) {
        const StartSource<Lanes> source{samples};
        splitBy<Lanes>(first.radix, source, rows, first.n, first.rings, first.roots);
    } else if (first.radix == 8) {
        splitSounding<Lanes, 8>(tables, samples, parts, rows);
    } else if (first.radix == 4) {
        splitSounding<Lanes, 4>(tables, samples, parts, rows);
    } else {
        splitSounding<Lanes, 2>(tables, samples, parts, rows);
    }
    splitRest<Lanes>(all, rows);
}

/// The passes across the lanes work on four rows at a time, which is what the registers hold
/// without spilling: rings of L / 4 groups of four lanes are split first, with the groups of four
/// lanes of several rows side by side, and then the remaining ones of four.
constexpr Index rowsAcross = 4;

template <class Lanes, class Function>
TESSALY_KERNEL_INLINE void onParts(Complex<Lanes> (&x)[rowsAcross], const Function& function) {
    typename Lanes::Vector re[rowsAcross] = {x[0].re, x[1].re, x[2].re, x[3].re};
    typename Lanes::Vector im[rowsAcross] = {x[0].im, x[1].im, x[2].im, x[3].im};
    function(re);
    function(im);
    TESSALY_KERNEL_UNROLL
    for (Index k = 0; k < rowsAcross; ++k) {
        x[k] = {re[k], im[k]};
    }
}

/// Lane groups k of four rows (or of each pair of rows) come together as x[k], and back.
template <class Lanes>
TESSALY_KERNEL_INLINE void exchangeQuarters(Complex<Lanes> (&x)[rowsAcross]) {
    onParts(x, [](auto& part) { Lanes::exchangeQuarters(part); });
}
/// Four by four, within each group of four lanes.
template <class Lanes>
TESSALY_KERNEL_INLINE void transposeQuarters(Complex<Lanes> (&x)[rowsAcross]) {
    onParts(x, [](auto& part) { Lanes::transposeQuarters(part); });
}

/// The roots that four rows take, in groups, in front of the butterflies between quarters and in
/// front of those within.
template <Index Lanes>
constexpr Index quarterRoots = Lanes == 16  ? 3
                               : Lanes == 8 ? 2
                                            : 0;
constexpr Index innerRoots = 3;

template <class Lanes>
TESSALY_KERNEL_INLINE void timesQuarterRoots(Complex<Lanes> (&x)[rowsAcross], const float* roots) {
    if constexpr (Lanes::count == 16) {
        x[1] = x[1] * loadGroup<Lanes>(roots, 0);
        x[2] = x[2] * loadGroup<Lanes>(roots, 1);
        x[3] = x[3] * loadGroup<Lanes>(roots, 2);
    } else if constexpr (Lanes::count == 8) {
        x[1] = x[1] * loadGroup<Lanes>(roots, 0);
        x[3] = x[3] * loadGroup<Lanes>(roots, 1);
    }
}
template <class Lanes>
TESSALY_KERNEL_INLINE void timesInnerRoots(Complex<Lanes> (&x)[rowsAcross], const float* roots) {
    x[1] = x[1] * loadGroup<Lanes>(roots, 0);
    x[2] = x[2] * loadGroup<Lanes>(roots, 1);
    x[3] = x[3] * loadGroup<Lanes>(roots, 2);
}
template <class Lanes>
TESSALY_KERNEL_INLINE void transformQuarters(Complex<Lanes> (&x)[rowsAcross]) {
    if constexpr (Lanes::count == 16) {
        transform4(x[0], x[1], x[2], x[3]);
    } else if constexpr (Lanes::count == 8) {
        transform2(x[0], x[1]);
        transform2(x[2], x[3]);
    }
}

/// The last pass of a forward transform, in place.
template <class Lanes>
void splitAcross(const BlockTables& tables, float* rows) {
    constexpr Index count = Lanes::count;
    const float* roots = tables.across;
    for (Index row = 0; row < tables.columns; row += rowsAcross) {
        Complex<Lanes> x[rowsAcross];
        TESSALY_KERNEL_UNROLL
        for (Index k = 0; k < rowsAcross; ++k) {
            x[k] = loadGroup<Lanes>(rows, row + k);
        }
        exchangeQuarters(x);
        timesQuarterRoots(x, roots);
        transformQuarters(x);
        transposeQuarters(x);
        timesInnerRoots(x, roots + 2 * count * quarterRoots<count>);
        transform4(x[0], x[1], x[2], x[3]);
        roots += 2 * count * (quarterRoots<count> + innerRoots);
        TESSALY_KERNEL_UNROLL
        for (Index k = 0; k < rowsAcross; ++k) {
            storeGroup(rows, row + k, x[k]);
        }
    }
}

/// The first pass of a backward transform. Real and imaginary parts change places, so that the
/// forward butterflies and roots make all of it.
template <class Lanes>
void joinAcross(const BlockTables& tables, const float* bins, float* rows) {
    constexpr Index count = Lanes::count;
    const float* roots = tables.across;
    for (Index row = 0; row < tables.columns; row += rowsAcross) {
        Complex<Lanes> x[rowsAcross];
        TESSALY_KERNEL_UNROLL
        for (Index k = 0; k < rowsAcross; ++k) {
            const Complex<Lanes> value = loadGroup<Lanes>(bins, row + k);
            x[k] = {value.im, value.re};
        }
        transform4(x[0], x[1], x[2], x[3]);
        timesInnerRoots(x, roots + 2 * count * quarterRoots<count>);
        transposeQuarters(x);
        transformQuarters(x);
        timesQuarterRoots(x, roots);
        exchangeQuarters(x);
        roots += 2 * count * (quarterRoots<count> + innerRoots);
        TESSALY_KERNEL_UNROLL
        for (Index k = 0; k < rowsAcross; ++k) {
            storeGroup(rows, row + k, x[k]);
        }
    }
}

/// Intermediate rows of a backward transform.
template <class Lanes>
struct RowSink {
    float* rows;

    TESSALY_KERNEL_INLINE void first(Index row, const Complex<Lanes>& value) const {
        storeGroup(rows, row, value);
    }
    TESSALY_KERNEL_INLINE void other(Index row,
                                     const Complex<Lanes>& value,
                                     const Complex<Lanes>& root) const {
        storeGroup(rows, row, value * root);
    }
};

/// The second half of the samples, and some rows of the first, the wrapped one. Twice the value: a
/// window and its spectrum count 2M.
template <class Lanes>
struct BlockSink {
    float* samples;
    float* wrapped;
    Index wrappedRows;

    TESSALY_KERNEL_INLINE void first(Index row, const Complex<Lanes>& value) const {
        Lanes::store(samples + Lanes::count * row, Lanes::add(value.re, value.re));
        if (row < wrappedRows) {
            Lanes::store(wrapped + Lanes::count * row, Lanes::add(value.im, value.im));
        }
    }
    TESSALY_KERNEL_INLINE void other(Index row,
                                     const Complex<Lanes>& value,
                                     const Complex<Lanes>& root) const {
        const auto re =
            Lanes::multiplySubtract(value.re, root.re, Lanes::multiply(value.im, root.im));
        Lanes::store(samples + Lanes::count * row, Lanes::add(re, re));
        if (row < wrappedRows) {
            const auto im =
                Lanes::multiplyAdd(value.re, root.im, Lanes::multiply(value.im, root.re));
            Lanes::store(wrapped + Lanes::count * row, Lanes::add(im, im));
        }
    }
};

/// The first value of a butterfly, in its order.
template <class Lanes, Index Radix>
TESSALY_KERNEL_INLINE Complex<Lanes> sumOfRows(const float* rows, Index first, Index step) {
    if constexpr (Radix == 1) {
        return loadGroup<Lanes>(rows, first);
    } else {
        return sumOfRows<Lanes, Radix / 2>(rows, first, 2 * step) +
               sumOfRows<Lanes, Radix / 2>(rows, first + step, 2 * step);
    }
}

/// Joins `Radix` rings of a `Radix`th of n rows each into one, `rings` times. Of each one's rows
/// those below `wanted` at least are made.
template <class Lanes, Index Radix, class Sink>
TESSALY_KERNEL_INLINE void joinRings(
    const float* rows, const Sink& sink, Index n, Index rings, Index wanted, const float* roots) {
    const Index step = n / Radix;
    if (wanted <= step) {
        for (Index ring = 0; ring < rings; ++ring) {
            for (Index p = ring * n; p < ring * n + wanted; ++p) {
                sink.first(p, sumOfRows<Lanes, Radix>(rows, p, step));
            }
        }
        return;
    }
    for (Index ring = 0; ring < rings; ++ring) {
        Complex<Lanes> root[Radix];
        roots = broadcastRoots(roots, root);
        for (Index p = ring * n; p < ring * n + step; ++p) {
            Complex<Lanes> x[Radix];
            TESSALY_KERNEL_UNROLL
            for (Index t = 0; t < Radix; ++t) {
                x[t] = loadGroup<Lanes>(rows, p + t * step);
            }
            transformRows<Lanes, Radix>(x);
            sink.first(p, x[0]);
            TESSALY_KERNEL_UNROLL
            for (Index t = 1; t < Radix; ++t) {
                sink.other(p + t * step, x[t], root[t]);
            }
        }
    }
}

template <class Lanes, class Sink>
TESSALY_KERNEL_INLINE void joinBy(const RingPasses::Pass& pass,
                                  const float* rows,
                                  const Sink& sink,
                                  Index wanted) {
    if (pass.radix == 8) {
        joinRings<Lanes, 8>(rows, sink, pass.n, pass.rings, wanted, pass.roots);
    } else if (pass.radix == 4) {
        joinRings<Lanes, 4>(rows, sink, pass.n, pass.rings, wanted, pass.roots);
    } else {
        joinRings<Lanes, 2>(rows, sink, pass.n, pass.rings, wanted, pass.roots);
    }
}

/// All passes down the rows, in place but for the last one. `wanted` rows of the result are made at
/// least.
template <class Lanes>
void joinAll(const BlockTables& tables, float* rows, const BlockSink<Lanes>& result, Index wanted) {
    const RingPasses all(tables);
    for (int k = all.count - 1; k > 0; --k) {
        joinBy<Lanes>(all.passes[k], rows, RowSink<Lanes>{rows}, wanted);
    }
    joinBy<Lanes>(all.passes[0], rows, result, wanted);
}

template <class Lanes>
void windowLanes(const BlockTables& tables, const float* input, ComplexBin* bins) {
    splitAll<Lanes>(tables, WindowSource<Lanes>{input, tables.points}, floats(bins));
    if constexpr (Lanes::count > 1) {
        splitAcross<Lanes>(tables, floats(bins));
    }
}

template <class Lanes>
void partitionLanes(const BlockTables& tables,
                    const float* input,
                    ComplexBin* bins,
                    std::uint64_t sounding) {
    splitPartition<Lanes>(tables, input, sounding, floats(bins));
    if constexpr (Lanes::count > 1) {
        splitAcross<Lanes>(tables, floats(bins));
    }
}

template <class Lanes>
void blockLanes(const BlockTables& tables,
                const ComplexBin* bins,
                float* output,
                float* work,
                std::size_t samples,
                float* wrapped,
                std::size_t wrappedSamples) {
    constexpr Index count = Lanes::count;
    const auto rowsOf = [](std::size_t wanted) {
        return (static_cast<Index>(wanted) + count - 1) / count;
    };
    if constexpr (count > 1) {
        joinAcross<Lanes>(tables, floats(bins), work);
    } else {
        for (Index k = 0; k < tables.points; ++k) {
            storeGroup(work, k, Complex<Lanes>{bins[k].im, bins[k].re});
        }
    }
    const BlockSink<Lanes> result{output, wrapped, rowsOf(wrappedSamples)};
    joinAll<Lanes>(tables, work, result,
                   rowsOf(samples > wrappedSamples ? samples : wrappedSamples));
}

}  // namespace
}  // namespace tessaly
