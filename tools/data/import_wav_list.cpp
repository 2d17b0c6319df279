// WAV pairs through libsndfile.
#include "data/import_wav_list.h"

#include <fstream>
#include <sndfile.hh>
#include <sstream>

#include "data/attribution.h"
#include "data/data_error.h"
#include "data/sha256.h"

namespace tessaly::data {

namespace {

struct ListLine {
    std::string file;
    Direction direction;
};

ListLine parseLine(const std::string& text, const std::string& place) {
    std::istringstream words(text);
    ListLine line;
    std::string rest;
    if (!(words >> line.file >> line.direction.azimuth >> line.direction.elevation) ||
        words >> rest) {
        throw DataError("{}: found \"{}\", expected: file azimuth elevation", place, text);
    }
    return line;
}

void appendPair(Measurement& measurement,
                const std::filesystem::path& path,
                const std::string& place) {
    SndfileHandle sound(path.string());
    if (sound.error() != SF_ERR_NO_ERROR) {
        throw DataError("{}: {} cannot be read as a sound file: {}", place, path.string(),
                        sound.strError());
    }
    if (sound.channels() != earCount) {
        throw DataError("{}: {} has {} channels, expected {}, left ear first", place, path.string(),
                        sound.channels(), earCount);
    }
    const auto frames = static_cast<std::size_t>(sound.frames());
    if (measurement.directions.empty()) {
        measurement.sampleRate = sound.samplerate();
        measurement.taps = frames;
    }
    if (static_cast<double>(sound.samplerate()) != measurement.sampleRate ||
        frames != measurement.taps) {
        throw DataError(
            "{}: {} has {} frames at {} Hz, expected {} frames at {} Hz as in the "
            "first file",
            place, path.string(), frames, sound.samplerate(), measurement.taps,
            measurement.sampleRate);
    }
    std::vector<double> pairs(frames * earCount);
    if (static_cast<std::size_t>(sound.readf(pairs.data(), sound.frames())) != frames) {
        throw DataError("{}: {} is cut short", place, path.string());
    }
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        for (std::size_t i = 0; i < frames; ++i) {
            measurement.samples.push_back(pairs[i * earCount + ear]);
        }
    }
}

}  // namespace

Measurement importWavList(const std::filesystem::path& list) {
    std::ifstream lines(list);
    if (!lines.is_open() || std::filesystem::is_directory(list)) {
        throw DataError("{} cannot be read; expected a text list of WAV pairs", list.string());
    }
    Measurement measurement;
    std::string checksums;
    std::string text;
    for (int number = 1; std::getline(lines, text); ++number) {
        const std::size_t start = text.find_first_not_of(" \t\r");
        if (start == std::string::npos || text[start] == '#') {
            continue;
        }
        const std::string place = fmt::format("{} line {}", list.filename().string(), number);
        const ListLine line = parseLine(firstLine(text.substr(start)), place);
        const std::filesystem::path file = list.parent_path() / line.file;
        appendPair(measurement, file, place);
        measurement.directions.push_back(line.direction);
        measurement.extraSeconds.push_back(0.0);
        checksums += sha256OfFile(file);
    }
    measurement.provenance.path = std::filesystem::absolute(list);
    measurement.provenance.sha256 = sha256(sha256OfFile(list) + checksums);
    measurement.provenance.licence = "not stated; see the origin of the WAV files";
    measurement.provenance.attribution =
        fmt::format("{} WAV pairs listed in {}\n", measurement.count(), list.filename().string());
    return measurement;
}

}  // namespace tessaly::data
