// How far the library's blocks lie from the reference's, over one test.
#pragma once

#include <cstddef>
#include <span>
#include <string>

namespace tessaly::test {

/// Largest difference of any sample, of a full scale of 1.0. The library convolves, filters and
/// sums in single precision: rounding at 6e-8 of a sum, grown by the square root of the number of
/// sums, ends near 1e-6; a wrong tap, gain or sample of the ramp is heard from 1e-4 on.
inline constexpr double tolerance = 1e-5;

class Deviation {
public:
    /// Compares one block; a value that is no number on either side never passes.
    /// @return empty if every sample is inside the tolerance, else the first one that is not
    std::string compare(std::span<const float> library, std::span<const double> reference);

    double largest() const { return largest_; }
    /// Largest magnitude of the reference: a test that compares silence shows it here.
    double peak() const { return peak_; }
    std::size_t samples() const { return samples_; }

private:
    double largest_ = 0.0;
    double peak_ = 0.0;
    std::size_t samples_ = 0;
};

}  // namespace tessaly::test
