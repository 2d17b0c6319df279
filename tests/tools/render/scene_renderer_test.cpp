// What is heard of a scene: levels, times, returns, engines with settings of their own.
#include "render/scene_renderer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <fstream>
#include <numbers>

#include "render/output_file.h"
#include "tools/render/scene_render_support.h"

namespace tessaly {
namespace {

constexpr std::size_t block = 1024;
constexpr double blockSeconds = 1024.0 / 48000.0;
constexpr int hall = 5;

class SceneRenderer : public SceneRender {
protected:
    // Sources spread round the head that feed a shared hall.
    static std::vector<SceneSource> choir() {
        std::vector<SceneSource> sources;
        const std::array<const char*, 3> sounds = {"pluck", "drums", "bursts"};
        for (int i = 0; i < 6; ++i) {
            SceneSource one = source(sounds[static_cast<std::size_t>(i % 3)],
                                     fromSpherical(60.0 * i, 10.0 * i, 1.5 + 0.5 * i));
            one.name += std::to_string(i);
            one.gainDb = -20.0 - i;
            one.start = 0.1 * i;
            one.parameters = {constantParameter("Reverb disable", 1.0)};
            one.sends = {{1, -i}};
            sources.push_back(one);
        }
        return sources;
    }

    static Scene sharedHall(std::vector<SceneSource> sources) {
        Scene scene = sceneWith(std::move(sources), 1.5);
        scene.tail = 1.0;
        scene.returns = {{"hall", 1, hall, {}}};
        return scene;
    }

