// Scenes read from texts and files: what they mean and what is wrong with them.
#include "scene/scene_file.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstddef>
#include <filesystem>
#include <fstream>
#include <string>

#include "scene/json_tree.h"

namespace tessaly {
namespace {

using testing::HasSubstr;
using testing::MatchesRegex;

Scene parsed(const std::string& text) { return parseScene(text, "a.json", "/nowhere"); }

std::string errorOf(const std::string& text) {
    try {
        parsed(text);
    } catch (const SceneError& error) {
        return error.what();
    }
    return "no error";
}

// A scene of one plucked string with more keys in its source.
std::string withSource(const std::string& keys) {
    return R"({"duration": 6, "sources": [{"sound": "pluck", )" + keys + "}]}";
}

TEST(SceneFile, LeavesDefaultsWhereNothingIsSaid) {
    const Scene scene = parsed(R"({"sources": [{"sound": "pluck"}]})");
    EXPECT_EQ(scene.sampleRate, 48000);
    EXPECT_EQ(scene.blockLength, 1024);
    EXPECT_FALSE(scene.duration);
    EXPECT_EQ(scene.tail, 0.0);
    EXPECT_FALSE(scene.wallDistances);
    ASSERT_EQ(scene.sources.size(), 1u);
    const SceneSource& source = scene.sources[0];
    EXPECT_EQ(source.name, "pluck");
    EXPECT_EQ(source.input.sound, "pluck");
    EXPECT_TRUE(source.input.file.empty());
    EXPECT_EQ(source.room, 0);
    EXPECT_EQ(positionAt(source.path, 0.0, 1.0).z, 1.0);
    EXPECT_FALSE(source.loop);
    EXPECT_FALSE(source.engine);
    EXPECT_TRUE(source.parameters.empty());
    EXPECT_TRUE(scene.returns.empty());
}

TEST(SceneFile, ReadsTheFrame) {
    const Scene scene = parsed(R"({
        "$schema": "x", "comment": [1], "title": "Cave", "description": "two\nlines",
        "rate": 24000, "block": 256, "duration": 4.5, "tail": 2,
        "walls": {"right": 6, "left": 5, "back": 4, "front": 3, "below": 2, "above": 1},
        "sources": [{"sound": "drums"}]})");
    EXPECT_EQ(scene.title, "Cave");
    EXPECT_EQ(scene.description, "two lines");
    EXPECT_EQ(scene.sampleRate, 24000);
    EXPECT_EQ(scene.blockLength, 256);
    EXPECT_EQ(scene.duration, 4.5);
    EXPECT_EQ(scene.tail, 2.0);
    // SetRoomDistances takes above, below, front, back, left, right.
    EXPECT_EQ(scene.wallDistances, (std::array<float, 6>{1, 2, 3, 4, 5, 6}));
}

TEST(SceneFile, ReadsTheListener) {
    const Scene scene = parsed(R"({
        "sources": [{"sound": "pluck"}],
        "listener": {"position": {"keyframes": [{"time": 0, "at": [0, 0, 0]},
                                                {"time": 2, "at": [4, 0, 2]}]},
                     "yaw": {"keyframes": [[0, 0], [1, 720]], "interpolation": "step"},
                     "pitch": -5, "roll": 3}})");
    const Pose pose = listenerAt(scene.listener, 1.0);
    EXPECT_DOUBLE_EQ(pose.position.x, 2.0);
    EXPECT_EQ(pose.yaw, 720.0);
    EXPECT_EQ(pose.pitch, -5.0);
    EXPECT_EQ(pose.roll, 3.0);
    EXPECT_EQ(listenerAt(scene.listener, 0.9).yaw, 0.0);
}

