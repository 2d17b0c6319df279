// Inputs in time: start, use, loop, gain, channels, and how long a scene is.
#include "render/scene_inputs.h"

#include <gtest/gtest.h>

#include <cmath>

#include "demo_sounds/demo_sounds.h"
#include "render/output_file.h"

namespace tessaly {
namespace {

// Stereo values n and -n, counted from 1.
PlacedSound counting(std::size_t frames) {
    PlacedSound placed;
    placed.sound.channels = 2;
    placed.sound.sampleRate = 48000.0;
    for (std::size_t i = 1; i <= frames; ++i) {
        placed.sound.samples.push_back(static_cast<float>(i));
        placed.sound.samples.push_back(-static_cast<float>(i));
    }
    placed.framesHeard = frames;
    return placed;
}

std::vector<float> blockOf(const PlacedSound& placed, std::size_t start, std::size_t frames) {
    std::vector<float> block(2 * frames, 99.0f);
    placed.fillBlock(start, block);
    return block;
}

TEST(PlacedSound, IsSilentBeforeAndAfter) {
    PlacedSound placed = counting(3);
    placed.firstFrame = 2;
    EXPECT_EQ(blockOf(placed, 0, 7),
              (std::vector<float>{0, 0, 0, 0, 1, -1, 2, -2, 3, -3, 0, 0, 0, 0}));
    EXPECT_EQ(blockOf(placed, 3, 2), (std::vector<float>{2, -2, 3, -3}));
}

TEST(PlacedSound, LoopsUntilItsTimeIsOver) {
    PlacedSound placed = counting(2);
    placed.firstFrame = 1;
    placed.framesHeard = 5;
    EXPECT_EQ(blockOf(placed, 0, 7),
              (std::vector<float>{0, 0, 1, -1, 2, -2, 1, -1, 2, -2, 1, -1, 0, 0}));
}

TEST(PlacedSound, MonoStandsOnBothSides) {
    PlacedSound placed;
    placed.sound.samples = {0.25f, 0.5f};
    placed.framesHeard = 2;
    EXPECT_EQ(blockOf(placed, 0, 3), (std::vector<float>{0.25f, 0.25f, 0.5f, 0.5f, 0, 0}));
}

TEST(PlacedSound, SilenceIsWhatIsHeardOfIt) {
    PlacedSound placed;
    placed.sound.samples = {0.0f, 0.0f, 0.5f};
    placed.framesHeard = 3;
    EXPECT_FALSE(placed.silent());
    placed.framesHeard = 2;
    EXPECT_TRUE(placed.silent());
}

SceneSource sourceOf(const char* sound) {
    SceneSource source;
    source.input.sound = sound;
    return source;
}

TEST(SceneInputs, ASceneEndsWithItsLastInput) {
    Scene scene;
    scene.sources = {sourceOf("bursts"), sourceOf("pluck")};
    scene.sources[0].input.duration = 0.5;
    scene.sources[1].input.duration = 0.25;
    scene.sources[1].start = 1.0;
    scene.tail = 0.1;
    const SceneInputs inputs = loadInputs(scene);
    EXPECT_EQ(inputs.frames, 60000u);
    EXPECT_EQ(inputs.tailFrames, 4800u);
    EXPECT_EQ(inputs.duration, 1.25);
    EXPECT_EQ(inputs.sounds[1].firstFrame, 48000u);
    EXPECT_EQ(inputs.sounds[1].framesHeard, 12000u);
}

TEST(SceneInputs, ADurationCutsAndLoopsFillIt) {
    Scene scene;
    scene.duration = 0.5;
    scene.sources = {sourceOf("bursts"), sourceOf("bursts")};
    scene.sources[0].input.duration = 2.0;
    scene.sources[0].start = 0.1;
    scene.sources[1].input.duration = 0.2;
    scene.sources[1].loop = true;
    const SceneInputs inputs = loadInputs(scene);
    EXPECT_EQ(inputs.frames, 24000u);
    EXPECT_EQ(inputs.sounds[0].framesHeard, 19200u);
    EXPECT_EQ(inputs.sounds[1].sound.frames(), 9600u);
    EXPECT_EQ(inputs.sounds[1].framesHeard, 24000u);
}

TEST(SceneInputs, BuiltInSoundsLastToTheEndOrEightSeconds) {
    Scene scene;
    scene.sources = {sourceOf("drums")};
    EXPECT_EQ(loadInputs(scene).frames, 8u * 48000u);
    scene.duration = 0.5;
    scene.sources[0].start = 0.125;
    EXPECT_EQ(loadInputs(scene).sounds[0].sound.frames(), 18000u);
}

TEST(SceneInputs, GainIsAppliedInDecibels) {
    Scene scene;
    scene.duration = 0.1;
    scene.sources = {sourceOf("bursts"), sourceOf("impulse")};
    scene.sources[0].gainDb = -12.0;
    scene.sources[1].gainDb = 20.0 * std::log10(0.25);
    const SceneInputs inputs = loadInputs(scene);
    const std::vector<float> plain = makeDemoSound(DemoSound::Bursts, 48000.0, 4800);
    EXPECT_EQ(inputs.sounds[0].sound.samples[100],
              plain[100] * static_cast<float>(std::pow(10.0, -12.0 / 20.0)));
    EXPECT_EQ(inputs.sounds[1].sound.samples[0], 0.25f);
    EXPECT_EQ(inputs.sounds[1].sound.samples[1], 0.0f);
}

TEST(SceneInputs, FilesAreUsedAsFarAsAsked) {
    const std::filesystem::path file =
        std::filesystem::path(::testing::TempDir()) / "scene_inputs_test.wav";
    {
        PendingFile pending(file);
        writeWav(pending, counting(1000).sound.samples, 48000, SampleFormat::Float);
        pending.complete();
    }
    Scene scene;
    scene.sources.emplace_back();
    scene.sources[0].input.file = file;
    EXPECT_EQ(loadInputs(scene).frames, 1000u);
    EXPECT_EQ(loadInputs(scene).sounds[0].sound.samples[1999], -1000.0f);
    scene.sources[0].input.duration = 0.01;
    EXPECT_EQ(loadInputs(scene).frames, 480u);
    std::filesystem::remove(file);
    EXPECT_THROW(loadInputs(scene), std::runtime_error);
}

}  // namespace
}  // namespace tessaly
