// Minimum-phase spectra from magnitudes, by the real cepstrum.
#pragma once

#include <vector>

#include "data/fft.h"

namespace tessaly::data {

/// dB to natural logarithm of the magnitude.
inline constexpr double neperPerDecibel = 0.11512925464970229;  // ln(10) / 20

/// Finds the minimum-phase spectrum of a magnitude. Holds work buffers: one object a thread.
class MinimumPhase {
public:
    explicit MinimumPhase(RealTransform& transform);

    /// @param logMagnitude  bins() natural logarithms of the magnitude, finite
    /// @param logSpectrum   bins() complex logarithms: the given real part (up to the cepstrum's
    ///                      aliasing), and the minimum phase in radians as imaginary part
    void logSpectrum(const double* logMagnitude, Complex* logSpectrum);

private:
    RealTransform& transform_;
    std::vector<Complex> even_;
    std::vector<double> cepstrum_;
};

}  // namespace tessaly::data
