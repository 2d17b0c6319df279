// The built renderer, run as a user runs it, with the stand-in library behind it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "demo_sounds/sound_file.h"
#include "demo_sounds/speech.h"
#include "render/binaural_measures.h"
#include "render/output_file.h"
#include "tools/render/data_files.h"
#include "tools/render/program_run.h"
#include "tools/render/xml_check.h"

namespace tessaly {
namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;

class RenderProgram : public ::testing::Test {
protected:
    void SetUp() override {
        const auto* test = ::testing::UnitTest::GetInstance()->current_test_info();
        folder = std::filesystem::path(::testing::TempDir()) /
                 ("render_program_" + std::string(test->name()));
        std::filesystem::remove_all(folder);
        std::filesystem::create_directories(folder / "data");
        putResponses(folder / "data" / "TSLdata120.dat", 128);
        putResponses(folder / "data" / "TSLdata121.dat", 139);
    }
    void TearDown() override { std::filesystem::remove_all(folder); }

    std::string inFolder(const char* name) const { return (folder / name).string(); }

    ProgramRun run(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(),
                         {"--library", TESSALY_MOCK_PLUGIN, "--data", inFolder("data")});
        return runProgram(TESSALY_RENDER, arguments);
    }

    // A second of sound into out.wav.
    ProgramRun render(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(),
                         {"--sound", "bursts", "--duration", "1", "-o", inFolder("out.wav")});
        return run(arguments);
    }

    // Names of all files in the folder but the data.
    std::vector<std::string> written() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(folder)) {
            if (entry.path().filename() != "data") {
                names.push_back(entry.path().filename().string());
            }
        }
        std::sort(names.begin(), names.end());
        return names;
    }

    // One line on standard error, nothing on the other stream, nothing written.
    void expectRefused(const ProgramRun& refused, const std::string& says) const {
        EXPECT_NE(refused.exitCode, 0);
        EXPECT_NE(refused.exitCode, -1);
        EXPECT_EQ(refused.output, "");
        EXPECT_THAT(refused.errors, HasSubstr(says));
        EXPECT_EQ(std::count(refused.errors.begin(), refused.errors.end(), '\n'), 1)
            << refused.errors;
        EXPECT_THAT(written(), ::testing::IsEmpty());
    }

    std::filesystem::path folder;
};

TEST_F(RenderProgram, WritesSoundAndPictureAndSaysNothingIntoAPipe) {
    const ProgramRun done = render({"--orbit", "--radius", "2"});
    EXPECT_EQ(done.exitCode, 0);
    EXPECT_EQ(done.output, "");
    EXPECT_EQ(done.errors, "");
    EXPECT_EQ(written(), (std::vector<std::string>{"out.svg", "out.wav"}));
    const Sound sound = readSoundFile(folder / "out.wav", 10.0);
    EXPECT_EQ(sound.frames(), 48000u);
    EXPECT_EQ(sound.channels, 2);
    EXPECT_EQ(sound.sampleRate, 48000.0);
    std::ostringstream picture;
    picture << std::ifstream(folder / "out.svg").rdbuf();
    EXPECT_EQ(xmlFault(picture.str()), "");
    EXPECT_THAT(picture.str(), HasSubstr("bursts: orbit at 2 m, 1 turn clockwise"));
}

TEST_F(RenderProgram, SourceOnTheRightReachesTheRightEarFirstAndLouder) {
    for (const auto& [direction, sign] :
         {std::pair("90,0,1.5", 1.0), std::pair("-90,0,1.5", -1.0)}) {
        ASSERT_EQ(render({"--at", direction}).exitCode, 0);
        const Sound sound = readSoundFile(folder / "out.wav", 10.0);
        // The stand-in delays the far ear by 30 samples and lowers it by 12 dB.
        const std::optional<double> time = interauralTime(sound.samples, 48000.0);
        ASSERT_TRUE(time.has_value());
        EXPECT_NEAR(*time, sign * 0.625, 0.003);
        const auto points = measureBinaural(sound.samples, 48000.0, 0.1);
        ASSERT_TRUE(points[1].levelDifference.has_value());
        EXPECT_NEAR(*points[1].levelDifference, sign * 12.04, 0.3);
    }
}

