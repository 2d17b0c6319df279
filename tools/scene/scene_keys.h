// Every key that a scene may hold, and the words that some of them choose from.
#pragma once

#include <array>
#include <span>
#include <string_view>

namespace tessaly::scene_keys {

// clang-format off
inline constexpr std::array<std::string_view, 12> scene = {
    "$schema", "title", "description", "rate", "block", "duration", "tail", "walls", "listener",
    "sources", "returns", "comment"};
/// In the order of SetRoomDistances.
inline constexpr std::array<std::string_view, 6> walls = {
    "above", "below", "front", "back", "left", "right"};
inline constexpr std::array<std::string_view, 5> listener = {
    "position", "yaw", "pitch", "roll", "comment"};
inline constexpr std::array<std::string_view, 14> source = {
    "name", "file", "sound", "text", "use", "gain", "start", "loop", "position", "room",
    "parameters", "sends", "engine", "comment"};
inline constexpr std::array<std::string_view, 5> returnEffect = {
    "name", "id", "room", "parameters", "comment"};
inline constexpr std::array<std::string_view, 2> send = {"to", "level"};
inline constexpr std::array<std::string_view, 2> scalarTrack = {"keyframes", "interpolation"};
inline constexpr std::array<std::string_view, 2> positionTrack = {"keyframes", "interpolation"};
inline constexpr std::array<std::string_view, 2> positionKeyframe = {"time", "at"};
inline constexpr std::array<std::string_view, 3> direction = {"azimuth", "elevation", "distance"};
inline constexpr std::array<std::string_view, 6> orbit = {
    "radius", "turns", "period", "elevation", "start", "direction"};
inline constexpr std::array<std::string_view, 2> line = {"from", "to"};
inline constexpr std::array<std::string_view, 4> rise = {"radius", "azimuth", "from", "to"};
inline constexpr std::array<std::string_view, 17> engine = {
    "quality", "headphone", "interpolateSpectra", "interpolateFilters", "earlyReflections",
    "flexReflections", "smoothSteps", "fading", "trackDirection", "use256HRIR", "limitPhi",
    "limitTheta", "updateInterval", "alwaysUpdateFilter", "auralisation",
    "doppler", "bypass3DAudio"};

inline constexpr std::array<std::string_view, 5> sounds = {
    "pluck", "drums", "bursts", "speech", "impulse"};
inline constexpr std::array<std::string_view, 3> interpolations = {"step", "linear", "spline"};
inline constexpr std::array<std::string_view, 2> directions = {"clockwise", "anticlockwise"};
// clang-format on

/// The objects that a scene is made of, by the names their rules have in the schema.
struct ObjectKeys {
    std::string_view object;
    std::span<const std::string_view> keys;
};
inline constexpr std::array<ObjectKeys, 14> objects = {{
    {"scene", scene},
    {"walls", walls},
    {"listener", listener},
    {"source", source},
    {"return", returnEffect},
    {"send", send},
    {"scalarTrack", scalarTrack},
    {"positionTrack", positionTrack},
    {"positionKeyframe", positionKeyframe},
    {"direction", direction},
    {"orbit", orbit},
    {"line", line},
    {"rise", rise},
    {"engine", engine},
}};

}  // namespace tessaly::scene_keys
