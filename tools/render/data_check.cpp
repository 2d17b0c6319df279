// Which data files a scene's rate, rooms and headphones ask for.
#include "render/data_check.h"

#include <fmt/format.h>

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <fstream>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>

#include "engine/headphone_compensation.h"
#include "engine/reverb_presets.h"
#include "render/effect_names.h"
#include "render/rooms.h"
#include "resources/hrir_grid.h"

namespace tessaly {

namespace {

constexpr int firstPresetWithTail = 15;
constexpr int longTaps = 256;  // frames of a response in the long form
constexpr std::uintmax_t waveHeaderBytes = 44;
constexpr std::uintmax_t pairBytes = 8;          // a float for each ear
constexpr std::uintmax_t tailHeaderBytes = 242;  // 2 unused, 60 offsets of 4
constexpr std::streamoff wordBytes = 4;
constexpr std::uintmax_t headphoneTaps = 256;
constexpr std::streamoff bitsOffset = 34;  // in a WAV header

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

std::uintmax_t sizeOf(const std::filesystem::path& file) {
    std::error_code failure;
    const std::uintmax_t size = std::filesystem::file_size(file, failure);
    if (failure) {
        throw std::runtime_error(
            fmt::format("cannot read {}: {}", file.string(), failure.message()));
    }
    return size;
}

// The value as it lies in the file, 0 behind its end.
template <typename T>
T valueIn(const std::filesystem::path& file, std::streamoff offset) {
    std::array<char, sizeof(T)> bytes{};
    std::ifstream stream(file, std::ios::binary);
    stream.seekg(offset);
    return stream.read(bytes.data(), sizeof(T)) ? std::bit_cast<T>(bytes) : T{};
}

std::runtime_error damaged(const std::filesystem::path& file, const std::string& fault) {
    return std::runtime_error(fmt::format("{} is damaged: {}", file.string(), fault));
}

// Frames of a response at a rate, but for the long form.
int ownTaps(int sampleRate) { return sampleRate == 44100 ? 128 : sampleRate == 48000 ? 139 : 70; }

std::uintmax_t responseBytes(int taps) {
    return waveHeaderBytes + std::uintmax_t{hrirCount} * static_cast<unsigned>(taps) * pairBytes;
}

// With a file of the other form the library would play noise, or read it as too short.
void checkResponses(const std::filesystem::path& file, const Scene& scene) {
    const std::uintmax_t size = sizeOf(file);
    const int own = ownTaps(scene.sampleRate);
    bool ownWanted = !scene.returns.empty();
    const SceneSource* longWanted = nullptr;
    for (const SceneSource& source : scene.sources) {
        if (source.engine && usesLongResponses(*source.engine)) {
            longWanted = &source;
        } else {
            ownWanted = true;
        }
    }
    if (size != responseBytes(own) && size != responseBytes(longTaps)) {
        const int expected = ownWanted ? own : longTaps;
        throw damaged(file, fmt::format("{} bytes, expected {}", size, responseBytes(expected)));
    }
    if (ownWanted && size != responseBytes(own)) {
        throw std::runtime_error(
            fmt::format("{} holds responses of {} frames: only sources with the engine setting "
                        "use256HRIR can use it",
                        file.string(), longTaps));
    }
    if (longWanted != nullptr && size != responseBytes(longTaps)) {
        throw std::runtime_error(fmt::format(
            "{} holds responses of {} frames: source \"{}\" needs responses of {} frames: make a "
            "set with tessaly-data all --taps {}",
            file.string(), own, longWanted->name, longTaps, longTaps));
    }
}

// A tail that does not lie in the file as a whole would be silent from the file's end on.
void checkTail(const std::filesystem::path& file, int room, int sampleRate) {
    const ReverbPreset* preset = findReverbPreset(roomAt(room).preset);
    if (preset == nullptr) {
        return;
    }
    const std::uintmax_t size = sizeOf(file);
    if (size < tailHeaderBytes) {
        throw damaged(file, fmt::format("{} bytes, expected more than {}", size, tailHeaderBytes));
    }
    const auto start = valueIn<std::int32_t>(file, wordBytes * preset->number - 2);
    if (start < 0 || static_cast<std::uintmax_t>(start) > (size - tailHeaderBytes) / pairBytes) {
        throw damaged(file, fmt::format("{} bytes, but the tail of room {} ({}) starts at frame {}",
                                        size, room, roomAt(room).name, start));
    }
    const std::int64_t end = std::int64_t{start} + reverbFramesAt(sampleRate, preset->length48000);
    const std::uintmax_t needed = tailHeaderBytes + static_cast<std::uintmax_t>(end) * pairBytes;
    if (size < needed) {
        throw damaged(
            file, fmt::format("{} bytes, expected {} or more for the tail of room {} ({})", size,
                              needed, room, roomAt(room).name));
    }
}

void checkTails(const std::filesystem::path& directory, const Scene& scene) {
    const auto tails = directory / fmt::format("TSLdata51{}.dat", rateDigit(scene.sampleRate));
    for (const int room : roomsOf(scene)) {
        if (room < 0 || room >= roomCount || roomAt(room).preset < firstPresetWithTail) {
            continue;
        }
        if (!isFile(tails)) {
            throw std::runtime_error(fmt::format("no tail for room {} ({}) at {} Hz: {} is missing",
                                                 room, roomAt(room).name, scene.sampleRate,
                                                 tails.string()));
        }
        checkTail(tails, room, scene.sampleRate);
    }
}

void checkHeadphoneFilter(const std::filesystem::path& file) {
    const std::uintmax_t size = sizeOf(file);
    const auto mark = valueIn<std::array<char, 4>>(file, 0);
    if (std::string_view(mark.data(), mark.size()) != "RIFF") {
        throw damaged(file, fmt::format("{} bytes, and no WAV header", size));
    }
    const unsigned sampleBytes = valueIn<std::uint16_t>(file, bitsOffset) == 16 ? 2 : 4;
    const std::uintmax_t needed = waveHeaderBytes + headphoneTaps * sampleBytes;
    if (size < needed) {
        throw damaged(file, fmt::format("{} bytes, expected {} or more", size, needed));
    }
}

void checkHeadphones(const std::filesystem::path& directory, const Scene& scene) {
    for (const SceneSource& source : scene.sources) {
        const int selection = source.engine ? source.engine->settings.qvHpTFcompSelect : 0;
        const char* name = headphoneFileName(selection);
        if (name == nullptr) {
            continue;
        }
        const std::filesystem::path file = directory.string() + name;
        if (!isFile(file)) {
            throw std::runtime_error(
                fmt::format("no filter for headphone {}: {} is missing", selection, file.string()));
        }
        checkHeadphoneFilter(file);
    }
}

}  // namespace

bool usesLongResponses(const DirectEngine& engine) noexcept {
    const std::int16_t step = engine.qualityValue;
    if (step == 0) {
        return engine.settings.qvUse256HRIR != 0;
    }
    return step >= 2 && step != 6 && step != 8;
}

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
    checkResponses(directory / fmt::format("TSLdata12{}.dat", rateDigit(scene.sampleRate)), scene);
}

}  // namespace tessaly
