// Rooms and parameters by name.
#include "scene/parameter_reader.h"

#include <fmt/format.h>

#include <algorithm>
#include <string>

#include "render/rooms.h"
#include "render/text_numbers.h"
#include "scene/near_names.h"

namespace tessaly {

namespace {

constexpr std::string_view roomParameter = "Room Selection";

// The row that a name stands for, or the key's error.
const ParameterRow& rowOf(const SceneValue& parameters,
                          std::size_t index,
                          std::span<const ParameterRow> rows) {
    const std::string folded = foldedName(parameters.keyName(index));
    const auto row = std::find_if(rows.begin(), rows.end(), [&](const ParameterRow& candidate) {
        return foldedName(candidate.name) == folded;
    });
    if (row != rows.end()) {
        return *row;
    }
    std::vector<std::string_view> names;
    for (const ParameterRow& candidate : rows) {
        names.emplace_back(candidate.name);
    }
    parameters.failAtKey(index, "unknown parameter" + didYouMean(parameters.keyName(index), names));
}

}  // namespace

ScalarRange rangeOf(const ParameterRow& row) noexcept {
    if (row.name == roomParameter) {
        return {0.0, roomCount - 1.0, true, true};
    }
    const bool isSwitch = std::string_view(row.unit) == "OnOff";
    return {static_cast<double>(row.min), static_cast<double>(row.max), false, isSwitch};
}

int readRoom(const SceneValue& value) {
    if (value.isNumber()) {
        return value.wholeNumber(0, roomCount - 1);
    }
    const std::string text = value.text();
    if (const std::optional<int> room = roomFromText(text)) {
        return *room;
    }
    std::vector<std::string_view> names;
    for (int room = 0; room < roomCount; ++room) {
        names.push_back(roomAt(room).name);
    }
    value.fail(fmt::format("no room {}{}", inQuotes(text), didYouMean(text, names)));
}

std::vector<ParameterTrack> readParameters(const SceneValue& value,
                                           std::span<const ParameterRow> rows,
                                           std::span<const OwnKey> ownKeys) {
    std::vector<ParameterTrack> tracks;
    for (std::size_t i = 0; i < value.keyCount(); ++i) {
        const ParameterRow& row = rowOf(value, i, rows);
        const auto own = std::find_if(ownKeys.begin(), ownKeys.end(), [&](const OwnKey& candidate) {
            return candidate.parameter == row.name;
        });
        if (own != ownKeys.end()) {
            value.failAtKey(i, fmt::format("is set by \"{}\" beside \"parameters\"", own->key));
        }
        if (findTrack(tracks, row.name) != nullptr) {
            value.failAtKey(i, fmt::format("repeats the parameter \"{}\"", row.name));
        }
        tracks.push_back({row.name, readScalarTrack(value.keyValue(i), rangeOf(row))});
    }
    return tracks;
}

const ParameterTrack* findTrack(const std::vector<ParameterTrack>& tracks, std::string_view name) {
    const auto found = std::find_if(tracks.begin(), tracks.end(), [&](const ParameterTrack& track) {
        return track.name == name;
    });
    return found == tracks.end() ? nullptr : &*found;
}

int readRoomAndParameters(const SceneValue& owner,
                          std::span<const ParameterRow> rows,
                          std::span<const OwnKey> ownKeys,
                          std::vector<ParameterTrack>& tracks) {
    if (const std::optional<SceneValue> parameters = owner.find("parameters")) {
        tracks = readParameters(*parameters, rows, ownKeys);
    }
    const ParameterTrack* overTime = findTrack(tracks, roomParameter);
    const std::optional<SceneValue> room = owner.find("room");
    if (room && overTime != nullptr) {
        room->fail(fmt::format("does not go with the parameter \"{}\"", roomParameter));
    }
    if (overTime != nullptr) {
        return static_cast<int>(overTime->track.keys.front().value);
    }
    return room ? readRoom(*room) : 0;
}

}  // namespace tessaly
