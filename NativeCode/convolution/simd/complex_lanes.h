// Complex numbers over a lane type, and the short transforms that all others are made of.
//
// Everything in these templates stays in an unnamed namespace: each kernel source gets copies of
// its own, built with its own flags, and none can become the one that the linker gives to an older
// machine. A lane type offers
//   Vector, count (L), load, store, broadcast, add, subtract, multiply,
//   multiplyAdd(a, b, c) = a b + c, multiplySubtract = a b - c, negateMultiplyAdd = c - a b,
//   reverse, loadInterleaved / storeInterleaved (2 L floats to and from L real, L imaginary parts),
//   transpose (L vectors of L), exchangeQuarters and transposeQuarters (four vectors: the groups of
//   four lanes that rows have in the same place come together; four by four within the groups),
//   orBits, anyBits (one is set),
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

/// By the compilers' own operator: headers of the standard library could leave functions behind
/// that are built for this instruction set.
TESSALY_KERNEL_INLINE std::uint32_t bitsOf(float value) {
    return __builtin_bit_cast(std::uint32_t, value);
}

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
TESSALY_KERNEL_INLINE void transform2(Complex<Lanes>& a, Complex<Lanes>& b) {
    const Complex<Lanes> difference = a - b;
    a = a + b;
    b = difference;
}

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

/// L groups from `row` on, lane c of them all as x[c].
template <class Lanes>
TESSALY_KERNEL_INLINE void loadTransposed(const float* groups,
                                          Index row,
                                          Complex<Lanes> (&x)[Lanes::count]) {
    constexpr Index count = Lanes::count;
    typename Lanes::Vector re[count];
    typename Lanes::Vector im[count];
    TESSALY_KERNEL_UNROLL
    for (Index j = 0; j < count; ++j) {
        const Complex<Lanes> value = loadGroup<Lanes>(groups, row + j);
        re[j] = value.re;
        im[j] = value.im;
    }
    Lanes::transpose(re);
    Lanes::transpose(im);
    TESSALY_KERNEL_UNROLL
    for (Index c = 0; c < count; ++c) {
        x[c] = {re[c], im[c]};
    }
}

/// L values of as many lanes each, across the values.
template <class Lanes>
TESSALY_KERNEL_INLINE void transformLanesOf(Complex<Lanes> (&x)[Lanes::count]) {
    if constexpr (Lanes::count == 4) {
        transform4(x[0], x[1], x[2], x[3]);
    } else if constexpr (Lanes::count == 8) {
        transform8(x);
    } else {
        transform16(x);
    }
}

}  // namespace
}  // namespace tessaly
