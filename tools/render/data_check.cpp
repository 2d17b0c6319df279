// Which data files a scene's rate, rooms and headphones ask for.
#include "render/data_check.h"

#include <fmt/format.h>

#include <set>
#include <stdexcept>
#include <string>

#include "engine/headphone_compensation.h"
#include "render/effect_names.h"
#include "render/rooms.h"

namespace tessaly {

namespace {

constexpr int firstPresetWithTail = 15;

bool isFile(const std::filesystem::path& file) {
    std::error_code ignored;
    return std::filesystem::is_regular_file(file, ignored);
}

// The digit in the names of the files of a rate.
char rateDigit(int sampleRate) {
    return sampleRate == 44100 ? '0' : sampleRate == 48000 ? '1' : '2';
}

void addRooms(int room, const std::vector<ParameterTrack>& parameters, std::set<int>& rooms) {
    rooms.insert(room);
    for (const ParameterTrack& parameter : parameters) {
        if (parameter.name == roomParameter) {
            for (const Keyframe<double>& key : parameter.track.keys) {
                rooms.insert(static_cast<int>(key.value));
            }
        }
    }
}

std::set<int> roomsOf(const Scene& scene) {
    std::set<int> rooms;
    for (const SceneSource& source : scene.sources) {
        addRooms(source.room, source.parameters, rooms);
    }
    for (const SceneReturn& one : scene.returns) {
        addRooms(one.room, one.parameters, rooms);
    }
    return rooms;
}

void checkTails(const std::filesystem::path& directory, const Scene& scene) {
    const auto tails = directory / fmt::format("TSLdata51{}.dat", rateDigit(scene.sampleRate));
    if (isFile(tails)) {
        return;
    }
    for (const int room : roomsOf(scene)) {
        if (room >= 0 && room < roomCount && roomAt(room).preset >= firstPresetWithTail) {
            throw std::runtime_error(fmt::format("no tail for room {} ({}) at {} Hz: {} is missing",
                                                 room, roomAt(room).name, scene.sampleRate,
                                                 tails.string()));
        }
    }
}

void checkHeadphones(const std::filesystem::path& directory, const Scene& scene) {
    for (const SceneSource& source : scene.sources) {
        const int selection = source.engine ? source.engine->settings.qvHpTFcompSelect : 0;
        const char* name = headphoneFileName(selection);
        if (name != nullptr && !isFile(directory.string() + name)) {
            throw std::runtime_error(fmt::format("no filter for headphone {}: {} is missing",
                                                 selection, directory.string() + name));
        }
    }
}

}  // namespace

void checkData(const std::filesystem::path& directory, const Scene& scene) {
    std::error_code ignored;
    if (!std::filesystem::is_directory(directory, ignored)) {
        throw std::runtime_error("no data directory " + directory.string() +
                                 ": make it with tessaly-data or name one with --data");
    }
    checkTails(directory, scene);
    checkHeadphones(directory, scene);
    // The library asks for the file of 44100 Hz whatever the rate.
    for (const char digit : {rateDigit(scene.sampleRate), '0'}) {
        const auto file = directory / fmt::format("TSLdata12{}.dat", digit);
        if (!isFile(file)) {
            throw std::runtime_error(
                fmt::format("no data for {} Hz: {} is missing", scene.sampleRate, file.string()));
        }
    }
}

}  // namespace tessaly
