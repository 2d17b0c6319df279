// Header check and the engine's reader.
#include "data/library_reader.h"

#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "base/ess_error.h"
#include "data/data_error.h"
#include "data/headphone_design.h"
#include "data/wave_image.h"
#include "resources/hrir_grid.h"
#include "resources/wav_reader.h"

namespace tessaly::data {

namespace {

/// Keeps the library's log lines out of the tool's output.
class QuietLog {
public:
    QuietLog() : output_(std::cout.rdbuf(text_.rdbuf())), error_(std::cerr.rdbuf(text_.rdbuf())) {}
    QuietLog(const QuietLog&) = delete;
    QuietLog& operator=(const QuietLog&) = delete;
    ~QuietLog() {
        std::cout.rdbuf(output_);
        std::cerr.rdbuf(error_);
    }

private:
    std::ostringstream text_;
    std::streambuf* output_;
    std::streambuf* error_;
};

WaveHeader headerOf(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::string start(waveHeaderBytes, '\0');
    file.read(start.data(), static_cast<std::streamsize>(start.size()));
    start.resize(static_cast<std::size_t>(file.gcount()));
    if (!file.is_open()) {
        throw DataError("{} cannot be read", path.string());
    }
    return checkWaveHeader(start, std::filesystem::file_size(path), path.string());
}

/// Reads through the library's reader.
void readSamples(const std::filesystem::path& directory,
                 const std::string& name,
                 int sampleRate,
                 std::size_t frames,
                 int channels,
                 std::vector<float>& samples) {
    samples.resize(frames * static_cast<std::size_t>(channels));
    WavSource source;
    source.bundleBasePath = directory.string();
    source.sampleRate = sampleRate;
    const QuietLog quiet;
    if (!readWav(source, "/" + name, samples.data(), static_cast<int>(frames),
                 static_cast<std::int16_t>(channels))) {
        throw DataError("{} is refused by the plug-in's reader with code {}",
                        (directory / name).string(), essError);
    }
}

}  // namespace

HrirSet readPackedSet(const std::filesystem::path& directory, const RateEntry& rate) {
    const std::filesystem::path path = directory / rate.fileName;
    const WaveHeader header = headerOf(path);
    if (header.channels != earCount || header.sampleRate != rate.sampleRate) {
        throw DataError("{} has {} channels at {} Hz, expected {} at {} Hz", path.string(),
                        header.channels, header.sampleRate, earCount, rate.sampleRate);
    }
    const std::size_t taps = header.frames / hrirCount;
    if (header.frames % hrirCount != 0 || taps < static_cast<std::size_t>(fewestHrirTaps) ||
        taps > static_cast<std::size_t>(mostHrirTaps)) {
        throw DataError("{} has {} frames, expected {} responses of {} to {} frames", path.string(),
                        header.frames, hrirCount, fewestHrirTaps, mostHrirTaps);
    }
    HrirSet set;
    set.sampleRate = rate.sampleRate;
    set.taps = taps;
    readSamples(directory, rate.fileName, rate.sampleRate, header.frames, earCount, set.pairs);
    return set;
}

std::vector<double> readHeadphoneFilter(const std::filesystem::path& directory,
                                        const std::string& name,
                                        int sampleRate) {
    const WaveHeader header = headerOf(directory / name);
    if (header.channels != 1 || header.sampleRate != sampleRate || header.frames != headphoneTaps) {
        throw DataError("{} has {} frames of {} channels at {} Hz, expected {} of 1 at {} Hz",
                        (directory / name).string(), header.frames, header.channels,
                        header.sampleRate, headphoneTaps, sampleRate);
    }
    std::vector<float> taps;
    readSamples(directory, name, sampleRate, header.frames, 1, taps);
    return {taps.begin(), taps.end()};
}

}  // namespace tessaly::data
