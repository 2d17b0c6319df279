// Reads what makes sound in a scene: sources and returns.
#pragma once

#include <filesystem>
#include <optional>
#include <vector>

#include "scene/scene.h"
#include "scene/scene_value.h"

namespace tessaly {

/// @param before  returns already read; no ID and no name twice
/// @throws SceneError
SceneReturn readReturn(const SceneValue& value, const std::vector<SceneReturn>& before);

/// What a source refers to outside itself.
struct SourceSurroundings {
    const std::filesystem::path& folder;      ///< of relative sound files
    int blockLength;                          ///< frames
    const std::optional<double>& duration;    ///< of the scene, seconds
    const std::vector<SceneReturn>& returns;  ///< all of them
};

/// @throws SceneError
SceneSource readSource(const SceneValue& value, const SourceSurroundings& surroundings);

}  // namespace tessaly
