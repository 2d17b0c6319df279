// Looks at the files that a scene needs, so that a missing or damaged one is told by name.
#pragma once

#include <filesystem>

#include "scene/scene.h"

namespace tessaly {

/// Whether an engine asks for responses of 256 frames, by its settings or its quality step.
bool usesLongResponses(const DirectEngine& engine) noexcept;

/// Judges presence and size; of contents only headers are read.
/// @throws std::runtime_error with one line naming the first file that is missing, damaged or of
///         the wrong response length
void checkData(const std::filesystem::path& directory, const Scene& scene);

}  // namespace tessaly
