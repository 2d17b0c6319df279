// Little-endian header and samples, written byte by byte.
#include "data/wave_image.h"

#include <bit>
#include <cstdint>

#include "data/data_error.h"

namespace tessaly::data {

namespace {

constexpr int invertedRate = 48000;
constexpr unsigned floatFormatTag = 3;
constexpr unsigned sampleBytes = 4;

void append(std::string& bytes, std::uint32_t value, int width) {
    for (int i = 0; i < width; ++i) {
        bytes.push_back(static_cast<char>(static_cast<unsigned char>(value >> (8 * i))));
    }
}

std::uint32_t field(const std::string& bytes, std::size_t offset, std::size_t width) {
    std::uint32_t value = 0;
    for (std::size_t i = width; i > 0; --i) {
        value = value << 8 | static_cast<unsigned char>(bytes[offset + i - 1]);
    }
    return value;
}

std::string header(std::uint32_t dataBytes, std::uint32_t channels, std::uint32_t sampleRate) {
    const std::uint32_t frameBytes = channels * sampleBytes;
    std::string bytes = "RIFF";
    append(bytes, static_cast<std::uint32_t>(waveHeaderBytes) - 8 + dataBytes, 4);
    bytes += "WAVEfmt ";
    append(bytes, 16, 4);
    append(bytes, floatFormatTag, 2);
    append(bytes, channels, 2);
    append(bytes, sampleRate, 4);
    append(bytes, sampleRate * frameBytes, 4);
    append(bytes, frameBytes, 2);
    append(bytes, 8 * sampleBytes, 2);
    bytes += "data";
    append(bytes, dataBytes, 4);
    return bytes;
}

}  // namespace

std::string waveImage(const std::vector<float>& samples, int channels, int sampleRate) {
    const auto dataBytes = static_cast<std::uint32_t>(samples.size() * sampleBytes);
    std::string bytes = header(dataBytes, static_cast<std::uint32_t>(channels),
                               static_cast<std::uint32_t>(sampleRate));
    bytes.reserve(bytes.size() + dataBytes);
    for (const float sample : samples) {
        append(bytes, std::bit_cast<std::uint32_t>(sampleRate == invertedRate ? -sample : sample),
               4);
    }
    return bytes;
}

WaveHeader checkWaveHeader(const std::string& bytes,
                           std::size_t fileBytes,
                           const std::string& name) {
    if (bytes.size() < waveHeaderBytes) {
        throw DataError("{} has {} bytes, expected a header of {} bytes and samples", name,
                        fileBytes, waveHeaderBytes);
    }
    WaveHeader found;
    found.channels = static_cast<int>(field(bytes, 22, 2));
    found.sampleRate = static_cast<int>(field(bytes, 24, 4));
    const std::uint32_t dataBytes = field(bytes, 40, 4);
    const std::string expected =
        header(dataBytes, static_cast<std::uint32_t>(found.channels), field(bytes, 24, 4));
    for (std::size_t i = 0; i < waveHeaderBytes; ++i) {
        if (bytes[i] != expected[i]) {
            throw DataError("{}: header byte {} is 0x{:02x}, expected 0x{:02x}", name, i,
                            static_cast<unsigned char>(bytes[i]),
                            static_cast<unsigned char>(expected[i]));
        }
    }
    if (fileBytes != waveHeaderBytes + dataBytes) {
        throw DataError("{} has {} bytes, expected {} by its header", name, fileBytes,
                        waveHeaderBytes + dataBytes);
    }
    if (found.channels == 0) {
        throw DataError("{} has no channel", name);
    }
    found.frames = dataBytes / (static_cast<std::size_t>(found.channels) * sampleBytes);
    return found;
}

}  // namespace tessaly::data
