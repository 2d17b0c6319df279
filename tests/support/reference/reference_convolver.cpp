// Partitioned convolution of the reference, by plain sums or by a double-precision transform.
#include "support/reference/reference_convolver.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <numbers>
#include <utility>

namespace tessaly::reference {

namespace {

/// Written out: the library operator also looks for infinities.
std::complex<double> product(std::complex<double> a, std::complex<double> b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

/// e^(-2 pi i k / n), or its conjugate, for k below n / 2, worked out once a length.
const Pairs& turnsOf(std::size_t n, bool conjugate) {
    static std::map<std::pair<std::size_t, bool>, Pairs> tables;
    Pairs& turns = tables[{n, conjugate}];
    for (std::size_t k = turns.size(); k < n / 2; ++k) {
        const double angle = (conjugate ? 2.0 : -2.0) * std::numbers::pi * static_cast<double>(k) /
                             static_cast<double>(n);
        turns.push_back({std::cos(angle), std::sin(angle)});
    }
    return turns;
}

}  // namespace

void fourier(std::vector<std::complex<double>>& values, bool backward) {
    const std::size_t n = values.size();
    for (std::size_t i = 1, j = 0; i < n; ++i) {
        std::size_t bit = n >> 1;
        for (; (j & bit) != 0; bit >>= 1) {
            j ^= bit;
        }
        j ^= bit;
        if (i < j) {
            std::swap(values[i], values[j]);
        }
    }
    for (std::size_t length = 2; length <= n; length *= 2) {
        const std::size_t half = length / 2;
        const Pairs& turns = turnsOf(length, backward);
        for (std::size_t start = 0; start < n; start += length) {
            for (std::size_t k = 0; k < half; ++k) {
                const std::complex<double> odd = product(values[start + k + half], turns[k]);
                const std::complex<double> even = values[start + k];
                values[start + k] = even + odd;
                values[start + k + half] = even - odd;
            }
        }
    }
}

WindowRing::WindowRing(int blockLength, int slotCount)
    : windows_(static_cast<std::size_t>(slotCount),
               std::vector<double>(static_cast<std::size_t>(2 * blockLength), 0.0)),
      spectra_(static_cast<std::size_t>(slotCount),
               Pairs(static_cast<std::size_t>(2 * blockLength))),
      silent_(static_cast<std::size_t>(slotCount), true) {}

void WindowRing::write(int slot, std::span<const double> window) {
    silent_[slot] = std::all_of(window.begin(), window.end(), [](double x) { return x == 0.0; });
    windows_[slot].assign(window.begin(), window.end());
    spectra_[slot].assign(window.begin(), window.end());
    fourier(spectra_[slot], false);
}

PartitionedResponse::PartitionedResponse(int blockLength, int partitionCount)
    : blockLength_(blockLength),
      taps_(static_cast<std::size_t>(partitionCount),
            Pairs(static_cast<std::size_t>(2 * blockLength))),
      spectra_(taps_) {}

void PartitionedResponse::take(int partition,
                               const std::vector<double>& left,
                               const std::vector<double>& right,
                               int first,
                               int count) {
    Pairs& taps = taps_[partition];
    bool changed = false;
    for (int i = 0; i < static_cast<int>(taps.size()); ++i) {
        std::complex<double> tap;
        if (i < count) {
            tap = {left.at(first + i), right.at(first + i)};
        }
        if (taps[i] != tap) {
            taps[i] = tap;
            changed = true;
        }
    }
    if (changed) {
        spectra_[partition] = taps;
        fourier(spectra_[partition], false);
    }
}

void PartitionedResponse::cut(const std::vector<double>& left, const std::vector<double>& right) {
    for (int p = 0; p < static_cast<int>(taps_.size()); ++p) {
        take(p, left, right, p * blockLength_, blockLength_);
    }
}

void PartitionedResponse::feedDirectly(const std::vector<double>& left,
                                       const std::vector<double>& right) {
    take(0, left, right, 0, 2 * blockLength_);
}

Pairs convolveBlock(const WindowRing& ring,
                    int newestSlot,
                    const PartitionedResponse& response,
                    Arithmetic arithmetic) {
    const int n = ring.slotCount();
    const int b = response.blockLength();
    Pairs block(static_cast<std::size_t>(b));
    if (arithmetic == Arithmetic::direct) {
        for (int p = 0; p < n; ++p) {
            const std::vector<double>& x = ring.window((newestSlot - p + n) % n);
            const Pairs& h = response.taps(p);
            for (int i = 0; i < b; ++i) {
                for (int m = 0; m < 2 * b; ++m) {
                    block[i] += h[m] * x[(b + i - m + 2 * b) % (2 * b)];
                }
            }
        }
        return block;
    }
    Pairs sum(static_cast<std::size_t>(2 * b));
    for (int p = 0; p < n; ++p) {
        const int slot = (newestSlot - p + n) % n;
        if (ring.silent(slot)) {
            continue;
        }
        const Pairs& x = ring.spectrum(slot);
        const Pairs& h = response.spectrum(p);
        for (int k = 0; k < 2 * b; ++k) {
            sum[k] += product(x[k], h[k]);
        }
    }
    fourier(sum, true);
    for (int i = 0; i < b; ++i) {
        block[i] = sum[b + i] / (2.0 * b);
    }
    return block;
}

}  // namespace tessaly::reference
