// Responses made from flat curves: place, gain, window.
#include "data/synthesis.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>

#include "data/interaural_time.h"

namespace tessaly::data {
namespace {

TEST(Window, FadesThreeSamplesInAndTheEndOut) {
    std::vector<double> ones(64, 1.0);
    applyWindow(ones.data(), ones.size(), 44100);
    const auto ramp = [](double place) { return 0.5 - 0.5 * std::cos(std::numbers::pi * place); };
    EXPECT_DOUBLE_EQ(ones[0], ramp(0.5 / 3.0));
    EXPECT_DOUBLE_EQ(ones[2], ramp(2.5 / 3.0));
    EXPECT_EQ(ones[3], 1.0);
    EXPECT_EQ(ones[64 - 17], 1.0);
    EXPECT_LT(ones[64 - 16], 1.0);  // 0.36 ms are 16 samples
    EXPECT_DOUBLE_EQ(ones[63], ramp(0.5 / 16.0));
}

TEST(Window, LengthFollowsTheRate) {
    const struct {
        int rate;
        int faded;
    } cases[] = {{24000, 9}, {44100, 16}, {48000, 17}};
    for (const auto& item : cases) {
        std::vector<double> ones(70, 1.0);
        applyWindow(ones.data(), ones.size(), item.rate);
        EXPECT_EQ(std::count_if(ones.begin() + 3, ones.end(), [](double x) { return x < 1.0; }),
                  item.faded)
            << item.rate;
    }
}

class SynthesisRate : public testing::TestWithParam<int> {};

/// A field of one level with the sphere's time differences.
ResponseField flatField(double level) {
    ResponseField field;
    field.levels.bins = 2049;
    field.levels.binHertz = 44100.0 / 4096.0;
    field.levels.decibels.assign(packedOrder().size() * earCount * field.levels.bins, level);
    for (const GridEntry& at : packedOrder()) {
        field.itdSeconds.push_back(
            woodworth({static_cast<double>(at.phi), static_cast<double>(at.theta)}));
    }
    return field;
}

TEST_P(SynthesisRate, FlatCurvesGiveImpulsesAtTheEarsDelaysWithTheCurvesGain) {
    const int rate = GetParam();
    Progress progress(stderr);
    const HrirSet set = synthesise(flatField(6.0), rate, 96, progress);
    ASSERT_EQ(set.sampleRate, rate);
    ASSERT_EQ(set.pairs.size(), packedOrder().size() * 96 * 2);
    for (const auto& [phi, theta] : {std::pair{0, 0}, {90, 0}, {-90, 0}, {45, 30}, {180, -60}}) {
        const auto entry = static_cast<std::size_t>(packedIndex(phi, theta));
        const EarDelays delays =
            earDelays(woodworth({static_cast<double>(phi), static_cast<double>(theta)}));
        for (int ear = 0; ear < earCount; ++ear) {
            // The centre of gravity of the samples is the delay, their sum the gain at 0 Hz.
            double sum = 0.0;
            double moment = 0.0;
            const std::vector<double> response = set.response(entry, ear);
            for (std::size_t i = 0; i < response.size(); ++i) {
                sum += response[i];
                moment += static_cast<double>(i) * response[i];
            }
            const double own = ear == leftEar ? delays.left : delays.right;
            const double place = (own + 0.0875 / 343.0 + 0.25e-3) * rate;
            EXPECT_NEAR(sum, std::pow(10.0, 6.0 / 20.0), 0.01) << phi << " " << theta;
            EXPECT_NEAR(moment / sum, place, 0.15) << phi << " " << theta;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Rates, SynthesisRate, testing::Values(24000, 44100, 48000));

}  // namespace
}  // namespace tessaly::data
