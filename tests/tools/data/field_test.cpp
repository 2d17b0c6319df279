// Level curves: bands, means, interpolation to the grid, equalisation.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>

#include "data/data_error.h"
#include "data/target_field.h"
#include "tools/data/synthetic_head.h"

namespace tessaly::data {
namespace {

using testing::HasSubstr;

std::size_t entryAt(int phi, int theta) {
    return static_cast<std::size_t>(packedIndex(phi, theta));
}

TEST(LevelCurve, IsLinearBetweenBinsAndHeldBeyond) {
    const double curve[] = {0.0, 10.0, -10.0};
    EXPECT_DOUBLE_EQ(levelAt(curve, 3, 100.0, 0.0), 0.0);
    EXPECT_DOUBLE_EQ(levelAt(curve, 3, 100.0, 25.0), 2.5);
    EXPECT_DOUBLE_EQ(levelAt(curve, 3, 100.0, 150.0), 0.0);
    EXPECT_DOUBLE_EQ(levelAt(curve, 3, 100.0, 200.0), -10.0);
    EXPECT_DOUBLE_EQ(levelAt(curve, 3, 100.0, 9999.0), -10.0);
}

TEST(LevelCurve, BandLevelIsThePowerMeanOfItsBins) {
    std::vector<double> curve(200, -100.0);
    // 1000 Hz, 100 Hz a bin: the band runs from 890.9 to 1122.5 Hz, bins 9 to 11.
    curve[9] = 0.0;
    curve[10] = 10.0;
    curve[11] = -20.0;
    EXPECT_NEAR(bandLevel(curve.data(), curve.size(), 100.0, 0),
                10.0 * std::log10((1.0 + 10.0 + 0.01) / 3.0), 1e-12);
    EXPECT_DOUBLE_EQ(bandCentre(band8kHz), 8000.0);
    EXPECT_DOUBLE_EQ(bandCentre(band16kHz), 16000.0);
    EXPECT_NEAR(bandCentre(lowestBand), 250.0, 1e-9);
}

TEST(LevelCurve, DiffuseLevelWeighsByArea) {
    LevelCurves levels;
    levels.bins = 1;
    levels.binHertz = 1.0;
    levels.resize(packedOrder().size());
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        // Upper hemisphere +3.01 dB, lower one nothing, the horizon half: the mean is 1.
        const int theta = packedOrder()[entry].theta;
        const double power = theta > 0 ? 2.0 : theta < 0 ? 1e-20 : 1.0;
        levels.curve(entry, leftEar)[0] = 10.0 * std::log10(power);
        levels.curve(entry, rightEar)[0] = 10.0 * std::log10(power);
    }
    EXPECT_NEAR(diffuseLevel(levels)[0], 0.0, 1e-9);
}

TEST(Equalisation, BandEndsAreHeldAtTheMeanOfTheirNeighbourhood) {
    constexpr double binHertz = 10.0;
    std::vector<double> curve;
    for (int k = 0; k < 2300; ++k) {
        const double hertz = k * binHertz;
        curve.push_back(hertz <= 300.0     ? (hertz < 150.0 ? -60.0 : 4.0)
                        : hertz <= 18000.0 ? -2.0
                                           : -50.0);
    }
    holdBandEnds(curve.data(), curve.size(), binHertz);
    const auto at = [&curve](double hertz) {
        return curve[static_cast<std::size_t>(hertz / binHertz)];
    };
    EXPECT_DOUBLE_EQ(at(0.0), 4.0);
    EXPECT_DOUBLE_EQ(at(140.0), 4.0);
    EXPECT_DOUBLE_EQ(at(220.0), 4.0);
    EXPECT_DOUBLE_EQ(at(5000.0), -2.0);
    EXPECT_DOUBLE_EQ(at(18000.0), -2.0);
    EXPECT_NEAR(at(19250.0), -26.0, 1e-9);  // half way
    EXPECT_NEAR(at(20500.0), -2.0, 1e-9);
    EXPECT_NEAR(at(22000.0), -2.0, 1e-9);
}

TEST(Equalisation, TheSubtractedCurveIsLimited) {
    LevelCurves levels;
    levels.bins = 3;
    levels.binHertz = 100.0;
    levels.decibels = {1.0, 2.0, 3.0, 4.0, 5.0, 6.0};
    subtractLimited(levels, {1.0, 70.0, -70.0});
    EXPECT_EQ(levels.decibels, (std::vector<double>{0.0, -38.0, 43.0, 3.0, -35.0, 46.0}));
}

class SyntheticField : public testing::Test {
protected:
    GridField interpolate(const Measurement& head, const HrirOptions& options = {}) {
        measured = analyse(head, progress);
        return interpolateField(head, measured, options, progress);
    }

