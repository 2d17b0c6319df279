// Settings in words: values with units, changing ones with their keyframes.
#include "render/report_parameters.h"

#include <fmt/format.h>

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "host/parameter_tables.h"
#include "render/effect_names.h"
#include "render/single_source.h"
#include "render/source_path.h"
#include "scene/engine_keys.h"
#include "scene/scene_keys.h"

namespace tessaly {

namespace {

constexpr std::size_t mostKeyframesTold = 12;

std::string textOf(double value) { return fmt::format("{:g}", value); }

std::string textOf(const Vector3& value) {
    return fmt::format("({:g}, {:g}, {:g})", value.x, value.y, value.z);
}

const char* nameOf(Interpolation interpolation) {
    switch (interpolation) {
        case Interpolation::Step:
            return "steps";
        case Interpolation::Linear:
            return "linear";
        case Interpolation::Spline:
            return "spline";
    }
    return "";
}

template <typename Value>
std::string textOf(const Track<Value>& track) {
    if (track.constant()) {
        return textOf(track.keys[0].value);
    }
    std::string text;
    std::size_t told = 0;
    for (const Keyframe<Value>& key : track.keys) {
        if (told == mostKeyframesTold) {
            text += fmt::format(", and {} more", track.keys.size() - told);
            break;
        }
        text += fmt::format("{}{:g} s: {}", told == 0 ? "" : ", ", key.time, textOf(key.value));
        ++told;
    }
    return fmt::format("{} ({})", text, nameOf(track.interpolation));
}

std::string textOf(const ScenePath& path) {
    const auto* track = std::get_if<PositionTrack>(&path);
    return track != nullptr ? textOf(*track) : describe(std::get<SourcePath>(path));
}

class Rows {
public:
    void owner(std::string name) { owner_ = std::move(name); }
    void add(std::string name, std::string unit, std::string value) {
        rows_.push_back({owner_, std::move(name), std::move(unit), std::move(value)});
    }
    std::vector<ReportParameter> take() { return std::move(rows_); }

private:
    std::string owner_;
    std::vector<ReportParameter> rows_;
};

std::string unitOf(std::span<const ParameterRow> table, const std::string& name) {
    for (const ParameterRow& row : table) {
        if (name == row.name) {
            return row.unit;
        }
    }
    return "";
}

void addParameters(Rows& rows,
                   std::span<const ParameterRow> table,
                   const std::vector<ParameterTrack>& parameters) {
    for (const ParameterTrack& parameter : parameters) {
        rows.add(parameter.name, unitOf(table, parameter.name), textOf(parameter.track));
    }
}

void addScene(Rows& rows, const Scene& scene, double duration) {
    rows.owner("scene");
    rows.add("sample rate", "Hz", std::to_string(scene.sampleRate));
    rows.add("block", "frames", std::to_string(scene.blockLength));
    rows.add("duration", "s", fmt::format("{:.4g}", duration));
    rows.add("tail", "s", textOf(scene.tail));
    for (std::size_t i = 0; scene.wallDistances && i < scene_keys::walls.size(); ++i) {
        rows.add(fmt::format("wall {}", scene_keys::walls[i]), "m",
                 fmt::format("{:g}", (*scene.wallDistances)[i]));
    }
    rows.owner("listener");
    rows.add("position", "m", textOf(scene.listener.position));
    rows.add("yaw", "deg", textOf(scene.listener.yaw));
    rows.add("pitch", "deg", textOf(scene.listener.pitch));
    rows.add("roll", "deg", textOf(scene.listener.roll));
}

std::string inputText(const SceneInput& input) {
    if (!input.file.empty()) {
        return input.file.filename().string();
    }
    return input.sound == "speech" ? fmt::format("speech: {}", input.text) : input.sound;
}

const SceneReturn* returnOf(const Scene& scene, int reverbId) {
    for (const SceneReturn& one : scene.returns) {
        if (one.reverbId == reverbId) {
            return &one;
        }
    }
    return nullptr;
}

void addEngine(Rows& rows, const DirectEngine& engine) {
    rows.add("engine", "", "built directly");
    if (engine.qualityValue != 0) {
        rows.add("engine: quality", "", std::to_string(engine.qualityValue));
    }
    const EngineSettings given;
    for (const EngineSwitch& one : engineSwitches) {
        const std::uint8_t value = engine.settings.*one.field;
        if (value != given.*one.field) {
            rows.add(fmt::format("engine: {}", one.key), "OnOff", value != 0 ? "on" : "off");
        }
    }
    for (const EngineNumber& one : engineNumbers) {
        const std::int16_t value = engine.settings.*one.field;
        if (value != given.*one.field) {
            rows.add(fmt::format("engine: {}", one.key), "", std::to_string(value));
        }
    }
}

void addSource(Rows& rows, const Scene& scene, const SceneSource& source) {
    rows.owner(source.name);
    rows.add("input", "", inputText(source.input));
    rows.add("gain", "dB", textOf(source.gainDb));
    rows.add("start", "s", textOf(source.start));
    rows.add("loop", "OnOff", source.loop ? "on" : "off");
    rows.add("position", "m", textOf(source.path));
    rows.add("room", "", roomText(source.room));
    addParameters(rows, spatializer::parameterRows, source.parameters);
    for (const SceneSend& send : source.sends) {
        const SceneReturn* target = returnOf(scene, send.reverbId);
        rows.add(fmt::format("send to {}", target != nullptr ? target->name : "nothing"), "dB",
                 std::to_string(send.level));
    }
    if (source.engine) {
        addEngine(rows, *source.engine);
    }
}

void addReturn(Rows& rows, const SceneReturn& one) {
    rows.owner(fmt::format("return {}", one.name));
    rows.add(reverbIdParameter, "No", std::to_string(one.reverbId));
    rows.add("room", "", roomText(one.room));
    addParameters(rows, reverb::parameterRows, one.parameters);
}

}  // namespace

std::vector<ReportParameter> reportParameters(const Scene& scene, double duration) {
    Rows rows;
    addScene(rows, scene, duration);
    for (const SceneSource& source : scene.sources) {
        addSource(rows, scene, source);
    }
    for (const SceneReturn& one : scene.returns) {
        addReturn(rows, one);
    }
    return rows.take();
}

}  // namespace tessaly
