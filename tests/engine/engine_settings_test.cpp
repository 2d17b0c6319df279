// The settings step: quality ladder, limits, switches that exclude each other.
#include "engine/engine_settings.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "engine/ambience.h"
#include "engine/shared_state.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

struct Step {
    EffectiveSettings effective;
    std::int16_t angleStep = 5;
};

Step settle(const EngineSettings& settings, int quality, int blocklenght = 1024, int instance = 0) {
    Step step;
    setQualitySettings(settings, static_cast<std::int16_t>(quality), step.effective, step.angleStep,
                       static_cast<std::int16_t>(instance), blocklenght, 0);
    return step;
}

EngineSettings settingsAt(int rate) {
    EngineSettings settings;
    settings.sampleRate = rate;
    return settings;
}

using EngineSettingsStep = EngineFixture;

// One row a quality value, worked out from the ladder's conditions by hand.
struct LadderRow {
    int q;
    bool early, flex, spectra, filters, smooth, fading, track, taps256, elevation;
    int limitPhi, limitTheta, interval;
};

// clang-format off
// Limits after direction tracking has had its say. Filter blending gives way to spectra at 10.
constexpr LadderRow ladder[] = {
    // q     early  flex   spectra filters smooth fading track  256    elev   phi  theta interval
    {1,      false, false, false,  false,  false, false, false, false, false,   0,  0, 4},
    {2,      true,  false, false,  false,  false, false, false, true,  false,   0,  0, 4},
    {3,      false, true,  false,  false,  false, false, false, true,  false,   0,  0, 4},
    {4,      true,  false, false,  false,  true,  false, true,  true,  false,  90,  0, 4},
    {5,      false, true,  false,  false,  true,  true,  true,  true,  false, 180,  0, 2},
    {6,      false, true,  false,  false,  false, true,  true,  false, true,   90, 90, 2},
    {7,      false, true,  false,  false,  false, true,  true,  true,  true,  180, 90, 1},
    {8,      false, true,  false,  true,   false, true,  true,  false, true,  180, 90, 1},
    {9,      false, true,  false,  true,   false, true,  true,  true,  true,  180, 90, 1},
    {10,     false, true,  true,   false,  false, true,  true,  true,  true,  180, 90, 1},
    {999,    false, true,  true,   false,  false, true,  true,  true,  true,  180, 90, 1},
    {1000,   true,  true,  true,   false,  true,  true,  true,  true,  true,  180, 90, 1},
};
// clang-format on

TEST_F(EngineSettingsStep, LadderSetsEverySwitch) {
    for (const LadderRow& row : ladder) {
        SCOPED_TRACE(row.q);
        const Step step = settle(settingsAt(48000), row.q);
        const EffectiveSettings& e = step.effective;
        EXPECT_EQ(e.qvEarlyReflections, row.early);
        EXPECT_EQ(e.qvFlexReflections, row.flex);
        EXPECT_EQ(e.qvInterpolateSpectra, row.spectra);
        EXPECT_EQ(e.qvInterpolateFilters, row.filters);
        EXPECT_EQ(e.interpolateAngles, row.spectra || row.filters);
        EXPECT_EQ(step.angleStep, row.spectra || row.filters ? 1 : 5);
        EXPECT_EQ(e.qvSmoothSteps, row.smooth);
        EXPECT_EQ(e.fading, row.fading);
        EXPECT_EQ(e.qvTrackDirection, row.track);
        EXPECT_EQ(e.qvUse256HRIR, row.taps256);
        EXPECT_EQ(e.hrirLength, row.taps256 ? 256 : 139);
        EXPECT_EQ(e.useElevation, row.elevation);
        EXPECT_EQ(e.limitPhi, row.limitPhi);
        EXPECT_EQ(e.limitTheta, row.limitTheta);
        EXPECT_EQ(e.phiLimited, row.limitPhi != 180);
        EXPECT_EQ(e.thetaLimited, row.limitTheta != 90);
        EXPECT_EQ(e.qvUpdateInterval, row.interval);
        EXPECT_EQ(e.atmoSelect, 0);
        EXPECT_EQ(e.qvDiagnosticsA, row.q >= 1000);
        EXPECT_EQ(e.qvDiagnosticsB, row.q >= 1000);
        EXPECT_EQ(e.qvDiagnosticsC, row.q >= 1000);
    }
}

