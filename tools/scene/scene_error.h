// What reading a scene throws.
#pragma once

#include <stdexcept>

namespace tessaly {

/// A scene that cannot be understood; what() is one line: file, line, key and reason, e.g.
/// "cave.json:14: sources[1].position.keyframes[2].time: must be above 1.5, got 1.5".
class SceneError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

}  // namespace tessaly
