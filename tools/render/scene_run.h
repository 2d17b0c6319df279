// A scene's effects, ready to run block by block.
#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <span>
#include <vector>

#include "minihost/effect_instance.h"
#include "minihost/plugin_library.h"
#include "render/own_engine.h"
#include "render/parameter_setter.h"
#include "scene/scene.h"

namespace tessaly {

/// One effect with the parameters that a scene gives it.
struct Voice {
    std::unique_ptr<EffectInstance> instance;
    ParameterSetter parameters;
    std::optional<OwnEngine> engine;
    std::vector<float> in;   ///< interleaved stereo, one block; filled by the caller for a source
    std::vector<float> out;  ///< the same, after the block
};

/// All voices of a scene. One thread at a time.
class SceneRun {
public:
    /// @param duration  of the scene without its tail, seconds: what its paths take
    /// @throws std::runtime_error with one line on what the library does not have or refuses
    SceneRun(const PluginLibrary& library,
             const std::filesystem::path& dataDirectory,
             const Scene& scene,
             double duration);
    ~SceneRun();
    SceneRun(const SceneRun&) = delete;
    SceneRun& operator=(const SceneRun&) = delete;

    /// The input of a source for the next block.
    std::span<float> input(std::size_t source) noexcept { return sources[source].in; }

    /// Runs the block that begins at a time in the scene.
    /// @throws std::runtime_error with one line if the library reports a failure
    void block(double seconds);

    /// @throws std::runtime_error with one line if the library has reported a failure
    void check() const;

    std::span<const float> sourceOutput(std::size_t i) const noexcept { return sources[i].out; }
    std::span<const float> returnOutput(std::size_t i) const noexcept { return returns[i].out; }

    /// Of the library, so far, in blocks that load nothing.
    std::uint64_t allocations() const noexcept { return allocationCount; }
    std::uint64_t releases() const noexcept { return releaseCount; }

private:
    Voice sourceVoice(const SceneSource& source) const;
    Voice returnVoice(const SceneReturn& one) const;
    Voice voiceOf(const UnityAudioEffectDefinition& effect,
                  int room,
                  const std::vector<ParameterTrack>& parameters) const;
    bool setParameters(double seconds);
    void process(Voice& voice);
    void runAll(double seconds);

    const PluginLibrary& library_;
    const Scene& scene_;
    double duration_;
    std::optional<OwnEngineSession> session;
    std::vector<Voice> sources;
    std::vector<Voice> returns;
    bool begun = false;
    bool loading = false;
    std::uint64_t allocationCount = 0;
    std::uint64_t releaseCount = 0;
};

}  // namespace tessaly
