// Reading through the sound library and resampling at high quality.
#include "demo_sounds/sound_file.h"

#include <sndfile.h>
#include <soxr.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <stdexcept>
#include <string>

namespace tessaly {

namespace {

struct CloseFile {
    void operator()(SNDFILE* file) const noexcept { sf_close(file); }
};

constexpr std::size_t readFrames = 65536;

}  // namespace

Sound readSoundFile(const std::filesystem::path& file, double maxSeconds) {
    SF_INFO info{};
    const std::unique_ptr<SNDFILE, CloseFile> opened(sf_open(file.c_str(), SFM_READ, &info));
    if (!opened) {
        throw std::runtime_error("cannot read " + file.string() + ": " + sf_strerror(nullptr));
    }
    if (info.channels < 1 || info.samplerate < 1) {
        throw std::runtime_error("cannot read " + file.string() + ": no channels or no rate");
    }
    // Integer formats stay within full scale, float ones come as stored.
    const std::size_t stored = static_cast<std::size_t>(info.channels);
    const std::size_t kept = std::min<std::size_t>(stored, 2);
    const double limit = std::ceil(maxSeconds * static_cast<double>(info.samplerate));
    Sound sound;
    sound.channels = static_cast<int>(kept);
    sound.sampleRate = static_cast<double>(info.samplerate);
    std::vector<float> chunk(readFrames * stored);
    while (static_cast<double>(sound.frames()) < limit) {
        const double missing = limit - static_cast<double>(sound.frames());
        const std::size_t wanted = missing < static_cast<double>(readFrames)
                                       ? static_cast<std::size_t>(missing)
                                       : readFrames;
        const sf_count_t got =
            sf_readf_float(opened.get(), chunk.data(), static_cast<sf_count_t>(wanted));
        if (got <= 0) {
            break;
        }
        for (std::size_t frame = 0; frame < static_cast<std::size_t>(got); ++frame) {
            const float* values = chunk.data() + frame * stored;
            sound.samples.insert(sound.samples.end(), values, values + kept);
        }
    }
    if (sf_error(opened.get()) != SF_ERR_NO_ERROR) {
        throw std::runtime_error("cannot read " + file.string() + ": " + sf_strerror(opened.get()));
    }
    if (sound.samples.empty()) {
        throw std::runtime_error("no sound in " + file.string());
    }
    for (float& sample : sound.samples) {
        if (!std::isfinite(sample)) {
            throw std::runtime_error("samples that are no numbers in " + file.string());
        }
    }
    return sound;
}

Sound resampled(const Sound& sound, double sampleRate) {
    if (sound.sampleRate == sampleRate || sound.samples.empty()) {
        Sound same = sound;
        same.sampleRate = sampleRate;
        return same;
    }
    const double ratio = sampleRate / sound.sampleRate;
    // The product of two exact rates may come out a hair above the whole number it stands for.
    const double exactFrames = static_cast<double>(sound.frames()) * ratio;
    const std::size_t frames = static_cast<std::size_t>(std::ceil(exactFrames - 1e-6));
    Sound result;
    result.channels = sound.channels;
    result.sampleRate = sampleRate;
    result.samples.assign(frames * static_cast<std::size_t>(sound.channels), 0.0f);
    const soxr_io_spec_t format = soxr_io_spec(SOXR_FLOAT32_I, SOXR_FLOAT32_I);
    const soxr_quality_spec_t quality = soxr_quality_spec(SOXR_HQ, 0);
    std::size_t written = 0;
    const soxr_error_t failure =
        soxr_oneshot(sound.sampleRate, sampleRate, static_cast<unsigned>(sound.channels),
                     sound.samples.data(), sound.frames(), nullptr, result.samples.data(), frames,
                     &written, &format, &quality, nullptr);
    if (failure != nullptr) {
        throw std::runtime_error(std::string("cannot resample: ") + failure);
    }
    return result;
}

}  // namespace tessaly
