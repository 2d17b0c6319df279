// The seven designs against their analogue prototypes, the recursion, and the frequency bound.
#include "engine/biquad.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <complex>
#include <cstdint>
#include <limits>
#include <numbers>
#include <random>
#include <vector>

namespace tessaly::test {
namespace {

using Complex = std::complex<double>;

constexpr std::array<double, 3> sampleRates = {24000.0, 44100.0, 48000.0};
constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double infinity = std::numeric_limits<double>::infinity();

/// The analogue section at s, cut-off at s = j. A cut is one over the boost of the same size.
Complex prototype(std::int32_t type, double gainDb, Complex s) {
    const double q = 0.707;
    const double v = std::pow(10.0, std::fabs(gainDb) / 20.0);
    const Complex resonator = s * s + s / q + 1.0;
    const Complex flat = s * s + std::sqrt(2.0) * s + 1.0;
    Complex boost;
    switch (type) {
        case 0:
            return 1.0 / resonator;
        case 1:
            return s * s / resonator;
        case 2:
            return s / q / resonator;
        case 3:
            return (s * s + 1.0) / resonator;
        case 4:
            boost = (s * s + v * s / q + 1.0) / resonator;
            break;
        case 5:
            boost = (s * s + std::sqrt(2.0 * v) * s + v) / flat;
            break;
        default:
            boost = (v * s * s + std::sqrt(2.0 * v) * s + 1.0) / flat;
            break;
    }
    return std::signbit(gainDb) && gainDb != 0.0 ? 1.0 / boost : boost;
}

/// Response of the coefficients at a frequency in cycles per sample.
Complex response(const Biquad& filter, double frequency) {
    const Complex z = std::polar(1.0, -2.0 * std::numbers::pi * frequency);
    return (filter.b0 + filter.b1 * z + filter.b2 * z * z) /
           (1.0 + filter.a1 * z + filter.a2 * z * z);
}

struct Design {
    std::int32_t type;
    double gainDb;
    const char* name;
};

constexpr std::array<Design, 13> designs = {{{0, 0.0, "low-pass"},
                                             {1, 0.0, "high-pass"},
                                             {2, 0.0, "band-pass"},
                                             {3, 0.0, "notch"},
                                             {4, 7.5, "peak boost"},
                                             {4, -7.5, "peak cut"},
                                             {4, 0.0, "peak flat"},
                                             {5, 4.67, "low shelf boost"},
                                             {5, -4.67, "low shelf cut"},
                                             {5, -0.0, "low shelf flat"},
                                             {6, 12.0, "high shelf boost"},
                                             {6, -12.0, "high shelf cut"},
                                             {6, 0.0, "high shelf flat"}}};

TEST(BiquadDesign, EqualsTheBilinearTransformOfThePrototype) {
    for (const double sampleRate : sampleRates) {
        for (const double cutOff : {10.0, 180.0, 400.0, 3000.0, 8000.0, 10500.0}) {
            for (const Design& design : designs) {
                const double f = cutOff / sampleRate;
                const Biquad filter(design.type, design.gainDb, f);
                const double k = std::tan(std::numbers::pi * f);
                for (const double at : {0.5 * cutOff, cutOff, 1.1 * cutOff, 0.45 * sampleRate}) {
                    const double probe = at / sampleRate;
                    // z = e^(j w) puts s on the imaginary axis at tan(w / 2) / K.
                    const Complex s(0.0, std::tan(std::numbers::pi * probe) / k);
                    const Complex expected = prototype(design.type, design.gainDb, s);
                    // Coefficients of a cut-off near 0 cancel: at 10 Hz about 1e-6 remains of 1.
                    EXPECT_NEAR(std::abs(response(filter, probe) - expected), 0.0, 1e-8)
                        << design.name << " at " << cutOff << " of " << sampleRate << ", " << at;
                }
            }
        }
    }
}

TEST(BiquadDesign, LowPassIsDownToItsQAtTheCutOff) {
    const Biquad filter(Biquad::lowPass, 0.0, 0.1);
    EXPECT_NEAR(std::abs(response(filter, 0.1)), 0.707, 1e-12) << "the literal, not 1 / sqrt(2)";
    EXPECT_EQ(filter.Q, 0.707);
}

TEST(BiquadDesign, ShelvesIgnoreQ) {
    for (const std::int32_t type : {Biquad::lowShelf, Biquad::highShelf}) {
        Biquad filter(type, -4.67, 0.01);
        const Biquad before = filter;
        filter.Q = 3.0;
        filter.design();
        EXPECT_EQ(filter.b0, before.b0);
        EXPECT_EQ(filter.a1, before.a1);
        EXPECT_EQ(filter.a2, before.a2);
    }
}

TEST(BiquadDesign, CutExchangesNumeratorAndDenominatorOfTheBoost) {
    for (const std::int32_t type : {Biquad::peak, Biquad::lowShelf, Biquad::highShelf}) {
        const Biquad boost(type, 9.0, 0.05);
        const Biquad cut(type, -9.0, 0.05);
        EXPECT_NEAR(cut.b0, 1.0 / boost.b0, 1e-12);
        EXPECT_NEAR(cut.b1, boost.a1 / boost.b0, 1e-12);
        EXPECT_NEAR(cut.b2, boost.a2 / boost.b0, 1e-12);
        EXPECT_NEAR(cut.a1, boost.b1 / boost.b0, 1e-12);
        EXPECT_NEAR(cut.a2, boost.b2 / boost.b0, 1e-12);
    }
}

TEST(BiquadDesign, GainOfEitherZeroIsUnity) {
    for (const std::int32_t type : {Biquad::peak, Biquad::lowShelf, Biquad::highShelf}) {
        for (const double gain : {0.0, -0.0}) {
            const Biquad filter(type, gain, 0.02);
            EXPECT_NEAR(filter.b0, 1.0, 1e-15);
            EXPECT_NEAR(filter.b1, filter.a1, 1e-15);
            EXPECT_NEAR(filter.b2, filter.a2, 1e-15);
        }
    }
}

TEST(BiquadDesign, TypesOutsideTheSevenDesignNothing) {
    for (const std::int32_t type : {7, 8, 1000, -1}) {
        const Biquad fresh(type, 6.0, 0.1);
        EXPECT_EQ(fresh.b0, 0.0);
        EXPECT_EQ(fresh.b1, 0.0);
        EXPECT_EQ(fresh.b2, 0.0);
        EXPECT_EQ(fresh.a1, 0.0);
        EXPECT_EQ(fresh.a2, 0.0);

        Biquad filter(Biquad::highPass, 0.0, 0.1);
        const Biquad before = filter;
        filter.filterType = type;
        filter.redesign(0.3);
        EXPECT_EQ(filter.normalisedFrequency, 0.3);
        EXPECT_EQ(filter.b0, before.b0);
        EXPECT_EQ(filter.b1, before.b1);
        EXPECT_EQ(filter.b2, before.b2);
        EXPECT_EQ(filter.a1, before.a1);
        EXPECT_EQ(filter.a2, before.a2);
    }
}

TEST(BiquadFrequency, IsBoundedBeforeItIsStored) {
    const double justBelow = std::nextafter(0.458, 0.0);
    const std::array<std::array<double, 2>, 9> cases = {{{0.458, 0.458},
                                                         {justBelow, justBelow},
                                                         {0.5, 0.458},
                                                         {infinity, 0.458},
                                                         {nan, 0.458},
                                                         {-1e-9, 0.0},
                                                         {-infinity, 0.0},
                                                         {0.0, 0.0},
                                                         {0.25, 0.25}}};
    for (const auto& [given, stored] : cases) {
        EXPECT_EQ(Biquad(Biquad::lowPass, 0.0, given).normalisedFrequency, stored) << given;
        Biquad filter(Biquad::lowPass, 0.0, 0.1);
        filter.redesign(given);
        EXPECT_EQ(filter.normalisedFrequency, stored) << given;
        filter.redesign(Biquad::highPass, given);
        EXPECT_EQ(filter.normalisedFrequency, stored) << given;
    }
}

TEST(BiquadFrequency, TwentyKilohertzAtTheLowRateIsBounded) {
    Biquad filter(Biquad::lowPass, 0.0, Biquad::normalise(20000.0f, 24000));
    EXPECT_EQ(filter.normalisedFrequency, 0.458);
    const Biquad before = filter;
    filter.follow(Biquad::normalise(20000.0f, 24000));
    EXPECT_EQ(filter.b0, before.b0) << "designed again, to the same result";
    EXPECT_EQ(filter.normalisedFrequency, 0.458);
}

TEST(BiquadFrequency, QuotientIsSinglePrecision) {
    const float quotient = 400.0f / 44100.0f;
    EXPECT_EQ(Biquad::normalise(400.0f, 44100), static_cast<double>(quotient));
    EXPECT_NE(Biquad::normalise(400.0f, 44100), 400.0 / 44100.0);
}

TEST(BiquadRedesign, KeepsTheStateAndFollowSkipsTheStoredFrequency) {
    Biquad filter(Biquad::lowShelf, 4.67, 0.02);
    filter.process(0.75f);
    const double z1 = filter.z1;
    const double z2 = filter.z2;
    ASSERT_NE(z1, 0.0);
    filter.gainDb = -4.67;
    filter.redesign(0.02);
    EXPECT_EQ(filter.z1, z1);
    EXPECT_EQ(filter.z2, z2);

    filter.b0 = 42.0;
    filter.follow(0.02);
    EXPECT_EQ(filter.b0, 42.0) << "the stored frequency is not designed again";
    filter.follow(0.03);
    EXPECT_NE(filter.b0, 42.0);
    EXPECT_EQ(filter.z1, z1);

    filter.Q = 5.0;
    filter.redesign(Biquad::highPass, 0.1);
    EXPECT_EQ(filter.filterType, Biquad::highPass);
    EXPECT_EQ(filter.Q, 0.707);
    EXPECT_EQ(filter.gainDb, 0.0);
    EXPECT_EQ(filter.z2, z2);
}

TEST(BiquadRecursion, EqualsTheDifferenceEquation) {
    std::mt19937 random(11);
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    for (const Design& design : designs) {
        Biquad filter(design.type, design.gainDb, 0.07);
        std::array<double, 3> x{};
        std::array<double, 3> y{};
        for (int n = 0; n < 500; ++n) {
            const float sample = noise(random);
            x = {static_cast<double>(sample), x[0], x[1]};
            const double out = filter.b0 * x[0] + filter.b1 * x[1] + filter.b2 * x[2] -
                               filter.a1 * y[0] - filter.a2 * y[1];
            y = {out, y[0], y[1]};
            // Half a single-precision step at magnitudes below 8.
            EXPECT_NEAR(static_cast<double>(filter.process(sample)), out, 2.4e-7) << design.name;
        }
    }
}

TEST(BiquadRecursion, BlockEqualsSampleBySampleAndCarriesTheState) {
    std::mt19937 random(12);
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    Biquad oneByOne(Biquad::lowPass, 0.0, 0.1);
    Biquad inBlocks = oneByOne;
    for (const int count : {1, 0, 7, 64, 255}) {
        std::vector<float> samples(static_cast<std::size_t>(count));
        for (float& sample : samples) {
            sample = noise(random);
        }
        std::vector<float> expected = samples;
        for (float& sample : expected) {
            sample = oneByOne.process(sample);
        }
        inBlocks.processInPlace(samples.data(), count);
        EXPECT_EQ(samples, expected);
        EXPECT_EQ(inBlocks.z1, oneByOne.z1);
        EXPECT_EQ(inBlocks.z2, oneByOne.z2);
    }
    inBlocks.clear();
    EXPECT_EQ(inBlocks.z1, 0.0);
    EXPECT_EQ(inBlocks.z2, 0.0);
    EXPECT_EQ(inBlocks.b0, oneByOne.b0);
}

TEST(BiquadRecursion, DefaultIsSilent) {
    Biquad filter;
    EXPECT_EQ(filter.normalisedFrequency, 0.0);
    for (int n = 0; n < 10; ++n) {
        EXPECT_EQ(filter.process(1.0f), 0.0f);
    }
}

}  // namespace
}  // namespace tessaly::test
