// The block loop of the renderer and the checks round it.
#include "render/offline_renderer.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <stdexcept>

#include "base/ess_error.h"
#include "minihost/effect_instance.h"
#include "render/rooms.h"
#include "render/text_numbers.h"

namespace tessaly {

namespace {

constexpr int firstPresetWithTail = 15;

const char* meaningOf(int errorState) {
    switch (errorState) {
        case essErrorBlockSize:
            return "block size refused";
        case essErrorSampleRate:
            return "sample rate refused";
        case essErrorDatabaseMissing:
            return "HRIR file missing";
        case essErrorHrirMissing:
            return "a direction has no HRIR";
        case essErrorTailUnreadable:
            return "reverb file of this rate missing";
        case essErrorWavChannels:
            return "data file with a wrong channel count";
        case essErrorWavTooShort:
            return "data file too short";
        case essErrorWavBitDepth:
            return "data file with a wrong sample format";
        case essErrorWavUnreadable:
            return "data file missing";
        case essErrorTransformPlan:
            return "no transform of this length";
        case essErrorSpectrumMemory:
            return "out of memory";
        default:
            return "unknown reason";
    }
}

// By exact name, by name without regard to case and blanks, or by index.
int findParameter(const UnityAudioEffectDefinition& effect, const std::string& wanted) {
    const int exact = parameterIndex(effect, wanted);
    if (exact >= 0) {
        return exact;
    }
    const auto parameters = parametersOf(effect);
    if (const std::optional<double> number = numberFromText(wanted)) {
        const bool known = *number >= 0.0 && *number < static_cast<double>(parameters.size()) &&
                           *number == std::floor(*number);
        return known ? static_cast<int>(*number) : -1;
    }
    const std::string folded = foldedName(wanted);
    for (std::size_t i = 0; i < parameters.size(); ++i) {
        if (foldedName(fieldText(parameters[i].name)) == folded) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

void setParameters(EffectInstance& instance, const RenderJob& job) {
    const UnityAudioEffectDefinition& effect = instance.definition();
    // All defaults first, as a host does; the room is what makes the library load.
    instance.setDefaults();
    instance.setParameter("Room Selection", static_cast<float>(job.room));
    for (const auto& [name, value] : job.parameters) {
        const int index = findParameter(effect, name);
        if (index < 0) {
            throw std::runtime_error(
                fmt::format("unknown parameter \"{}\": --list shows the names and indices", name));
        }
        const UnityAudioParameterDefinition& parameter = parametersOf(effect)[index];
        if (!(value >= parameter.min && value <= parameter.max)) {
            throw std::runtime_error(fmt::format("parameter \"{}\" takes {:g} to {:g}, got {:g}",
                                                 fieldText(parameter.name), parameter.min,
                                                 parameter.max, value));
        }
        instance.setParameter(index, value);
    }
}

void checkErrorState(const PluginLibrary& library) {
    const int state = library.getErrorState();
    if (state != essErrorNone) {
        throw std::runtime_error(
            fmt::format("the library reports error {}: {}", state, meaningOf(state)));
    }
}

// Interleaved stereo, as a source reaches a spatializer; a mono clip stands on both sides.
void fillBlock(const Sound& input, std::size_t start, std::vector<float>& block) {
    const std::size_t channels = static_cast<std::size_t>(input.channels);
    const std::size_t frames = input.frames();
    for (std::size_t i = 0; i < block.size() / 2; ++i) {
        const std::size_t frame = start + i;
        const bool inside = frame < frames;
        block[2 * i] = inside ? input.samples[frame * channels] : 0.0f;
        block[2 * i + 1] = inside ? input.samples[frame * channels + channels - 1] : 0.0f;
    }
}

}  // namespace

void checkData(const std::filesystem::path& directory, int sampleRate, int room) {
    std::error_code ignored;
    if (!std::filesystem::is_directory(directory, ignored)) {
        throw std::runtime_error("no data directory " + directory.string() +
                                 ": make it with tessaly-data or name one with --data");
    }
    const char* ofRate = sampleRate == 44100   ? "TSLdata120.dat"
                         : sampleRate == 48000 ? "TSLdata121.dat"
                                               : "TSLdata122.dat";
    const Room& wanted = roomAt(room);
    const std::string tails = fmt::format("TSLdata51{}.dat", ofRate[std::strlen("TSLdata12")]);
    if (wanted.preset >= firstPresetWithTail &&
        !std::filesystem::is_regular_file(directory / tails, ignored)) {
        throw std::runtime_error(fmt::format("no tail for room {} ({}) at {} Hz: {} is missing",
                                             room, wanted.name, sampleRate,
                                             (directory / tails).string()));
    }
    // The library asks for the file of 44100 Hz whatever the rate.
    for (const char* name : {ofRate, "TSLdata120.dat"}) {
        if (!std::filesystem::is_regular_file(directory / name, ignored)) {
            throw std::runtime_error(fmt::format("no data for {} Hz: {} is missing", sampleRate,
                                                 (directory / name).string()));
        }
    }
}

RenderResult render(const PluginLibrary& library,
                    const RenderJob& job,
                    const std::function<void(double)>& onBlock) {
    if (!library.setStreamingAssetsPath(job.dataDirectory.string())) {
        throw std::runtime_error("the library refuses the data directory " +
                                 job.dataDirectory.string());
    }
    const auto blockLength = static_cast<std::size_t>(job.blockLength);
    EffectInstance instance(library.effect(spatializerName),
                            static_cast<std::uint32_t>(job.sampleRate),
                            static_cast<std::uint32_t>(job.blockLength));
    setParameters(instance, job);

    RenderResult result;
    result.stereo.resize(2 * job.frames);
    std::vector<float> in(2 * blockLength);
    std::vector<float> out(2 * blockLength);
    Pose source;
    for (std::size_t start = 0; start < job.frames; start += blockLength) {
        const double fraction = static_cast<double>(start) / static_cast<double>(job.frames);
        onBlock(fraction);
        source.position = positionAt(job.path, fraction);
        instance.place(Pose{}, source);
        fillBlock(job.input, start, in);
        instance.processBlock(in.data(), out.data(), static_cast<std::uint32_t>(blockLength));
        if (start == 0) {
            checkErrorState(library);
        } else {
            result.allocations += instance.blockAllocations();
            result.releases += instance.blockReleases();
        }
        const std::size_t wanted = std::min(blockLength, job.frames - start);
        std::copy_n(out.begin(), 2 * wanted,
                    result.stereo.begin() + static_cast<std::ptrdiff_t>(2 * start));
    }
    checkErrorState(library);
    return result;
}

}  // namespace tessaly
