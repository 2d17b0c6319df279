// Reads rooms and effect parameters from a scene's text.
#pragma once

#include <array>
#include <span>
#include <string_view>
#include <vector>

#include "host/parameter_tables.h"
#include "scene/scene.h"
#include "scene/scene_value.h"
#include "scene/track_reader.h"

namespace tessaly {

/// A parameter that a scene expresses by a key of its own.
struct OwnKey {
    std::string_view parameter;
    std::string_view key;
};
inline constexpr std::array<OwnKey, 3> sourceOwnKeys = {
    {{"Reverb Size", "sends"}, {"Reverb ID", "sends"}, {"Reverb Send", "sends"}}};
inline constexpr std::array<OwnKey, 1> returnOwnKeys = {{{"ReverbID", "id"}}};

/// Values the effect takes for one of its parameters. "Room Selection" ends with the last room,
/// below its declared range; switches and rooms have nothing in between.
ScalarRange rangeOf(const ParameterRow& row) noexcept;

/// A room by its number or its name. @throws SceneError
int readRoom(const SceneValue& value);

/// An object of parameters, by name without regard to case and blanks.
/// @param rows  the effect's
/// @returns tracks in the order of the text, named as the library declares them
/// @throws SceneError
std::vector<ParameterTrack> readParameters(const SceneValue& value,
                                           std::span<const ParameterRow> rows,
                                           std::span<const OwnKey> ownKeys);

/// @returns the track of that exact name, null if there is none
const ParameterTrack* findTrack(const std::vector<ParameterTrack>& tracks, std::string_view name);

/// Reads "parameters" and "room" of a source or return, which may both set the room, but not both.
/// @returns the room at the start
int readRoomAndParameters(const SceneValue& owner,
                          std::span<const ParameterRow> rows,
                          std::span<const OwnKey> ownKeys,
                          std::vector<ParameterTrack>& tracks);

}  // namespace tessaly