TEST_F(EngineSettingsStep, LadderLeavesTailDopplerAndBypassAsConstructed) {
    EngineSettings settings = settingsAt(48000);
    settings.qvReverb = 16;
    settings.doppler = 1;
    settings.dopplerScale = 2.0f;
    settings.bypass3DAudio = 1;
    const EffectiveSettings e = settle(settings, 7).effective;
    EXPECT_EQ(e.qvReverb, 0);
    EXPECT_FALSE(e.doppler);
    EXPECT_EQ(e.dopplerScale, 0.0f);
    EXPECT_FALSE(e.bypass3DAudio);
}

TEST_F(EngineSettingsStep, LadderSaysWhenItTakesTheLongHrirsBack) {
    for (const int q : {5, 6, 7, 8, 9}) {
        LogCapture log;
        settle(settingsAt(48000), q);
        EXPECT_EQ(log.count(LogStream::output, "deactivate qvUse256HRIR"),
                  q == 6 || q == 8 ? 1u : 0u)
            << q;
    }
}

TEST_F(EngineSettingsStep, TopQualitySelectsAHeadphoneThatTheSettingsReplace) {
    EngineSettings settings = settingsAt(48000);
    settle(settings, 1000);
    EXPECT_EQ(qvHpTFcompSelect, 0);
    EXPECT_FALSE(hpTFactive);
    settings.qvHpTFcompSelect = 5;
    settle(settings, 1000);
    EXPECT_EQ(qvHpTFcompSelect, 5);
    EXPECT_TRUE(hpTFactive);
}

TEST_F(EngineSettingsStep, QualityZeroTakesTheSettings) {
    EngineSettings settings = settingsAt(44100);
    settings.qvEarlyReflections = 1;
    settings.qvFlexReflections = 0;
    settings.qvReverb = 25;
    settings.qvSmoothSteps = 1;
    settings.fading = 0;
    settings.qvUpdateInterval = 3;
    settings.limitPhi = 90;
    settings.limitTheta = 45;
    settings.doppler = 1;
    settings.dopplerScale = 0.5f;
    settings.bypass3DAudio = 1;
    settings.alwaysUpdateFilter = 0;
    settings.atmoSelect = 2;
    const EffectiveSettings e = settle(settings, 0).effective;
    EXPECT_TRUE(e.qvEarlyReflections);
    EXPECT_FALSE(e.qvFlexReflections);
    EXPECT_EQ(e.qvReverb, 25);
    EXPECT_TRUE(e.qvSmoothSteps);
    EXPECT_FALSE(e.fading);
    EXPECT_EQ(e.qvUpdateInterval, 3);
    EXPECT_EQ(e.limitPhi, 90);
    EXPECT_EQ(e.limitTheta, 45);
    EXPECT_TRUE(e.useElevation);
    EXPECT_TRUE(e.doppler);
    EXPECT_EQ(e.dopplerScale, 0.5f);
    EXPECT_TRUE(e.bypass3DAudio);
    EXPECT_EQ(e.alwaysUpdateFilter, 0);
    EXPECT_EQ(e.atmoSelect, 2);
    EXPECT_EQ(e.hrirLength, 128);
}

TEST_F(EngineSettingsStep, NegativeQualityTakesNeitherPath) {
    LogCapture log;
    const EffectiveSettings e = settle(settingsAt(48000), -1).effective;
    EXPECT_EQ(log.outputLines(), std::vector<std::string>{"ERROR: qualityValue is negativ!!!"});
    EXPECT_FALSE(e.qvTrackDirection);
    EXPECT_FALSE(e.fading);
    EXPECT_EQ(e.qvUpdateInterval, 0);
    EXPECT_EQ(e.alwaysUpdateFilter, 1);
    EXPECT_EQ(e.hrirLength, 139);
}

TEST_F(EngineSettingsStep, HrirLengthFollowsTheRate) {
    EXPECT_EQ(settle(settingsAt(24000), 0).effective.hrirLength, 70);
    EXPECT_EQ(settle(settingsAt(44100), 0).effective.hrirLength, 128);
    EXPECT_EQ(settle(settingsAt(48000), 0).effective.hrirLength, 139);
    EngineSettings longer = settingsAt(24000);
    longer.qvUse256HRIR = 1;
    EXPECT_EQ(settle(longer, 0).effective.hrirLength, 256);
}

TEST_F(EngineSettingsStep, LimitsGoDownToTheGrid) {
    EngineSettings settings = settingsAt(48000);
    settings.limitPhi = 47;
    settings.limitTheta = 44;
    const EffectiveSettings e = settle(settings, 0).effective;
    EXPECT_EQ(e.limitPhi, 45);
    EXPECT_EQ(e.limitTheta, 40);
    EXPECT_TRUE(e.phiLimited);
    EXPECT_TRUE(e.thetaLimited);
}

