// The engine's one second-order filter: seven designs, transposed direct form II.
#pragma once

#include <cstdint>

namespace tessaly {

/// Coefficients and state are double precision, samples single. Designs are the bilinear-transform
/// second-order sections in common use (Zoelzer, Digital Audio Signal Processing); the shelves use
/// the square root of 2 in place of `Q`.
struct Biquad {
    static constexpr std::int32_t lowPass = 0;
    static constexpr std::int32_t highPass = 1;
    static constexpr std::int32_t bandPass = 2;
    static constexpr std::int32_t notch = 3;
    static constexpr std::int32_t peak = 4;
    static constexpr std::int32_t lowShelf = 5;
    static constexpr std::int32_t highShelf = 6;
    /// Upper bound of the normalised frequency, cycles per sample.
    static constexpr double frequencyBound = 0.458;

    /// A low-pass at frequency 0: silent, and safe to run.
    Biquad() noexcept : Biquad(lowPass, 0.0, 0.0) {}
    /// @param type       0..6; above 6 nothing is designed and the coefficients are 0
    /// @param gain       dB, types 4 to 6
    /// @param frequency  cut-off over sample rate; bounded to 0..0.458, a NaN becomes 0.458
    Biquad(std::int32_t type, double gain, double frequency) noexcept;

    /// The frequency as it is stored: NaN and values from 0.458 up become 0.458, negative ones 0.
    static double boundFrequency(double frequency) noexcept;
    /// Cut-off in hertz over sample rate: divided in single precision, then widened.
    static double normalise(float cutOff, int sampleRate) noexcept {
        return static_cast<double>(cutOff / static_cast<float>(sampleRate));
    }
    /// Computes the coefficients from the fields; state and other fields stay. Types above 6
    /// change nothing.
    void design() noexcept;
    /// Stores the bounded frequency and designs; the state runs on.
    void redesign(double frequency) noexcept {
        normalisedFrequency = boundFrequency(frequency);
        design();
    }
    /// Stores type, `Q` 0.707 and gain 0 as well; the state runs on.
    void redesign(std::int32_t type, double frequency) noexcept {
        filterType = type;
        Q = 0.707;
        gainDb = 0.0;
        redesign(frequency);
    }
    /// Redesigns unless this is the stored frequency. The stored one is bounded, so a frequency
    /// above the bound redesigns every time, with the same result.
    void follow(double frequency) noexcept {
        if (normalisedFrequency != frequency) {
            redesign(frequency);
        }
    }
    /// One sample. Block time.
    float process(float sample) noexcept {
        const double x = static_cast<double>(sample);
        const double y = x * b0 + z1;
        z1 = x * b1 + z2 - a1 * y;
        z2 = x * b2 - a2 * y;
        return static_cast<float>(y);
    }
    /// Runs over `count` samples in place. Block time.
    void processInPlace(float* samples, int count) noexcept;
    /// Zeroes the state.
    void clear() noexcept { z1 = z2 = 0.0; }

    double z1 = 0.0;
    double z2 = 0.0;
    double normalisedFrequency = 0.0;  ///< after the bound
    std::int32_t filterType = lowPass;
    double b0 = 0.0;
    double b1 = 0.0;
    double b2 = 0.0;
    double a1 = 0.0;  ///< the leading denominator coefficient is 1
    double a2 = 0.0;
    double Q = 0.707;  ///< this literal, not 1 / sqrt(2)
    double gainDb = 0.0;
};

}  // namespace tessaly
