// Reads a whole scene: the file, its own keys, and the order in which parts need each other.
#include "scene/scene_file.h"

#include <fmt/format.h>

#include <array>
#include <cstddef>
#include <fstream>
#include <optional>
#include <system_error>
#include <vector>

#include "scene/json_tree.h"
#include "scene/scene_keys.h"
#include "scene/scene_limits.h"
#include "scene/scene_value.h"
#include "scene/source_reader.h"
#include "scene/track_reader.h"

namespace tessaly {

namespace {

using namespace scene_limits;

std::string tooLarge(const std::string& name) {
    return fmt::format("{}: is larger than {} MB", name, largestFile / (1024u * 1024u));
}

int readRate(const SceneValue& value) {
    const int rate = value.wholeNumber(0, 1000000);
    if (rate != 24000 && rate != 44100 && rate != 48000) {
        value.fail(fmt::format("must be 24000, 44100 or 48000, got {}", rate));
    }
    return rate;
}

int readBlock(const SceneValue& value) {
    const int block = value.wholeNumber(smallestBlock, largestBlock);
    if ((block & (block - 1)) != 0) {
        value.fail(fmt::format("must be a power of two, got {}", block));
    }
    return block;
}

std::array<float, 6> readWalls(const SceneValue& value) {
    value.allowOnly(scene_keys::walls);
    std::array<float, 6> walls{};
    for (std::size_t i = 0; i < walls.size(); ++i) {
        const double metres = value.need(scene_keys::walls[i]).number(nearestWall, farthestWall);
        walls[i] = static_cast<float>(metres);
    }
    return walls;
}

void readTurning(const SceneValue& listener, std::string_view key, ScalarTrack& track) {
    if (const std::optional<SceneValue> value = listener.find(key)) {
        track = readScalarTrack(*value, {-widestAngle, widestAngle});
    }
}

SceneListener readListener(const SceneValue& value) {
    value.allowOnly(scene_keys::listener);
    SceneListener listener;
    if (const std::optional<SceneValue> position = value.find("position")) {
        listener.position = readPositionTrack(*position);
    }
    readTurning(value, "yaw", listener.yaw);
    readTurning(value, "pitch", listener.pitch);
    readTurning(value, "roll", listener.roll);
    return listener;
}

void readReturns(const SceneValue& root, Scene& scene) {
    const std::optional<SceneValue> returns = root.find("returns");
    if (!returns) {
        return;
    }
    const std::size_t count = returns->listSize(0, static_cast<std::size_t>(highestId));
    for (std::size_t i = 0; i < count; ++i) {
        scene.returns.push_back(readReturn(returns->item(i), scene.returns));
    }
}

// The headphone filter is one for the whole process: the first engine's.
void checkHeadphone(const SceneValue& sources, const Scene& scene) {
    std::optional<std::size_t> first;
    for (std::size_t i = 0; i < scene.sources.size(); ++i) {
        const std::optional<DirectEngine>& engine = scene.sources[i].engine;
        if (!engine) {
            continue;
        }
        if (!first) {
            first = i;
        }
        const std::int16_t shared = scene.sources[*first].engine->settings.qvHpTFcompSelect;
        if (engine->settings.qvHpTFcompSelect != shared) {
            const SceneValue value = sources.item(i).need("engine");
            value.find("headphone")
                .value_or(value)
                .fail(fmt::format("all engines share one headphone filter: must be {} as in "
                                  "sources[{}], got {}",
                                  shared, *first, engine->settings.qvHpTFcompSelect));
        }
    }
}

void readSources(const SceneValue& root, const std::filesystem::path& folder, Scene& scene) {
    const SceneValue sources = root.need("sources");
    const std::size_t count = sources.listSize(1, std::size_t{100000});
    const SourceSurroundings surroundings{folder, scene.blockLength, scene.duration, scene.returns};
    scene.sources.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        scene.sources.push_back(readSource(sources.item(i), surroundings));
    }
    checkHeadphone(sources, scene);
}

}  // namespace

Scene parseScene(std::string_view text,
                 const std::string& name,
                 const std::filesystem::path& folder) {
    if (text.size() > largestFile) {
        throw SceneError(tooLarge(name));
    }
    const JsonNode tree = parseJson(text, name);
    const SceneValue root(tree, name);
    root.allowOnly(scene_keys::scene);
    root.textOr("$schema", "");  // for editors
    Scene scene;
    scene.title = root.textOr("title", "");
    scene.description = root.textOr("description", "");
    if (const std::optional<SceneValue> rate = root.find("rate")) {
        scene.sampleRate = readRate(*rate);
    }
    if (const std::optional<SceneValue> block = root.find("block")) {
        scene.blockLength = readBlock(*block);
    }
    if (const std::optional<SceneValue> duration = root.find("duration")) {
        scene.duration = duration->number(shortest, longest);
    }
    scene.tail = root.numberOr("tail", 0.0, longestTail, 0.0);
    if (const std::optional<SceneValue> walls = root.find("walls")) {
        scene.wallDistances = readWalls(*walls);
    }
    if (const std::optional<SceneValue> listener = root.find("listener")) {
        scene.listener = readListener(*listener);
    }
    readReturns(root, scene);
    readSources(root, folder, scene);
    return scene;
}

Scene readScene(const std::filesystem::path& file) {
    const std::string name = file.string();
    std::error_code failure;
    if (!std::filesystem::exists(file, failure)) {
        throw SceneError(fmt::format("{}: there is no such file", name));
    }
    std::ifstream stream(file, std::ios::binary);
    if (std::filesystem::is_directory(file, failure) || !stream) {
        throw SceneError(fmt::format("{}: cannot be read", name));
    }
    // One byte more than allowed, so that a file that grows or has no size is noticed too.
    std::string text(largestFile + 1, '\0');
    stream.read(text.data(), static_cast<std::streamsize>(text.size()));
    const auto size = static_cast<std::size_t>(stream.gcount());
    if (stream.bad()) {
        throw SceneError(fmt::format("{}: cannot be read", name));
    }
    if (size > largestFile) {
        throw SceneError(tooLarge(name));
    }
    text.resize(size);
    return parseScene(text, name, file.parent_path());
}

}  // namespace tessaly
