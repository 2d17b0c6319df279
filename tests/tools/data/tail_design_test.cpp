// The designs of all tails against a table of their own: volumes, onsets, decay, ratios.
#include "data/tail_design.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>

#include "data/data_error.h"
#include "data/sphere.h"

namespace tessaly::data {
namespace {

struct ExpectedTail {
    int preset;
    double mid;
    double volume;                // m3, 0 without walls all around
    double onset;                 // ms
    std::array<double, 6> times;  // s at 125, 500, 1000, 2000, 4000, 8000 Hz
    double directToReverb;        // dB
    bool byHand;
};

// clang-format off
constexpr std::array<ExpectedTail, 46> expectedTails = {{
    {15, 0.45, 134, 12, {0.53, 0.46, 0.44, 0.41, 0.37, 0.31}, -0.8, false},
    {16, 1.6, 25107, 158, {1.96, 1.63, 1.57, 1.40, 1.10, 0.69}, 12.0, false},
    {17, 0.6, 171, 13, {0.52, 0.60, 0.60, 0.56, 0.50, 0.38}, -0.9, false},
    {18, 0.55, 72, 9, {0.50, 0.55, 0.55, 0.54, 0.49, 0.39}, -4.3, false},
    {19, 0.55, 2082, 46, {0.85, 0.57, 0.53, 0.50, 0.45, 0.34}, 10.3, false},
    {20, 0.07, 16, 4, {0.12, 0.07, 0.07, 0.06, 0.05, 0.04}, -1.8, false},
    {21, 0.75, 350, 19, {0.84, 0.75, 0.75, 0.71, 0.63, 0.48}, 1.2, false},
    {22, 4.0, 8260, 91, {5.07, 4.19, 3.82, 3.28, 2.30, 1.11}, 7.6, false},
    {23, 0.4, 76, 9, {0.53, 0.41, 0.39, 0.35, 0.31, 0.24}, -2.7, false},
    {24, 1.2, 1422, 38, {1.35, 1.21, 1.19, 1.12, 0.96, 0.66}, 5.2, false},
    {25, 4.2, 236560, 349, {5.34, 4.40, 4.01, 3.42, 2.37, 1.13}, 12.0, false},
    {26, 3.2, 22942, 119, {3.99, 3.33, 3.07, 2.69, 1.98, 1.03}, 12.0, false},
    {27, 1.0, 267, 16, {1.12, 1.01, 0.99, 0.94, 0.82, 0.58}, -1.2, false},
    {28, 0.4, 169, 13, {0.53, 0.41, 0.39, 0.35, 0.31, 0.24}, 0.7, false},
    {29, 0.9, 0, 100, {0.73, 0.90, 0.90, 0.75, 0.54, 0.30}, 14.0, true},
    {30, 1.7, 16952, 130, {2.09, 1.73, 1.67, 1.49, 1.16, 0.71}, 12.0, false},
    {31, 1.5, 26411, 121, {1.31, 1.51, 1.49, 1.36, 1.13, 0.71}, 9.0, true},
    {32, 0.55, 645, 4, {0.79, 0.58, 0.52, 0.42, 0.31, 0.20}, 5.0, true},
    {33, 0.4, 0, 30, {0.32, 0.40, 0.40, 0.34, 0.25, 0.15}, 9.0, true},
    {34, 2.3, 31907, 121, {2.85, 2.35, 2.25, 1.97, 1.48, 0.84}, 12.0, false},
    {35, 2.3, 26411, 121, {2.85, 2.35, 2.25, 1.97, 1.48, 0.84}, 12.0, false},
    {36, 1.5, 242, 16, {1.70, 1.51, 1.49, 1.38, 1.16, 0.75}, -3.4, false},
    {37, 2.3, 26411, 121, {2.85, 2.35, 2.25, 1.97, 1.48, 0.84}, 12.0, false},
    {38, 2.1, 26411, 121, {2.60, 2.15, 2.06, 1.81, 1.38, 0.80}, 12.0, false},
    {39, 1.6, 645, 25, {1.81, 1.61, 1.59, 1.47, 1.22, 0.78}, 0.6, false},
    {40, 0.85, 645, 12, {0.82, 0.85, 0.85, 0.79, 0.67, 0.47}, 4.0, true},
    {41, 0.25, 100, 10, {0.22, 0.26, 0.24, 0.24, 0.21, 0.18}, 0.5, false},
    {42, 1.1, 645, 25, {0.96, 1.11, 1.09, 1.01, 0.87, 0.59}, 2.2, false},
    {43, 0.65, 645, 12, {0.63, 0.65, 0.65, 0.60, 0.53, 0.38}, 5.0, true},
    {44, 2.2, 26411, 4, {3.28, 2.33, 2.08, 1.63, 1.10, 0.58}, 6.0, true},
    {45, 0.55, 870, 12, {0.53, 0.55, 0.55, 0.51, 0.45, 0.33}, 5.0, true},
    {46, 1.2, 870, 4, {1.75, 1.27, 1.14, 0.91, 0.65, 0.38}, 5.0, true},
    {47, 2.1, 16072, 119, {2.56, 2.18, 2.03, 1.82, 1.45, 0.86}, 12.0, false},
    {48, 0.5, 645, 12, {0.48, 0.50, 0.50, 0.47, 0.41, 0.31}, 6.0, true},
    {49, 1.8, 5234, 72, {2.21, 1.84, 1.76, 1.57, 1.22, 0.74}, 9.1, false},
    {50, 2.3, 26411, 4, {3.43, 2.44, 2.17, 1.70, 1.14, 0.60}, 6.0, true},
    {51, 0.7, 129, 11, {0.64, 0.70, 0.70, 0.68, 0.62, 0.46}, -2.8, false},
    {52, 0.06, 7, 3, {0.10, 0.06, 0.06, 0.05, 0.05, 0.04}, -4.9, false},
    {53, 0.4, 104, 10, {0.44, 0.40, 0.40, 0.38, 0.35, 0.29}, -1.4, false},
    {54, 2.6, 9293, 96, {3.20, 2.70, 2.50, 2.22, 1.70, 0.95}, 10.0, false},
    {55, 0.75, 645, 25, {0.84, 0.75, 0.75, 0.71, 0.63, 0.48}, 3.8, false},
    {56, 0.25, 132, 11, {0.33, 0.26, 0.24, 0.22, 0.19, 0.16}, 1.7, false},
    {57, 0.45, 645, 25, {0.60, 0.46, 0.44, 0.39, 0.34, 0.27}, 6.1, false},
    {58, 0.85, 456, 21, {0.95, 0.85, 0.85, 0.80, 0.71, 0.52}, 1.8, false},
    {59, 1.8, 18228, 135, {2.21, 1.84, 1.76, 1.57, 1.22, 0.74}, 12.0, false},
    {60, 1.0, 2392, 49, {1.21, 1.02, 0.98, 0.89, 0.73, 0.51}, 8.3, false},
}};
// clang-format on

constexpr std::array<double, 6> timeHertz = {125.0, 500.0, 1000.0, 2000.0, 4000.0, 8000.0};

TEST(TailDesign, AllTailsHaveTheirVolumeOnsetDecayAndRatio) {
    ASSERT_EQ(tailDesigns().size(), expectedTails.size());
    for (const ExpectedTail& expected : expectedTails) {
        SCOPED_TRACE(expected.preset);
        const TailDesign& design = tailDesign(expected.preset);
        EXPECT_EQ(design.preset, expected.preset);
        EXPECT_DOUBLE_EQ(design.decay.mid(), expected.mid);
        EXPECT_NEAR(design.volume, expected.volume, 0.51);
        EXPECT_EQ(design.enclosed, expected.volume > 0.0);
        EXPECT_NEAR(1e3 * design.onsetSeconds, expected.onset, 0.51);
        EXPECT_DOUBLE_EQ(design.startSeconds, 0.4 * design.onsetSeconds);
        for (std::size_t i = 0; i < timeHertz.size(); ++i) {
            EXPECT_NEAR(design.decay.at(timeHertz[i]), expected.times[i], 0.0051) << timeHertz[i];
        }
        EXPECT_NEAR(design.directToReverb, expected.directToReverb, 0.051);
        EXPECT_EQ(design.directToReverbSet, expected.byHand);
    }
}

TEST(TailDesign, MidTimeIsTheGeometricMeanOf500And1000Hz) {
    for (const TailDesign& design : tailDesigns()) {
        const double mean = std::sqrt(design.decay.at(500.0) * design.decay.at(1000.0));
        EXPECT_NEAR(mean, design.decay.mid(), 1e-12) << design.preset;
    }
}

TEST(TailDesign, ReflectionsTakeTheirShareOfTheEnergyUnlessTheRatioIsSetByHand) {
    const TailDesign& room = tailDesign(15);
    const double left = std::exp(-11.0 * room.onsetSeconds / 0.45);
    EXPECT_NEAR(room.directToTail(), room.directToReverb - 10.0 * std::log10(left), 1e-12);
    EXPECT_DOUBLE_EQ(tailDesign(29).directToTail(), 14.0);
}

TEST(TailDesign, FramesAreRoundedUpAtEachRate) {
    EXPECT_EQ(storedTailFrames(tailDesign(15), 48000), 23147u);
    EXPECT_EQ(storedTailFrames(tailDesign(15), 44100), 21267u);
    EXPECT_EQ(storedTailFrames(tailDesign(15), 24000), 11574u);
    for (const TailDesign& design : tailDesigns()) {
        for (const int rate : {24000, 44100, 48000}) {
            const auto read = reverbFramesAt(rate, static_cast<int>(design.frames48000));
            const auto stored = static_cast<int>(storedTailFrames(design, rate));
            EXPECT_GE(stored, read) << design.preset << " at " << rate;
            EXPECT_LE(stored, read + 1) << design.preset << " at " << rate;
        }
    }
}

TEST(TailDesign, OtherPresetsHaveNone) {
    EXPECT_THROW(tailDesign(14), DataError);
    EXPECT_THROW(tailDesign(61), DataError);
}

TEST(DirectionWeights, CorridorsSoundAlongTheirAxisAndOpenPlacesFromTheHorizon) {
    const std::vector<double>& area = areaWeights();
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    const auto side = static_cast<std::size_t>(packedIndex(90, 0));
    const auto high = static_cast<std::size_t>(packedIndex(0, 25));
    EXPECT_EQ(directionWeights(tailDesign(15)), area);
    EXPECT_DOUBLE_EQ(directionWeights(tailDesign(27))[front], 1.25 * area[front]);
    EXPECT_NEAR(directionWeights(tailDesign(27))[side], 0.25 * area[side], 1e-12);
    for (const int preset : {29, 33}) {
        EXPECT_EQ(directionWeights(tailDesign(preset))[high], 0.0);
        EXPECT_EQ(directionWeights(tailDesign(preset))[front], area[front]);
    }
}

}  // namespace
}  // namespace tessaly::data
