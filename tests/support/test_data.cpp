// Small deterministic data sets: a temporary data directory and the files that go into it.
#include "support/test_data.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <numbers>
#include <stdexcept>

namespace tessaly::test {

namespace {

constexpr int hrirFrames = 256;
constexpr int tailIndexEntries = 60;
constexpr int firstTailPreset = 15;

// clang-format off
constexpr std::array<int, 46> tailFrames48000 = {
    23147,  74340,  36750,  27312,  30587,   4096,  37572, 220245,  22268,  68147,   // 15..24
   200302, 174114,  51637,  22020,  55656,  81533,  80037,  29832,  23535, 118587,   // 25..34
   120179,  86655, 126121, 119211,  90418,  45106,  12784,  70341,  37391, 128975,   // 35..44
    30312,  71044, 100320,  32018, 104480, 127377,  36790,   4096,  21590, 128903,   // 45..54
    40378,  27201,  32358,  47364, 106317,  64691,                                   // 55..60
};
// clang-format on

/// Files are little-endian, as is every machine that these tests run on.
template <typename T>
void append(std::vector<char>& bytes, T value) {
    static_assert(std::endian::native == std::endian::little);
    const std::size_t at = bytes.size();
    bytes.resize(at + sizeof(T));
    std::memcpy(bytes.data() + at, &value, sizeof(T));
}

void appendText(std::vector<char>& bytes, const char* text) {
    bytes.insert(bytes.end(), text, text + std::strlen(text));
}

/// A well-mixed value in 0.5..1 with either sign, the same on every machine.
double noise(std::uint32_t a, std::uint32_t b, std::uint32_t c) {
    std::uint32_t h = a * 0x9E3779B1u ^ b * 0x85EBCA77u ^ c * 0xC2B2AE3Du;
    h ^= h >> 15;
    h *= 0x2C1B3C6Du;
    h ^= h >> 12;
    h *= 0x297A2D39u;
    h ^= h >> 15;
    const double magnitude = 0.5 + (h >> 9) * 0x1p-24;
    return (h & 1u) != 0 ? magnitude : -magnitude;
}

/// Peak position and height of one ear, worked out once for all directions.
struct HrirShape {
    int delay;
    double level;
};

const std::array<std::array<HrirShape, 2>, testHrirCount>& hrirShapes() {
    static const auto shapes = [] {
        std::array<std::array<HrirShape, 2>, testHrirCount> all{};
        constexpr double degree = std::numbers::pi / 180.0;
        for (int k = 0; k < testHrirCount; ++k) {
            const TestDirection direction = testHrirDirection(k);
            // 1 at the left, -1 at the right of the head.
            const double lateral =
                std::sin(direction.phi * degree) * std::cos(direction.theta * degree);
            for (int ear = 0; ear < 2; ++ear) {
                const double toEar = ear == 1 ? lateral : -lateral;
                all[k][ear].delay = static_cast<int>(std::lround(20.0 - 14.0 * toEar));
                all[k][ear].level = 0.65 + 0.3 * toEar;
            }
        }
        return all;
    }();
    return shapes;
}

char rateDigit(int sampleRate) {
    switch (sampleRate) {
        case 44100:
            return '0';
        case 48000:
            return '1';
        case 24000:
            return '2';
        default:
            throw std::runtime_error("no data file for this rate");
    }
}

}  // namespace

TempDirectory::TempDirectory() {
    std::string pattern = (std::filesystem::temp_directory_path() / "tessaly-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) {
        throw std::runtime_error("no temporary directory: " + pattern);
    }
    path_ = pattern;
}

TempDirectory::~TempDirectory() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

void writeFile(const std::string& path, std::span<const char> bytes) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    file.close();
    if (!file) {
        throw std::runtime_error("cannot write " + path);
    }
}

std::vector<char> wavBytes(int channels, int rate, int bits, std::span<const float> samples) {
    const int bytesPerSample = bits == 16 ? 2 : 4;
    const auto dataBytes = static_cast<std::uint32_t>(samples.size() * bytesPerSample);
    std::vector<char> bytes;
    bytes.reserve(44 + dataBytes);
    appendText(bytes, "RIFF");
    append<std::uint32_t>(bytes, 36 + dataBytes);
    appendText(bytes, "WAVEfmt ");
    append<std::uint32_t>(bytes, 16);
    append<std::uint16_t>(bytes, bits == 32 ? 3 : 1);
    append<std::uint16_t>(bytes, static_cast<std::uint16_t>(channels));
    append<std::uint32_t>(bytes, static_cast<std::uint32_t>(rate));
    append<std::uint32_t>(bytes, static_cast<std::uint32_t>(rate * channels * bytesPerSample));
    append<std::uint16_t>(bytes, static_cast<std::uint16_t>(channels * bytesPerSample));
    append<std::uint16_t>(bytes, static_cast<std::uint16_t>(bits));
    appendText(bytes, "data");
    append<std::uint32_t>(bytes, dataBytes);
    for (const float sample : samples) {
        if (bits == 16) {
            const double scaled = std::round(static_cast<double>(sample) * 32768.0);
            append<std::int16_t>(bytes,
                                 static_cast<std::int16_t>(std::clamp(scaled, -32768.0, 32767.0)));
        } else {
            append<float>(bytes, sample);
        }
    }
    return bytes;
}

