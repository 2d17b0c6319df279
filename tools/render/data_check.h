// Looks for the files that a scene needs, so that a missing one is told by name.
#pragma once

#include <filesystem>

#include "scene/scene.h"

namespace tessaly {

/// @throws std::runtime_error with one line naming the first file that is missing
void checkData(const std::filesystem::path& directory, const Scene& scene);

}  // namespace tessaly
