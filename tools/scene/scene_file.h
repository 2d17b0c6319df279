// Reads a scene from a JSON text.
#pragma once

#include <filesystem>
#include <stdexcept>
#include <string>
#include <string_view>

#include "scene/scene.h"

namespace tessaly {

/// A scene that cannot be understood; what() is one line: file, line, key and reason, e.g.
/// "cave.json:14: sources[1].position.keyframes[2].time: must be above 1.5, got 1.5".
class SceneError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Reads and checks a whole scene. Unknown keys, wrong types, values out of range, parameters the
/// effects do not have, sends without a return and repeated keys are errors.
/// @param file  its folder is where relative sound files are looked for
/// @throws SceneError
Scene readScene(const std::filesystem::path& file);

/// The same from a text.
/// @param name    how the text is called in errors
/// @param folder  where relative sound files are looked for
Scene parseScene(std::string_view text,
                 const std::string& name,
                 const std::filesystem::path& folder);

}  // namespace tessaly