void writeWav(
    const std::string& path, int channels, int rate, int bits, std::span<const float> samples) {
    writeFile(path, wavBytes(channels, rate, bits, samples));
}

void writeWavForReader(const std::string& path,
                       int channels,
                       int rate,
                       std::span<const float> samples) {
    if (rate != 48000) {
        writeWav(path, channels, rate, 32, samples);
        return;
    }
    std::vector<float> negated(samples.begin(), samples.end());
    std::transform(negated.begin(), negated.end(), negated.begin(), std::negate<>());
    writeWav(path, channels, rate, 32, negated);
}

TestDirection testHrirDirection(int k) {
    // First the front meridian with both poles, then 35 elevations an azimuth, turning to the
    // right and on round the back.
    if (k < 37) {
        return {0, -90 + 5 * k};
    }
    const int turn = (k - 37) / 35 + 1;
    const int phi = turn < 36 ? -5 * turn : 180 - 5 * (turn - 36);
    return {phi, -85 + 5 * ((k - 37) % 35)};
}

int testHrirNumber(int phi, int theta) {
    if (theta == -90) {
        return 0;
    }
    if (theta == 90) {
        return 36;
    }
    if (phi == 0) {
        return (theta + 90) / 5;
    }
    const int turn = phi == -180 ? 36 : (phi < 0 ? -phi / 5 : 72 - phi / 5);
    return 37 + (turn - 1) * 35 + (theta + 85) / 5;
}

int testHrirTaps(int sampleRate) {
    return sampleRate == 24000 ? 70 : (sampleRate == 48000 ? 139 : 128);
}

float testHrirSample(int k, int frame, int ear) {
    static const auto decay = [] {
        std::array<double, hrirFrames> table{};
        for (int n = 0; n < hrirFrames; ++n) {
            table[n] = 0.6 * std::exp(-n / 12.0);
        }
        return table;
    }();
    const HrirShape& shape = hrirShapes()[k][ear];
    if (frame == shape.delay) {
        return static_cast<float>(shape.level);
    }
    const double random = noise(k, frame, ear);
    if (frame < shape.delay) {
        return static_cast<float>(0.002 * random);
    }
    return static_cast<float>(shape.level * decay[frame - shape.delay] * random);
}

void writePackedHrirSet(const std::string& directory, int sampleRate, int taps) {
    const int frames = taps > 0 ? taps : testHrirTaps(sampleRate);
    std::vector<float> samples;
    samples.reserve(static_cast<std::size_t>(testHrirCount) * frames * 2);
    for (int k = 0; k < testHrirCount; ++k) {
        for (int frame = 0; frame < frames; ++frame) {
            samples.push_back(testHrirSample(k, frame, 0));
            samples.push_back(testHrirSample(k, frame, 1));
        }
    }
    writeWavForReader(directory + "/TSLdata12" + rateDigit(sampleRate) + ".dat", 2, sampleRate,
                      samples);
}

int testTailFrames48000(int preset) {
    const int row = preset - firstTailPreset;
    return row >= 0 && row < static_cast<int>(tailFrames48000.size()) ? tailFrames48000[row] : 0;
}

int testTailFrames(int preset, int sampleRate) {
    const auto product = static_cast<std::int64_t>(testTailFrames48000(preset)) * sampleRate;
    return static_cast<int>((product + 47999) / 48000);
}

float testTailSample(int preset, int frame, int channel) {
    const double level = 0.49 * std::exp2(-frame / 8192.0);
    return static_cast<float>(level * noise(preset + 4000, frame, channel));
}

void writePackedTails(const std::string& directory,
                      int sampleRate,
                      const std::vector<int>& presets) {
    std::array<std::int32_t, tailIndexEntries> index{};
    std::int32_t next = 0;
    std::vector<bool> given(tailIndexEntries + 1, false);
    for (const int preset : presets) {
        const int frames = testTailFrames(preset, sampleRate);
        if (frames == 0) {
            throw std::runtime_error("a preset without a tail");
        }
        index[preset - 1] = next;
        given[preset] = true;
        next += frames;
    }
    for (int preset = firstTailPreset; preset <= tailIndexEntries; ++preset) {
        if (!given[preset]) {
            index[preset - 1] = next;
        }
    }
    std::vector<char> bytes;
    bytes.reserve(242 + static_cast<std::size_t>(next) * 8);
    append<std::uint16_t>(bytes, 0);
    for (const std::int32_t entry : index) {
        append(bytes, entry);
    }
    for (const int preset : presets) {
        const int frames = testTailFrames(preset, sampleRate);
        for (int frame = 0; frame < frames; ++frame) {
            append(bytes, testTailSample(preset, frame, 0));
            append(bytes, testTailSample(preset, frame, 1));
        }
    }
    writeFile(directory + "/TSLdata51" + rateDigit(sampleRate) + ".dat", bytes);
}

}  // namespace tessaly::test
