// Where the source is on the 5-degree grid, and whether it moved.
#include "engine/source_direction.h"

#include <cmath>
#include <cstdlib>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "resources/hrir_grid.h"

namespace tessaly {

namespace {

/// A step of this size or more crosses the back of the listener and is never limited.
constexpr float stepAcrossTheBack = 270.0f;  // degrees
constexpr float gridStep = 5.0f;             // degrees
constexpr int upperLimitMargin = 4;          // degrees; values up to the limit + 3 pass unclamped
constexpr double sqrtHalf = 0.7071067811865475;  // 1 / sqrt(2)

bool axisChanged(std::int16_t next, std::int16_t present, std::int16_t limit) noexcept {
    return next != present && (std::abs(int{next}) <= limit || std::abs(int{present}) < limit);
}

std::int16_t clampToLimit(std::int16_t next, std::int16_t limit) noexcept {
    if (next <= -limit) {
        return wrapToInt16(-limit);
    }
    if (next >= limit + upperLimitMargin) {
        return limit;
    }
    return next;
}

/// Replaces a step above `angleStep` in size by one of exactly that size.
void limitStep(std::int16_t& angle,
               float& step,
               std::int16_t angleOld,
               std::int16_t angleStep) noexcept {
    if (step > static_cast<float>(angleStep)) {
        angle = wrapToInt16(angleOld + angleStep);
        step = static_cast<float>(angleStep);
    } else if (step < static_cast<float>(-angleStep)) {
        angle = wrapToInt16(angleOld - angleStep);
        step = static_cast<float>(-angleStep);
    }
}

/// One axis of the step bookkeeping: the first line that fits applies.
void followAxis(float& moved,
                float step,
                std::int16_t angleStep,
                std::int16_t& index,
                std::int16_t& indexOld,
                bool& filterUpdatePending,
                bool& filterChange,
                bool& holdInterpPair) noexcept {
    const float unit = static_cast<float>(angleStep);
    if (moved == -unit && step < 0.0f) {
        filterUpdatePending = true;
        filterChange = true;
    } else if (moved == unit && step > 0.0f) {
        filterUpdatePending = true;
        filterChange = true;
        index = wrapToInt16(indexOld + 1);
    } else if (std::fabs(moved) >= gridStep) {
        filterUpdatePending = true;
        filterChange = true;
        indexOld = index;
        moved = 0.0f;
    } else if (moved == 0.0f) {
        filterUpdatePending = true;
        filterChange = true;
        indexOld = index;
        holdInterpPair = true;
    }
}

}  // namespace

bool SourceDirection::changed(const EffectiveSettings& switches) const noexcept {
    return axisChanged(phiNew, phi, switches.limitPhi) ||
           (switches.useElevation && axisChanged(thetaNew, theta, switches.limitTheta));
}

void SourceDirection::update(const EffectiveSettings& switches, bool& filterChange) noexcept {
    phi = clampToLimit(phiNew, switches.limitPhi);
    phiStep = static_cast<float>(phi - phiOld);
    if (switches.qvSmoothSteps && std::fabs(phiStep) < stepAcrossTheBack) {
        limitStep(phi, phiStep, phiOld, angleStep);
    }
    filterChange = true;
    phiOld = phi;
    indexPhi = phiToIndex(phi);

    if (switches.useElevation) {
        theta = clampToLimit(thetaNew, switches.limitTheta);
        thetaStep = static_cast<float>(theta - thetaOld);
        if (switches.qvSmoothSteps) {
            limitStep(theta, thetaStep, thetaOld, angleStep);
        }
        thetaOld = theta;
        indexTheta = thetaToIndex(theta);
    }
}

void SourceDirection::bookkeepSteps(const EffectiveSettings& switches,
                                    bool& filterChange) noexcept {
    phiMoved += phiStep;
    phiStepMoved = phiStep;
    thetaStepMoved = thetaStep;
    const bool phiStepped = phiStep != 0.0f;
    const bool thetaStepped = thetaStep != 0.0f;

    if (phiStepped) {
        followAxis(phiMoved, phiStep, angleStep, indexPhi, indexPhiOld, filterUpdatePending,
                   filterChange, holdInterpPair);
    }
    if (switches.useElevation && thetaStepped) {
        thetaMoved += thetaStep;
        followAxis(thetaMoved, thetaStep, angleStep, indexTheta, indexThetaOld, filterUpdatePending,
                   filterChange, holdInterpPair);
        thetaStep = 0.0f;
    }

    if (phiStepped && thetaStepped) {
        const double moved = std::sqrt(wide(thetaMoved * thetaMoved + phiMoved * phiMoved));
        interpAngleOffset = single(moved * sqrtHalf);
    } else if (thetaStepped) {
        interpAngleOffset = thetaMoved;
    } else {
        interpAngleOffset = phiMoved;
    }
    phiStep = 0.0f;
}

}  // namespace tessaly
