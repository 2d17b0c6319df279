// Radix-2 complex transform of half the length, with the usual split of a real signal.
#include "data/fft.h"

#include <cmath>
#include <numbers>
#include <utility>

#include "data/data_error.h"

namespace tessaly::data {

namespace {

Complex unitPhasor(double turns) {
    const double angle = 2.0 * std::numbers::pi * turns;
    return {std::cos(angle), std::sin(angle)};
}

double fraction(std::size_t numerator, std::size_t denominator) {
    return static_cast<double>(numerator) / static_cast<double>(denominator);
}

}  // namespace

RealTransform::RealTransform(std::size_t length) : length_(length) {
    if (length < 4 || (length & (length - 1)) != 0) {
        throw DataError("transform length {} is not a power of two from 4 up", length);
    }
    const std::size_t half = length / 2;
    work_.resize(half);
    reversed_.resize(half);
    for (std::size_t i = 0, j = 0; i < half; ++i) {
        reversed_[i] = j;
        std::size_t bit = half >> 1;
        while (bit != 0 && (j & bit) != 0) {
            j ^= bit;
            bit >>= 1;
        }
        j |= bit;
    }
    for (std::size_t size = 2; size <= half; size *= 2) {
        for (std::size_t k = 0; k < size / 2; ++k) {
            stageTwiddles_.push_back(unitPhasor(-fraction(k, size)));
        }
    }
    realTwiddles_.resize(half + 1);
    for (std::size_t k = 0; k <= half; ++k) {
        realTwiddles_[k] = unitPhasor(-fraction(k, length));
    }
}

void RealTransform::transformWork() {
    const std::size_t half = work_.size();
    for (std::size_t i = 0; i < half; ++i) {
        if (i < reversed_[i]) {
            std::swap(work_[i], work_[reversed_[i]]);
        }
    }
    const Complex* twiddles = stageTwiddles_.data();
    for (std::size_t size = 2; size <= half; size *= 2) {
        const std::size_t span = size / 2;
        for (std::size_t start = 0; start < half; start += size) {
            Complex* low = work_.data() + start;
            Complex* high = low + span;
            for (std::size_t k = 0; k < span; ++k) {
                const Complex turned = times(high[k], twiddles[k]);
                high[k] = low[k] - turned;
                low[k] += turned;
            }
        }
        twiddles += span;
    }
}

void RealTransform::forward(const double* time, Complex* spectrum) {
    const std::size_t half = length_ / 2;
    for (std::size_t i = 0; i < half; ++i) {
        work_[i] = {time[2 * i], time[2 * i + 1]};
    }
    transformWork();
    for (std::size_t k = 0; k <= half; ++k) {
        const Complex direct = work_[k % half];
        const Complex mirrored = std::conj(work_[(half - k) % half]);
        const Complex even = 0.5 * (direct + mirrored);
        const Complex odd = 0.5 * (direct - mirrored);
        const Complex turned = times(odd, realTwiddles_[k]);
        spectrum[k] = {even.real() + turned.imag(), even.imag() - turned.real()};
    }
    spectrum[0] = spectrum[0].real();
    spectrum[half] = spectrum[half].real();
}

void RealTransform::inverse(const Complex* spectrum, double* time) {
    const std::size_t half = length_ / 2;
    for (std::size_t k = 0; k < half; ++k) {
        const Complex direct = k == 0 ? Complex(spectrum[0].real()) : spectrum[k];
        const Complex mirrored =
            k == 0 ? Complex(spectrum[half].real()) : std::conj(spectrum[half - k]);
        const Complex even = direct + mirrored;
        const Complex odd = times(direct - mirrored, std::conj(realTwiddles_[k]));
        // conj(even + i odd): the forward transform of the conjugate is the inverse's conjugate.
        work_[k] = {even.real() - odd.imag(), -(even.imag() + odd.real())};
    }
    transformWork();
    const double scale = 1.0 / static_cast<double>(length_);
    for (std::size_t i = 0; i < half; ++i) {
        time[2 * i] = work_[i].real() * scale;
        time[2 * i + 1] = -work_[i].imag() * scale;
    }
}

std::size_t nextPowerOfTwo(std::size_t value) noexcept {
    std::size_t power = 1;
    while (power < value) {
        power *= 2;
    }
    return power;
}

}  // namespace tessaly::data
