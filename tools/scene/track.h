// Values that change over time, given by keyframes.
#pragma once

#include <vector>

#include "minihost/pose.h"

namespace tessaly {

/// How a value goes from one keyframe to the next.
enum class Interpolation {
    Step,    ///< keeps the last keyframe's value
    Linear,  ///< straight, even speed between two keyframes
    Spline,  ///< Catmull-Rom through all keyframes, parametrised by their times
};

template <typename Value>
struct Keyframe {
    double time = 0.0;  ///< seconds
    Value value{};
};

/// Before the first keyframe and after the last one their values hold. A track with one keyframe
/// is a constant.
template <typename Value>
struct Track {
    std::vector<Keyframe<Value>> keys;  ///< one or more, times rising
    Interpolation interpolation = Interpolation::Linear;

    bool constant() const noexcept { return keys.size() == 1; }
};

using ScalarTrack = Track<double>;
using PositionTrack = Track<Vector3>;

/// A track that never changes.
template <typename Value>
Track<Value> constantTrack(const Value& value) {
    return {{{0.0, value}}, Interpolation::Step};
}

/// @param seconds  any time; see Track for times outside the keyframes
double valueAt(const ScalarTrack& track, double seconds) noexcept;
Vector3 valueAt(const PositionTrack& track, double seconds) noexcept;

}  // namespace tessaly