TEST_F(RenderProgram, EveryRateAndBlockSizeGivesTheWholeDuration) {
    putResponses(folder / "data" / "TSLdata122.dat", 70);
    for (const char* rate : {"24000", "44100", "48000"}) {
        for (const char* block : {"32", "1024", "4096"}) {
            ASSERT_EQ(render({"--rate", rate, "--block", block}).exitCode, 0);
            const Sound sound = readSoundFile(folder / "out.wav", 10.0);
            EXPECT_EQ(sound.sampleRate, std::stod(rate));
            EXPECT_EQ(static_cast<double>(sound.frames()), std::stod(rate));
        }
    }
}

TEST_F(RenderProgram, ParametersReachTheEffectByNameAndByIndex) {
    ASSERT_EQ(render({"--at", "0,0,1"}).exitCode, 0);
    const Sound plain = readSoundFile(folder / "out.wav", 10.0);
    for (const char* setting : {"Gain=-6", "gain=-6", "0=-6"}) {
        ASSERT_EQ(render({"--at", "0,0,1", "--set", setting}).exitCode, 0);
        const Sound lower = readSoundFile(folder / "out.wav", 10.0);
        ASSERT_EQ(lower.samples.size(), plain.samples.size());
        const float factor = std::pow(10.0f, -6.0f * 0.05f);
        for (std::size_t i = 0; i < plain.samples.size(); ++i) {
            ASSERT_EQ(lower.samples[i], plain.samples[i] * factor) << setting << " " << i;
        }
    }
}

TEST_F(RenderProgram, PlaysSoundFilesOfOtherRatesToTheirEnd) {
    std::vector<float> ramp;
    for (int i = 0; i < 22050; ++i) {
        const float value = std::sin(0.1f * static_cast<float>(i));
        ramp.push_back(value);
        ramp.push_back(-value);
    }
    {
        PendingFile file(folder / "data" / "in.wav");
        writeWav(file, ramp, 22050, SampleFormat::Int16);
        file.complete();
    }
    const ProgramRun done =
        run({inFolder("data/in.wav"), "--at", "0,0,1", "-o", inFolder("out.wav")});
    ASSERT_EQ(done.exitCode, 0) << done.errors;
    const Sound sound = readSoundFile(folder / "out.wav", 10.0);
    EXPECT_EQ(sound.frames(), 48000u);
    // The left channel is what a source at the default "Input Channel" plays.
    EXPECT_NEAR(sound.samples[2 * 24000], std::sin(0.1 * 24000.0 * 22050.0 / 48000.0), 0.01);
}

TEST_F(RenderProgram, ShortFilesEndInSilenceOrRepeat) {
    {
        PendingFile file(folder / "data" / "in.wav");
        writeWav(file, std::vector<float>(2 * 4800, 0.5f), 48000, SampleFormat::Float);
        file.complete();
    }
    const std::vector<std::string> request = {inFolder("data/in.wav"), "--at",       "0,0,1", "-o",
                                              inFolder("out.wav"),     "--duration", "0.5"};
    ASSERT_EQ(run(request).exitCode, 0);
    const Sound ended = readSoundFile(folder / "out.wav", 10.0);
    ASSERT_EQ(ended.frames(), 24000u);
    EXPECT_EQ(ended.samples[2 * 4000], 0.5f);
    EXPECT_EQ(ended.samples[2 * 5000], 0.0f);
    std::vector<std::string> looped = request;
    looped.push_back("--loop");
    ASSERT_EQ(run(looped).exitCode, 0);
    const Sound repeated = readSoundFile(folder / "out.wav", 10.0);
    EXPECT_TRUE(std::all_of(repeated.samples.begin(), repeated.samples.end(),
                            [](float sample) { return sample == 0.5f; }));
}

TEST_F(RenderProgram, ListShowsEffectsParametersAndRooms) {
    const ProgramRun listed = run({"--list"});
    EXPECT_EQ(listed.exitCode, 0);
    EXPECT_EQ(listed.errors, "");
    EXPECT_THAT(listed.output,
                AllOf(HasSubstr("Tessaly Engine (spatializer, one a source)"),
                      HasSubstr("Tessaly Reverb (effect of a mixer group)"),
                      HasSubstr("    3  Input Channel    LR           -1        1       -1"),
                      HasSubstr("   31      22  Warehouse"), HasSubstr("   52       0  dry")));
}

