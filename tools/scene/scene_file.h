// Reads a scene from a JSON text.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>

#include "scene/scene.h"
#include "scene/scene_error.h"

namespace tessaly {

/// Reads and checks a whole scene. Unknown keys, wrong types, values out of range, parameters the
/// effects do not have, sends without a return and repeated keys are errors, and so are sound files
/// that are not there.
/// @param file  its folder is where relative sound files are looked for
/// @throws SceneError
Scene readScene(const std::filesystem::path& file);

/// The same from a text.
/// @param name    how the text is called in errors
/// @param folder  where relative sound files are looked for
/// @throws SceneError
Scene parseScene(std::string_view text,
                 const std::string& name,
                 const std::filesystem::path& folder);

}  // namespace tessaly
