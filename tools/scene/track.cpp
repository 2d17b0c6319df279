// Interpolation between keyframes.
#include "scene/track.h"

#include <algorithm>
#include <cstddef>

namespace tessaly {

namespace {

double mixed(double from, double to, double fraction) { return from + (to - from) * fraction; }

// A cubic through both ends with the given slopes, per second, at them.
double hermite(
    double from, double to, double slopeFrom, double slopeTo, double seconds, double fraction) {
    const double square = fraction * fraction;
    const double cube = square * fraction;
    return (2.0 * cube - 3.0 * square + 1.0) * from + (3.0 * square - 2.0 * cube) * to +
           (cube - 2.0 * square + fraction) * seconds * slopeFrom +
           (cube - square) * seconds * slopeTo;
}

// Slope at a keyframe: across its two neighbours, or across the one there is at an end.
template <typename Value, typename Component>
double slopeAt(const std::vector<Keyframe<Value>>& keys, std::size_t index, Component component) {
    const std::size_t before = index == 0 ? index : index - 1;
    const std::size_t after = std::min(index + 1, keys.size() - 1);
    return (component(keys[after].value) - component(keys[before].value)) /
           (keys[after].time - keys[before].time);
}

// One component of the value strictly between the keyframes index and index + 1.
template <typename Value, typename Component>
double between(const Track<Value>& track, std::size_t index, double seconds, Component component) {
    const Keyframe<Value>& from = track.keys[index];
    const Keyframe<Value>& to = track.keys[index + 1];
    const double length = to.time - from.time;
    const double fraction = (seconds - from.time) / length;
    if (track.interpolation == Interpolation::Linear) {
        return mixed(component(from.value), component(to.value), fraction);
    }
    return hermite(component(from.value), component(to.value),
                   slopeAt(track.keys, index, component), slopeAt(track.keys, index + 1, component),
                   length, fraction);
}

// Calls `inside` with the index of the keyframe passed last, unless a keyframe's own value holds.
template <typename Value, typename Inside>
Value lookUp(const Track<Value>& track, double seconds, Inside inside) {
    const std::vector<Keyframe<Value>>& keys = track.keys;
    if (!(seconds > keys.front().time)) {  // a time that is no number takes the first
        return keys.front().value;
    }
    if (seconds >= keys.back().time) {
        return keys.back().value;
    }
    const auto next =
        std::upper_bound(keys.begin(), keys.end(), seconds,
                         [](double time, const Keyframe<Value>& key) { return time < key.time; });
    const Keyframe<Value>& last = *(next - 1);
    if (track.interpolation == Interpolation::Step || last.time == seconds) {
        return last.value;
    }
    return inside(static_cast<std::size_t>(next - 1 - keys.begin()));
}

}  // namespace

double valueAt(const ScalarTrack& track, double seconds) noexcept {
    return lookUp(track, seconds, [&](std::size_t index) {
        return between(track, index, seconds, [](double value) { return value; });
    });
}

Vector3 valueAt(const PositionTrack& track, double seconds) noexcept {
    return lookUp(track, seconds, [&](std::size_t index) {
        return Vector3{between(track, index, seconds, [](const Vector3& at) { return at.x; }),
                       between(track, index, seconds, [](const Vector3& at) { return at.y; }),
                       between(track, index, seconds, [](const Vector3& at) { return at.z; })};
    });
}

}  // namespace tessaly
