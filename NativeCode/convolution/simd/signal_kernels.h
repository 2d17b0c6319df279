// Inner loops over samples: second-order filters, stored pairs, interleaved output.
#pragma once

#include <cstddef>

namespace tessaly {

/// Coefficients of a transposed direct form II section; the leading denominator one is 1.
struct SectionCoefficients {
    double b0;
    double b1;
    double b2;
    double a1;
    double a2;
};

/// A section with its state, in series with others.
struct RunningSection {
    SectionCoefficients coefficients;
    double z1;
    double z2;
};

/// Interleaved pairs through a section at rest, both channels alike.
struct PairFilter {
    const float* input;  ///< pairs
    float* output;       ///< as many pairs; overlaps no input
    SectionCoefficients coefficients;
};

/// All functions are block time and take any alignment.
struct SignalKernels {
    /// `count` filters over `frames` pairs each, rounded once a sample. Bit for bit the recursion
    /// written out, in every table: the filters run side by side.
    void (*filterPairs)(std::size_t frames, std::size_t count, const PairFilter* filters);
    /// `count` samples in place through 0 to 4 sections in series, rounded to single behind each.
    /// The vector tables look some samples ahead: a section's output and state differ from the
    /// recursion written out by double rounding, so that a sample may round to the next single.
    /// One that is not finite may spoil the seven samples before it.
    void (*filterSeries)(std::size_t count,
                         float* samples,
                         std::size_t sections,
                         RunningSection* series);
    /// even[i] += pairs[2i] * gain, odd[i] += pairs[2i + 1] * gain. The three arrays are apart.
    /// This and the two below are bit for bit the same in every table.
    void (*addPairs)(std::size_t frames, const float* pairs, float gain, float* even, float* odd);
    /// even[i] = pairs[2i] * gain * secondGain, odd likewise, in this order.
    void (*writePairs)(std::size_t frames,
                       const float* pairs,
                       float gain,
                       float secondGain,
                       float* even,
                       float* odd);
    /// pairs[2i] = even[i] * gain, pairs[2i + 1] = odd[i] * gain.
    void (*interleave)(
        std::size_t frames, const float* even, const float* odd, float gain, float* pairs);
    /// Every sample is a zero without sign. Of others it is known soon after the first.
    bool (*isSilent)(std::size_t count, const float* samples);
};

}  // namespace tessaly
