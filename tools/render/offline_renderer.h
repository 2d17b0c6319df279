// Plays one moving source through one spatializer instance.
#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "demo_sounds/sound_file.h"
#include "minihost/plugin_library.h"
#include "render/source_path.h"

namespace tessaly {

/// Name of the effect that is inserted on each source.
inline constexpr const char* spatializerName = "Tessaly Engine";

struct RenderJob {
    std::filesystem::path dataDirectory;
    int sampleRate = 48000;  ///< Hz
    int blockLength = 512;   ///< frames
    int room = 0;
    std::vector<std::pair<std::string, float>> parameters;  ///< name or index and value, in order
    SourcePath path;
    Sound input;             ///< at sampleRate; silence follows its end
    std::size_t frames = 0;  ///< length of the output
};

struct RenderResult {
    std::vector<float> stereo;      ///< interleaved, left first, RenderJob::frames long
    std::uint64_t allocations = 0;  ///< in all blocks but the first, which loads
    std::uint64_t releases = 0;     ///< likewise
};

/// Looks for the files that rate and room need, so that a missing one is told by name.
/// @throws std::runtime_error with one line
void checkData(const std::filesystem::path& directory, int sampleRate, int room);

/// Renders the job.
/// @param onBlock  called before each block with the part done, 0 to 1; may throw to stop
/// @throws std::runtime_error with one line on an unknown or out-of-range parameter, on a refused
///         data directory, and on any failure the library reports
RenderResult render(const PluginLibrary& library,
                    const RenderJob& job,
                    const std::function<void(double)>& onBlock);

}  // namespace tessaly