TEST_F(EngineSettingsStep, AnUntrackedDirectionHasNoRange) {
    EngineSettings settings = settingsAt(48000);
    settings.qvTrackDirection = 0;
    const EffectiveSettings e = settle(settings, 0).effective;
    EXPECT_EQ(e.limitPhi, 0);
    EXPECT_EQ(e.limitTheta, 0);
    EXPECT_FALSE(e.useElevation);
}

TEST_F(EngineSettingsStep, NegativeElevationLimitIsReported) {
    EngineSettings settings = settingsAt(48000);
    settings.limitTheta = -7;
    LogCapture log;
    const EffectiveSettings e = settle(settings, 0).effective;
    EXPECT_EQ(log.outputLines(), std::vector<std::string>{"ERROR: limitTheta is negativ!!!"});
    EXPECT_FALSE(e.useElevation);
    EXPECT_EQ(e.limitTheta, -5);
}

TEST_F(EngineSettingsStep, SpectralInterpolationWins) {
    EngineSettings settings = settingsAt(48000);
    settings.qvInterpolateSpectra = 1;
    settings.qvInterpolateFilters = 1;
    const Step step = settle(settings, 0);
    EXPECT_TRUE(step.effective.qvInterpolateSpectra);
    EXPECT_FALSE(step.effective.qvInterpolateFilters);
    EXPECT_TRUE(step.effective.interpolateAngles);
    EXPECT_EQ(step.angleStep, 1);
}

TEST_F(EngineSettingsStep, AmbienceBelongsToTheFirstEngine) {
    EngineSettings settings = settingsAt(48000);
    settings.atmoSelect = 1;
    LogCapture log;
    EXPECT_EQ(settle(settings, 0, 1024, 0).effective.atmoSelect, 1);
    EXPECT_EQ(log.outputLines(),
              (std::vector<std::string>{"ATMO_LENGTH = 1064960", "ATMO_BLOCKS = 0"}));
    log.clear();
    EXPECT_EQ(settle(settings, 0, 1024, 1).effective.atmoSelect, 0);
    EXPECT_EQ(log.outputLines(), std::vector<std::string>{
                                     "Atmo only available in first essCore-Instanz,do prevent from "
                                     "multiple-playing!!! disabled in this one!!"});
    settings.atmoSelect = -3;
    EXPECT_EQ(settle(settings, 0).effective.atmoSelect, 0);
}

TEST_F(EngineSettingsStep, ShortBlocksHaveNoHeadphoneCompensation) {
    EngineSettings settings = settingsAt(48000);
    settings.qvHpTFcompSelect = 3;
    settle(settings, 0, 512);
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 0);
    settle(settings, 0, 1024);
    EXPECT_TRUE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 3);
}

TEST_F(EngineSettingsStep, EveryMixFieldCountsAsAChange) {
    const MixParameters start;
    EXPECT_FALSE(mixParametersDiffer(start, start));
    float MixParameters::*const fields[] = {
        &MixParameters::directGain,       &MixParameters::earlyGain,    &MixParameters::reverbGain,
        &MixParameters::mixCutoffSlot,    &MixParameters::reverbCutoff, &MixParameters::mixSlot,
        &MixParameters::unityAttenuation, &MixParameters::mixRoomSlot,  &MixParameters::roomSize};
    for (const auto field : fields) {
        MixParameters other;
        other.*field += 0.5f;
        EXPECT_TRUE(mixParametersDiffer(other, start));
        other.*field = std::numeric_limits<float>::quiet_NaN();
        EXPECT_TRUE(mixParametersDiffer(other, other)) << "a NaN never equals itself";
    }
    MixParameters other;
    other.unityDistance = 1;
    EXPECT_TRUE(mixParametersDiffer(other, start));
}

TEST_F(EngineSettingsStep, StartValuesOfTheMixRecord) {
    const MixParameters mix;
    EXPECT_EQ(mix.directGain, 1.0f);
    EXPECT_EQ(mix.earlyGain, 1.0f);
    EXPECT_EQ(mix.reverbGain, 1.0f);
    EXPECT_EQ(mix.mixCutoffSlot, 20000.0f);
    EXPECT_EQ(mix.reverbCutoff, 20000.0f);
    EXPECT_EQ(mix.mixSlot, 0.0f);
    EXPECT_EQ(mix.unityAttenuation, 1.0f);
    EXPECT_EQ(mix.unityDistance, 0);
    EXPECT_EQ(mix.mixRoomSlot, 40.0f);
    EXPECT_EQ(mix.roomSize, 1.0f);
}

}  // namespace
}  // namespace tessaly::test
