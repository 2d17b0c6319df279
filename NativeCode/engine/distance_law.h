// Turns the source's distance into the gains of direct sound, reflections and tail.
#pragma once

#include "base/audio_thread.h"
#include "engine/engine_settings.h"

namespace tessaly {

/// The gains ride in the composed response, so a change is heard through its crossfade.
class DistanceLaw {
public:
    /// Takes `distanceNew` over and applies the law. Block time.
    /// @param unityDistance  the host applies the attenuation: all gains 1
    /// @param filterChange   set if the response must be rebuilt
    /// @param forceUpdate    set if everything that follows distance must be redone
    void distanceUpdate(const EffectiveSettings& switches,
                        bool unityDistance,
                        bool& filterChange,
                        bool& forceUpdate) noexcept TESSALY_NONBLOCKING;

    float distance = 0.0f;     ///< metres, at least 0.1 after the first update
    float distanceNew = 0.0f;  ///< metres, as the host has it
    float distanceOld = 0.0f;  ///< metres, in the block before
    float directGain = 1.0f;
    float earlyDistanceGain = 1.0f;
    float reverbDistanceGain = 1.0f;
    float distanceFade = 1.0f;   ///< far fade of direct sound and reflections, 1 at 7 m, 0 at 28 m
    float distanceMoved = 0.0f;  ///< kept for a debugger
    float dopplerPitch = 0.0f;   ///< kept for a debugger
};

}  // namespace tessaly
