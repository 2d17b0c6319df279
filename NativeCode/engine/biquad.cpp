// Coefficient designs of the second-order filter.
#include "engine/biquad.h"

#include <cmath>
#include <numbers>

namespace tessaly {

namespace {

constexpr double sqrtTwo = std::numbers::sqrt2;  // the shelves' stand-in for 1 / Q
constexpr double butterworthLikeQ = 0.707;       // this literal, not 1 / sqrt(2)

/// Numerator and denominator of a section before the division by the leading denominator term.
struct Polynomials {
    double n0;
    double n1;
    double n2;
    double d0;
    double d1;
    double d2;
};

/// A cut is the boost with numerator and denominator exchanged.
Polynomials mirrored(const Polynomials& boost, double gainDb) noexcept {
    if (gainDb < 0.0) {
        return {boost.d0, boost.d1, boost.d2, boost.n0, boost.n1, boost.n2};
    }
    return boost;
}

}  // namespace

Biquad::Biquad(std::int32_t type, double gain, double frequency) noexcept
    : normalisedFrequency(boundFrequency(frequency)),
      filterType(type),
      Q(butterworthLikeQ),
      gainDb(gain) {
    design();
}

double Biquad::boundFrequency(double frequency) noexcept {
    // Written so that a NaN takes the upper bound.
    if (!(frequency < frequencyBound)) {
        return frequencyBound;
    }
    return frequency < 0.0 ? 0.0 : frequency;
}

void Biquad::design() noexcept {
    const double K = std::tan(std::numbers::pi * normalisedFrequency);
    const double K2 = K * K;

    if (filterType >= lowPass && filterType <= notch) {
        const double norm = 1.0 / (1.0 + K / Q + K2);
        a1 = 2.0 * (K2 - 1.0) * norm;
        a2 = (1.0 - K / Q + K2) * norm;
        switch (filterType) {
            case lowPass:
                b0 = K2 * norm;
                b1 = 2.0 * b0;
                b2 = b0;
                break;
            case highPass:
                b0 = norm;
                b1 = -2.0 * norm;
                b2 = norm;
                break;
            case bandPass:
                b0 = (K / Q) * norm;
                b1 = 0.0;
                b2 = -b0;
                break;
            default:  // notch
                b0 = (1.0 + K2) * norm;
                b1 = a1;
                b2 = b0;
                break;
        }
        return;
    }

    // Only the sign of the gain tells boost from cut; negative zero is a boost.
    const double V = std::pow(10.0, std::fabs(gainDb) * 0.05);
    const double S = sqrtTwo * K;
    const double T = std::sqrt(2.0 * V) * K;
    Polynomials section{};
    switch (filterType) {
        case peak: {
            const double P = K / Q;
            const double W = V * K / Q;
            const double middle = 2.0 * (K2 - 1.0);
            section = mirrored(
                {1.0 + W + K2, middle, 1.0 - W + K2, 1.0 + P + K2, middle, 1.0 - P + K2}, gainDb);
            break;
        }
        case lowShelf: {
            const double VK = V * K2;
            section = mirrored({1.0 + T + VK, 2.0 * (VK - 1.0), 1.0 - T + VK, 1.0 + S + K2,
                                2.0 * (K2 - 1.0), 1.0 - S + K2},
                               gainDb);
            break;
        }
        case highShelf:
            section = mirrored({V + T + K2, 2.0 * (K2 - V), V - T + K2, 1.0 + S + K2,
                                2.0 * (K2 - 1.0), 1.0 - S + K2},
                               gainDb);
            break;
        default:
            return;
    }
    const double norm = 1.0 / section.d0;
    b0 = section.n0 * norm;
    b1 = section.n1 * norm;
    b2 = section.n2 * norm;
    a1 = section.d1 * norm;
    a2 = section.d2 * norm;
}

void Biquad::processInPlace(float* samples, int count) noexcept {
    Biquad running = *this;  // a local copy stays in registers: `samples` cannot alias it
    for (int i = 0; i < count; ++i) {
        samples[i] = running.process(samples[i]);
    }
    z1 = running.z1;
    z2 = running.z2;
}

}  // namespace tessaly
