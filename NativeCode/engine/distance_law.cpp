// Distance to gains: near law, far fade and the tail's own law.
#include "engine/distance_law.h"

#include <algorithm>
#include <cmath>

#include "base/precision.h"

namespace tessaly {

namespace {

constexpr double nearestDistance = 0.1;   // metres; compared in double, stored in single
constexpr float rebuildDistance = 0.11f;  // metres; nearer than this nothing is forced

constexpr float slewNearLimit = 1.0f;  // metres
constexpr float slewFar = 0.4f;        // metres an update
constexpr float slewNear = 0.01f;      // metres an update, inside one metre

// 1 / g with g = (d + offset)^0.75 + bias. The branches do not meet at 1 m: 1.815 above, 1.507 at
// and below it, a step of 1.6 dB that belongs to the law.
constexpr float directExponent = 0.75f;
constexpr float directStepDistance = 1.0f;  // metres
constexpr float farOffset = 0.7f;
constexpr float farBias = 0.3265f;
constexpr float nearOffset = 0.4f;
constexpr float nearBias = 0.22f;

constexpr double reverbRange = 13.7;                    // metres without a loss in the tail
constexpr double perReverbRange = 0.07299270072992702;  // 1/m, 1 / 13.7
constexpr double reverbFadeStart = 30.0;                // metres
constexpr double perReverbFade = 0.1;                   // 1/m: silent from 40 m on

constexpr double fadeStart = 7.0;                      // metres
constexpr double perFadeRange = 0.047619047619047616;  // 1/m, 1 / 21: silent from 28 m on

constexpr float pitchPerMetre = 0.25f;
constexpr float lowestPitch = 0.9f;
constexpr float highestPitch = 1.1f;

float directLaw(float d) noexcept {
    if (d > directStepDistance) {
        return 1.0f / (std::pow(d + farOffset, directExponent) + farBias);
    }
    return 1.0f / (std::pow(d + nearOffset, directExponent) + nearBias);
}

float reverbLaw(float d) noexcept {
    if (!(wide(d) > reverbRange)) {
        return 1.0f;
    }
    const double ranges = wide(d) * perReverbRange;
    float gain = single(1.0 / (ranges * ranges));
    if (wide(d) > reverbFadeStart) {
        gain = single((1.0 - (wide(d) - reverbFadeStart) * perReverbFade) * wide(gain));
    }
    // An infinite distance gives a NaN above; it is as silent as any other from 40 m on.
    return !(gain >= 0.0f) ? 0.0f : gain;
}

}  // namespace

void DistanceLaw::distanceUpdate(const EffectiveSettings& switches,
                                 bool unityDistance,
                                 bool& filterChange,
                                 bool& forceUpdate) noexcept {
    distance = nearestDistance > wide(distanceNew) ? single(nearestDistance) : distanceNew;
    if (distanceOld > rebuildDistance) {
        forceUpdate = true;
        filterChange = true;
    }

    if (switches.qvSmoothSteps) {
        const float most = distanceOld > slewNearLimit ? slewFar : slewNear;
        const float step = distance - distanceOld;
        if (step > most) {
            distance = distanceOld + most;
        } else if (step < -most) {
            distance = distanceOld - most;
        }
    }
    if (switches.interpolateAngles) {
        distanceMoved = distance - distanceOld;
    }

    if (unityDistance) {
        directGain = 1.0f;
        earlyDistanceGain = 1.0f;
        reverbDistanceGain = 1.0f;
        distanceFade = 1.0f;
    } else {
        directGain = directLaw(distance);
        if (switches.qvEarlyReflections || switches.qvFlexReflections) {
            earlyDistanceGain = 1.0f;
            reverbDistanceGain = reverbLaw(distance);
        }
        // At 7 m and nearer `distanceFade` keeps its last value, unused.
        if (wide(distance) > fadeStart) {
            const float fade = single(1.0 - (wide(distance) - fadeStart) * perFadeRange);
            distanceFade = std::max(fade, 0.0f);
            directGain *= distanceFade;
            earlyDistanceGain *= distanceFade;
        }
    }

    if (switches.doppler) {
        const float pitch = (distanceOld - distance) * pitchPerMetre + 1.0f;
        dopplerPitch = std::clamp(pitch, lowestPitch, highestPitch);
    }
}

}  // namespace tessaly
