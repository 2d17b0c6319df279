// Plain forms of the convolver's arithmetic: naive transforms in double precision, and vector
// operations in separate scalar passes.
#pragma once

#include <cmath>
#include <complex>
#include <cstddef>
#include <numbers>
#include <vector>

#include "convolution/complex_bin.h"

namespace tessaly::test {

using Spectrum = std::vector<std::complex<double>>;

/// e^(-2 pi i k / n) for k = 0 .. n - 1.
inline Spectrum plainRoots(std::size_t n) {
    Spectrum roots(n);
    for (std::size_t k = 0; k < n; ++k) {
        const double angle =
            -2.0 * std::numbers::pi * static_cast<double>(k) / static_cast<double>(n);
        roots[k] = {std::cos(angle), std::sin(angle)};
    }
    return roots;
}

/// X[k] = sum of x[j] e^(-2 pi i j k / n), one bin of a real block, straight from the definition.
/// @param roots  plainRoots(x.size())
template <typename Real>
std::complex<double> plainBin(const std::vector<Real>& x, const Spectrum& roots, std::size_t k) {
    const std::size_t n = x.size();
    double re = 0.0;
    double im = 0.0;
    for (std::size_t j = 0, at = 0; j < n; ++j, at = (at + k) % n) {
        re += static_cast<double>(x[j]) * roots[at].real();
        im += static_cast<double>(x[j]) * roots[at].imag();
    }
    return {re, im};
}

/// All n/2 + 1 bins of a real block.
template <typename Real>
Spectrum plainForward(const std::vector<Real>& x) {
    const Spectrum roots = plainRoots(x.size());
    Spectrum bins(x.size() / 2 + 1);
    for (std::size_t k = 0; k < bins.size(); ++k) {
        bins[k] = plainBin(x, roots, k);
    }
    return bins;
}

/// x[j] = sum over all n bins of the conjugate-even spectrum, e^(+2 pi i j k / n), no scale
/// factor; the imaginary parts of the first and the last bin do not count.
/// @param roots  plainRoots(2 * (bins.size() - 1))
inline double plainSample(const Spectrum& bins, const Spectrum& roots, std::size_t j) {
    const std::size_t half = bins.size() - 1;
    const std::size_t n = 2 * half;
    double sum = bins[0].real() + (j % 2 == 0 ? 1.0 : -1.0) * bins[half].real();
    for (std::size_t k = 1, at = j; k < half; ++k, at = (at + j) % n) {
        sum += 2.0 * (bins[k].real() * roots[at].real() + bins[k].imag() * roots[at].imag());
    }
    return sum;
}

/// All samples.
inline std::vector<double> plainBackward(const Spectrum& bins) {
    std::vector<double> x(2 * (bins.size() - 1));
    const Spectrum roots = plainRoots(x.size());
    for (std::size_t j = 0; j < x.size(); ++j) {
        x[j] = plainSample(bins, roots, j);
    }
    return x;
}

/// y = a * b, bin by bin; y may be a or b.
inline void plainMultiply(std::size_t bins,
                          const ComplexBin* a,
                          const ComplexBin* b,
                          ComplexBin* y) {
    for (std::size_t i = 0; i < bins; ++i) {
        const ComplexBin p = a[i];
        const ComplexBin q = b[i];
        y[i].re = p.re * q.re - p.im * q.im;
        y[i].im = p.re * q.im + p.im * q.re;
    }
}

/// y = a + b, bin by bin; y may be a or b.
inline void plainAdd(std::size_t bins, const ComplexBin* a, const ComplexBin* b, ComplexBin* y) {
    for (std::size_t i = 0; i < bins; ++i) {
        y[i].re = a[i].re + b[i].re;
        y[i].im = a[i].im + b[i].im;
    }
}

/// One ear over the ring: clear, then a product into `scratch` and a sum for each partition.
inline void plainRing(std::size_t bins,
                      std::size_t partitions,
                      std::size_t newest,
                      const ComplexBin* const* ring,
                      const ComplexBin* const* parts,
                      ComplexBin* scratch,
                      ComplexBin* sum) {
    for (std::size_t i = 0; i < bins; ++i) {
        sum[i] = {0.0f, 0.0f};
    }
    for (std::size_t i = 0; i < partitions; ++i) {
        const std::size_t slot = (newest + i) % partitions;
        const std::size_t part = (partitions - i) % partitions;
        plainMultiply(bins, ring[slot], parts[part], scratch);
        plainAdd(bins, scratch, sum, sum);
    }
}

/// Root of the mean squared difference over that of the reference.
inline double relativeRms(const Spectrum& reference, const ComplexBin* bins) {
    double error = 0.0;
    double power = 0.0;
    for (std::size_t k = 0; k < reference.size(); ++k) {
        const std::complex<double> bin(static_cast<double>(bins[k].re),
                                       static_cast<double>(bins[k].im));
        error += std::norm(bin - reference[k]);
        power += std::norm(reference[k]);
    }
    return std::sqrt(error / power);
}
inline double relativeRms(const std::vector<double>& reference, const float* samples) {
    double error = 0.0;
    double power = 0.0;
    for (std::size_t j = 0; j < reference.size(); ++j) {
        const double difference = static_cast<double>(samples[j]) - reference[j];
        error += difference * difference;
        power += reference[j] * reference[j];
    }
    return std::sqrt(error / power);
}

}  // namespace tessaly::test