TEST_F(RenderProgram, BadRequestsAreRefusedInOneLine) {
    expectRefused(render({"--rate", "32000"}), "no data for 32000 Hz");
    expectRefused(render({"--rate", "24000"}), "TSLdata122.dat is missing");
    expectRefused(render({"--block", "500"}), "--block must be a power of two");
    expectRefused(render({"--set", "Loudness=3"}), "unknown parameter \"Loudness\"");
    expectRefused(render({"--set", "17=3"}), "unknown parameter \"17\"");
    expectRefused(render({"--set", "Direct=-200"}), "parameter \"Direct\" takes -96 to 24");
    expectRefused(render({"--set", "Direct=nan"}), "--set needs a number");
    expectRefused(render({"--no-such-option"}), "--no-such-option");
    expectRefused(render({"--radius", "wide"}), "--radius needs a number");
}

TEST_F(RenderProgram, ARoomWithoutItsTailFileIsRefusedByName) {
    expectRefused(render({"--room", "4"}), "TSLdata511.dat is missing");
    EXPECT_EQ(render({"--room", "2"}).exitCode, 0) << "reflections only";
}

TEST_F(RenderProgram, TheInputIsNeverTheOutput) {
    ASSERT_EQ(render({}).exitCode, 0);
    const std::string sound = inFolder("out.wav");
    const auto before = std::filesystem::file_size(sound);
    std::filesystem::create_symlink(sound, folder / "link.wav");
    for (const std::string& input : {sound, inFolder("link.wav")}) {
        const ProgramRun refused = run({input, "-o", sound, "--duration", "0.1"});
        EXPECT_NE(refused.exitCode, 0);
        EXPECT_THAT(refused.errors, HasSubstr("is the input and cannot be the output too"));
        EXPECT_EQ(std::filesystem::file_size(sound), before);
    }
}

TEST_F(RenderProgram, TheInputIsNeverThePictureOrThePage) {
    ASSERT_EQ(render({}).exitCode, 0);
    std::filesystem::create_directory(folder / "page");
    const std::string input = inFolder("page/index.html");
    std::filesystem::rename(folder / "out.wav", input);
    std::filesystem::create_symlink(input, folder / "link.svg");
    const auto before = std::filesystem::file_size(input);
    const std::vector<std::vector<std::string>> requests = {
        {"-o", inFolder("new.wav"), "--picture", inFolder("link.svg")},
        {"--report", inFolder("page")},
        {"--report", inFolder("page"), "--room", "all"}};
    putTails(folder / "data" / "TSLdata511.dat");
    for (std::vector<std::string> request : requests) {
        request.insert(request.begin(), {input, "--duration", "0.1"});
        const ProgramRun refused = run(request);
        EXPECT_EQ(refused.exitCode, 1);
        EXPECT_THAT(refused.errors, HasSubstr("is the input and cannot be the output too"));
        EXPECT_EQ(std::filesystem::file_size(input), before);
        EXPECT_TRUE(std::filesystem::is_symlink(folder / "link.svg"));
    }
}

TEST_F(RenderProgram, DamagedDataIsRefusedByName) {
    std::filesystem::resize_file(folder / "data" / "TSLdata121.dat", 100000);
    expectRefused(render({}), "TSLdata121.dat is damaged: 100000 bytes, expected 2804508");
}

TEST_F(RenderProgram, ATemporaryDirectoryThatIsMissingIsToldForWhat) {
    const char* const set = std::getenv("TMPDIR");
    const std::string before = set != nullptr ? set : "";
    setenv("TMPDIR", "/nonexistent", 1);
    const ProgramRun refused = run({"--sound", "speech", "-o", inFolder("out.wav")});
    if (set != nullptr) {
        setenv("TMPDIR", before.c_str(), 1);
    } else {
        unsetenv("TMPDIR");
    }
    EXPECT_EQ(refused.exitCode, 1);
    expectRefused(refused, "speech");
    if (speechAvailable()) {
        EXPECT_THAT(
            refused.errors,
            HasSubstr("speech needs a directory for a temporary file: TMPDIR is /nonexistent: "));
    }
}

