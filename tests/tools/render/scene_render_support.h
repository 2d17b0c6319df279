// Scenes through the built library with the measured data set, for tests of what is heard.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <span>
#include <string>
#include <utility>
#include <vector>

#include "minihost/plugin_library.h"
#include "render/scene_renderer.h"
#include "scene/scene.h"

namespace tessaly {

/// Skips the test where the measurement that the data is made of is not installed.
class SceneRender : public ::testing::Test {
protected:
    void SetUp() override {
        if (!std::filesystem::exists(std::filesystem::path(TESSALY_TEST_DATA) / "TSLdata511.dat")) {
            GTEST_SKIP() << "no data set";
        }
    }

    /// Renders with a library of its own.
    static SceneResult render(const Scene& scene) {
        const PluginLibrary library = PluginLibrary::privateCopy(TESSALY_LIBRARY);
        return renderScene(library, TESSALY_TEST_DATA, scene, loadInputs(scene), [](double) {});
    }

    static SceneSource source(std::string sound, const Vector3& position) {
        SceneSource one;
        one.name = sound;
        one.input.sound = std::move(sound);
        one.path = constantTrack(position);
        return one;
    }

    static Scene sceneWith(std::vector<SceneSource> sources, double duration) {
        Scene scene;
        scene.duration = duration;
        scene.sources = std::move(sources);
        return scene;
    }

    static ParameterTrack constantParameter(std::string name, double value) {
        return {std::move(name), constantTrack(value)};
    }
};

inline float largest(std::span<const float> samples) {
    float peak = 0.0f;
    for (const float sample : samples) {
        peak = std::max(peak, std::abs(sample));
    }
    return peak;
}

/// Largest difference of two sounds of one length.
inline double deviation(std::span<const float> a, std::span<const float> b) {
    EXPECT_EQ(a.size(), b.size());
    double worst = 0.0;
    for (std::size_t i = 0; i < std::min(a.size(), b.size()); ++i) {
        worst = std::max(worst, std::abs(static_cast<double>(a[i]) - static_cast<double>(b[i])));
    }
    return worst;
}

}  // namespace tessaly
