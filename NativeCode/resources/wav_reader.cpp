// Reads the sound files of the data directory: WAV layout at fixed offsets, and packed tails.
#include "resources/wav_reader.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstddef>
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

/// Converts `count` stored values from the file's position on. At the end of the file the rest
/// of `destination` stays as it is.
template <typename Stored, typename Convert>
void readSamples(std::ifstream& file, float* destination, std::uint32_t count, Convert convert) {
    std::array<Stored, 4096> chunk{};
    while (count > 0) {
        const std::uint32_t asked = std::min<std::uint32_t>(count, chunk.size());
        file.read(reinterpret_cast<char*>(chunk.data()),
                  static_cast<std::streamsize>(asked * sizeof(Stored)));
        const auto got = static_cast<std::uint32_t>(file.gcount()) / sizeof(Stored);
        destination = std::transform(chunk.begin(), chunk.begin() + got, destination, convert);
        if (got < asked) {
            return;
        }
        count -= asked;
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
    std::ifstream file(source.IRfilePath, std::ios::binary);
    if (!file) {
        logBoth("Tessaly_e ERROR: Wav ", source.IRfilePath, " not readable!!!!");
        essError = essErrorTailUnreadable;
        return false;
    }
    // A start outside the file makes the seek or the read fail: the tail stays as it is.
    const std::streamoff start =
        readAt<std::int32_t>(file, std::streamoff{4} * source.qvReverb - 2);
    file.seekg(std::streamoff{4} * (tailIndexEntries + 2 * start) + 2);
    if (source.reverbLength > 0) {
        file.read(reinterpret_cast<char*>(destination), tailFrameBytes * source.reverbLength);
    }
    return true;
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
    if (bits == 32 && rate == invertedRate) {
        readSamples<float>(file, destination, wanted, [](float value) { return -value; });
    } else if (bits == 32) {
        readSamples<float>(file, destination, wanted, [](float value) { return value; });
    } else if (bits == 16) {
        readSamples<std::int16_t>(file, destination, wanted, [](std::int16_t value) {
            return static_cast<float>(value) * fromInt16;
        });
    } else {
        logBoth("Tessaly_e ERROR: Wav not 32 or 16 Bit!!!!");
        essError = essErrorWavBitDepth;
        return false;
    }
    return true;
}

}  // namespace tessaly