TEST_F(RenderProgram, TextIsForSpeech) {
    const ProgramRun refused = render({"--text", "Hello"});
    expectRefused(refused, "--text has no meaning without --sound speech");
    EXPECT_EQ(refused.exitCode, 2);
}

TEST_F(RenderProgram, MissingFilesAreRefusedInOneLine) {
    expectRefused(run({inFolder("none.wav"), "-o", inFolder("out.wav")}), "none.wav");
    expectRefused(run({inFolder("data/TSLdata120.dat"), "-o", inFolder("out.wav")}), "cannot read");
    expectRefused(run({"--sound", "pluck", "-o", inFolder("none/out.wav")}), "cannot write");
    expectRefused(
        runProgram(TESSALY_RENDER, {"--sound", "pluck", "-o", inFolder("out.wav"), "--library",
                                    inFolder("none.so"), "--data", inFolder("data")}),
        "library not found: ");
    expectRefused(
        runProgram(TESSALY_RENDER, {"--sound", "pluck", "-o", inFolder("out.wav"), "--library",
                                    TESSALY_MOCK_PLUGIN, "--data", inFolder("none")}),
        "no data directory");
}

TEST_F(RenderProgram, FailureOfTheLibraryIsTold) {
    expectRefused(render({"--set", "Misbehave=2"}), "the library reports error -105");
}

TEST_F(RenderProgram, FailedRequestLeavesAnOlderFileAlone) {
    ASSERT_EQ(render({}).exitCode, 0);
    const auto before = std::filesystem::last_write_time(folder / "out.wav");
    EXPECT_NE(render({"--set", "Misbehave=2"}).exitCode, 0);
    EXPECT_EQ(std::filesystem::last_write_time(folder / "out.wav"), before);
    EXPECT_EQ(written(), (std::vector<std::string>{"out.svg", "out.wav"}));
}

TEST_F(RenderProgram, AllocationsInNormalBlocksAreReported) {
    const ProgramRun done = render({"--set", "Misbehave=1"});
    EXPECT_EQ(done.exitCode, 0);
    // 94 blocks of 512 hold a second; the first one loads. Two allocations in each.
    EXPECT_THAT(done.errors, HasSubstr("186 allocations and 186 releases in normal blocks"));
}

TEST_F(RenderProgram, SilentOutputIsReported) {
    const ProgramRun done = render({"--set", "Misbehave=3"});
    EXPECT_EQ(done.exitCode, 0);
    EXPECT_THAT(done.errors, HasSubstr("the output is silent though the input is not"));
}

TEST_F(RenderProgram, CutSamplesAreReportedForIntegerFormats) {
    EXPECT_THAT(render({"--set", "Gain=24", "--format", "16"}).errors,
                HasSubstr("samples were cut at full scale"));
    EXPECT_EQ(render({"--set", "Gain=24"}).errors, "");
}

TEST_F(RenderProgram, LibraryLogIsShownOnRequestOnly) {
    EXPECT_EQ(render({"--set", "Misbehave=4"}).errors, "");
    EXPECT_THAT(render({"--set", "Misbehave=4", "--verbose"}).errors,
                HasSubstr("chatter of the library"));
}

// ---- Scenes, pages, all rooms ----

class SceneProgram : public RenderProgram {
protected:
    void SetUp() override {
        RenderProgram::SetUp();
        putTails(folder / "data" / "TSLdata511.dat");
    }

    std::string scene(const std::string& name, const std::string& text) const {
        const std::string file = inFolder(("data/" + name).c_str());
        std::ofstream(file) << text;
        return file;
    }

    static std::string contentOf(const std::filesystem::path& file) {
        std::ostringstream text;
        text << std::ifstream(file, std::ios::binary).rdbuf();
        return text.str();
    }
};

constexpr const char* sideScene =
    R"({"title": "On the right", "duration": 0.5, "block": 512, "sources": [{"sound": "bursts",
        "position": {"azimuth": 90, "elevation": 0, "distance": 1.5}}]})";

