// Where everything in a scene is at one moment.
#include "scene/scene.h"

#include <algorithm>

namespace tessaly {

Vector3 positionAt(const ScenePath& path, double seconds, double duration) noexcept {
    if (const auto* track = std::get_if<PositionTrack>(&path)) {
        return valueAt(*track, seconds);
    }
    // In the tail a path stays at its end.
    const double fraction = std::clamp(seconds / duration, 0.0, 1.0);
    return positionAt(*std::get_if<SourcePath>(&path), fraction);
}

Pose listenerAt(const SceneListener& listener, double seconds) noexcept {
    return {valueAt(listener.position, seconds), valueAt(listener.yaw, seconds),
            valueAt(listener.pitch, seconds), valueAt(listener.roll, seconds)};
}

}  // namespace tessaly