    static SceneSource impulse(const Vector3& position = {0.0, 0.0, 1.0}) {
        SceneSource one = source("impulse", position);
        one.start = 20.0 * blockSeconds;  // the input filters have settled
        return one;
    }
};

std::vector<float> sumOf(const std::vector<float>& a, const std::vector<float>& b) {
    std::vector<float> sum = a;
    for (std::size_t i = 0; i < b.size(); ++i) {
        sum[i] += b[i];
    }
    return sum;
}

TEST_F(SceneRenderer, SixSourcesThroughOneReturnAreTheSumOfSixSingles) {
    const SceneResult together = render(sharedHall(choir()));
    ASSERT_EQ(together.returnOutputs.size(), 1u);
    ASSERT_GT(largest(together.returnOutputs[0]), 0.01f);
    std::vector<double> returns(together.stereo.size(), 0.0);
    std::vector<double> all(together.stereo.size(), 0.0);
    for (const SceneSource& one : choir()) {
        const SceneResult alone = render(sharedHall({one}));
        ASSERT_GT(largest(alone.returnOutputs[0]), 1e-4f) << one.name;
        for (std::size_t i = 0; i < all.size(); ++i) {
            returns[i] += static_cast<double>(alone.returnOutputs[0][i]);
            all[i] += static_cast<double>(alone.stereo[i]);
        }
    }
    double ofReturns = 0.0;
    double ofAll = 0.0;
    for (std::size_t i = 0; i < all.size(); ++i) {
        const auto shared = static_cast<double>(together.returnOutputs[0][i]);
        ofReturns = std::max(ofReturns, std::abs(returns[i] - shared));
        ofAll = std::max(ofAll, std::abs(all[i] - static_cast<double>(together.stereo[i])));
    }
    RecordProperty("deviation_of_the_return", std::to_string(1e9 * ofReturns) + "e-9");
    RecordProperty("deviation_of_the_mix", std::to_string(1e9 * ofAll) + "e-9");
    EXPECT_LE(ofReturns, 1e-6);
    EXPECT_LE(ofAll, 1e-6);
}

TEST_F(SceneRenderer, TwoReturnsTakeWhatIsSentToEach) {
    SceneSource one = source("bursts", {1.0, 0.0, 1.0});
    one.parameters = {constantParameter("Reverb disable", 1.0)};
    one.sends = {{3, -6}, {8, 0}};
    Scene scene = sceneWith({one}, 0.5);
    scene.tail = 0.5;
    scene.returns = {{"hall", 3, hall, {}}, {"stone", 8, 20, {}}};
    const SceneResult both = render(scene);
    Scene hallOnly = scene;
    hallOnly.returns = {scene.returns[0]};
    Scene stoneOnly = scene;
    stoneOnly.returns = {scene.returns[1]};
    EXPECT_EQ(both.returnOutputs[0], render(hallOnly).returnOutputs[0]);
    EXPECT_EQ(both.returnOutputs[1], render(stoneOnly).returnOutputs[0]);
    EXPECT_NE(both.returnOutputs[0], both.returnOutputs[1]);
    EXPECT_EQ(both.stereo,
              sumOf(sumOf(both.sourceOutputs[0], both.returnOutputs[0]), both.returnOutputs[1]));
}

TEST_F(SceneRenderer, AnEngineOfItsOwnWithAnEffectsSettingsIsThatEffect) {
    for (const int room : {0, hall}) {
        SceneSource moving = source("bursts", {});
        moving.room = room;
        moving.path =
            PositionTrack{{{0.0, {-2.0, 0.0, 1.0}}, {1.0, {3.0, 1.0, 4.0}}}, Interpolation::Linear};
        SceneSource resting = source("pluck", {0.5, 0.5, 1.0});
        resting.room = 20;
        Scene scene = sceneWith({moving, resting}, 1.0);
        scene.tail = 0.3;
        const SceneResult effects = render(scene);
        for (SceneSource& one : scene.sources) {
            one.engine = DirectEngine{};
        }
        const SceneResult engines = render(scene);
        EXPECT_GT(largest(effects.stereo), 0.1f);
        EXPECT_EQ(engines.stereo, effects.stereo) << "room " << room;
        EXPECT_EQ(engines.allocations, 0u);
        EXPECT_EQ(render(scene).stereo, engines.stereo) << "again, as in a new process";
    }
}

TEST_F(SceneRenderer, ParametersReachAnEngineOfItsOwn) {
    SceneSource one = source("bursts", {0.0, 0.0, 2.0});
    one.parameters = {constantParameter("Gain", -9.0), constantParameter("Occlusion", 0.7)};
    Scene scene = sceneWith({one}, 0.5);
    const SceneResult effect = render(scene);
    scene.sources[0].engine = DirectEngine{};
    EXPECT_EQ(render(scene).stereo, effect.stereo);
}

TEST_F(SceneRenderer, AnEngineOfItsOwnCannotSend) {
    Scene scene = sharedHall({choir()[0]});
    scene.sources[0].engine = DirectEngine{};
    try {
        render(scene);
        FAIL() << "rendered";
    } catch (const std::runtime_error& failure) {
        EXPECT_THAT(failure.what(), ::testing::HasSubstr("source \"pluck0\" has an engine"));
    }
}

// Frequency by upward crossings of zero, Hz.
double frequencyOf(std::span<const float> stereo, std::size_t from, std::size_t to) {
    double first = 0.0;
    double last = 0.0;
    int crossings = 0;
    for (std::size_t i = from + 1; i < to; ++i) {
        const auto before = static_cast<double>(stereo[2 * (i - 1)]);
        const auto now = static_cast<double>(stereo[2 * i]);
        if (before < 0.0 && now >= 0.0) {
            last = static_cast<double>(i) - now / (now - before);
            first = crossings == 0 ? last : first;
            ++crossings;
        }
    }
    return 48000.0 * (crossings - 1) / (last - first);
}

TEST_F(SceneRenderer, AnApproachingSourceWithDopplerSoundsHigher) {
    const std::filesystem::path file =
        std::filesystem::path(::testing::TempDir()) / "scene_renderer_tone.wav";
    std::vector<float> tone;
    for (int i = 0; i < 2 * 48000; ++i) {
        const double turn = 2.0 * std::numbers::pi * 1000.0 * i / 48000.0;
        tone.insert(tone.end(), 2, static_cast<float>(0.2 * std::sin(turn)));
    }
    {
        PendingFile pending(file);
        writeWav(pending, tone, 48000, SampleFormat::Float);
        pending.complete();
    }
    constexpr double speed = 10.0;  // m/s
    SceneSource car;
    car.name = "car";
    car.input.file = file;
    car.path = PositionTrack{{{0.0, {0.0, 0.0, 25.0}}, {2.0, {0.0, 0.0, 25.0 - 2.0 * speed}}},
                             Interpolation::Linear};
    Scene scene = sceneWith({car}, 2.0);
    const std::vector<float> plain = render(scene).stereo;
    scene.sources[0].engine = DirectEngine{};
    scene.sources[0].engine->settings.doppler = 1;
    const std::vector<float> shifted = render(scene).stereo;
    std::filesystem::remove(file);
    EXPECT_NEAR(frequencyOf(plain, 24000, 72000), 1000.0, 0.5);
    EXPECT_NEAR(frequencyOf(shifted, 24000, 72000), 1000.0 * (1.0 + speed / 343.42), 1.0);
}

// The filter's samples as the library reads them: true polarity.
std::vector<double> headphoneFilter(const char* name) {
    std::ifstream stream(std::filesystem::path(TESSALY_TEST_DATA) / name, std::ios::binary);
    std::vector<char> bytes((std::istreambuf_iterator<char>(stream)), {});
    std::vector<double> filter;
    for (std::size_t i = 44; i + 4 <= bytes.size(); i += 4) {
        float sample = 0.0f;
        std::memcpy(&sample, bytes.data() + i, sizeof sample);
        filter.push_back(-static_cast<double>(sample));  // files of 48000 Hz are stored negated
    }
    return filter;
}

TEST_F(SceneRenderer, HeadphoneCompensationIsItsFilterAtAThirdOfTheLevel) {
    Scene scene = sceneWith({impulse()}, 0.6);
    scene.sources[0].engine = DirectEngine{};
    const std::vector<float> off = render(scene).stereo;
    scene.sources[0].engine->settings.qvHpTFcompSelect = 5;
    const std::vector<float> on = render(scene).stereo;
    const std::vector<double> filter = headphoneFilter("FFIH03GL");
    ASSERT_EQ(filter.size(), 256u);
    ASSERT_EQ(on.size(), off.size());
    ASSERT_GT(largest(on), 0.1f);
    for (std::size_t i = 0; i < on.size(); ++i) {
        double expected = 0.0;
        for (std::size_t k = 0; k < filter.size() && 2 * k <= i; ++k) {
            expected += filter[k] * static_cast<double>(off[i - 2 * k]) / 3.0;
        }
        ASSERT_NEAR(static_cast<double>(on[i]), expected, 2e-6) << i;
    }
}

TEST_F(SceneRenderer, StartAndGainActOnTheInput) {
    const std::vector<float> early = render(sceneWith({impulse()}, 0.8)).stereo;
    SceneSource later = impulse();
    later.start += 4.0 * blockSeconds;
    later.gainDb = 20.0 * std::log10(0.5);
    const std::vector<float> late = render(sceneWith({later}, 0.8)).stereo;
    ASSERT_GT(largest(early), 0.1f);
    const std::size_t shift = 2 * 4 * block;
    for (std::size_t i = shift; i < late.size(); ++i) {
        ASSERT_NEAR(late[i], 0.5f * early[i - shift], 1e-7f) << i;
    }
    // An odd sample of a block is as good as its first.
    SceneSource odd = impulse();
    odd.start += 333.0 / 48000.0;
    const std::vector<float> between = render(sceneWith({odd}, 0.8)).stereo;
    for (std::size_t i = 2 * 333; i < between.size(); ++i) {
        ASSERT_NEAR(between[i], early[i - 2 * 333], 1e-6f) << i;
    }
}

TEST_F(SceneRenderer, ALoopRepeatsToTheEndButNotIntoTheTail) {
    SceneSource clicks = impulse();
    clicks.input.duration = 5.0 * blockSeconds;
    clicks.loop = true;
    Scene scene = sceneWith({clicks}, 40.0 * blockSeconds);
    scene.tail = 10.0 * blockSeconds;
    const std::vector<float> heard = render(scene).stereo;
    ASSERT_EQ(heard.size(), 2 * 50 * block);
    const auto click = [&](std::size_t number) {
        return std::span(heard).subspan(2 * (20 + 5 * number) * block, 2 * 5 * block);
    };
    EXPECT_GT(largest(click(0)), 0.1f);
    for (const std::size_t number : {1u, 2u, 3u}) {
        EXPECT_LE(deviation(click(number), click(0)), 1e-6) << number;
    }
    EXPECT_LE(largest(click(4)), 1e-6f);
    EXPECT_LE(largest(click(5)), 1e-6f);
}

TEST_F(SceneRenderer, KeyframesAreHeardFromTheBlockThatBeginsAtThem) {
    SceneSource quiet = source("pluck", {0.0, 0.0, 1.0});
    quiet.parameters = {
        {"Gain", {{{0.0, 0.0}, {10.5 * blockSeconds, -20.0}}, Interpolation::Step}}};
    const SceneSource loud = source("pluck", {0.0, 0.0, 1.0});
    SceneSource always = loud;
    always.parameters = {constantParameter("Gain", -20.0)};
    const double seconds = 20.0 * blockSeconds;
    const std::vector<float> stepped = render(sceneWith({quiet}, seconds)).stereo;
    const std::vector<float> before = render(sceneWith({loud}, seconds)).stereo;
    const std::vector<float> after = render(sceneWith({always}, seconds)).stereo;
    for (std::size_t i = 0; i < stepped.size(); ++i) {
        // A time within a block waits for the next one.
        ASSERT_EQ(stepped[i], i < 2 * 11 * block ? before[i] : after[i]) << i;
    }
}

TEST_F(SceneRenderer, TurningTheListenerIsMovingTheSourceTheOtherWay) {
    const double seconds = 0.5;
    Scene turned = sceneWith({source("bursts", fromSpherical(80.5, 0.0, 2.0))}, seconds);
    turned.listener.yaw = {{{0.0, 10.0}, {seconds, 50.0}}, Interpolation::Linear};
    SceneSource orbiting = source("bursts", {});
    OrbitPath orbit;
    orbit.radius = 2.0;
    orbit.startAzimuth = 70.5;
    orbit.turns = 40.0 / 360.0;
    orbit.clockwise = false;
    orbiting.path = SourcePath{orbit};
    EXPECT_LE(deviation(render(turned).stereo, render(sceneWith({orbiting}, seconds)).stereo),
              1e-6);
}

TEST_F(SceneRenderer, WallsAreHeardOnlyWhereTheyFollow) {
    SceneSource one = source("bursts", {0.5, 0.0, 1.0});
    one.room = 20;
    Scene scene = sceneWith({one}, 0.5);
    const std::vector<float> preset = render(scene).stereo;
    scene.wallDistances = {{1.0f, 1.0f, 2.0f, 2.0f, 2.0f, 2.0f}};
    EXPECT_EQ(render(scene).stereo, preset) << "without \"Auralization\"";
    scene.sources[0].parameters = {constantParameter("Auralization", 1.0)};
    const std::vector<float> followed = render(scene).stereo;
    EXPECT_NE(followed, preset);
    scene.wallDistances = {{3.0f, 3.0f, 8.0f, 8.0f, 8.0f, 8.0f}};
    EXPECT_NE(render(scene).stereo, followed);
}

TEST_F(SceneRenderer, CutOffsSurviveTheLoadThatTheyComeBefore) {
    SceneSource one = source("bursts", {0.0, 0.0, 2.0});
    one.room = hall;
    Scene scene = sceneWith({one}, 0.6);
    const std::vector<float> open = render(scene).stereo;
    scene.sources[0].parameters = {constantParameter("ReverbLP", 600.0)};
    EXPECT_GT(deviation(render(scene).stereo, open), 1e-3);
}

TEST_F(SceneRenderer, NormalBlocksAllocateNothingThoughRoomsChange) {
    SceneSource one = source("bursts", {0.0, 0.0, 2.0});
    one.parameters = {
        {"Room Selection", {{{0.0, 0.0}, {0.2, 5.0}, {0.4, 20.0}}, Interpolation::Step}},
        {"Gain", {{{0.0, -10.0}, {0.6, 0.0}}, Interpolation::Linear}}};
    const SceneResult result = render(sceneWith({one}, 0.6));
    EXPECT_EQ(result.allocations, 0u);
    EXPECT_EQ(result.releases, 0u);
    EXPECT_THAT(result.warnings, ::testing::IsEmpty());
}

TEST_F(SceneRenderer, AMeasuredResponseIsWhatAnImpulseBringsAtThatMoment) {
    Scene scene = sharedHall({impulse({1.0, 0.0, 2.0}), source("bursts", {-1.0, 0.0, 1.0})});
    scene.sources[0].parameters = {
        constantParameter("Reverb disable", 1.0),
        {"Occlusion", {{{0.0, 0.0}, {1.5, 1.0}}, Interpolation::Linear}}};
    scene.sources[0].sends = {{1, -3}};
    const PluginLibrary library = PluginLibrary::privateCopy(TESSALY_LIBRARY);
    const MeasuredResponse measured =
        measureResponse(library, TESSALY_TEST_DATA, scene, 1.5, 0, 0.6, [] {});
    ASSERT_EQ(measured.left.size(), measured.right.size());
    ASSERT_GT(measured.left.size(), 48000u) << "the hall's tail";

    // The same moment for ever, and the impulse once all has settled.
    Scene still = sharedHall({scene.sources[0]});
    still.sources[0].parameters[1] = constantParameter("Occlusion", 0.4);
    still.sources[0].start = 50.0 * blockSeconds;
    still.duration = still.sources[0].start + 1.5;
    const std::vector<float> heard = render(still).stereo;
    for (std::size_t i = 0; i < 48000; ++i) {
        ASSERT_NEAR(measured.left[i], heard[2 * (50 * block + i)], 1e-6f) << i;
        ASSERT_NEAR(measured.right[i], heard[2 * (50 * block + i) + 1], 1e-6f) << i;
    }
}

TEST_F(SceneRenderer, NothingIsMeasuredOfASilentSource) {
    Scene scene = sceneWith({source("bursts", {0.0, 0.0, 50.0})}, 1.0);
    const PluginLibrary library = PluginLibrary::privateCopy(TESSALY_LIBRARY);
    EXPECT_TRUE(
        measureResponse(library, TESSALY_TEST_DATA, scene, 1.0, 0, 0.5, [] {}).left.empty());
}

}  // namespace
}  // namespace tessaly