TEST(SceneFile, ReadsASource) {
    const Scene scene = parsed(withSource(
        R"("name": "left string", "use": 2, "gain": -6, "start": 1.5, "loop": true,
           "room": "famous concerthall", "position": [-1, 0.5, 2])"));
    const SceneSource& source = scene.sources[0];
    EXPECT_EQ(source.name, "left string");
    EXPECT_EQ(source.input.duration, 2.0);
    EXPECT_EQ(source.gainDb, -6.0);
    EXPECT_EQ(source.start, 1.5);
    EXPECT_TRUE(source.loop);
    EXPECT_EQ(source.room, 5);
    EXPECT_EQ(positionAt(source.path, 3.0, 6.0).y, 0.5);
}

TEST(SceneFile, GivesEndlessSoundsAnEnd) {
    EXPECT_EQ(parsed(withSource(R"("start": 1.5)")).sources[0].input.duration, 4.5);
    EXPECT_EQ(parsed(R"({"sources": [{"sound": "bursts"}]})").sources[0].input.duration, 8.0);
    const Scene speech =
        parsed(R"({"duration": 3, "sources": [{"sound": "speech", "text": "x"}]})");
    EXPECT_FALSE(speech.sources[0].input.duration);
    EXPECT_EQ(speech.sources[0].input.text, "x");
}

TEST(SceneFile, ReadsEveryKindOfPath) {
    const auto at = [](const std::string& position, double seconds) {
        const Scene scene = parsed(withSource("\"position\": " + position));
        return positionAt(scene.sources[0].path, seconds, 6.0);
    };
    constexpr double tiny = 1.0e-9;
    EXPECT_NEAR(at(R"({"azimuth": 90, "distance": 2})", 0.0).x, 2.0, tiny);
    EXPECT_NEAR(at(R"({"elevation": 90})", 0.0).y, 1.0, tiny);
    EXPECT_NEAR(at(R"({"line": {"from": [-3, 0, 1], "to": [3, 0, 1]}})", 4.0).x, 1.0, tiny);
    EXPECT_NEAR(at(R"({"orbit": {}})", 1.5).x, 1.5, tiny);
    EXPECT_NEAR(
        at(R"({"orbit": {"radius": 2, "period": 3, "direction": "anticlockwise"}})", 0.75).x, -2.0,
        tiny);
    EXPECT_NEAR(at(R"({"orbit": {"turns": 0, "start": 180, "elevation": 30}})", 2.0).y, 0.75, tiny);
    EXPECT_NEAR(at(R"({"rise": {"radius": 2, "azimuth": 90, "from": 0, "to": 180}})", 6.0).x, -2.0,
                tiny);
    EXPECT_NEAR(at(R"({"keyframes": [{"time": 2, "at": [0, 0, 1]}, {"time": 3, "at": [0, 1, 1]}],
                      "interpolation": "linear"})",
                   2.25)
                    .y,
                0.25, tiny);
}

TEST(SceneFile, ReadsParametersByLenientNamesInOrder) {
    const Scene scene = parsed(withSource(
        R"("parameters": {"room_size": 60, "Bypass": {"keyframes": [[0, 0], [2, 1]]},
                          "Direct": {"keyframes": [[0, 0], [2, -12]], "interpolation": "spline"}})"));
    const std::vector<ParameterTrack>& tracks = scene.sources[0].parameters;
    ASSERT_EQ(tracks.size(), 3u);
    EXPECT_EQ(tracks[0].name, "RoomSize");
    EXPECT_TRUE(tracks[0].track.constant());
    EXPECT_EQ(valueAt(tracks[0].track, 1.0), 60.0);
    EXPECT_EQ(tracks[1].name, "Bypass");
    EXPECT_EQ(valueAt(tracks[1].track, 1.9), 0.0);  // switches step by themselves
    EXPECT_EQ(tracks[2].name, "Direct");
    EXPECT_EQ(tracks[2].track.interpolation, Interpolation::Spline);
}

