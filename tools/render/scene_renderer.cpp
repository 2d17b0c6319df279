// From block to block through a scene, and the measurement of one moment.
#include "render/scene_renderer.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

#include "render/scene_run.h"

namespace tessaly {

namespace {

constexpr double longestResponse = 6.0;     // seconds
constexpr double silenceToEnd = 0.5;        // seconds: longer than between a room's single echoes
constexpr double settlingTime = 0.75;       // seconds: occlusion takes 0.55 for a full swing
constexpr std::size_t settlingBlocks = 40;  // limited steps turn by 5 degrees a block
constexpr float inaudible = 1e-7f;          // re peak

void append(std::vector<float>& all, std::span<const float> block, std::size_t frames) {
    all.insert(all.end(), block.begin(), block.begin() + static_cast<std::ptrdiff_t>(2 * frames));
}

void add(std::span<float> sum, std::span<const float> part) {
    for (std::size_t i = 0; i < sum.size(); ++i) {
        sum[i] += part[i];
    }
}

bool allZero(const std::vector<float>& samples) {
    return std::all_of(samples.begin(), samples.end(), [](float x) { return x == 0.0f; });
}

void addWarnings(SceneResult& result, const SceneInputs& inputs) {
    if (result.allocations + result.releases > 0) {
        result.warnings.push_back(
            fmt::format("the library made {} allocations and {} releases in normal blocks",
                        result.allocations, result.releases));
    }
    const bool played = std::any_of(inputs.sounds.begin(), inputs.sounds.end(),
                                    [](const PlacedSound& sound) { return !sound.silent(); });
    if (played && allZero(result.stereo)) {
        result.warnings.emplace_back("the output is silent though the input is not");
    }
}

ScalarTrack frozen(const ScalarTrack& track, double seconds) {
    return constantTrack(valueAt(track, seconds));
}

void freeze(std::vector<ParameterTrack>& parameters, double seconds) {
    for (ParameterTrack& parameter : parameters) {
        parameter.track = frozen(parameter.track, seconds);
    }
}

// The scene as it stands at one moment, without what the source has nothing to do with. Sources
// with engines of their own stay: these share the headphone filter.
Scene frozenScene(const Scene& scene, double duration, std::size_t source, double seconds) {
    Scene result = scene;
    SceneListener& listener = result.listener;
    listener.position = constantTrack(valueAt(listener.position, seconds));
    for (ScalarTrack* angle : {&listener.yaw, &listener.pitch, &listener.roll}) {
        *angle = frozen(*angle, seconds);
    }
    result.sources.clear();
    for (std::size_t i = 0; i < scene.sources.size(); ++i) {
        if (i == source || scene.sources[i].engine) {
            SceneSource one = scene.sources[i];
            one.path = constantTrack(positionAt(one.path, seconds, duration));
            freeze(one.parameters, seconds);
            result.sources.push_back(one);
        }
    }
    std::erase_if(result.returns, [&](const SceneReturn& one) {
        const std::vector<SceneSend>& sends = scene.sources[source].sends;
        return std::none_of(sends.begin(), sends.end(),
                            [&](const SceneSend& send) { return send.reverbId == one.reverbId; });
    });
    for (SceneReturn& one : result.returns) {
        freeze(one.parameters, seconds);
    }
    return result;
}

std::size_t placeInFrozen(const Scene& scene, std::size_t source) {
    return static_cast<std::size_t>(std::count_if(
        scene.sources.begin(), scene.sources.begin() + static_cast<std::ptrdiff_t>(source),
        [](const SceneSource& one) { return one.engine.has_value(); }));
}

// Sum of all outputs of a block.
void mix(const SceneRun& run, const Scene& scene, std::span<float> sum) {
    std::fill(sum.begin(), sum.end(), 0.0f);
    for (std::size_t i = 0; i < scene.sources.size(); ++i) {
        add(sum, run.sourceOutput(i));
    }
    for (std::size_t i = 0; i < scene.returns.size(); ++i) {
        add(sum, run.returnOutput(i));
    }
}

// Takes a response block by block and knows when it has died away.
class ResponseRecorder {
public:
    explicit ResponseRecorder(int sampleRate) : rate(sampleRate) {}

