// Engines built by the renderer itself, for settings that the library's effect never gives.
#pragma once

#include <cstdint>
#include <filesystem>
#include <mutex>

#include "minihost/effect_instance.h"
#include "scene/scene.h"

namespace tessaly {

/// The renderer carries the library's code too, with one process-wide state for all engines that
/// it builds itself. While one of these is alive that state belongs to one scene; another scene
/// waits. Begins and ends with the state of a new process; no engine may outlive it.
class OwnEngineSession {
public:
    OwnEngineSession(const std::filesystem::path& dataDirectory, const Scene& scene);
    ~OwnEngineSession();
    OwnEngineSession(const OwnEngineSession&) = delete;
    OwnEngineSession& operator=(const OwnEngineSession&) = delete;

    /// The spatializer of the renderer's own copy.
    static const UnityAudioEffectDefinition& spatializer();

    /// @throws std::runtime_error with one line if an engine has failed
    static void check();

private:
    std::unique_lock<std::mutex> turn;
};

/// Puts an engine with settings of our own behind one effect of the renderer's own copy; the
/// effect goes on giving it position, levels and room.
class OwnEngine {
public:
    explicit OwnEngine(const DirectEngine& wanted);

    /// Before each block: if the effect builds an engine, replaces it. Block time but for that.
    void follow(EffectInstance& instance);

private:
    EngineSettings settings;  ///< lent to the engine, which reads the headphone selection live
    std::int16_t qualityValue;
    bool wallsFollow;  ///< whatever the effect's "Auralization" says
};

}  // namespace tessaly