TEST_F(SceneProgram, AOneSourceSceneIsTheSameAsTheSingleSound) {
    const std::string file = scene("side.json", sideScene);
    ASSERT_EQ(run({"--scene", file, "-o", inFolder("scene.wav")}).errors, "");
    ASSERT_EQ(run({"--sound", "bursts", "--duration", "0.5", "--at", "90,0,1.5", "-o",
                   inFolder("single.wav"), "--no-picture"})
                  .errors,
              "");
    EXPECT_EQ(contentOf(folder / "scene.wav"), contentOf(folder / "single.wav"));
    EXPECT_EQ(written(), (std::vector<std::string>{"scene.wav", "single.wav"}));
}

TEST_F(SceneProgram, RateAndBlockCanBeOverridden) {
    putResponses(folder / "data" / "TSLdata122.dat", 70);
    const std::string file = scene("side.json", sideScene);
    ASSERT_EQ(run({"--scene", file, "-o", inFolder("out.wav"), "--rate", "24000", "--block", "64"})
                  .errors,
              "");
    const Sound sound = readSoundFile(folder / "out.wav", 10.0);
    EXPECT_EQ(sound.sampleRate, 24000.0);
    EXPECT_EQ(sound.frames(), 12000u);
}

TEST_F(SceneProgram, SeveralScenesMakeOnePage) {
    const std::string one = scene("side.json", sideScene);
    const std::string two =
        scene("untitled.json",
              R"({"duration": 0.3, "sources": [{"sound": "pluck"}, {"sound": "drums"}]})");
    const ProgramRun done = run({"--scene", one, "--scene", two, "--report", inFolder("page")});
    ASSERT_EQ(done.exitCode, 0) << done.errors;
    EXPECT_EQ(done.errors, "");
    EXPECT_EQ(written(), std::vector<std::string>{"page"});
    const std::string page = contentOf(folder / "page" / "index.html");
    EXPECT_THAT(page, HasSubstr("On the right"));
    EXPECT_THAT(page, HasSubstr("untitled")) << "a scene without a title has its file's name";
    EXPECT_THAT(page, HasSubstr("drums at 0.1 s")) << "a response";
}

TEST_F(SceneProgram, SingleSoundsHavePagesToo) {
    ASSERT_EQ(run({"--sound", "bursts", "--duration", "0.5", "--report", inFolder("page")}).errors,
              "");
    EXPECT_EQ(written(), std::vector<std::string>{"page"});
    EXPECT_THAT(contentOf(folder / "page" / "index.html"), HasSubstr("bursts: orbit at 1.5 m"));
}

TEST_F(SceneProgram, BadScenesAreRefusedInOneLine) {
    const std::string bad = scene("bad.json", "{\n \"sources\": [{\"sound\": \"harp\"}]\n}\n");
    const ProgramRun refused = run({"--scene", bad, "-o", inFolder("out.wav")});
    expectRefused(refused, "bad.json:2: sources[0].sound");
    EXPECT_EQ(refused.exitCode, 1);
    expectRefused(run({"--scene", inFolder("none.json"), "-o", inFolder("out.wav")}), "none.json");
    const ProgramRun misused = run({"--scene", bad, "--room", "3", "-o", inFolder("out.wav")});
    expectRefused(misused, "--room has no meaning for --scene");
    EXPECT_EQ(misused.exitCode, 2);
    std::filesystem::remove(folder / "data" / "TSLdata511.dat");
    const std::string hall =
        scene("hall.json", R"({"duration": 0.1, "sources": [{"sound": "pluck", "room": 5}]})");
    expectRefused(run({"--scene", hall, "-o", inFolder("out.wav")}),
                  "no tail for room 5 (FamousConcerthall)");
}

TEST_F(SceneProgram, ASceneNeverOverwritesWhatItPlays) {
    ASSERT_EQ(render({}).exitCode, 0);
    const std::string before = contentOf(folder / "out.wav");
    const std::string file =
        scene("echo.json", R"({"sources": [{"file": "../out.wav"}, {"sound": "pluck"}]})");
    const ProgramRun refused = run({"--scene", file, "-o", inFolder("out.wav")});
    EXPECT_EQ(refused.exitCode, 1);
    EXPECT_THAT(refused.errors, HasSubstr("is the input and cannot be the output too"));
    EXPECT_EQ(contentOf(folder / "out.wav"), before);
}

