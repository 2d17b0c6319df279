// Gains by distance, the slew limit and the flags that a distance change raises.
#include "engine/distance_law.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <limits>

namespace tessaly::test {
namespace {

constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();
constexpr double fewRoundings = 5e-7;  // relative, of a handful of single-precision operations

struct Flags {
    bool filterChange = false;
    bool forceUpdate = false;
};

EffectiveSettings withReflections() {
    EffectiveSettings switches;
    switches.qvFlexReflections = true;
    return switches;
}

/// A fresh law after one update to `distance`.
DistanceLaw lawAt(float distance, EffectiveSettings switches = withReflections()) {
    DistanceLaw law;
    law.distanceNew = distance;
    Flags flags;
    law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
    return law;
}

double fadeAt(double d) { return d > 7.0 ? std::fmax(0.0, 1.0 - (d - 7.0) / 21.0) : 1.0; }

double directAt(double d) {
    const double g = d > 1.0 ? std::pow(d + 0.7, 0.75) + 0.3265 : std::pow(d + 0.4, 0.75) + 0.22;
    return fadeAt(d) / g;
}

double reverbAt(double d) {
    double gain = d > 13.7 ? (13.7 / d) * (13.7 / d) : 1.0;
    if (d > 30.0) {
        gain *= 1.0 - (d - 30.0) / 10.0;
    }
    return std::fmax(gain, 0.0);
}

TEST(DistanceLaw, GainsFollowTheirLaws) {
    for (int step = 1; step <= 500; ++step) {
        const float distance = static_cast<float>(step) * 0.1f;
        const double d = static_cast<double>(distance);
        const DistanceLaw law = lawAt(distance);
        // The fades end in 0: there a rounded slope is compared on the scale of 1.
        EXPECT_NEAR(static_cast<double>(law.directGain), directAt(d), fewRoundings) << d;
        EXPECT_NEAR(static_cast<double>(law.earlyDistanceGain), fadeAt(d), fewRoundings) << d;
        EXPECT_NEAR(static_cast<double>(law.reverbDistanceGain), reverbAt(d), fewRoundings) << d;
    }
}

TEST(DistanceLaw, NearestIsTenCentimetres) {
    for (const float asked : {0.0f, -3.0f, 0.05f, -infinity}) {
        const DistanceLaw law = lawAt(asked);
        EXPECT_EQ(law.distance, 0.1f);
        EXPECT_NEAR(static_cast<double>(law.directGain), 1.0 / (std::pow(0.5, 0.75) + 0.22), 1e-6);
    }
    EXPECT_EQ(lawAt(0.1f).distance, 0.1f);
    EXPECT_EQ(lawAt(0.11f).distance, 0.11f);
}

TEST(DistanceLaw, DirectGainStepsAtOneMetre) {
    const float above = std::nextafter(1.0f, 2.0f);
    const double nearGain = static_cast<double>(lawAt(1.0f).directGain);
    const double farGain = static_cast<double>(lawAt(above).directGain);
    EXPECT_NEAR(1.0 / nearGain, std::pow(1.4, 0.75) + 0.22, 1e-6);
    EXPECT_NEAR(1.0 / farGain, std::pow(1.7, 0.75) + 0.3265, 1e-6);
    EXPECT_NEAR(20.0 * std::log10(nearGain / farGain), 1.6, 0.05);
}

TEST(DistanceLaw, LimitsThemselvesAreUntouched) {
    EXPECT_NEAR(static_cast<double>(lawAt(7.0f).directGain), 1.0 / (std::pow(7.7, 0.75) + 0.3265),
                1e-7);
    EXPECT_EQ(lawAt(7.0f).earlyDistanceGain, 1.0f);
    EXPECT_EQ(lawAt(13.7f).reverbDistanceGain, 1.0f);
    EXPECT_LT(lawAt(std::nextafter(13.7f, 14.0f)).reverbDistanceGain, 1.0f);
    EXPECT_NEAR(static_cast<double>(lawAt(30.0f).reverbDistanceGain), std::pow(13.7 / 30.0, 2.0),
                1e-7);
}

TEST(DistanceLaw, OnlyTheTailIsLeftFromTwentyEightMetresOnAndNothingFromForty) {
    for (const float distance : {28.0f, 30.0f, 39.0f, 40.0f, 1000.0f, 1e30f, infinity}) {
        const DistanceLaw law = lawAt(distance);
        EXPECT_EQ(law.directGain, 0.0f) << distance;
        EXPECT_EQ(law.earlyDistanceGain, 0.0f) << distance;
        EXPECT_EQ(law.reverbDistanceGain > 0.0f, distance < 40.0f) << distance;
    }
}

TEST(DistanceLaw, FadeKeepsItsValueAtSevenMetresAndNearer) {
    DistanceLaw law = lawAt(17.5f);
    EXPECT_NEAR(static_cast<double>(law.distanceFade), 0.5, 1e-6);
    law.distanceNew = 7.0f;
    Flags flags;
    law.distanceUpdate(withReflections(), false, flags.filterChange, flags.forceUpdate);
    EXPECT_NEAR(static_cast<double>(law.distanceFade), 0.5, 1e-6);
    EXPECT_EQ(law.earlyDistanceGain, 1.0f) << "not multiplied";
}

TEST(DistanceLaw, WithoutReflectionsTheirGainsAreNotSetAnewAndFadeOnAndOn) {
    DistanceLaw law = lawAt(17.5f, EffectiveSettings{});
    EXPECT_NEAR(static_cast<double>(law.earlyDistanceGain), 0.5, 1e-6);
    EXPECT_EQ(law.reverbDistanceGain, 1.0f);
    Flags flags;
    law.distanceUpdate(EffectiveSettings{}, false, flags.filterChange, flags.forceUpdate);
    EXPECT_NEAR(static_cast<double>(law.earlyDistanceGain), 0.25, 1e-6);
    EXPECT_EQ(law.reverbDistanceGain, 1.0f);

    EffectiveSettings fixedPair;
    fixedPair.qvEarlyReflections = true;
    EXPECT_LT(lawAt(20.0f, fixedPair).reverbDistanceGain, 1.0f) << "either kind turns them on";
}

TEST(DistanceLaw, UnityDistanceSetsAllGainsToOneAndStillMoves) {
    EffectiveSettings switches = withReflections();
    switches.doppler = true;
    DistanceLaw law = lawAt(35.0f);
    law.distanceOld = 20.0f;
    law.distanceNew = 20.2f;
    Flags flags;
    law.distanceUpdate(switches, true, flags.filterChange, flags.forceUpdate);
    EXPECT_EQ(law.distance, 20.2f);
    EXPECT_EQ(law.directGain, 1.0f);
    EXPECT_EQ(law.earlyDistanceGain, 1.0f);
    EXPECT_EQ(law.reverbDistanceGain, 1.0f);
    EXPECT_EQ(law.distanceFade, 1.0f);
    EXPECT_NEAR(static_cast<double>(law.dopplerPitch), 0.95, 1e-5);
    EXPECT_TRUE(flags.filterChange);
    EXPECT_TRUE(flags.forceUpdate);
}

TEST(DistanceLaw, TheVeryNearFieldForcesNothing) {
    for (const float old : {0.0f, 0.1f, 0.11f}) {
        DistanceLaw law;
        law.distanceOld = old;
        law.distanceNew = 5.0f;
        Flags flags;
        law.distanceUpdate(withReflections(), false, flags.filterChange, flags.forceUpdate);
        EXPECT_FALSE(flags.filterChange) << old;
        EXPECT_FALSE(flags.forceUpdate) << old;
        law.distanceOld = std::nextafter(0.11f, 1.0f);
        law.distanceUpdate(withReflections(), false, flags.filterChange, flags.forceUpdate);
        EXPECT_TRUE(flags.filterChange);
        EXPECT_TRUE(flags.forceUpdate);
    }
}

TEST(DistanceLaw, SmoothStepsLimitTheMove) {
    struct Case {
        float old;
        float wanted;
        float reached;
    };
    const std::array<Case, 8> cases = {{{5.0f, 9.0f, 5.0f + 0.4f},
                                        {5.0f, 1.0f, 5.0f - 0.4f},
                                        {5.0f, 5.3f, 5.3f},
                                        {1.0f, 3.0f, 1.0f + 0.01f},
                                        {1.0f, 0.2f, 1.0f - 0.01f},
                                        {0.5f, 0.505f, 0.505f},
                                        {1.001f, 0.2f, 1.001f - 0.4f},
                                        {0.5f, -4.0f, 0.5f - 0.01f}}};
    EffectiveSettings switches = withReflections();
    switches.interpolateAngles = true;
    for (const Case& c : cases) {
        DistanceLaw law;
        law.distanceOld = c.old;
        law.distanceNew = c.wanted;
        Flags flags;
        switches.qvSmoothSteps = true;
        law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
        EXPECT_EQ(law.distance, c.reached) << c.old << " to " << c.wanted;
        EXPECT_EQ(law.distanceMoved, c.reached - c.old);
        switches.qvSmoothSteps = false;
        law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
        EXPECT_EQ(law.distance, std::fmax(c.wanted, 0.1f)) << "unlimited without the switch";
    }
}

TEST(DistanceLaw, PitchIsKeptWithDopplerOnlyAndLimited) {
    struct Case {
        float old;
        float now;
        float pitch;
    };
    const std::array<Case, 4> cases = {
        {{5.0f, 5.0f, 1.0f}, {9.0f, 5.0f, 1.1f}, {5.0f, 9.0f, 0.9f}, {5.25f, 5.0f, 1.0625f}}};
    EffectiveSettings switches = withReflections();
    for (const Case& c : cases) {
        DistanceLaw law;
        law.dopplerPitch = -1.0f;
        law.distanceOld = c.old;
        law.distanceNew = c.now;
        Flags flags;
        switches.doppler = false;
        law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
        EXPECT_EQ(law.dopplerPitch, -1.0f);
        switches.doppler = true;
        law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
        EXPECT_EQ(law.dopplerPitch, c.pitch);
    }
}

TEST(DistanceLaw, RecoversFromANaN) {
    EffectiveSettings switches = withReflections();
    switches.qvSmoothSteps = true;
    switches.doppler = true;
    DistanceLaw law;
    Flags flags;
    law.distanceNew = nan;
    law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
    law.distanceOld = law.distance;
    law.distanceNew = 3.0f;
    law.distanceUpdate(switches, false, flags.filterChange, flags.forceUpdate);
    EXPECT_EQ(law.distance, 3.0f);
    EXPECT_NEAR(static_cast<double>(law.directGain), directAt(3.0), 1e-6);
}

}  // namespace
}  // namespace tessaly::test
