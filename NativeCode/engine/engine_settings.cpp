// The settings step: settings or quality ladder to effective switches.
#include "engine/engine_settings.h"

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "engine/ambience.h"
#include "engine/shared_state.h"

namespace tessaly {

namespace {

constexpr int smallestHeadphoneBlock = 1024;  // frames; the filter's 256 taps need room
constexpr float hrirTapsAt44100 = 128.0f;
constexpr float per44100 = 2.2675737e-05f;  // 1 / 44100 Hz
constexpr std::int16_t hrirTapsLong = 256;
constexpr std::int16_t gridStep = 5;  // degrees

void applyQualityLadder(std::int16_t q, EffectiveSettings& effective) {
    const bool everything = q >= 1000;
    effective.atmoSelect = 0;
    effective.qvEarlyReflections = everything;
    effective.qvSmoothSteps = everything;
    hpTFactive = everything;
    effective.qvFlexReflections = q >= 3;
    effective.qvInterpolateSpectra = q >= 10;
    effective.qvInterpolateFilters = q >= 8;
    effective.fading = q >= 5;
    effective.qvTrackDirection = q >= 4;
    effective.qvUse256HRIR = q >= 2;
    if (q == 6 || q == 8) {
        effective.qvUse256HRIR = false;
        logOutput("deactivate qvUse256HRIR");
    }
    effective.useElevation = q >= 6;
    effective.limitTheta = q >= 6 ? 90 : 0;
    effective.limitPhi = (q >= 7 || q == 5) ? 180 : 90;
    effective.qvUpdateInterval = q >= 7 ? 1 : (q >= 5 ? 2 : 4);
    if (q == 2 || q == 4) {
        effective.qvEarlyReflections = true;
        effective.qvFlexReflections = false;
    }
    if (q == 4 || q == 5) {
        effective.qvSmoothSteps = true;
    }
    if (everything) {
        qvHpTFcompSelect = 3;
        effective.qvDiagnosticsA = true;
        effective.qvDiagnosticsB = true;
        effective.qvDiagnosticsC = true;
    }
}

void takeSettings(const EngineSettings& settings, EffectiveSettings& effective) {
    effective.atmoSelect = settings.atmoSelect;
    effective.qvEarlyReflections = settings.qvEarlyReflections != 0;
    effective.qvFlexReflections = settings.qvFlexReflections != 0;
    effective.qvReverb = settings.qvReverb;
    effective.qvSmoothSteps = settings.qvSmoothSteps != 0;
    effective.qvInterpolateSpectra = settings.qvInterpolateSpectra != 0;
    effective.qvInterpolateFilters = settings.qvInterpolateFilters != 0;
    effective.fading = settings.fading != 0;
    effective.qvTrackDirection = settings.qvTrackDirection != 0;
    effective.qvUpdateInterval = settings.qvUpdateInterval;
    effective.qvUse256HRIR = settings.qvUse256HRIR != 0;
    effective.bypass3DAudio = settings.bypass3DAudio != 0;
    effective.limitPhi = settings.limitPhi;
    effective.limitTheta = settings.limitTheta;
    effective.doppler = settings.doppler != 0;
    effective.dopplerScale = settings.dopplerScale;
    effective.qvDiagnosticsA = false;
    effective.qvDiagnosticsB = false;
    effective.qvDiagnosticsC = false;
}

constexpr std::int16_t downToGrid(std::int16_t degrees) noexcept {
    return static_cast<std::int16_t>(degrees / gridStep * gridStep);
}

void settleAmbience(EffectiveSettings& effective, std::int16_t instanceNumber, int atmoBlocks) {
    if (effective.atmoSelect <= 0) {
        return;
    }
    if (instanceNumber > 0) {
        effective.atmoSelect = 0;
        logOutput(
            "Atmo only available in first essCore-Instanz,do prevent from multiple-playing!!! "
            "disabled in this one!!");
    } else {
        logOutput("ATMO_LENGTH = ", ATMO_LENGTH);
        logOutput("ATMO_BLOCKS = ", atmoBlocks);
    }
}

}  // namespace

bool mixParametersDiffer(const MixParameters& a, const MixParameters& b) noexcept {
    return !(a == b);  // an unordered comparison counts as a difference
}

void setQualitySettings(const EngineSettings& settings,
                        std::int16_t qualityValue,
                        EffectiveSettings& effective,
                        std::int16_t& angleStep,
                        std::int16_t instanceNumber,
                        int blocklenght,
                        int atmoBlocks) {
    if (qualityValue > 0) {
        applyQualityLadder(qualityValue, effective);
    } else if (qualityValue == 0) {
        takeSettings(settings, effective);
    } else {
        logOutput("ERROR: qualityValue is negativ!!!");
    }

    // The headphone selection is the settings' whatever the ladder said.
    hpTFactive = settings.qvHpTFcompSelect != 0;
    qvHpTFcompSelect = settings.qvHpTFcompSelect;
    effective.atmoSelect = settings.atmoSelect < 1 ? std::int16_t{0} : settings.atmoSelect;
    effective.alwaysUpdateFilter = settings.alwaysUpdateFilter;
    effective.mixParametersChanged = 0;

    effective.hrirLength =
        effective.qvUse256HRIR
            ? hrirTapsLong
            : truncateToInt16(static_cast<float>(settings.sampleRate) * hrirTapsAt44100 * per44100 +
                              0.5f);

    if (!effective.qvTrackDirection) {
        effective.limitPhi = 0;
        effective.limitTheta = 0;
    }
    effective.limitPhi = downToGrid(effective.limitPhi);
    effective.limitTheta = downToGrid(effective.limitTheta);
    effective.phiLimited = effective.limitPhi != 180;
    effective.thetaLimited = effective.limitTheta != 90;

    effective.useElevation = effective.limitTheta > 0;
    if (effective.limitTheta < 0) {
        logOutput("ERROR: limitTheta is negativ!!!");
    }

    effective.interpolateAngles = effective.qvInterpolateSpectra || effective.qvInterpolateFilters;
    if (effective.interpolateAngles) {
        angleStep = 1;
        if (effective.qvInterpolateSpectra) {
            effective.qvInterpolateFilters = false;
        }
    }

    settleAmbience(effective, instanceNumber, atmoBlocks);

    if (blocklenght < smallestHeadphoneBlock && hpTFactive) {
        hpTFactive = false;
        qvHpTFcompSelect = 0;
    }
}

}  // namespace tessaly