TEST_F(SceneProgram, EveryRoomHasASoundAndAPicture) {
    const std::vector<std::string> request = {"--sound", "bursts", "--duration", "0.1",
                                              "--room",  "all",    "-o",         inFolder("rooms")};
    ASSERT_EQ(run(request).errors, "");
    std::size_t sounds = 0;
    for (const auto& entry : std::filesystem::directory_iterator(folder / "rooms")) {
        const bool isSound = entry.path().extension() == ".wav";
        sounds += isSound ? 1 : 0;
        if (!isSound) {
            EXPECT_EQ(xmlFault(contentOf(entry.path())), "") << entry.path();
        }
        std::filesystem::path other = entry.path();
        EXPECT_TRUE(std::filesystem::exists(other.replace_extension(isSound ? ".svg" : ".wav")))
            << entry.path();
    }
    EXPECT_EQ(sounds, 53u);
    EXPECT_TRUE(std::filesystem::exists(folder / "rooms" / "22_Small_Livingroom.wav"));
    ASSERT_EQ(
        run({"--sound", "bursts", "--duration", "0.1", "--room", "22", "-o", inFolder("one.wav")})
            .errors,
        "");
    for (const char* extension : {".wav", ".svg"}) {
        EXPECT_EQ(contentOf(folder / ("one" + std::string(extension))),
                  contentOf(folder / "rooms" / ("22_Small_Livingroom" + std::string(extension))));
    }
}

TEST_F(SceneProgram, EveryRoomOnAPageNeedsNoSoundFiles) {
    ASSERT_EQ(run({"--sound", "bursts", "--duration", "0.05", "--room", "all", "--report",
                   inFolder("page")})
                  .errors,
              "");
    EXPECT_EQ(written(), std::vector<std::string>{"page"});
    const std::filesystem::directory_iterator files(folder / "page");
    EXPECT_EQ(std::distance(begin(files), end(files)), 1);
    EXPECT_THAT(contentOf(folder / "page" / "index.html"),
                AllOf(HasSubstr("00 dry"), HasSubstr("52 dry")));
}

TEST_F(SceneProgram, APageThatFailsLeavesNoDirectory) {
    expectRefused(run({"--sound", "bursts", "--duration", "0.1", "--report", inFolder("new/page"),
                       "--set", "Misbehave=2"}),
                  "the library reports error -105");
}

TEST_F(SceneProgram, EveryRoomOrNone) {
    const ProgramRun failed = run({"--sound", "bursts", "--duration", "0.1", "--room", "all", "-o",
                                   inFolder("rooms"), "--set", "Misbehave=2"});
    expectRefused(failed, "the library reports error -105");
    std::ofstream(folder / "taken") << "a file";
    const ProgramRun refused = run({"--sound", "bursts", "--room", "all", "-o", inFolder("taken")});
    EXPECT_EQ(refused.exitCode, 1);
    EXPECT_THAT(refused.errors, HasSubstr("cannot write"));
    EXPECT_EQ(contentOf(folder / "taken"), "a file");
}

TEST_F(SceneProgram, AnInterruptLeavesNothing) {
    const ProgramRun ended =
        interruptProgram(TESSALY_RENDER,
                         {"--library", TESSALY_MOCK_PLUGIN, "--data", inFolder("data"), "--sound",
                          "bursts", "--duration", "60", "--room", "all", "-o", inFolder("rooms")},
                         [this] {
                             std::error_code ignored;
                             return std::filesystem::exists(folder / "rooms", ignored) &&
                                    !std::filesystem::is_empty(folder / "rooms", ignored);
                         });
    EXPECT_EQ(ended.exitCode, 130);
    EXPECT_THAT(ended.errors, HasSubstr("interrupted, nothing written"));
    EXPECT_THAT(written(), ::testing::IsEmpty());
}

}  // namespace
}  // namespace tessaly