    Progress progress{stderr};
    MeasuredField measured;
};

TEST_F(SyntheticField, LevelsAndTimesOfTheSphereComeBackEverywhereMeasured) {
    HrirOptions options;
    options.symmetry = Symmetry::off;
    const GridField grid = interpolate(syntheticHead(), options);
    EXPECT_EQ(grid.lowestElevation, -45);
    EXPECT_EQ(grid.highestElevation, 90);
    EXPECT_FALSE(grid.symmetric);
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const GridEntry& at = packedOrder()[entry];
        const Direction direction{static_cast<double>(at.phi), static_cast<double>(at.theta)};
        EXPECT_NEAR(grid.field.itdSeconds[entry], woodworth(direction), 12e-6)
            << at.phi << " " << at.theta;
        if (at.theta < -45) {
            continue;
        }
        // Between points 15 degrees apart the chord of the cosine-shaped shadow is 0.1 dB off.
        const double expected = syntheticShadowDb * toVector(direction)[1];
        const double* left = grid.field.levels.curve(entry, leftEar);
        const double* right = grid.field.levels.curve(entry, rightEar);
        const double step = grid.field.levels.binHertz;
        EXPECT_NEAR(levelAt(left, grid.field.levels.bins, step, 1000.0), expected, 0.15);
        EXPECT_NEAR(levelAt(right, grid.field.levels.bins, step, 1000.0), -expected, 0.15);
    }
}

TEST_F(SyntheticField, MeasuredGridDirectionsAreMarked) {
    const Measurement head = syntheticHead();
    const GridField grid = interpolate(head);
    std::size_t hits = 0;
    for (std::size_t entry = 0; entry < grid.measuredAt.size(); ++entry) {
        const int source = grid.measuredAt[entry];
        if (source < 0) {
            continue;
        }
        ++hits;
        const Direction& direction = head.directions[static_cast<std::size_t>(source)];
        const GridEntry& at = packedOrder()[entry];
        EXPECT_LT(angleBetween(toVector(direction), toVector({static_cast<double>(at.phi),
                                                              static_cast<double>(at.theta)})),
                  1e-3);
    }
    EXPECT_EQ(hits, head.count());
}

TEST_F(SyntheticField, BelowTheLowestRingTheBlendEndsAtTheDarkerMeanOfTheRing) {
    const GridField grid = interpolate(syntheticHead());
    const LevelCurves& levels = grid.field.levels;
    double power = 0.0;
    for (int phi = -175; phi <= 180; phi += 5) {
        for (int ear = 0; ear < earCount; ++ear) {
            power += powerOf(levelAt(levels.curve(entryAt(phi, -45), ear), levels.bins,
                                     levels.binHertz, 3000.0));
        }
    }
    // 4 f^2 / (f^2 + 1500^2) is 3.2 dB at 3000 Hz.
    const double expected = 10.0 * std::log10(power / 144.0) - 3.2;
    EXPECT_NEAR(levelAt(levels.curve(0, leftEar), levels.bins, levels.binHertz, 3000.0), expected,
                0.01);
    EXPECT_NEAR(grid.field.itdSeconds[0], 0.0, 1e-9);
    // Half way down the weights are equal: u = 20 / 45 is the nearest ring, v = u^2 (3 - 2 u).
    const double u = 20.0 / 45.0;
    const double v = u * u * (3.0 - 2.0 * u);
    const double edge =
        levelAt(levels.curve(entryAt(90, -45), leftEar), levels.bins, levels.binHertz, 3000.0);
    EXPECT_NEAR(
        levelAt(levels.curve(entryAt(90, -65), leftEar), levels.bins, levels.binHertz, 3000.0),
        (1.0 - v) * edge + v * expected, 0.01);
}

TEST_F(SyntheticField, AGapAboveIsFilledWithoutShadow) {
    const GridField grid = interpolate(syntheticHead(15, -45, 60));
    EXPECT_EQ(grid.highestElevation, 60);
    const LevelCurves& levels = grid.field.levels;
    double power = 0.0;
    for (int phi = -175; phi <= 180; phi += 5) {
        for (int ear = 0; ear < earCount; ++ear) {
            power += powerOf(
                levelAt(levels.curve(entryAt(phi, 60), ear), levels.bins, levels.binHertz, 3000.0));
        }
    }
    EXPECT_NEAR(
        levelAt(levels.curve(entryAt(0, 90), rightEar), levels.bins, levels.binHertz, 3000.0),
        10.0 * std::log10(power / 144.0), 0.01);
}