TEST(SceneFile, TakesTheFirstRoomOfRoomsOverTime) {
    const Scene scene =
        parsed(withSource(R"("parameters": {"Room Selection": {"keyframes": [[1, 4], [2, 9]]}})"));
    EXPECT_EQ(scene.sources[0].room, 4);
    ASSERT_EQ(scene.sources[0].parameters.size(), 1u);
    EXPECT_EQ(valueAt(scene.sources[0].parameters[0].track, 1.99), 4.0);
}

TEST(SceneFile, ReadsReturnsAndSendsByNameAndId) {
    const Scene scene = parsed(R"({
        "sources": [{"sound": "pluck", "sends": [{"to": "hall", "level": -6}, {"to": 2}]}],
        "returns": [{"name": "hall", "id": 9, "room": 4, "parameters": {"Mute": 1}}, {}]})");
    ASSERT_EQ(scene.returns.size(), 2u);
    EXPECT_EQ(scene.returns[0].reverbId, 9);
    EXPECT_EQ(scene.returns[0].room, 4);
    EXPECT_EQ(scene.returns[0].parameters[0].name, "Mute");
    EXPECT_EQ(scene.returns[1].reverbId, 2);
    EXPECT_EQ(scene.returns[1].name, "return 2");
    const std::vector<SceneSend>& sends = scene.sources[0].sends;
    ASSERT_EQ(sends.size(), 2u);
    EXPECT_EQ(sends[0].reverbId, 9);
    EXPECT_EQ(sends[0].level, -6);
    EXPECT_EQ(sends[1].reverbId, 2);
    EXPECT_EQ(sends[1].level, 0);
}

TEST(SceneFile, TurnsTheOwnReverbOffWhereItSends) {
    const auto tracks = [](const std::string& keys) {
        return parsed(R"({"returns": [{}], "sources": [{"sound": "pluck")" + keys + "}]}")
            .sources[0]
            .parameters;
    };
    EXPECT_TRUE(tracks("").empty());
    EXPECT_TRUE(tracks(R"(, "sends": [])").empty());
    const std::vector<ParameterTrack> added = tracks(R"(, "sends": [{"to": 1}])");
    ASSERT_EQ(added.size(), 1u);
    EXPECT_EQ(added[0].name, "Reverb disable");
    EXPECT_EQ(valueAt(added[0].track, 0.0), 1.0);
    const std::vector<ParameterTrack> own = tracks(
        R"(, "sends": [{"to": 1}], "parameters": {"Reverb disable": {"keyframes": [[0, 0], [2, 1]]}})");
    ASSERT_EQ(own.size(), 1u);
    EXPECT_EQ(valueAt(own[0].track, 1.0), 0.0);
}

TEST(SceneFile, ReadsAnEngine) {
    const Scene scene = parsed(withSource(
        R"("room": 4, "parameters": {"Occlusion": 0.5}, "engine": {"doppler": true, "fading": false, "headphone": 3, "limitPhi": 90,
            "updateInterval": 2, "bypass3DAudio": true, "quality": 7})"));
    ASSERT_TRUE(scene.sources[0].engine);
    const DirectEngine& engine = *scene.sources[0].engine;
    EXPECT_EQ(scene.sources[0].parameters.size(), 1u);
    EXPECT_EQ(engine.settings.doppler, 1);
    EXPECT_EQ(engine.settings.fading, 0);
    EXPECT_EQ(engine.settings.qvHpTFcompSelect, 3);
    EXPECT_EQ(engine.settings.limitPhi, 90);
    EXPECT_EQ(engine.settings.limitTheta, 90);
    EXPECT_EQ(engine.settings.qvUpdateInterval, 2);
    EXPECT_EQ(engine.settings.bypass3DAudio, 1);
    EXPECT_EQ(engine.settings.qvFlexReflections, 1);
    EXPECT_EQ(engine.qualityValue, 7);
}

