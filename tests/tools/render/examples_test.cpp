// Every example scene renders whole: heard, below full scale, without allocations, and its first
// seconds a second time the same.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <utility>
#include <vector>

#include "data/worker_pool.h"
#include "demo_sounds/speech.h"
#include "render/data_check.h"
#include "scene/scene_file.h"
#include "tools/render/scene_render_support.h"

namespace tessaly {
namespace {

struct Example {
    std::filesystem::path file;
    Scene scene;
    SceneInputs inputs;
    SceneResult first;
    SceneResult second;
};

bool speaks(const SceneSource& source) { return source.input.sound == "speech"; }

// All that this machine can play.
std::vector<Example> examples() {
    std::vector<Example> all;
    for (const auto& entry : std::filesystem::directory_iterator(TESSALY_EXAMPLES)) {
        if (entry.path().extension() != ".json") {
            continue;
        }
        Scene scene = readScene(entry.path());
        const std::vector<SceneSource>& sources = scene.sources;
        if (speechAvailable() || std::none_of(sources.begin(), sources.end(), speaks)) {
            Example& example = all.emplace_back();
            example.file = entry.path();
            example.scene = std::move(scene);
        }
    }
    return all;
}

constexpr std::size_t framesCompared = 96000;

SceneResult renderedWithACopy(const Example& example, const SceneInputs& inputs) {
    const PluginLibrary library = PluginLibrary::privateCopy(TESSALY_LIBRARY);
    return renderScene(library, TESSALY_TEST_DATA, example.scene, inputs, [](double) {});
}

// The same scene, left early: paths keep their time.
SceneInputs beginning(const SceneInputs& inputs) {
    SceneInputs result = inputs;
    result.frames = std::min(result.frames, framesCompared);
    result.tailFrames = 0;
    return result;
}

class Examples : public SceneRender {};

TEST_F(Examples, EachIsHeardAndStaysBelowFullScale) {
    std::vector<Example> all = examples();
    ASSERT_GE(all.size(), 12u);
    for (Example& example : all) {
        SCOPED_TRACE(example.file.filename());
        ASSERT_NO_THROW(checkData(TESSALY_TEST_DATA, example.scene));
        example.inputs = loadInputs(example.scene);
    }
    data::forEachParallel(2 * all.size(), [&](std::size_t i) {
        Example& example = all[i / 2];
        if (i % 2 == 0) {
            example.first = renderedWithACopy(example, example.inputs);
        } else {
            example.second = renderedWithACopy(example, beginning(example.inputs));
        }
    });
    for (const Example& example : all) {
        SCOPED_TRACE(example.file.filename());
        const float peak = largest(example.first.stereo);
        EXPECT_GT(peak, 0.02f);
        EXPECT_LT(peak, 1.0f);
        EXPECT_TRUE(example.first.warnings.empty()) << example.first.warnings.front();
        EXPECT_EQ(example.first.allocations + example.first.releases, 0u);
        ASSERT_GT(largest(example.second.stereo), 0.0f);
        ASSERT_LE(example.second.stereo.size(), example.first.stereo.size());
        EXPECT_TRUE(std::equal(example.second.stereo.begin(), example.second.stereo.end(),
                               example.first.stereo.begin()));
        for (const std::vector<float>& output : example.first.returnOutputs) {
            EXPECT_GT(largest(output), 1e-3f) << "a return that nobody hears";
        }
    }
}

}  // namespace
}  // namespace tessaly
