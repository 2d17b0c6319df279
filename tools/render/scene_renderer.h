// Plays a whole scene through the built library, block by block as a game's mixer does.
#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "minihost/plugin_library.h"
#include "render/scene_inputs.h"
#include "scene/scene.h"

namespace tessaly {

struct SceneResult {
    std::vector<float> stereo;                      ///< interleaved, left first: sum of all
    std::vector<std::vector<float>> sourceOutputs;  ///< the same length, one a source
    std::vector<std::vector<float>> returnOutputs;  ///< the same length, one a return
    std::uint64_t allocations = 0;                  ///< of the library, in blocks that load nothing
    std::uint64_t releases = 0;                     ///< likewise
    std::vector<std::string> warnings;
};

/// Renders the scene. Each block: parameters whose value changed are set, the sources run in
/// order, then the returns, so that a return renders what was sent in the same block. In the block
/// after a load all parameters are set once more, as by a script that sets them every frame: a load
/// puts the room's cut-offs in place of those asked for.
/// Wall distances and errors are kept for the life of a loaded library: give each scene a
/// library of its own (PluginLibrary::privateCopy) where they must not meet. Scenes with libraries
/// of their own may be rendered by several threads.
/// @param inputs   loadInputs() of the scene
/// @param onBlock  called before each block with the part done, 0 to 1; may throw to stop
/// @throws std::runtime_error with one line
SceneResult renderScene(const PluginLibrary& library,
                        const std::filesystem::path& dataDirectory,
                        const Scene& scene,
                        const SceneInputs& inputs,
                        const std::function<void(double)>& onBlock);

/// The composed response of one source with all it sends into, as it stands at one moment:
/// everything is frozen at that moment, a unit impulse is played, and what reaches the ears is
/// measured, for 6 s at most.
struct MeasuredResponse {
    std::vector<float> left;   ///< from the impulse on, empty if nothing is heard of it
    std::vector<float> right;  ///< the same length
};

/// @param duration  of the scene without its tail, seconds
/// @param source    index in the scene
/// @param seconds   the moment
/// @param onBlock   called before each block; may throw to stop
MeasuredResponse measureResponse(const PluginLibrary& library,
                                 const std::filesystem::path& dataDirectory,
                                 const Scene& scene,
                                 double duration,
                                 std::size_t source,
                                 double seconds,
                                 const std::function<void()>& onBlock);

}  // namespace tessaly
