// One source from the options, and its picture.
#include "render/single_source.h"

#include <fmt/format.h>

#include <algorithm>

#include "render/picture.h"
#include "render/rooms.h"

namespace tessaly {

namespace {

constexpr double finestHop = 0.02;     // seconds between the points of the picture
constexpr double mostPoints = 1000.0;  // in one picture

}  // namespace

Scene sceneOf(const RenderOptions& options) {
    SceneSource source;
    source.name = options.sound.empty() ? options.input.filename().string() : options.sound;
    source.input.file = options.input;
    source.input.sound = options.sound;
    source.input.text = options.text;
    source.input.duration = options.duration;
    source.loop = options.loop;
    source.path = options.path;
    source.room = options.room;
    for (const auto& [name, value] : options.parameters) {
        source.parameters.push_back({name, constantTrack(static_cast<double>(value))});
    }
    Scene scene;
    scene.title = fmt::format("{}: {}", source.name, describe(options.path));
    scene.sampleRate = options.sampleRate;
    scene.blockLength = options.blockLength;
    scene.duration = options.duration;
    scene.sources.push_back(source);
    return scene;
}

void settleOrbit(Scene& scene, const RenderOptions& options, double duration) {
    auto* path = std::get_if<SourcePath>(&scene.sources[0].path);
    auto* orbit = path != nullptr ? std::get_if<OrbitPath>(path) : nullptr;
    if (orbit != nullptr && options.orbitPeriod) {
        orbit->turns = duration / *options.orbitPeriod;
        scene.title = fmt::format("{}: {}", scene.sources[0].name, describe(*orbit));
    }
}

std::string roomText(int room) {
    const Room& entry = roomAt(room);
    return entry.preset == 0 ? std::string("dry") : fmt::format("room {} ({})", room, entry.name);
}

std::string pictureOf(const Scene& scene, double duration, const std::vector<float>& stereo) {
    const SceneSource& source = scene.sources[0];
    PictureContent content;
    content.title = scene.title;
    content.subtitle = fmt::format("Tessaly, {}, {} Hz, blocks of {} frames", roomText(source.room),
                                   scene.sampleRate, scene.blockLength);
    for (const ParameterTrack& parameter : source.parameters) {
        content.subtitle +=
            fmt::format(", {} = {:g}", parameter.name, valueAt(parameter.track, 0.0));
    }
    content.path = std::get<SourcePath>(source.path);
    content.duration = duration;
    const double hop = std::max(finestHop, duration / mostPoints);
    content.points = measureBinaural(stereo, scene.sampleRate, hop);
    return drawPicture(content);
}

}  // namespace tessaly
