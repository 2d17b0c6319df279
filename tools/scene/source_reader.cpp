// Sources with their inputs, sends and engines, and returns.
#include "scene/source_reader.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <string>
#include <string_view>
#include <system_error>

#include "host/parameter_tables.h"
#include "scene/engine_keys.h"
#include "scene/near_names.h"
#include "scene/parameter_reader.h"
#include "scene/scene_keys.h"
#include "scene/scene_limits.h"
#include "scene/track_reader.h"

namespace tessaly {

namespace {

using namespace scene_limits;

constexpr double defaultUse = 8.0;  // seconds of a built-in sound
constexpr int highestQuality = 1000;
constexpr std::string_view reverbDisable = "Reverb disable";

std::string readFile(const SceneValue& value, const std::filesystem::path& folder) {
    const std::filesystem::path file = folder / value.text();
    std::error_code ignored;
    if (!std::filesystem::is_regular_file(file, ignored)) {
        value.fail(fmt::format("no file {}", inQuotes(file.string())));
    }
    return file.string();
}

SceneInput readInput(const SceneValue& source, const SourceSurroundings& surroundings) {
    SceneInput input;
    const std::optional<SceneValue> sound = source.find("sound");
    const std::optional<SceneValue> text = source.find("text");
    if (const std::optional<SceneValue> file = source.find("file")) {
        if (sound) {
            sound->fail("does not go with \"file\"");
        }
        input.file = readFile(*file, surroundings.folder);
    } else if (sound) {
        input.sound = scene_keys::sounds[sound->choice(scene_keys::sounds)];
    } else {
        source.fail("needs \"file\" or \"sound\"");
    }
    const bool speech = input.sound == "speech";
    if (text && !speech) {
        text->fail("goes with \"sound\": \"speech\" only");
    }
    if (speech) {
        input.text = source.need("text").text();
    }
    if (const std::optional<SceneValue> use = source.find("use")) {
        input.duration = use->number(shortest, longest);
    }
    return input;
}

// Built-in sounds repeat their pattern for as long as they are asked to.
void bound(SceneInput& input, double start, const std::optional<double>& sceneDuration) {
    const bool endless = !input.sound.empty() && input.sound != "speech";
    if (endless && !input.duration) {
        input.duration = sceneDuration ? *sceneDuration - start : defaultUse;
    }
}

int readReturnId(const SceneValue& value, const std::vector<SceneReturn>& returns) {
    if (value.isNumber()) {
        const int id = value.wholeNumber(1, highestId);
        const bool known = std::any_of(returns.begin(), returns.end(),
                                       [&](const SceneReturn& one) { return one.reverbId == id; });
        if (!known) {
            value.fail(fmt::format("no return has the ID {}", id));
        }
        return id;
    }
    const std::string wanted = value.text();
    std::vector<std::string_view> names;
    for (const SceneReturn& one : returns) {
        if (one.name == wanted) {
            return one.reverbId;
        }
        names.emplace_back(one.name);
    }
    value.fail(
        fmt::format("no return is called {}{}", inQuotes(wanted), didYouMean(wanted, names)));
}

std::vector<SceneSend> readSends(const SceneValue& value, const std::vector<SceneReturn>& returns) {
    std::vector<SceneSend> sends;
    const std::size_t count = value.listSize(0, mostSends);
    for (std::size_t i = 0; i < count; ++i) {
        const SceneValue item = value.item(i);
        item.allowOnly(scene_keys::send);
        SceneSend send;
        send.reverbId = readReturnId(item.need("to"), returns);
        if (const std::optional<SceneValue> level = item.find("level")) {
            send.level = level->wholeNumber(static_cast<int>(quietest), static_cast<int>(loudest));
        }
        sends.push_back(send);
    }
    return sends;
}

// A source feeds returns only while its own reverb is off.
void turnOffOwnReverb(const SceneValue& value, SceneSource& source) {
    const ParameterTrack* own = findTrack(source.parameters, reverbDisable);
    if (own == nullptr) {
        source.parameters.push_back({std::string(reverbDisable), constantTrack(1.0)});
        return;
    }
    const std::vector<Keyframe<double>>& keys = own->track.keys;
    const bool everOff = std::any_of(keys.begin(), keys.end(),
                                     [](const Keyframe<double>& key) { return key.value >= 1.0; });
    if (!everOff) {
        value.need("sends").fail(fmt::format(
            "needs the parameter \"{}\" at 1 or above, or left out: it is never", reverbDisable));
    }
}

DirectEngine readEngine(const SceneValue& value, int blockLength) {
    value.allowOnly(scene_keys::engine);
    DirectEngine engine;
    for (const EngineSwitch& one : engineSwitches) {
        if (const std::optional<SceneValue> given = value.find(one.key)) {
            engine.settings.*one.field = given->flag() ? 1 : 0;
        }
    }
    for (const EngineNumber& one : engineNumbers) {
        if (const std::optional<SceneValue> given = value.find(one.key)) {
            const int number = given->wholeNumber(one.low, one.high);
            engine.settings.*one.field = static_cast<std::int16_t>(number);
        }
    }
    if (engine.settings.qvHpTFcompSelect > 0 && blockLength < headphoneBlock) {
        value.need("headphone")
            .fail(
                fmt::format("needs \"block\" of {} or more, got {}", headphoneBlock, blockLength));
    }
    if (const std::optional<SceneValue> quality = value.find("quality")) {
        engine.qualityValue = static_cast<std::int16_t>(quality->wholeNumber(0, highestQuality));
    }
    return engine;
}

}  // namespace

SceneReturn readReturn(const SceneValue& value, const std::vector<SceneReturn>& before) {
    value.allowOnly(scene_keys::returnEffect);
    SceneReturn result;
    const std::optional<SceneValue> id = value.find("id");
    result.reverbId = id ? id->wholeNumber(1, highestId) : static_cast<int>(before.size()) + 1;
    result.name = value.textOr("name", fmt::format("return {}", result.reverbId));
    for (const SceneReturn& other : before) {
        if (other.reverbId == result.reverbId) {
            (id ? *id : value)
                .fail(fmt::format("a return before has the ID {} too", result.reverbId));
        }
        if (other.name == result.name) {
            value.find("name").value_or(value).fail(
                fmt::format("a return before is called {} too", inQuotes(result.name)));
        }
    }
    result.room =
        readRoomAndParameters(value, reverb::parameterRows, returnOwnKeys, result.parameters);
    return result;
}

SceneSource readSource(const SceneValue& value, const SourceSurroundings& surroundings) {
    value.allowOnly(scene_keys::source);
    SceneSource source;
    source.input = readInput(value, surroundings);
    source.name =
        value.textOr("name", source.input.sound.empty() ? source.input.file.stem().string()
                                                        : source.input.sound);
    source.gainDb = value.numberOr("gain", quietest, loudest, 0.0);
    source.start = value.numberOr("start", 0.0, longest, 0.0);
    if (surroundings.duration && source.start >= *surroundings.duration) {
        value.need("start").fail(fmt::format("must be below the scene's {} s, got {}",
                                             *surroundings.duration, source.start));
    }
    source.loop = value.flagOr("loop", false);
    bound(source.input, source.start, surroundings.duration);
    if (const std::optional<SceneValue> position = value.find("position")) {
        source.path = readPath(*position, surroundings.duration);
    }
    source.room =
        readRoomAndParameters(value, spatializer::parameterRows, sourceOwnKeys, source.parameters);
    if (const std::optional<SceneValue> sends = value.find("sends")) {
        source.sends = readSends(*sends, surroundings.returns);
    }
    if (!source.sends.empty()) {
        turnOffOwnReverb(value, source);
    }
    if (const std::optional<SceneValue> engine = value.find("engine")) {
        if (!source.sends.empty()) {
            value.need("sends").fail("goes through the effect's engine, not with \"engine\"");
        }
        source.engine = readEngine(*engine, surroundings.blockLength);
    }
    return source;
}

}  // namespace tessaly
