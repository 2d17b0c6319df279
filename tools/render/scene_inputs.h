// What the sources of a scene play: loaded, at the scene's rate and level, placed in time.
#pragma once

#include <cstddef>
#include <span>
#include <vector>

#include "demo_sounds/sound_file.h"
#include "scene/scene.h"

namespace tessaly {

/// One source's sound in the scene's time.
struct PlacedSound {
    Sound sound;                  ///< gain applied
    std::size_t firstFrame = 0;   ///< silence before
    std::size_t framesHeard = 0;  ///< from firstFrame on; silence after
    bool loop = false;

    /// Writes one block as it reaches an effect: interleaved stereo, a mono sound on both sides.
    /// @param start  frame of the scene
    void fillBlock(std::size_t start, std::span<float> block) const noexcept;

    /// All samples that are heard are 0.
    bool silent() const noexcept;
};

struct SceneInputs {
    std::vector<PlacedSound> sounds;  ///< one a source
    std::size_t frames = 0;           ///< of the scene, without its tail; at least 1
    std::size_t tailFrames = 0;
    double duration = 0.0;  ///< seconds that `frames` take
};

/// Longest scene and longest input in seconds; everything is kept in memory.
inline constexpr double longestScene = 3600.0;

/// Loads all inputs. Without a duration of its own the scene ends with the last input; a built-in
/// sound without one lasts to the end of the scene, or 8 s if that is open.
/// @throws std::runtime_error with one line if a file cannot be read or speech not be made
SceneInputs loadInputs(const Scene& scene);

}  // namespace tessaly