TEST_F(SyntheticField, SymmetricSetsAreAveragedExactlyAndOthersOnRequest) {
    const GridField grid = interpolate(syntheticHead());
    EXPECT_TRUE(grid.symmetric);
    EXPECT_LT(grid.mirrorDecibels, 0.01);
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const auto mirror = static_cast<std::size_t>(mirrorIndex(static_cast<int>(entry)));
        EXPECT_EQ(grid.field.itdSeconds[entry], -grid.field.itdSeconds[mirror]);
        EXPECT_EQ(grid.field.levels.curve(entry, leftEar)[100],
                  grid.field.levels.curve(mirror, rightEar)[100]);
    }
    Measurement lopsided = syntheticHead();
    for (std::size_t i = 0; i < lopsided.count(); ++i) {
        for (std::size_t n = 0; n < lopsided.taps; ++n) {
            lopsided.samples[i * earCount * lopsided.taps + n] *= 1.5;  // 3.5 dB at the left
        }
    }
    EXPECT_FALSE(interpolate(lopsided).symmetric);
    HrirOptions options;
    options.symmetry = Symmetry::on;
    const GridField forced = interpolate(lopsided, options);
    EXPECT_TRUE(forced.symmetric);
    // 3.52 dB where measured, less towards the lower pole, whose level both sides share.
    EXPECT_NEAR(forced.mirrorDecibels, 3.4, 0.1);
    EXPECT_EQ(forced.field.levels.curve(entryAt(40, 0), leftEar)[100],
              forced.field.levels.curve(entryAt(-40, 0), rightEar)[100]);
}

TEST_F(SyntheticField, TheLowestElevationCanBeRaisedButNotLowered) {
    HrirOptions options;
    options.lowestElevation = -22.0;
    EXPECT_EQ(interpolate(syntheticHead(), options).lowestElevation, -20);
    options.lowestElevation = -60.0;
    try {
        interpolate(syntheticHead(), options);
        FAIL() << "accepted";
    } catch (const DataError& error) {
        EXPECT_THAT(error.what(), HasSubstr("expected -45 to 0"));
    }
}

TEST_F(SyntheticField, SetsThatDoNotCloseAroundTheHeadAreRefused) {
    const auto refusal = [this](const Measurement& head) -> std::string {
        try {
            interpolate(head);
        } catch (const DataError& error) {
            return error.what();
        }
        return "";
    };
    EXPECT_THAT(refusal(syntheticHead(3, 0, 0)), HasSubstr("do not close around the head"));
    EXPECT_THAT(refusal(syntheticHead(10, -40, 10)), HasSubstr("do not close around the head"));
    Measurement open = syntheticHead();
    for (std::size_t i = open.count(); i-- > 0;) {
        const double azimuth = open.directions[i].azimuth;
        if (azimuth > 120.0 && azimuth < 240.0) {
            open.directions.erase(open.directions.begin() + static_cast<std::ptrdiff_t>(i));
            open.extraSeconds.pop_back();
            const auto first =
                open.samples.begin() + static_cast<std::ptrdiff_t>(i * earCount * open.taps);
            open.samples.erase(first, first + static_cast<std::ptrdiff_t>(earCount * open.taps));
        }
    }
    EXPECT_THAT(refusal(open), HasSubstr("do not close around the head"));
}

TEST_F(SyntheticField, EqualisedSetsHaveAFlatDiffuseFieldAndTheFrontAtZero) {
    const Measurement head = syntheticHead();
    const TargetField target = buildTarget(head, {}, progress);
    const LevelCurves& levels = target.grid.field.levels;
    EXPECT_NEAR(frontalLevel(levels), 0.0, 1e-9);
    const std::vector<double> diffuse = diffuseLevel(levels);
    const double middle = levelAt(diffuse.data(), diffuse.size(), levels.binHertz, 1000.0);
    for (double hertz = 310.0; hertz < 17900.0; hertz += 97.0) {
        EXPECT_NEAR(levelAt(diffuse.data(), diffuse.size(), levels.binHertz, hertz), middle, 0.01)
            << hertz;
    }
    HrirOptions louder;
    louder.diffuseFieldEqualisation = false;
    louder.gainDb = -3.0;
    const TargetField plain = buildTarget(head, louder, progress);
    EXPECT_NEAR(frontalLevel(plain.grid.field.levels), -3.0, 1e-9);
    EXPECT_EQ(plain.equalisation.subtracted, std::vector<double>(levels.bins, 0.0));
}

}  // namespace
}  // namespace tessaly::data
