// Lossless compression into memory.
#include "report/sound_data.h"

#include <sndfile.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>

namespace tessaly {

namespace {

constexpr double fullScale = 32767.0;
constexpr double strongestCompression = 1.0;

// A file in memory as the sound library wants to see one.
struct MemoryFile {
    std::vector<unsigned char> bytes;
    std::size_t place = 0;
};

MemoryFile& fileOf(void* user) noexcept { return *static_cast<MemoryFile*>(user); }

extern "C" {

static sf_count_t memoryLength(void* user) {
    return static_cast<sf_count_t>(fileOf(user).bytes.size());
}

static sf_count_t memorySeek(sf_count_t offset, int whence, void* user) {
    MemoryFile& file = fileOf(user);
    const sf_count_t base = whence == SEEK_CUR   ? static_cast<sf_count_t>(file.place)
                            : whence == SEEK_END ? memoryLength(user)
                                                 : 0;
    file.place = static_cast<std::size_t>(std::max<sf_count_t>(base + offset, 0));
    return static_cast<sf_count_t>(file.place);
}

static sf_count_t memoryRead(void* target, sf_count_t count, void* user) {
    MemoryFile& file = fileOf(user);
    const std::size_t left = file.bytes.size() - std::min(file.place, file.bytes.size());
    const std::size_t taken = std::min(left, static_cast<std::size_t>(count));
    std::copy_n(file.bytes.data() + file.place, taken, static_cast<unsigned char*>(target));
    file.place += taken;
    return static_cast<sf_count_t>(taken);
}

static sf_count_t memoryWrite(const void* source, sf_count_t count, void* user) {
    MemoryFile& file = fileOf(user);
    const auto length = static_cast<std::size_t>(count);
    file.bytes.resize(std::max(file.bytes.size(), file.place + length));
    std::copy_n(static_cast<const unsigned char*>(source), length, file.bytes.data() + file.place);
    file.place += length;
    return count;
}

static sf_count_t memoryTell(void* user) { return static_cast<sf_count_t>(fileOf(user).place); }

}  // extern "C"

struct CloseFile {
    void operator()(SNDFILE* file) const noexcept { sf_close(file); }
};

std::runtime_error cannotEncode(const char* reason) {
    return std::runtime_error(std::string("cannot put the sound into the page: ") + reason);
}

}  // namespace

CleanSound cleaned(std::span<const float> stereo) {
    CleanSound sound;
    sound.stereo.assign(stereo.begin(), stereo.end() - static_cast<int>(stereo.size() % 2));
    for (float& sample : sound.stereo) {
        if (!std::isfinite(sample)) {
            sample = 0.0f;
            ++sound.notNumbers;
        }
    }
    return sound;
}

double secondsOf(std::span<const float> stereo, int sampleRate) noexcept {
    const std::size_t frames = stereo.size() / 2;
    return static_cast<double>(frames) / sampleRate;
}

SoundData encodeFlac(std::span<const float> stereo, int sampleRate) {
    SoundData data;
    if (stereo.size() < 2) {
        return data;
    }
    double peak = 1.0;
    for (const float sample : stereo) {
        peak = std::max(peak, std::abs(static_cast<double>(sample)));
    }
    data.loweredDb = 20.0 * std::log10(peak);
    std::vector<short> whole(stereo.size());
    std::transform(stereo.begin(), stereo.end(), whole.begin(), [&](float sample) {
        return static_cast<short>(std::lround(static_cast<double>(sample) / peak * fullScale));
    });

    MemoryFile file;
    SF_VIRTUAL_IO calls{memoryLength, memorySeek, memoryRead, memoryWrite, memoryTell};
    SF_INFO info{};
    info.channels = 2;
    info.samplerate = sampleRate;
    info.format = SF_FORMAT_FLAC | SF_FORMAT_PCM_16;
    std::unique_ptr<SNDFILE, CloseFile> opened(sf_open_virtual(&calls, SFM_WRITE, &info, &file));
    if (!opened) {
        throw cannotEncode(sf_strerror(nullptr));
    }
    double level = strongestCompression;
    sf_command(opened.get(), SFC_SET_COMPRESSION_LEVEL, &level, sizeof(level));
    const auto frames = static_cast<sf_count_t>(whole.size() / 2);
    if (sf_writef_short(opened.get(), whole.data(), frames) != frames) {
        throw cannotEncode(sf_strerror(opened.get()));
    }
    if (sf_close(opened.release()) != 0) {
        throw cannotEncode("the encoder did not finish");
    }
    data.flac = std::move(file.bytes);
    return data;
}

}  // namespace tessaly
