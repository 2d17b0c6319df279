// Designs of the reference filter: bilinear transform of the analogue prototypes, K = tan(pi f).
#include "support/reference/reference_filter.h"

#include <cmath>
#include <numbers>

namespace tessaly::reference {

namespace {

/// A section before normalisation; the leading denominator term is divided out at the end.
struct Section {
    double b0;
    double b1;
    double b2;
    double a0;
    double a1;
    double a2;
};

/// Numerator and denominator change places: how a cut is made from the boost of the same size.
Section mirrored(const Section& s) { return {s.a0, s.a1, s.a2, s.b0, s.b1, s.b2}; }

}  // namespace

double boundedFrequency(double normalisedFrequency) {
    if (!(normalisedFrequency < highestNormalisedFrequency)) {
        return highestNormalisedFrequency;
    }
    return normalisedFrequency < 0.0 ? 0.0 : normalisedFrequency;
}

void Filter::design(int type, double gainDb, double normalisedFrequency) {
    constexpr double q = 0.707;  // the literal, not 1 / sqrt(2)
    const double k = std::tan(std::numbers::pi * boundedFrequency(normalisedFrequency));
    const double kk = k * k;
    const double v = std::pow(10.0, std::abs(gainDb) * 0.05);
    const double root2 = std::numbers::sqrt2;
    const Section resonator{0.0, 0.0, 0.0, 1.0 + k / q + kk, 2.0 * (kk - 1.0), 1.0 - k / q + kk};
    Section s = resonator;
    switch (type) {
        case 0:
            s.b0 = kk;
            s.b1 = 2.0 * kk;
            s.b2 = kk;
            break;
        case 1:
            s.b0 = 1.0;
            s.b1 = -2.0;
            s.b2 = 1.0;
            break;
        case 2:
            s.b0 = k / q;
            s.b1 = 0.0;
            s.b2 = -k / q;
            break;
        case 3:
            s.b0 = 1.0 + kk;
            s.b1 = 2.0 * (kk - 1.0);
            s.b2 = 1.0 + kk;
            break;
        case 4:
            s.b0 = 1.0 + v * k / q + kk;
            s.b1 = 2.0 * (kk - 1.0);
            s.b2 = 1.0 - v * k / q + kk;
            break;
        case 5:
            s = {1.0 + std::sqrt(2.0 * v) * k + v * kk,
                 2.0 * (v * kk - 1.0),
                 1.0 - std::sqrt(2.0 * v) * k + v * kk,
                 1.0 + root2 * k + kk,
                 2.0 * (kk - 1.0),
                 1.0 - root2 * k + kk};
            break;
        case 6:
            s = {v + std::sqrt(2.0 * v) * k + kk,
                 2.0 * (kk - v),
                 v - std::sqrt(2.0 * v) * k + kk,
                 1.0 + root2 * k + kk,
                 2.0 * (kk - 1.0),
                 1.0 - root2 * k + kk};
            break;
        default:
            return;
    }
    if (type >= 4 && gainDb < 0.0) {
        s = mirrored(s);
    }
    b0 = s.b0 / s.a0;
    b1 = s.b1 / s.a0;
    b2 = s.b2 / s.a0;
    a1 = s.a1 / s.a0;
    a2 = s.a2 / s.a0;
}

}  // namespace tessaly::reference
