// Keyframes and paths.
#include "scene/track_reader.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <string_view>
#include <vector>

#include "minihost/pose.h"
#include "scene/scene_keys.h"
#include "scene/scene_limits.h"

namespace tessaly {

namespace {

using namespace scene_limits;

Vector3 readPoint(const SceneValue& value) {
    value.listSize(3, 3);
    return {value.item(0).number(-farthest, farthest), value.item(1).number(-farthest, farthest),
            value.item(2).number(-farthest, farthest)};
}

double readScalar(const SceneValue& value, const ScalarRange& range) {
    if (range.wholeNumbers) {
        return value.wholeNumber(static_cast<int>(range.low), static_cast<int>(range.high));
    }
    return value.number(range.low, range.high);
}

Interpolation readInterpolation(const SceneValue& track, bool stepsOnly) {
    const std::optional<SceneValue> value = track.find("interpolation");
    if (!value) {
        return stepsOnly ? Interpolation::Step : Interpolation::Linear;
    }
    constexpr std::array kinds = {Interpolation::Step, Interpolation::Linear,
                                  Interpolation::Spline};
    const Interpolation chosen = kinds[value->choice(scene_keys::interpolations)];
    if (stepsOnly && chosen != Interpolation::Step) {
        value->fail("must be \"step\": the parameter has no values in between");
    }
    return chosen;
}

// Reads a keyframe's time, which must be above that of the keyframe before.
template <typename Value>
double readTime(const SceneValue& value, const std::vector<Keyframe<Value>>& before) {
    const double time = value.number(0.0, longest);
    if (!before.empty() && time <= before.back().time) {
        value.fail(fmt::format("must be above {}, got {}", before.back().time, time));
    }
    return time;
}

OrbitPath readOrbit(const SceneValue& value, const std::optional<double>& duration) {
    value.allowOnly(scene_keys::orbit);
    OrbitPath orbit;
    orbit.radius = value.numberOr("radius", nearest, farthest, orbit.radius);
    orbit.turns = value.numberOr("turns", 0.0, mostTurns, orbit.turns);
    orbit.elevation = value.numberOr("elevation", -90.0, 90.0, orbit.elevation);
    orbit.startAzimuth = value.numberOr("start", -360.0, 360.0, orbit.startAzimuth);
    if (const std::optional<SceneValue> direction = value.find("direction")) {
        orbit.clockwise = direction->choice(scene_keys::directions) == 0;
    }
    if (const std::optional<SceneValue> period = value.find("period")) {
        const double seconds = period->number(shortest, longest);
        if (value.has("turns")) {
            period->fail("does not go with \"turns\"");
        }
        if (!duration) {
            period->fail("needs the scene's \"duration\": without it give \"turns\"");
        }
        orbit.turns = *duration / seconds;
    }
    return orbit;
}

RisePath readRise(const SceneValue& value) {
    value.allowOnly(scene_keys::rise);
    RisePath rise;
    rise.radius = value.numberOr("radius", nearest, farthest, rise.radius);
    rise.azimuth = value.numberOr("azimuth", -360.0, 360.0, rise.azimuth);
    rise.fromElevation = value.numberOr("from", -90.0, 270.0, rise.fromElevation);
    rise.toElevation = value.numberOr("to", -90.0, 270.0, rise.toElevation);
    return rise;
}

LinePath readLine(const SceneValue& value) {
    value.allowOnly(scene_keys::line);
    return {readPoint(value.need("from")), readPoint(value.need("to"))};
}

FixedPath readDirection(const SceneValue& value) {
    value.allowOnly(scene_keys::direction);
    return {fromSpherical(value.numberOr("azimuth", -360.0, 360.0, 0.0),
                          value.numberOr("elevation", -90.0, 90.0, 0.0),
                          value.numberOr("distance", 0.0, farthest, 1.0))};
}

}  // namespace

ScalarTrack readScalarTrack(const SceneValue& value, const ScalarRange& range) {
    if (!value.isObject()) {
        return constantTrack(readScalar(value, range));
    }
    value.allowOnly(scene_keys::scalarTrack);
    ScalarTrack track;
    track.interpolation = readInterpolation(value, range.stepsOnly);
    const SceneValue keyframes = value.need("keyframes");
    const std::size_t count = keyframes.listSize(1, mostKeyframes);
    for (std::size_t i = 0; i < count; ++i) {
        const SceneValue pair = keyframes.item(i);
        pair.listSize(2, 2);
        const double time = readTime(pair.item(0), track.keys);
        track.keys.push_back({time, readScalar(pair.item(1), range)});
    }
    return track;
}

PositionTrack readPositionTrack(const SceneValue& value) {
    if (!value.isObject()) {
        return constantTrack(readPoint(value));
    }
    value.allowOnly(scene_keys::positionTrack);
    PositionTrack track;
    track.interpolation = readInterpolation(value, false);
    const SceneValue keyframes = value.need("keyframes");
    const std::size_t count = keyframes.listSize(1, mostKeyframes);
    for (std::size_t i = 0; i < count; ++i) {
        const SceneValue keyframe = keyframes.item(i);
        keyframe.allowOnly(scene_keys::positionKeyframe);
        const double time = readTime(keyframe.need("time"), track.keys);
        track.keys.push_back({time, readPoint(keyframe.need("at"))});
    }
    return track;
}

ScenePath readPath(const SceneValue& value, const std::optional<double>& duration) {
    if (!value.isObject()) {
        return readPositionTrack(value);
    }
    constexpr std::array<std::string_view, 8> known = {
        "keyframes", "interpolation", "orbit", "line", "rise", "azimuth", "elevation", "distance"};
    value.allowOnly(known);
    if (value.has("keyframes")) {
        return readPositionTrack(value);
    }
    constexpr std::array<std::string_view, 3> paths = {"orbit", "line", "rise"};
    const auto named = std::find_if(paths.begin(), paths.end(),
                                    [&](std::string_view key) { return value.has(key); });
    if (named == paths.end()) {
        if (value.keyCount() == 0) {
            value.fail("needs \"keyframes\", \"orbit\", \"line\", \"rise\" or \"azimuth\"");
        }
        return SourcePath(readDirection(value));
    }
    for (std::size_t i = 0; i < value.keyCount(); ++i) {
        if (value.keyName(i) != *named) {
            value.failAtKey(i, fmt::format("does not go with \"{}\"", *named));
        }
    }
    const SceneValue path = value.need(*named);
    if (*named == "orbit") {
        return SourcePath(readOrbit(path, duration));
    }
    return *named == "line" ? SourcePath(readLine(path)) : SourcePath(readRise(path));
}

}  // namespace tessaly
