// Loading, cutting and looping of inputs.
#include "render/scene_inputs.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>

#include "demo_sounds/demo_sounds.h"
#include "demo_sounds/speech.h"

namespace tessaly {

namespace {

constexpr double builtInDuration = 8.0;  // seconds, where nothing else decides

std::size_t framesOf(double seconds, int sampleRate) {
    return static_cast<std::size_t>(std::max(std::round(seconds * sampleRate), 0.0));
}

std::vector<float> unitImpulse(std::size_t frames) {
    std::vector<float> samples(std::max<std::size_t>(frames, 1), 0.0f);
    samples[0] = 1.0f;
    return samples;
}

Sound builtIn(const SceneSource& source, const Scene& scene) {
    const double rest = std::max(scene.duration.value_or(0.0) - source.start, 0.0);
    const double seconds = source.input.duration.value_or(scene.duration ? rest : builtInDuration);
    const std::size_t frames = std::max<std::size_t>(framesOf(seconds, scene.sampleRate), 1);
    const double rate = scene.sampleRate;
    Sound sound;
    sound.sampleRate = rate;
    const std::optional<DemoSound> demo = demoSoundByName(source.input.sound);
    sound.samples = demo ? makeDemoSound(*demo, rate, frames) : unitImpulse(frames);
    return sound;
}

// Where temporary files were looked for, in the order of the standard library; its error may not
// say.
std::string temporaryPlace() {
    for (const char* variable : {"TMPDIR", "TMP", "TEMP", "TEMPDIR"}) {
        const char* folder = std::getenv(variable);
        if (folder != nullptr) {
            return fmt::format("{} is {}: ", variable, folder);
        }
    }
    return "";
}

// What goes wrong on the way to speech is said to be about speech.
Sound spoken(const std::string& text, int sampleRate) {
    try {
        return makeSpeech(text, sampleRate);
    } catch (const std::filesystem::filesystem_error& failure) {
        throw std::runtime_error(fmt::format("speech needs a directory for a temporary file: {}{}",
                                             temporaryPlace(), failure.code().message()));
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(fmt::format("no speech: {}", failure.what()));
    }
}

Sound soundOf(const SceneSource& source, const Scene& scene) {
    const SceneInput& input = source.input;
    if (input.sound != "speech" && input.file.empty()) {
        return builtIn(source, scene);
    }
    const double limit = input.duration.value_or(longestScene);
    Sound sound = input.file.empty()
                      ? spoken(input.text, scene.sampleRate)
                      : resampled(readSoundFile(input.file, limit), scene.sampleRate);
    const std::size_t most = framesOf(limit, scene.sampleRate);
    if (sound.frames() > most) {
        sound.samples.resize(most * static_cast<std::size_t>(sound.channels));
    }
    return sound;
}

PlacedSound placed(const SceneSource& source, const Scene& scene) {
    PlacedSound result;
    result.sound = soundOf(source, scene);
    result.firstFrame = framesOf(source.start, scene.sampleRate);
    result.framesHeard = result.sound.frames();
    result.loop = source.loop;
    const auto gain = static_cast<float>(std::pow(10.0, source.gainDb / 20.0));
    for (float& sample : result.sound.samples) {
        sample *= gain;
    }
    return result;
}

}  // namespace

void PlacedSound::fillBlock(std::size_t start, std::span<float> block) const noexcept {
    const auto channels = static_cast<std::size_t>(sound.channels);
    const std::size_t once = sound.frames();
    for (std::size_t i = 0; i < block.size() / 2; ++i) {
        const std::size_t frame = start + i;
        const bool heard = frame >= firstFrame && frame - firstFrame < framesHeard && once > 0;
        const std::size_t at = heard ? (frame - firstFrame) % once * channels : 0;
        block[2 * i] = heard ? sound.samples[at] : 0.0f;
        block[2 * i + 1] = heard ? sound.samples[at + channels - 1] : 0.0f;
    }
}

bool PlacedSound::silent() const noexcept {
    const std::size_t heard = std::min(framesHeard, sound.frames());
    const auto end = sound.samples.begin() +
                     static_cast<std::ptrdiff_t>(heard * static_cast<std::size_t>(sound.channels));
    return std::all_of(sound.samples.begin(), end, [](float sample) { return sample == 0.0f; });
}

SceneInputs loadInputs(const Scene& scene) {
    SceneInputs inputs;
    std::size_t last = 1;
    for (const SceneSource& source : scene.sources) {
        inputs.sounds.push_back(placed(source, scene));
        last = std::max(last, inputs.sounds.back().firstFrame + inputs.sounds.back().framesHeard);
    }
    inputs.frames = scene.duration ? framesOf(*scene.duration, scene.sampleRate) : last;
    inputs.frames = std::max<std::size_t>(inputs.frames, 1);
    inputs.tailFrames = framesOf(scene.tail, scene.sampleRate);
    inputs.duration = static_cast<double>(inputs.frames) / scene.sampleRate;
    for (PlacedSound& one : inputs.sounds) {
        const std::size_t rest = inputs.frames - std::min(inputs.frames, one.firstFrame);
        one.framesHeard = one.loop ? rest : std::min(one.framesHeard, rest);
    }
    return inputs;
}

}  // namespace tessaly
