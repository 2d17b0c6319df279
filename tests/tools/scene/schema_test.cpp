// The schema that editors use, the reader, the examples and the scenes that are refused.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>
#include <random>
#include <set>
#include <span>
#include <string>

#include "render/rooms.h"
#include "scene/parameter_reader.h"
#include "scene/scene_file.h"
#include "scene/scene_keys.h"

namespace tessaly {
namespace {

using nlohmann::json;

json jsonOf(const std::string& file) {
    std::ifstream stream(file);
    return json::parse(stream);
}

const json& schema() {
    static const json whole = jsonOf(TESSALY_SCENE_SCHEMA);
    return whole;
}

const json& definition(std::string_view name) {
    return name == "scene" ? schema() : schema().at("definitions").at(std::string(name));
}

std::set<std::string> keysOf(const json& object) {
    std::set<std::string> keys;
    for (const auto& item : object.items()) {
        keys.insert(item.key());
    }
    return keys;
}

template <typename Texts>
std::set<std::string> setOf(const Texts& texts) {
    return {texts.begin(), texts.end()};
}

TEST(SceneSchema, KnowsTheKeysOfTheReader) {
    for (const scene_keys::ObjectKeys& object : scene_keys::objects) {
        SCOPED_TRACE(object.object);
        const json& rules = definition(object.object);
        EXPECT_EQ(keysOf(rules.at("properties")), setOf(object.keys));
        EXPECT_EQ(rules.at("additionalProperties"), false);
    }
}

TEST(SceneSchema, KnowsTheWordsOfTheReader) {
    const auto words = [](const json& rules) {
        return rules.at("enum").get<std::set<std::string>>();
    };
    const json& source = definition("source").at("properties");
    EXPECT_EQ(words(source.at("sound")), setOf(scene_keys::sounds));
    for (const char* track : {"scalarTrack", "positionTrack"}) {
        EXPECT_EQ(words(definition(track).at("properties").at("interpolation")),
                  setOf(scene_keys::interpolations));
    }
    EXPECT_EQ(words(definition("orbit").at("properties").at("direction")),
              setOf(scene_keys::directions));
    std::set<std::string> rooms;
    for (int room = 0; room < roomCount; ++room) {
        rooms.emplace(roomAt(room).name);
    }
    EXPECT_EQ(words(definition("room").at("anyOf").at(1)), rooms);
}

void expectParameters(const json& rules,
                      std::span<const ParameterRow> rows,
                      std::span<const OwnKey> ownKeys) {
    std::set<std::string> names;
    for (const ParameterRow& row : rows) {
        const bool own = std::any_of(ownKeys.begin(), ownKeys.end(),
                                     [&](const OwnKey& key) { return key.parameter == row.name; });
        if (own) {
            continue;
        }
        names.insert(row.name);
        SCOPED_TRACE(row.name);
        ASSERT_TRUE(rules.at("properties").contains(row.name));
        const json& rule = rules.at("properties").at(row.name);
        const ScalarRange range = rangeOf(row);
        EXPECT_EQ(rule.at("minimum").get<float>(), static_cast<float>(range.low));
        EXPECT_EQ(rule.at("maximum").get<float>(), static_cast<float>(range.high));
        EXPECT_EQ(rule.at("allOf").at(0).at("$ref"),
                  range.stepsOnly ? "#/definitions/stepTrack" : "#/definitions/track");
    }
    EXPECT_EQ(keysOf(rules.at("properties")), names);
    EXPECT_EQ(rules.at("additionalProperties"), false);
}

TEST(SceneSchema, KnowsTheParametersOfTheEffects) {
    expectParameters(definition("sourceParameters"), spatializer::parameterRows, sourceOwnKeys);
    expectParameters(definition("returnParameters"), reverb::parameterRows, returnOwnKeys);
}

// The schema says nothing of most defaults' effects, but what it says must hold.
TEST(SceneSchema, KnowsTheDefaultsOfAnEngine) {
    const EngineSettings settings;
    const json& rules = definition("engine").at("properties");
    EXPECT_EQ(rules.at("flexReflections").at("default"), settings.qvFlexReflections == 1);
    EXPECT_EQ(rules.at("fading").at("default"), settings.fading == 1);
    EXPECT_EQ(rules.at("trackDirection").at("default"), settings.qvTrackDirection == 1);
    EXPECT_EQ(rules.at("alwaysUpdateFilter").at("default"), settings.alwaysUpdateFilter == 1);
    EXPECT_EQ(rules.at("doppler").at("default"), settings.doppler == 1);
    EXPECT_EQ(rules.at("limitPhi").at("default"), settings.limitPhi);
    EXPECT_EQ(rules.at("limitTheta").at("default"), settings.limitTheta);
    EXPECT_EQ(rules.at("updateInterval").at("default"), settings.qvUpdateInterval);
}

// What the schema offers for an engine is what the reader takes.
TEST(SceneSchema, EveryEngineKeyIsRead) {
    const json& rules = definition("engine").at("properties");
    for (const auto& [key, rule] : rules.items()) {
        SCOPED_TRACE(key);
        const bool isFlag = rule.at("type") == "boolean";
        const json wrong = isFlag ? json(0) : json(false);
        const json scene = {{"sources", {{{"sound", "pluck"}, {"engine", {{key, wrong}}}}}}};
        EXPECT_THROW(parseScene(scene.dump(), "a.json", "."), SceneError);
        const json right = isFlag ? json(true) : rule.at("maximum");
        const json good = {{"sources", {{{"sound", "pluck"}, {"engine", {{key, right}}}}}}};
        EXPECT_NO_THROW(parseScene(good.dump(), "a.json", "."));
    }
}

TEST(SceneReader, RefusesWithTheseWords) {
    const json cases = jsonOf(TESSALY_BAD_SCENES);
    EXPECT_GE(cases.size(), 50u);
    for (const json& one : cases) {
        SCOPED_TRACE(one.at("what").get<std::string>());
        std::string error = "no error";
        try {
            parseScene(one.at("scene").dump(), "a.json", "/nowhere/at/all");
        } catch (const SceneError& caught) {
            error = caught.what();
        }
        EXPECT_EQ(error, "a.json:1: " + one.at("error").get<std::string>());
    }
}

TEST(SceneExamples, CanBeRead) {
    int count = 0;
    for (const auto& entry : std::filesystem::directory_iterator(TESSALY_EXAMPLES)) {
        SCOPED_TRACE(entry.path());
        ++count;
        ASSERT_EQ(entry.path().extension(), ".json");
        const Scene scene = readScene(entry.path());
        EXPECT_FALSE(scene.title.empty());
        EXPECT_FALSE(scene.description.empty());
        ASSERT_TRUE(scene.duration);
        EXPECT_LE(*scene.duration + scene.tail, 12.0);
        const json text = jsonOf(entry.path());
        EXPECT_EQ(std::filesystem::weakly_canonical(entry.path().parent_path() /
                                                    text.at("$schema").get<std::string>()),
                  std::filesystem::weakly_canonical(TESSALY_SCENE_SCHEMA));
    }
    EXPECT_GE(count, 12);
}

// Whatever a slip of the hand makes of a scene: it is read, or refused in one line.
TEST(SceneExamples, SurviveDamage) {
    constexpr std::string_view slips = "{}[]\",:-.0x9e\n";
    int refused = 0;
    for (const auto& entry : std::filesystem::directory_iterator(TESSALY_EXAMPLES)) {
        std::ifstream stream(entry.path());
        const std::string text{std::istreambuf_iterator<char>(stream), {}};
        std::minstd_rand random(7);
        for (int i = 0; i < 60; ++i) {
            std::string damaged = text;
            const std::size_t place = random() % damaged.size();
            damaged.replace(place, random() % 6, 1, slips[random() % slips.size()]);
            SCOPED_TRACE(damaged);
            try {
                parseScene(damaged, "a.json", ".");
            } catch (const SceneError& error) {
                ++refused;
                const std::string line = error.what();
                EXPECT_EQ(line.find('\n'), std::string::npos) << line;
                EXPECT_EQ(line.rfind("a.json:", 0), 0u) << line;
            }
        }
    }
    EXPECT_GT(refused, 300);  // of 900; many slips fall into words
}

TEST(SceneExamples, ThePageOfTheFormatShowsAGoodOne) {
    std::ifstream stream(TESSALY_SCENE_PAGE);
    const std::string page{std::istreambuf_iterator<char>(stream), {}};
    const std::string fence = "```json\n";
    const std::size_t begin = page.find(fence);
    ASSERT_NE(begin, std::string::npos);
    const std::size_t end = page.find("```", begin + fence.size());
    const std::string text = page.substr(begin + fence.size(), end - begin - fence.size());
    const Scene scene = parseScene(text, "example", ".");
    EXPECT_EQ(scene.sources.size(), 2u);
    EXPECT_EQ(scene.returns.size(), 1u);
    // Every key of the reader is told.
    for (const scene_keys::ObjectKeys& object : scene_keys::objects) {
        for (const std::string_view key : object.keys) {
            EXPECT_NE(page.find(key), std::string::npos) << key;
        }
    }
}

}  // namespace
}  // namespace tessaly