TEST(SceneFile, NamesTheLineOfAMeaninglessValue) {
    EXPECT_EQ(errorOf("{\n\"sources\": [\n  {\"sound\":\n\n\"pluck\", \"gain\": 99\n}]}"),
              "a.json:5: sources[0].gain: must be -96 to 24, got 99");
    EXPECT_EQ(errorOf("{\"sources\": [{\"sound\": \"pluck\",\n\n\"gian\":\n2}]}"),
              "a.json:3: sources[0].gian: unknown key, did you mean \"gain\"?");
    EXPECT_EQ(errorOf("\n\n{\n}"), "a.json:3: needs \"sources\"");
}

// The JSON reader looks one character past a number, here over the end of its line.
TEST(SceneFile, NamesTheLineOfANumberAtItsEnd) {
    EXPECT_EQ(errorOf("{\"block\": 1000\n\n\n, \"sources\": [{\"sound\": \"pluck\"}]}"),
              "a.json:1: block: must be a power of two, got 1000");
    EXPECT_EQ(errorOf("{\"block\":\n1000\n}\n"),
              "a.json:2: block: must be a power of two, got 1000");
}

TEST(SceneFile, NamesBothLinesOfARepeatedKey) {
    EXPECT_EQ(errorOf("{\"title\": \"a\",\n\"rate\": 48000,\n\n\"title\": \"b\"}"),
              "a.json:4: repeated key \"title\", first on line 1");
}

TEST(SceneFile, NamesTheLineOfWhatIsNoJson) {
    EXPECT_THAT(errorOf(""),
                MatchesRegex("a\\.json:1: not valid JSON: .*unexpected end of input.*"));
    EXPECT_THAT(errorOf("{\n\"a\": 1,\n}"), MatchesRegex("a\\.json:3: not valid JSON: while .*"));
    EXPECT_THAT(errorOf("{\"title\": \"\n\"}"), MatchesRegex("a\\.json:1: not valid JSON: .*"));
    EXPECT_THAT(errorOf("{\"gain\":\nNaN}"), MatchesRegex("a\\.json:2: not valid JSON: .*"));
    EXPECT_THAT(errorOf("{\"gain\": 1e999}"),
                MatchesRegex("a\\.json:1: not valid JSON: number .*"));
    EXPECT_THAT(errorOf("{\"title\": \"\xff\"}"), MatchesRegex("a\\.json:1: not valid JSON: .*"));
    EXPECT_THAT(errorOf("{} {}"), MatchesRegex("a\\.json:1: not valid JSON: .*"));
}

TEST(SceneFile, ErrorsHaveOneShortLine) {
    const std::string longWord(100000, 'x');
    for (const std::string& text :
         {"{\"" + longWord + "\": 1}", "{\"title\": \"" + longWord, "[" + longWord,
          std::string("{\"a\\nb\\u0000\": 1}"), std::string("{\"title\": \"\0\"}", 14),
          "{\"sources\": [{\"sound\": \"" + longWord + "\"}]}",
          "{\"sources\": [{\"file\": \"" + longWord + "\"}]}",
          withSource("\"room\": \"" + longWord.substr(0, 999) + "\"")}) {
        const std::string error = errorOf(text);
        EXPECT_NE(error, "no error");
        EXPECT_EQ(error.find_first_of(std::string("\n\r\0", 3)), std::string::npos) << error;
        EXPECT_LT(error.size(), 300u) << error;
    }
}

TEST(SceneFile, BoundsWhatATextMayHold) {
    EXPECT_EQ(errorOf(std::string(16, '[') + "1" + std::string(16, ']')),
              "a.json:1: must be an object, got a list");
    EXPECT_EQ(errorOf(std::string(1000000, '[')),
              "a.json:1: more than 16 levels of lists and objects");
    std::string nested;
    for (int i = 0; i < 100000; ++i) {
        nested += "{\"a\":\n";
    }
    EXPECT_EQ(errorOf(nested), "a.json:17: more than 16 levels of lists and objects");

    std::string keys = "{";
    for (int i = 0; i < 101; ++i) {
        keys += "\"" + std::to_string(i) + "\": 0,";
    }
    EXPECT_EQ(errorOf(keys), "a.json:1: more than 100 keys in one object");

    std::string values = "[";
    for (int i = 0; i < 500000; ++i) {
        values += "0,";
    }
    EXPECT_EQ(errorOf(values), "a.json:1: more than 500000 values");

    EXPECT_EQ(errorOf(std::string(10 * 1024 * 1024 + 1, ' ')), "a.json: is larger than 10 MB");
}

