// What is to be heard: sources, shared reverbs, listener and room, over time.
#pragma once

#include <array>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "engine/engine_settings.h"
#include "render/source_path.h"
#include "scene/track.h"

namespace tessaly {

/// What a source plays: a sound file, or a built-in sound by name.
struct SceneInput {
    std::filesystem::path file;  ///< absolute or from the working directory; empty: built-in
    std::string sound;           ///< "pluck", "drums", "bursts", "speech", "impulse"
    std::string text;            ///< what "speech" says
    /// Seconds of it that are used; all of a file or of what is said if not given. The other
    /// built-in sounds have no end of their own: a scene that was read gives them one here.
    std::optional<double> duration;
};

/// A parameter of an effect over time, set at the start of each block in which it differs.
struct ParameterTrack {
    std::string name;  ///< as the library declares it
    ScalarTrack track;
};

/// Keyframed positions, or one of the simple paths, which take the scene's whole duration.
using ScenePath = std::variant<PositionTrack, SourcePath>;

/// A source's dry signal into a shared reverb; heard while the source's own reverb is off.
struct SceneSend {
    int reverbId = 0;  ///< the return's "ReverbID"
    int level = 0;     ///< whole dB
};

/// Settings of the source's engine that no parameter of the effect reaches. The effect goes on
/// giving the engine position, levels and room; it cannot send.
struct DirectEngine {
    EngineSettings settings;        ///< rate, room and tail preset are filled in by the renderer
    std::int16_t qualityValue = 0;  ///< quality ladder, 0: settings as they stand
};

struct SceneSource {
    std::string name;
    SceneInput input;
    double gainDb = 0.0;  ///< applied to the input, dB
    double start = 0.0;   ///< seconds of silence before it begins
    bool loop = false;    ///< repeats its input to the end of the scene, tail excluded
    ScenePath path = PositionTrack{{{0.0, {0.0, 0.0, 1.0}}}, Interpolation::Linear};
    int room = 0;                            ///< "Room Selection"
    std::vector<ParameterTrack> parameters;  ///< in order; "Room Selection" may be among them
    std::vector<SceneSend> sends;
    std::optional<DirectEngine> engine;
};

/// One "Tessaly Reverb" on a mixer group.
struct SceneReturn {
    std::string name;
    int reverbId = 1;  ///< above 0
    int room = 0;      ///< "Room Selection"
    std::vector<ParameterTrack> parameters;
};

struct SceneListener {
    PositionTrack position = constantTrack(Vector3{});
    ScalarTrack yaw = constantTrack(0.0);    ///< degrees, to the right
    ScalarTrack pitch = constantTrack(0.0);  ///< degrees, upwards
    ScalarTrack roll = constantTrack(0.0);   ///< degrees, lowers the right side
};

struct Scene {
    std::string title;
    std::string description;
    int sampleRate = 48000;          ///< Hz: 24000, 44100 or 48000
    int blockLength = 1024;          ///< frames, a power of two
    std::optional<double> duration;  ///< seconds without the tail; default: all inputs to their end
    double tail = 0.0;               ///< seconds rendered after the duration
    /// Metres from the listener to the walls, for SetRoomDistances in its order; not called if
    /// absent.
    std::optional<std::array<float, 6>> wallDistances;
    SceneListener listener;
    std::vector<SceneSource> sources;  ///< one or more
    std::vector<SceneReturn> returns;
};

/// Position of a source.
/// @param seconds   time in the scene
/// @param duration  the scene's length in seconds, above 0, for paths that take all of it
Vector3 positionAt(const ScenePath& path, double seconds, double duration) noexcept;

/// Where the listener is and how it is turned.
Pose listenerAt(const SceneListener& listener, double seconds) noexcept;

}  // namespace tessaly
