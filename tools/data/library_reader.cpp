// Header check and the engine's reader.
#include "data/library_reader.h"

#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

#include "base/ess_error.h"
#include "data/data_error.h"
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

}  // namespace

HrirSet readPackedSet(const std::filesystem::path& directory, const RateEntry& rate) {
    const std::filesystem::path path = directory / rate.fileName;
    std::ifstream file(path, std::ios::binary);
    std::string start(waveHeaderBytes, '\0');
    file.read(start.data(), static_cast<std::streamsize>(start.size()));
    start.resize(static_cast<std::size_t>(file.gcount()));
    if (!file.is_open()) {
        throw DataError("{} cannot be read", path.string());
    }
    const WaveHeader header =
        checkWaveHeader(start, std::filesystem::file_size(path), path.string());
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
    set.pairs.resize(header.frames * earCount);
    WavSource source;
    source.bundleBasePath = directory.string();
    source.sampleRate = rate.sampleRate;
    const QuietLog quiet;
    if (!readWav(source, std::string("/") + rate.fileName, set.pairs.data(),
                 static_cast<int>(header.frames), earCount)) {
        throw DataError("{} is refused by the plug-in's reader with code {}", path.string(),
                        essError);
    }
    return set;
}

}  // namespace tessaly::data