TEST(SceneFile, TakesManyKeyframesButNotTooMany) {
    const auto keyframes = [](int count) {
        std::string list = "[0, 0]";
        for (int i = 1; i < count; ++i) {
            list += ",[" + std::to_string(i * 0.25) + ",1]";
        }
        return withSource("\"parameters\": {\"Gain\": {\"keyframes\": [" + list + "]}}");
    };
    EXPECT_EQ(parsed(keyframes(10000)).sources[0].parameters[0].track.keys.size(), 10000u);
    EXPECT_EQ(errorOf(keyframes(10001)),
              "a.json:1: sources[0].parameters.Gain.keyframes: must have 1 to 10000 items, got "
              "10001");
}

// Every beginning of a good text is a bad one: whatever the reader was in the middle of.
TEST(SceneFile, RefusesEveryTruncation) {
    const std::string text =
        R"({"title": "\u00e9t\u00e9", "sources": [{"sound": "pluck", "gain": -1.5e0, "loop": true,
            "position": {"keyframes": [{"time": 0, "at": [0, 1, 2]}]}, "engine": {}}]})";
    EXPECT_EQ(errorOf(text), "no error");
    for (std::size_t length = 0; length < text.size(); ++length) {
        EXPECT_THAT(errorOf(text.substr(0, length)), HasSubstr("a.json:")) << length;
    }
}

// A folder that is removed with all in it.
class ScratchFolder {
public:
    ScratchFolder()
        : path(std::filesystem::temp_directory_path() /
               ("tessaly_scene_" + std::to_string(::getpid()))) {
        std::filesystem::create_directories(path);
    }
    ~ScratchFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
    ScratchFolder(const ScratchFolder&) = delete;
    ScratchFolder& operator=(const ScratchFolder&) = delete;

    std::filesystem::path write(const std::string& name, const std::string& text) const {
        std::ofstream(path / name, std::ios::binary) << text;
        return path / name;
    }

    const std::filesystem::path path;
};

std::string errorOfFile(const std::filesystem::path& file) {
    try {
        readScene(file);
    } catch (const SceneError& error) {
        return error.what();
    }
    return "no error";
}

TEST(SceneFile, LooksForSoundsBesideTheScene) {
    const ScratchFolder folder;
    folder.write("bell.wav", "only its presence is asked for");
    const std::filesystem::path file =
        folder.write("bell.json", R"({"sources": [{"file": "bell.wav"}]})");
    const Scene scene = readScene(file);
    EXPECT_EQ(scene.sources[0].input.file, folder.path / "bell.wav");
    EXPECT_EQ(scene.sources[0].name, "bell");
    EXPECT_FALSE(scene.sources[0].input.duration);
}

TEST(SceneFile, NamesAFileThatCannotBeRead) {
    const ScratchFolder folder;
    const std::string missing = (folder.path / "missing.json").string();
    EXPECT_EQ(errorOfFile(missing), missing + ": there is no such file");
    EXPECT_EQ(errorOfFile(folder.path), folder.path.string() + ": cannot be read");
    EXPECT_EQ(errorOfFile("/dev/zero"), "/dev/zero: is larger than 10 MB");
    const std::string bad = folder.write("bad.json", "{\n\n]").string();
    EXPECT_THAT(errorOfFile(bad), HasSubstr(bad + ":3: not valid JSON"));
}

}  // namespace
}  // namespace tessaly
