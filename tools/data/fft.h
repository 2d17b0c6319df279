// Double-precision real transform for building data; not for the audio path.
#pragma once

#include <complex>
#include <cstddef>
#include <vector>

namespace tessaly::data {

using Complex = std::complex<double>;

/// Product without the infinity repair of the library's operator, which costs a call.
inline Complex times(Complex a, Complex b) noexcept {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

/// Real transform of one power-of-two length, 4 or more. Holds tables and a work buffer: one
/// object a thread.
class RealTransform {
public:
    /// @throws DataError if `length` is not a power of two or below 4
    explicit RealTransform(std::size_t length);

    std::size_t length() const noexcept { return length_; }
    std::size_t bins() const noexcept { return length_ / 2 + 1; }

    /// Unscaled forward transform, exponent sign minus.
    /// @param time      length() values
    /// @param spectrum  bins() values, the first and the last one real
    void forward(const double* time, Complex* spectrum);

    /// Inverse with factor 1 / length(): inverse(forward(x)) is x. The imaginary parts of the first
    /// and the last bin are ignored.
    void inverse(const Complex* spectrum, double* time);

private:
    void transformWork();

    std::size_t length_;
    std::vector<Complex> work_;
    std::vector<std::size_t> reversed_;
    std::vector<Complex> stageTwiddles_;  ///< all stages one after the other
    std::vector<Complex> realTwiddles_;   ///< exp(-2 pi i k / length)
};

/// The smallest power of two that is not below `value`.
std::size_t nextPowerOfTwo(std::size_t value) noexcept;

}  // namespace tessaly::data
