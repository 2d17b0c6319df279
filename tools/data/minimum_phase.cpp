// Folds the cepstrum of a magnitude onto its causal half.
#include "data/minimum_phase.h"

namespace tessaly::data {

MinimumPhase::MinimumPhase(RealTransform& transform)
    : transform_(transform), even_(transform.bins()), cepstrum_(transform.length()) {}

void MinimumPhase::logSpectrum(const double* logMagnitude, Complex* logSpectrum) {
    for (std::size_t k = 0; k < even_.size(); ++k) {
        even_[k] = logMagnitude[k];
    }
    transform_.inverse(even_.data(), cepstrum_.data());
    const std::size_t half = cepstrum_.size() / 2;
    for (std::size_t i = 1; i < half; ++i) {
        cepstrum_[i] *= 2.0;
        cepstrum_[half + i] = 0.0;
    }
    transform_.forward(cepstrum_.data(), logSpectrum);
}

}  // namespace tessaly::data
