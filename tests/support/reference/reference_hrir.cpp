// HRIR tables of the reference: order, file reading, lookup.
#include "support/reference/reference_hrir.h"

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>

#include "base/precision.h"

namespace tessaly::reference {

namespace {

constexpr int errorMissing = -103;
constexpr int errorChannels = -107;
constexpr int errorTooShort = -108;
constexpr int errorBits = -109;

template <typename T>
T valueAt(const std::vector<char>& bytes, std::size_t at) {
    T value{};
    if (at + sizeof(T) <= bytes.size()) {
        std::memcpy(&value, bytes.data() + at, sizeof(T));
    }
    return value;
}

HrirFile readPacked(const std::string& path, int frames) {
    HrirFile result;
    result.samples.assign(static_cast<std::size_t>(frames) * 2, 0.0);
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        result.error = errorMissing;
        return result;
    }
    const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
    if (valueAt<std::int16_t>(bytes, 22) != 2) {
        result.error = errorChannels;
        return result;
    }
    const auto rate = valueAt<std::int32_t>(bytes, 24);
    const int bits = valueAt<std::int16_t>(bytes, 34);
    std::size_t data = 36;
    while (data < bytes.size() && bytes[data] != 'd') {
        ++data;
    }
    if (bits < 8) {
        result.error = errorBits;
        return result;
    }
    if (valueAt<std::uint32_t>(bytes, data + 4) / static_cast<std::uint32_t>(bits / 8) <
        result.samples.size()) {
        result.error = errorTooShort;
        return result;
    }
    for (std::size_t i = 0; i < result.samples.size(); ++i) {
        if (bits == 32) {
            const double value = wide(valueAt<float>(bytes, data + 8 + 4 * i));
            result.samples[i] = rate == 48000 ? -value : value;
        } else if (bits == 16) {
            result.samples[i] = valueAt<std::int16_t>(bytes, data + 8 + 2 * i) / 32768.0;
        } else {
            result.error = errorBits;
        }
    }
    return result;
}

}  // namespace

int hrirNumber(int phi, int theta) {
    // The south pole, the whole meridian of phi 0 and the north pole come first, then 35
    // elevations for each azimuth, turning to the right: -5 to -175, then 180 down to 5.
    if (theta == -90) {
        return 0;
    }
    if (theta == 90) {
        return 36;
    }
    const int ring = (theta + 90) / 5 - 1;
    const int turn = ((360 - phi) % 360) / 5;
    return turn == 0 ? 1 + ring : 37 + (turn - 1) * 35 + ring;
}

HrirSource packedFilesIn(const std::string& directory) {
    return [directory](int sampleRate, int frames) {
        const char* digit = sampleRate == 44100 ? "0" : sampleRate == 48000 ? "1" : "2";
        return readPacked(directory + "/TSLdata12" + digit + ".dat", frames);
    };
}

HrirSource setOf(const std::function<double(int k, int frame, int ear)>& sample, int taps) {
    return [sample, taps](int, int frames) {
        HrirFile result;
        const int length = taps > 0 ? taps : frames / hrirCount;
        result.samples.assign(static_cast<std::size_t>(frames) * 2, 0.0);
        if (length * hrirCount < frames) {
            result.error = errorTooShort;
            return result;
        }
        for (int i = 0; i < frames; ++i) {
            for (int ear = 0; ear < 2; ++ear) {
                result.samples[static_cast<std::size_t>(2 * i + ear)] =
                    sample(i / length, i % length, ear);
            }
        }
        return result;
    };
}

int HrirTables::at(int indexPhi, int indexTheta) const {
    const int cell = indexPhi * elevationColumns + indexTheta;
    return cell < 0 || cell >= static_cast<int>(cells.size()) ? noHrir : cells[cell];
}

double HrirTables::sample(int hrir, int frame, int ear) const {
    if (hrir == noHrir) {
        return 0.0;
    }
    const std::size_t index =
        2 * (static_cast<std::size_t>(hrir) * static_cast<std::size_t>(stride) +
             static_cast<std::size_t>(frame)) +
        static_cast<std::size_t>(ear);
    return index < stream.size() ? stream[index] : 0.0;
}

}  // namespace tessaly::reference
