// The command line's one sound as a scene with one source.
#pragma once

#include <string>
#include <vector>

#include "render/options.h"
#include "scene/scene.h"

namespace tessaly {

/// The scene that the options ask for, in their room.
Scene sceneOf(const RenderOptions& options);

/// An orbit with a period makes its turns by the scene's length, which may be known only after
/// the input is loaded.
/// @param duration  seconds
void settleOrbit(Scene& scene, const RenderOptions& options, double duration);

/// Picture beside the sound, an SVG document.
/// @param scene   of sceneOf(), orbit settled
/// @param stereo  what was rendered
std::string pictureOf(const Scene& scene, double duration, const std::vector<float>& stereo);

/// "dry" or "room 5 (FamousConcerthall)".
std::string roomText(int room);

}  // namespace tessaly
