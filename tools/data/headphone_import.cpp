// Sound files and equaliser texts to filters of 256 taps.
#include "data/headphone_import.h"

#include <charconv>
#include <cmath>
#include <fstream>
#include <numbers>

#include "base/precision.h"
#include "data/attribution.h"
#include "data/data_error.h"
#include "data/headphone_table.h"
#include "data/output_directory.h"
#include "data/resampler.h"
#include "data/sha256.h"
#include "data/sound_input.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

constexpr double keptEnergy = 0.9;  // of a response, in its first 256 taps

struct RowFile {
    int row = 0;
    fs::path path;
};

RowFile rowFileOf(const std::string& argument) {
    RowFile result;
    const std::size_t sign = argument.find('=');
    const char* end = argument.data() + (sign == std::string::npos ? 0 : sign);
    const auto [stop, error] = std::from_chars(argument.data(), end, result.row);
    if (error != std::errc() || stop != end || sign + 1 == argument.size()) {
        throw DataError("filter \"{}\": expected ROW=FILE, e.g. 3=my_headphone.txt", argument);
    }
    if (result.row < 1 || result.row > static_cast<int>(headphoneRowCount)) {
        throw DataError("filter \"{}\": row {} is unknown, expected 1 to {}", argument, result.row,
                        headphoneRowCount);
    }
    result.path = argument.substr(sign + 1);
    return result;
}

/// Level and fade of a response that keeps its phase.
std::vector<float> fittedResponse(const std::vector<double>& response,
                                  int sampleRate,
                                  const std::string& name) {
    double energy = 0.0;
    double kept = 0.0;
    std::vector<double> cut(headphoneTaps);
    for (std::size_t i = 0; i < response.size(); ++i) {
        energy += response[i] * response[i];
        if (i < headphoneTaps) {
            cut[i] = response[i];
            kept += response[i] * response[i];
        }
    }
    if (!(kept >= keptEnergy * energy)) {
        throw DataError(
            "{} has {:.0f} % of its energy in the first {} taps at {} Hz, expected {:.0f} % or "
            "more; the minimum-phase option makes it shorter",
            name, 100.0 * kept / energy, headphoneTaps, sampleRate, 100.0 * keptEnergy);
    }
    for (std::size_t i = 0; i < headphoneFade; ++i) {
        const double place = (static_cast<double>(i) + 0.5) / static_cast<double>(headphoneFade);
        cut[headphoneTaps - headphoneFade + i] *= 0.5 + 0.5 * std::cos(std::numbers::pi * place);
    }
    const double gain =
        std::pow(10.0, (headphoneMiddleDb - middleLevel(responseLevel(cut, sampleRate))) / 20.0);
    std::vector<float> taps(headphoneTaps);
    for (std::size_t i = 0; i < headphoneTaps; ++i) {
        taps[i] = single(gain * cut[i]);
    }
    return taps;
}

void fromCurve(const HeadphoneCurve& curve, ImportedFilter& filter) {
    filter.taps = headphoneFilter(curve, headphoneTaps, headphoneFade);
    filter.smallTaps = smallHeadphoneFilter(curve);
}

void fromSound(const fs::path& path, int sampleRate, bool minimumPhase, ImportedFilter& filter) {
    const SoundInput sound = readSound(path, 1);
    const auto frames = static_cast<std::size_t>(std::ceil(
        static_cast<double>(sound.frames()) * sampleRate / static_cast<double>(sound.sampleRate)));
    const std::vector<double> response =
        resampleResponse(sound.samples, 1, sound.sampleRate, sampleRate, frames);
    const HeadphoneCurve curve = headphoneCurve(responseLevel(response, sampleRate), sampleRate);
    fromCurve(curve, filter);
    filter.kind = "response, minimum phase";
    if (!minimumPhase) {
        // The form for short responses stays minimum phase: 128 taps leave no room for delay.
        filter.kind = "response";
        filter.taps = fittedResponse(response, sampleRate, path.string());
    }
}

}  // namespace

void importFilter(const std::string& argument,
                  int sampleRate,
                  bool minimumPhase,
                  ImportedFilters& filters) {
    const RowFile file = rowFileOf(argument);
    if (filters.count(file.row) != 0) {
        throw DataError("filter \"{}\": row {} is given twice", argument, file.row);
    }
    std::error_code ignored;
    if (!fs::is_regular_file(file.path, ignored) || fs::file_size(file.path, ignored) == 0) {
        throw DataError("{} is missing or empty, expected a sound file or a text of filters",
                        file.path.string());
    }
    ImportedFilter filter;
    filter.path = file.path;
    filter.sha256 = sha256OfFile(file.path);
    if (describeContent(file.path, "") == "a text file") {
        const std::vector<EqFilter> settings =
            parseEqText(readIfPresent(file.path), file.path.string());
        filter.kind = "parametric";
        fromCurve(
            headphoneCurve([&](double hertz) { return eqLevel(settings, hertz); }, sampleRate),
            filter);
    } else {
        fromSound(file.path, sampleRate, minimumPhase, filter);
    }
    filters[file.row] = std::move(filter);
}

}  // namespace tessaly::data
