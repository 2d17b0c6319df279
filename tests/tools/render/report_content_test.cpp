// What a page tells about a scene: paths, settings, remarks.
#include "render/report_content.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "render/report_parameters.h"

namespace tessaly {
namespace {

Scene concert() {
    Scene scene;
    scene.title = "Concert";
    scene.description = "Two players";
    scene.wallDistances = {{1.0f, 2.0f, 3.0f, 4.0f, 5.0f, 6.0f}};
    scene.listener.yaw = {{{0.0, 0.0}, {2.0, 90.0}}, Interpolation::Linear};
    SceneSource player;
    player.name = "string";
    player.input.sound = "pluck";
    player.room = 5;
    player.path =
        PositionTrack{{{0.0, {0.0, 0.0, 1.0}}, {2.0, {4.0, 0.0, 1.0}}}, Interpolation::Linear};
    player.parameters = {{"Occlusion", {{{0.0, 0.0}, {1.0, 0.5}}, Interpolation::Spline}},
                         {"Reverb", constantTrack(-6.0)}};
    player.sends = {{4, -3}};
    SceneSource car;
    car.name = "car";
    car.input.sound = "drums";
    car.engine = DirectEngine{};
    car.engine->settings.doppler = 1;
    car.engine->settings.qvHpTFcompSelect = 3;
    scene.sources = {player, car};
    scene.returns = {{"hall", 4, 20, {{"Gain", constantTrack(2.0)}}}};
    return scene;
}

std::string rowOf(const std::vector<ReportParameter>& rows,
                  const std::string& owner,
                  const std::string& name) {
    for (const ReportParameter& row : rows) {
        if (row.owner == owner && row.name == name) {
            return row.value + (row.unit.empty() ? "" : " " + row.unit);
        }
    }
    return "none";
}

TEST(ReportParameters, TellAllThatTheSceneSets) {
    const std::vector<ReportParameter> rows = reportParameters(concert(), 2.0);
    EXPECT_EQ(rowOf(rows, "scene", "sample rate"), "48000 Hz");
    EXPECT_EQ(rowOf(rows, "scene", "duration"), "2 s");
    EXPECT_EQ(rowOf(rows, "scene", "wall left"), "5 m");
    EXPECT_EQ(rowOf(rows, "listener", "yaw"), "0 s: 0, 2 s: 90 (linear) deg");
    EXPECT_EQ(rowOf(rows, "string", "room"), "room 5 (FamousConcerthall)");
    EXPECT_EQ(rowOf(rows, "string", "position"), "0 s: (0, 0, 1), 2 s: (4, 0, 1) (linear) m");
    EXPECT_EQ(rowOf(rows, "string", "Occlusion"), "0 s: 0, 1 s: 0.5 (spline) a");
    EXPECT_EQ(rowOf(rows, "string", "Reverb"), "-6 dB");
    EXPECT_EQ(rowOf(rows, "string", "send to hall"), "-3 dB");
    EXPECT_EQ(rowOf(rows, "string", "engine"), "none");
    EXPECT_EQ(rowOf(rows, "car", "room"), "dry");
    EXPECT_EQ(rowOf(rows, "car", "engine: doppler"), "on OnOff");
    EXPECT_EQ(rowOf(rows, "car", "engine: headphone"), "3");
    EXPECT_EQ(rowOf(rows, "car", "engine: fading"), "none") << "as an effect has it";
    EXPECT_EQ(rowOf(rows, "return hall", "ReverbID"), "4 No");
    EXPECT_EQ(rowOf(rows, "return hall", "Gain"), "2 dB");
}

TEST(ReportParameters, LongTracksAreCutShort) {
    Scene scene = concert();
    scene.sources[0].parameters[0].track.keys.clear();
    for (int i = 0; i < 20; ++i) {
        scene.sources[0].parameters[0].track.keys.push_back({1.0 * i, 0.0});
    }
    EXPECT_THAT(rowOf(reportParameters(scene, 2.0), "string", "Occlusion"),
                ::testing::HasSubstr("11 s: 0, and 8 more (spline)"));
}

TEST(ReportEntry, PathsCoverTheWholeSound) {
    SceneResult result;
    result.stereo.assign(2 * 3 * 48000, 0.25f);  // a second of tail
    result.warnings = {"too loud"};
    const ReportEntry entry =
        reportEntry(concert(), 2.0, result, {{"string at 1.0 s", {1.0f}, {0.5f}}});
    EXPECT_EQ(entry.title, "Concert");
    EXPECT_EQ(entry.description, "Two players");
    EXPECT_EQ(entry.stereo.size(), result.stereo.size());
    EXPECT_EQ(entry.remarks, result.warnings);
    ASSERT_EQ(entry.responses.size(), 1u);
    ASSERT_EQ(entry.sources.size(), 2u);
    const ReportPath& path = entry.sources[0];
    ASSERT_EQ(path.times.size(), path.positions.size());
    EXPECT_EQ(path.times.front(), 0.0);
    EXPECT_EQ(path.times.back(), 3.0);
    EXPECT_EQ(path.positions.back().x, 4.0);
    for (std::size_t i = 1; i < path.times.size(); ++i) {
        ASSERT_GT(path.times[i], path.times[i - 1]);
        ASSERT_NEAR(path.positions[i].x, std::min(2.0 * path.times[i], 4.0), 1e-9);
    }
    EXPECT_TRUE(path.headings.empty());
    ASSERT_EQ(entry.listener.headings.size(), entry.listener.times.size());
    EXPECT_EQ(entry.listener.headings.back(), 90.0);
}

}  // namespace
}  // namespace tessaly
