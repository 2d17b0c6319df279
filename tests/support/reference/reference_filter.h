// Second-order filter of the reference: seven designs, transposed direct form II, all in double.
#pragma once

namespace tessaly::reference {

/// Largest normalised frequency that a design takes; a NaN ends here too.
inline constexpr double highestNormalisedFrequency = 0.458;

/// The frequency as a design takes it: 0 to 0.458, a NaN becomes 0.458.
double boundedFrequency(double normalisedFrequency);

/// One filter. Types: 0 low-pass, 1 high-pass, 2 band-pass, 3 notch, 4 peak, 5 low shelf,
/// 6 high shelf; any other type leaves the coefficients as they are.
struct Filter {
    double b0 = 0.0;
    double b1 = 0.0;
    double b2 = 0.0;
    double a1 = 0.0;
    double a2 = 0.0;
    double z1 = 0.0;
    double z2 = 0.0;

    Filter() = default;
    Filter(int type, double gainDb, double normalisedFrequency) {
        design(type, gainDb, normalisedFrequency);
    }

    /// New coefficients, running state kept. The frequency is bounded here.
    void design(int type, double gainDb, double normalisedFrequency);

    double run(double x) {
        const double y = x * b0 + z1;
        z1 = x * b1 + z2 - a1 * y;
        z2 = x * b2 - a2 * y;
        return y;
    }

    void clear() {
        z1 = 0.0;
        z2 = 0.0;
    }
};

}  // namespace tessaly::reference
