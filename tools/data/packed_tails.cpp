// Writes the index and the samples little-endian; reads through the engine's reader.
#include "data/packed_tails.h"

#include <bit>
#include <cstdint>

#include "base/ess_error.h"
#include "data/data_error.h"
#include "data/hrir_options.h"
#include "data/measurement.h"
#include "data/output_directory.h"
#include "resources/wav_reader.h"

namespace tessaly::data {

namespace {

void append(std::string& bytes, std::uint32_t value) {
    for (int i = 0; i < 4; ++i) {
        bytes.push_back(static_cast<char>(static_cast<unsigned char>(value >> (8 * i))));
    }
}

std::uint32_t wordAt(const std::string& bytes, std::size_t offset) {
    std::uint32_t value = 0;
    for (std::size_t i = 4; i > 0; --i) {
        value = value << 8 | static_cast<unsigned char>(bytes[offset + i - 1]);
    }
    return value;
}

std::size_t indexOffset(int preset) { return 2 + 4 * static_cast<std::size_t>(preset - 1); }

/// Start of each tail in frames if they follow each other, and the frames of all as last value.
std::vector<std::size_t> startsOf(int sampleRate) {
    std::vector<std::size_t> starts = {0};
    for (const TailDesign& design : tailDesigns()) {
        starts.push_back(starts.back() + storedTailFrames(design, sampleRate));
    }
    return starts;
}

void checkLayout(const std::string& bytes, int sampleRate, const std::string& name) {
    const std::vector<std::size_t> starts = startsOf(sampleRate);
    const std::size_t size = tailHeaderBytes + tailFrameBytes * starts.back();
    if (bytes.size() != size) {
        throw DataError("{} has {} bytes, expected {} for the tails of {} Hz", name, bytes.size(),
                        size, sampleRate);
    }
    for (int preset = 1; preset <= reverbPresetCount; ++preset) {
        const std::uint32_t found = wordAt(bytes, indexOffset(preset));
        const std::size_t expected =
            preset < firstTailPreset ? 0
                                     : starts[static_cast<std::size_t>(preset - firstTailPreset)];
        if (found != expected) {
            throw DataError("{}: the tail of preset {} starts at frame {}, expected {}", name,
                            preset, found, expected);
        }
    }
}

}  // namespace

const char* tailFileName(int sampleRate) {
    switch (rateEntry(sampleRate).sampleRate) {
        case 44100:
            return "TSLdata510.dat";
        case 48000:
            return "TSLdata511.dat";
        default:
            return "TSLdata512.dat";
    }
}

std::string packTails(const std::vector<std::vector<float>>& tails) {
    std::size_t frames = 0;
    std::string bytes(2, '\0');
    for (int preset = 1; preset <= reverbPresetCount; ++preset) {
        append(bytes, preset < firstTailPreset ? 0 : static_cast<std::uint32_t>(frames));
        if (preset >= firstTailPreset) {
            frames += tails[static_cast<std::size_t>(preset - firstTailPreset)].size() / earCount;
        }
    }
    bytes.reserve(tailHeaderBytes + tailFrameBytes * frames);
    for (const std::vector<float>& tail : tails) {
        for (const float sample : tail) {
            append(bytes, std::bit_cast<std::uint32_t>(sample));
        }
    }
    return bytes;
}

std::vector<std::vector<float>> readPackedTails(const std::filesystem::path& directory,
                                                int sampleRate) {
    const std::filesystem::path path = directory / tailFileName(sampleRate);
    const std::string bytes = readIfPresent(path);
    if (bytes.empty()) {
        throw DataError("{} is missing or empty", path.string());
    }
    checkLayout(bytes, sampleRate, path.string());
    WavSource source;
    source.loadingReverb = true;
    source.bundleBasePath = directory.string();
    source.IRfilePath = path.string();
    source.sampleRate = sampleRate;
    std::vector<std::vector<float>> tails;
    std::size_t offset = tailHeaderBytes;
    for (const TailDesign& design : tailDesigns()) {
        const std::size_t frames = storedTailFrames(design, sampleRate);
        std::vector<float>& tail = tails.emplace_back(frames * earCount);
        source.qvReverb = static_cast<std::int16_t>(design.preset);
        source.reverbLength = static_cast<int>(frames);
        if (!readWav(source, "", tail.data(), source.reverbLength, earCount)) {
            throw DataError("{} is refused by the plug-in's reader with code {}", path.string(),
                            essError);
        }
        for (const float sample : tail) {
            if (std::bit_cast<std::uint32_t>(sample) != wordAt(bytes, offset)) {
                throw DataError("{}: the plug-in reads another tail for preset {} than is stored",
                                path.string(), design.preset);
            }
            offset += 4;
        }
    }
    return tails;
}

}  // namespace tessaly::data
