// Minimum phase against filters whose phase is known.
#include "data/minimum_phase.h"

#include <gtest/gtest.h>

#include <cmath>

namespace tessaly::data {
namespace {

constexpr std::size_t length = 1024;

std::vector<double> minimumPhaseOf(const std::vector<double>& taps) {
    RealTransform transform(length);
    MinimumPhase minimumPhase(transform);
    std::vector<double> padded(length, 0.0);
    std::copy(taps.begin(), taps.end(), padded.begin());
    std::vector<Complex> spectrum(transform.bins());
    transform.forward(padded.data(), spectrum.data());
    std::vector<double> logMagnitude;
    for (const Complex& value : spectrum) {
        logMagnitude.push_back(std::log(std::abs(value)));
    }
    minimumPhase.logSpectrum(logMagnitude.data(), spectrum.data());
    for (Complex& value : spectrum) {
        value = std::exp(value);
    }
    transform.inverse(spectrum.data(), padded.data());
    return padded;
}

TEST(MinimumPhase, ZerosOutsideTheUnitCircleMoveInside) {
    // (1 + 2 z)(1 - 0.25 z): the first factor's minimum-phase twin is 2 + z.
    const std::vector<double> found = minimumPhaseOf({1.0, 1.75, -0.5});
    const double expected[] = {2.0, 0.5, -0.25};
    for (std::size_t i = 0; i < length; ++i) {
        EXPECT_NEAR(found[i], i < 3 ? expected[i] : 0.0, 1e-12) << i;
    }
}

TEST(MinimumPhase, MinimumPhaseFiltersStayAsTheyAreWhateverTheirDelay) {
    const std::vector<double> filter = {1.0, -0.6, 0.3, 0.1};
    std::vector<double> delayed(17, 0.0);
    delayed.insert(delayed.end(), filter.begin(), filter.end());
    const std::vector<double> found = minimumPhaseOf(delayed);
    for (std::size_t i = 0; i < length; ++i) {
        EXPECT_NEAR(found[i], i < filter.size() ? filter[i] : 0.0, 1e-12) << i;
    }
}

TEST(MinimumPhase, NeperPerDecibelIsTheLogarithmOfTenByTwenty) {
    EXPECT_DOUBLE_EQ(neperPerDecibel, std::log(10.0) / 20.0);
}

}  // namespace
}  // namespace tessaly::data