    void take(std::span<const float> block) {
        stereo.insert(stereo.end(), block.begin(), block.end());
        for (const float sample : block) {
            peak = std::max(peak, std::abs(sample));
        }
        const bool heard = std::any_of(block.begin(), block.end(), [this](float sample) {
            return std::abs(sample) > inaudible * peak;
        });
        if (heard) {
            lastHeard = seconds();
        }
    }

    bool ended() const {
        return seconds() >= longestResponse || seconds() - lastHeard >= silenceToEnd;
    }

    MeasuredResponse response() const {
        std::size_t frames =
            std::min(stereo.size() / 2, static_cast<std::size_t>(longestResponse * rate));
        while (frames > 0 && std::abs(stereo[2 * frames - 2]) <= inaudible * peak &&
               std::abs(stereo[2 * frames - 1]) <= inaudible * peak) {
            --frames;
        }
        MeasuredResponse result;
        for (std::size_t i = 0; i < frames; ++i) {
            result.left.push_back(stereo[2 * i]);
            result.right.push_back(stereo[2 * i + 1]);
        }
        return result;
    }

private:
    double seconds() const { return static_cast<double>(stereo.size() / 2) / rate; }

    int rate;
    std::vector<float> stereo;
    float peak = 0.0f;
    double lastHeard = 0.0;
};

}  // namespace

SceneResult renderScene(const PluginLibrary& library,
                        const std::filesystem::path& dataDirectory,
                        const Scene& scene,
                        const SceneInputs& inputs,
                        const std::function<void(double)>& onBlock) {
    SceneRun run(library, dataDirectory, scene, inputs.duration);
    const auto blockLength = static_cast<std::size_t>(scene.blockLength);
    const std::size_t frames = inputs.frames + inputs.tailFrames;
    SceneResult result;
    result.stereo.reserve(2 * frames);
    result.sourceOutputs.resize(scene.sources.size());
    result.returnOutputs.resize(scene.returns.size());
    std::vector<float> sum(2 * blockLength);
    for (std::size_t start = 0; start < frames; start += blockLength) {
        onBlock(static_cast<double>(start) / static_cast<double>(frames));
        for (std::size_t i = 0; i < scene.sources.size(); ++i) {
            inputs.sounds[i].fillBlock(start, run.input(i));
        }
        run.block(static_cast<double>(start) / scene.sampleRate);
        const std::size_t wanted = std::min(blockLength, frames - start);
        for (std::size_t i = 0; i < scene.sources.size(); ++i) {
            append(result.sourceOutputs[i], run.sourceOutput(i), wanted);
        }
        for (std::size_t i = 0; i < scene.returns.size(); ++i) {
            append(result.returnOutputs[i], run.returnOutput(i), wanted);
        }
        mix(run, scene, sum);
        append(result.stereo, sum, wanted);
    }
    run.check();
    result.allocations = run.allocations();
    result.releases = run.releases();
    addWarnings(result, inputs);
    return result;
}

MeasuredResponse measureResponse(const PluginLibrary& library,
                                 const std::filesystem::path& dataDirectory,
                                 const Scene& scene,
                                 double duration,
                                 std::size_t source,
                                 double seconds,
                                 const std::function<void()>& onBlock) {
    const Scene still = frozenScene(scene, duration, source, seconds);
    const std::size_t place = placeInFrozen(scene, source);
    SceneRun run(library, dataDirectory, still, duration);
    const auto blockLength = static_cast<std::size_t>(scene.blockLength);
    const auto settled =
        std::max(settlingBlocks,
                 static_cast<std::size_t>(settlingTime * scene.sampleRate) / blockLength + 1);
    ResponseRecorder recorder(scene.sampleRate);
    std::vector<float> sum(2 * blockLength);
    for (std::size_t block = 0; block < settled || !recorder.ended(); ++block) {
        onBlock();
        // Both sides, as a mono sound.
        std::fill_n(run.input(place).begin(), 2, block == settled ? 1.0f : 0.0f);
        run.block(seconds);
        if (block >= settled) {
            mix(run, still, sum);
            recorder.take(sum);
        }
    }
    return recorder.response();
}

}  // namespace tessaly
