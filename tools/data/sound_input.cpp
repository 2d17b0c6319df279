// Opens through the sound library and refuses what cannot be a response.
#include "data/sound_input.h"

#include <algorithm>
#include <cmath>
#include <sndfile.hh>

#include "data/data_error.h"

namespace tessaly::data {

namespace {

constexpr double longestSeconds = 120.0;

}  // namespace

SoundInput readSound(const std::filesystem::path& path, int channels) {
    const std::string name = path.string();
    std::error_code ignored;
    if (!std::filesystem::exists(path, ignored)) {
        throw DataError("{} does not exist, expected a sound file", name);
    }
    if (std::filesystem::is_regular_file(path, ignored) &&
        std::filesystem::file_size(path, ignored) == 0) {
        throw DataError("{} is empty, expected a sound file", name);
    }
    SndfileHandle sound(name);
    if (sound.error() != SF_ERR_NO_ERROR) {
        throw DataError("{} cannot be read as a sound file: {}", name, sound.strError());
    }
    if (sound.channels() != channels) {
        throw DataError("{} has {} channel{}, expected {}", name, sound.channels(),
                        sound.channels() == 1 ? "" : "s",
                        channels == 2 ? "2, left ear first" : fmt::to_string(channels));
    }
    if (sound.samplerate() < lowestImportRate) {
        throw DataError("{} has a rate of {} Hz, expected {} Hz or more", name, sound.samplerate(),
                        lowestImportRate);
    }
    if (sound.frames() <= 0) {
        throw DataError("{} has no samples", name);
    }
    const double seconds =
        static_cast<double>(sound.frames()) / static_cast<double>(sound.samplerate());
    if (seconds > longestSeconds) {
        throw DataError("{} lasts {:.0f} s, expected an impulse response of at most {} s", name,
                        seconds, longestSeconds);
    }
    SoundInput input;
    input.sampleRate = sound.samplerate();
    input.channels = channels;
    input.samples.resize(static_cast<std::size_t>(sound.frames()) *
                         static_cast<std::size_t>(channels));
    if (sound.readf(input.samples.data(), sound.frames()) != sound.frames()) {
        throw DataError("{} is cut short", name);
    }
    if (!std::all_of(input.samples.begin(), input.samples.end(),
                     [](double sample) { return std::isfinite(sample); })) {
        throw DataError("{} has samples that are no numbers", name);
    }
    if (std::all_of(input.samples.begin(), input.samples.end(),
                    [](double sample) { return sample == 0.0; })) {
        throw DataError("{} is silent", name);
    }
    return input;
}

}  // namespace tessaly::data
