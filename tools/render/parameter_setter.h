// The parameters of one effect over time.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "minihost/effect_instance.h"
#include "scene/scene.h"

namespace tessaly {

/// Sets an effect's parameters at the starts of blocks, each when its value differs from the last
/// one that was set.
class ParameterSetter {
public:
    /// @param parameters  names are exact, without regard to case and blanks, or indices
    /// @throws std::runtime_error with one line on an unknown name or a keyframe out of range
    ParameterSetter(const UnityAudioEffectDefinition& effect,
                    const std::vector<ParameterTrack>& parameters);

    /// @returns true if one was set that may make the effect load an engine
    bool set(EffectInstance& instance, double seconds);

    /// The next block sets all of them: a load puts the room's cut-offs in place of those that
    /// were set before.
    void repeatAll() noexcept;

private:
    struct Entry {
        int index;
        ScalarTrack track;
        float low;  ///< of the declared range; a spline may overshoot its keyframes
        float high;
        bool loads;
        std::optional<float> last;
        bool repeat;
    };
    std::vector<Entry> entries;
};

}  // namespace tessaly
