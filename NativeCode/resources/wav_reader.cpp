// Reads the sound files of the data directory: WAV layout at fixed offsets, and packed tails.
#include "resources/wav_reader.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstddef>
#include <cstring>
#include <fstream>

#include "base/ess_error.h"
#include "base/log.h"

namespace tessaly {

namespace {

// Byte offsets of the WAV header. Nothing else in it is looked at.
constexpr std::streamoff channelsOffset = 22;
constexpr std::streamoff rateOffset = 24;
constexpr std::streamoff bitsOffset = 34;
constexpr std::streamoff firstChunkOffset = 36;
constexpr std::streamoff dataSizeOffset = 4;   // from the "d" of "data"
constexpr std::streamoff dataStartOffset = 8;  // from the "d" of "data"

// 32-bit files that name this rate are stored upside down and turned back on reading.
constexpr std::uint32_t invertedRate = 48000;
constexpr float fromInt16 = 3.0517578e-05f;  // 1 / 32768

constexpr int tailIndexEntries = 60;  // int32 entries before the samples of the packed tail file
constexpr std::streamoff tailFrameBytes = 8;

/// The value at `offset` as it lies in the file, 0 behind its end.
template <typename T>
T readAt(std::ifstream& file, std::streamoff offset) {
    std::array<char, sizeof(T)> bytes{};
    file.seekg(offset);
    if (!file.read(bytes.data(), sizeof(T))) {
        return T{};
    }
    return std::bit_cast<T>(bytes);
}

/// Of `count` wanted values those that lie whole between the file's position and its end.
std::size_t heldValues(std::ifstream& file, std::size_t count, std::size_t valueBytes) {
    const std::streamoff start = file.tellg();
    file.seekg(0, std::ios::end);
    const std::streamoff end = file.tellg();
    file.seekg(start);
    return start < 0 || end <= start
               ? 0
               : std::min(count, static_cast<std::size_t>(end - start) / valueBytes);
}

/// @return values read, all of them unless the file changes meanwhile
template <typename Stored>
std::size_t readValues(std::ifstream& file, Stored* values, std::size_t count) {
    file.read(reinterpret_cast<char*>(values),
              static_cast<std::streamsize>(count * sizeof(Stored)));
    return static_cast<std::size_t>(file.gcount()) / sizeof(Stored);
}

/// Turns values upside down where they stand.
void invert(float* values, std::size_t count) noexcept {
    // Steps of a fixed length go through vector registers in every build.
    constexpr std::size_t step = 16;
    std::size_t i = 0;
    for (; i + step <= count; i += step) {
        for (std::size_t k = 0; k < step; ++k) {
            values[i + k] = -values[i + k];
        }
    }
    for (; i < count; ++i) {
        values[i] = -values[i];
    }
}

// Both read from the file's position on. At the end of the file the rest of `destination` stays as
// it is. A piece is still in the inner caches when its values are converted.
constexpr std::size_t pieceBytes = std::size_t{1} << 16;

void readFloats(std::ifstream& file, float* destination, std::size_t count, bool inverted) {
    constexpr std::size_t piece = pieceBytes / sizeof(float);
    std::size_t left = heldValues(file, count, sizeof(float));
    while (left > 0) {
        const std::size_t got = readValues(file, destination, std::min(left, piece));
        if (got == 0) {
            return;
        }
        if (inverted) {
            invert(destination, got);
        }
        destination += got;
        left -= got;
    }
}

void readIntegers(std::ifstream& file, float* destination, std::size_t count) {
    std::array<std::int16_t, 4096> piece;
    std::size_t left = heldValues(file, count, sizeof(std::int16_t));
    while (left > 0) {
        const std::size_t got = readValues(file, piece.data(), std::min(left, piece.size()));
        if (got == 0) {
            return;
        }
        for (std::size_t i = 0; i < got; ++i) {
            destination[i] = static_cast<float>(piece[i]) * fromInt16;
        }
        destination += got;
        left -= got;
    }
}

/// Offset of the first "d" from byte 36 on, taken as the start of the data chunk. Without one,
/// some offset behind the end of the file, where every further read gives 0.
std::streamoff findData(std::ifstream& file) {
    std::streamoff offset = firstChunkOffset;
    char byte = 0;
    file.seekg(offset);
    while (file.get(byte) && byte != 'd') {
        ++offset;
        logOutput("WAVE: not yet at \"data\" ");
    }
    return offset;
}

bool readTail(const WavSource& source, float* destination) {
    const std::streamsize wanted = tailFrameBytes * std::max(source.reverbLength, 0);
    std::streamsize got = 0;
    std::ifstream file(source.IRfilePath, std::ios::binary);
    const bool opened = file.is_open();
    if (opened) {
        // A start outside the file makes the seek or the read fail: nothing is read.
        const std::streamoff start =
            readAt<std::int32_t>(file, std::streamoff{4} * source.qvReverb - 2);
        file.seekg(std::streamoff{4} * (tailIndexEntries + 2 * start) + 2);
        if (wanted > 0) {
            file.read(reinterpret_cast<char*>(destination), wanted);
            got = file.gcount();
        }
    } else {
        logBoth("Tessaly_e ERROR: Wav ", source.IRfilePath, " not readable!!!!");
        essError = essErrorTailUnreadable;
    }
    if (source.zeroMissing && got < wanted) {
        std::memset(reinterpret_cast<char*>(destination) + got, 0,
                    static_cast<std::size_t>(wanted - got));
    }
    return opened;
}

std::string resolveName(const WavSource& source, const std::string& path) {
    std::string name = source.bundleBasePath + path;
    if (source.usePackedDatabase) {
        return name;
    }
    if (!source.loadingReverb) {
        return name + ".wav";
    }
    switch (source.sampleRate) {
        case 48000:
            return name + "_48000.wav";
        case 44100:
            return name + "_44100.wav";
        case 24000:
            return name + "_24000.wav";
        default:
            return {};
    }
}

}  // namespace

bool readWav(const WavSource& source,
             const std::string& path,
             float* destination,
             int frames,
             std::int16_t channels) {
    if (source.usePackedDatabase && source.loadingReverb) {
        return readTail(source, destination);
    }
    const std::string name = resolveName(source, path);
    logOutput("filePathIn = ", name);
    std::ifstream file(name, std::ios::binary);
    if (!file) {
        logBoth("Tessaly_e ERROR: Wav not readable!!!!");
        essError = essErrorWavUnreadable;
        return false;
    }
    const auto fileChannels = readAt<std::int16_t>(file, channelsOffset);
    if (fileChannels != channels) {
        logBoth("Tessaly_e ERROR: Wav is ", fileChannels, " instead of called for ", channels);
        essError = essErrorWavChannels;
        return false;
    }
    const auto rate = readAt<std::uint32_t>(file, rateOffset);
    const auto bits = readAt<std::uint16_t>(file, bitsOffset);
    const std::streamoff data = findData(file);

    // Files of less than 8 bits a sample have no length to check; their depth is refused below.
    const auto size = readAt<std::uint32_t>(file, data + dataSizeOffset);
    const std::uint32_t available = bits >= 8 ? size / (bits / 8u) : size;
    const auto wanted = static_cast<std::uint32_t>(channels) * static_cast<std::uint32_t>(frames);
    if (available < wanted || frames < 0 || channels < 0) {
        logBoth("Tessaly_e ERROR: Wav with ", available, " is too short for ", wanted, " frames!");
        essError = essErrorWavTooShort;
        return false;
    }
    file.seekg(data + dataStartOffset);
    if (bits == 32) {
        readFloats(file, destination, wanted, rate == invertedRate);
    } else if (bits == 16) {
        readIntegers(file, destination, wanted);
    } else {
        logBoth("Tessaly_e ERROR: Wav not 32 or 16 Bit!!!!");
        essError = essErrorWavBitDepth;
        return false;
    }
    return true;
}

}  // namespace tessaly
