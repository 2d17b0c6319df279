// Reads values over time and paths from a scene's text.
#pragma once

#include <optional>

#include "scene/scene.h"
#include "scene/scene_value.h"

namespace tessaly {

/// What the values of a track may be.
struct ScalarRange {
    double low = 0.0;
    double high = 0.0;
    bool wholeNumbers = false;
    bool stepsOnly = false;  ///< nothing between two keyframes has a meaning
};

/// A number, or an object with keyframes. @throws SceneError
ScalarTrack readScalarTrack(const SceneValue& value, const ScalarRange& range);

/// A list of three numbers, or an object with keyframes. @throws SceneError
PositionTrack readPositionTrack(const SceneValue& value);

/// A list of three numbers, keyframes, a direction or one of the simple paths.
/// @param duration  of the scene, seconds, if it is given
/// @throws SceneError
ScenePath readPath(const SceneValue& value, const std::optional<double>& duration);

}  // namespace tessaly
