// Beginning and end of a tail over time, at any rate.
#pragma once

#include <cstddef>
#include <vector>

#include "data/tail_design.h"

namespace tessaly::data {

/// Weights of each frame of a stored tail.
class TailEnvelope {
public:
    TailEnvelope(const TailDesign& design, int sampleRate);

    std::size_t frames() const noexcept { return gain_.size(); }
    /// First frame that may sound.
    std::size_t startFrame() const noexcept { return startFrame_; }

    /// Multiplies by onset ramp and end fade.
    /// @param samples  interleaved frames()
    void apply(std::vector<double>& samples, std::size_t channels) const;

    /// What a conversion has smeared out: silence before the start, 0 at the end.
    void silenceEnds(std::vector<double>& samples, std::size_t channels) const;

    /// Takes the sum of each channel out with the envelope's own decaying shape.
    /// @return energy taken away over energy before
    double removeSum(std::vector<double>& samples, std::size_t channels) const;

private:
    std::size_t startFrame_;
    std::vector<double> gain_;   ///< ramp and fade
    std::vector<double> decay_;  ///< the same with the decay of the middle frequencies
};

/// Half-cosine fade over the last 5 % of a tail, at least 60 frames; the last frame becomes 0.
/// @param position  frame, below `frames`
double tailFade(std::size_t position, std::size_t frames) noexcept;

}  // namespace tessaly::data
