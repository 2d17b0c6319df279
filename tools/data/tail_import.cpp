// Names, the ini file, onset, cut and conversion of measured tails.
#include "data/tail_import.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <numbers>
#include <sstream>

#include "data/data_error.h"
#include "data/measurement.h"
#include "data/output_directory.h"
#include "data/resampler.h"
#include "data/sha256.h"
#include "data/sound_input.h"
#include "data/tail_design.h"
#include "data/tail_envelope.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

constexpr const char* iniName = "tails.ini";
constexpr const char* tailPrefix = "preset_";
constexpr const char* tailSuffix = ".wav";
constexpr double onsetThreshold = 0.1;  // of the peak, -20 dB
constexpr double fadeInSeconds = 2e-3;
constexpr double largestGainDb = 60.0;
constexpr double longestStartMs = 60000.0;

std::string trimmed(const std::string& text) {
    const std::size_t first = text.find_first_not_of(" \t\r");
    if (first == std::string::npos) {
        return "";
    }
    return text.substr(first, text.find_last_not_of(" \t\r") - first + 1);
}

/// The number in "preset_15"; nothing if the text is not of that form.
std::optional<int> presetIn(const std::string& text) {
    const std::string prefix = tailPrefix;
    int preset = 0;
    const char* begin = text.data() + std::min(prefix.size(), text.size());
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(begin, end, preset);
    if (text.rfind(prefix, 0) != 0 || error != std::errc() || stop != end) {
        return std::nullopt;
    }
    return preset;
}

void checkPreset(int preset, const std::string& place) {
    if (preset < firstTailPreset || preset > reverbPresetCount) {
        throw DataError("{}: preset {} has no tail, expected {} to {}", place, preset,
                        firstTailPreset, reverbPresetCount);
    }
}

double numberIn(const std::string& text, double low, double high, const std::string& place) {
    double value = 0.0;
    const auto [stop, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || stop != text.data() + text.size() ||
        !(value >= low && value <= high)) {
        throw DataError("{}: found \"{}\", expected a number from {} to {}", place, text, low,
                        high);
    }
    return value;
}

void setKey(TailImportRule& rule,
            const std::string& key,
            const std::string& value,
            const std::string& place) {
    if (key == "file") {
        rule.file = value;
    } else if (key == "start_ms") {
        rule.startMs = numberIn(value, 0.0, longestStartMs, place);
    } else if (key == "gain_db") {
        rule.gainDb = numberIn(value, -largestGainDb, largestGainDb, place);
    } else if (key == "level") {
        if (value != "match" && value != "keep") {
            throw DataError("{}: level is \"{}\", expected match or keep", place, value);
        }
        rule.matchLevel = value == "match";
    } else if (key == "licence") {
        rule.licence = value;
    } else if (key == "source") {
        rule.source = value;
    } else {
        throw DataError(
            "{}: \"{}\" is unknown, expected file, start_ms, gain_db, level, licence or source",
            place, key);
    }
}

/// First frame within 20 dB of the peak of both channels.
std::size_t onsetFrame(const std::vector<double>& pairs) {
    double peak = 0.0;
    for (const double sample : pairs) {
        peak = std::max(peak, std::abs(sample));
    }
    const auto found = std::find_if(pairs.begin(), pairs.end(), [peak](double sample) {
        return std::abs(sample) >= onsetThreshold * peak;
    });
    return static_cast<std::size_t>(found - pairs.begin()) / earCount;
}

void removeMean(std::vector<double>& pairs) {
    const double frames = static_cast<double>(pairs.size() / earCount);
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        double sum = 0.0;
        for (std::size_t i = ear; i < pairs.size(); i += earCount) {
            sum += pairs[i];
        }
        for (std::size_t i = ear; i < pairs.size(); i += earCount) {
            pairs[i] -= sum / frames;
        }
    }
}

/// Puts the direct sound at time 0, and drops what comes before `startSeconds` behind it.
void cut(std::vector<double>& pairs, double startSeconds, double rate) {
    const auto onset = static_cast<std::ptrdiff_t>(onsetFrame(pairs) * earCount);
    pairs.erase(pairs.begin(), pairs.begin() + onset);
    const auto start = static_cast<std::size_t>(std::lround(startSeconds * rate));
    const auto fade = static_cast<std::size_t>(std::lround(fadeInSeconds * rate));
    for (std::size_t i = 0; i < pairs.size() && i / earCount < start + fade; ++i) {
        const std::size_t frame = i / earCount;
        const double place = (static_cast<double>(frame) - static_cast<double>(start) + 0.5) /
                             static_cast<double>(fade);
        pairs[i] *= frame < start ? 0.0 : 0.5 - 0.5 * std::cos(std::numbers::pi * place);
    }
}

MeasuredTail importTail(const fs::path& path, int preset, const TailImportRule& rule) {
    const SoundInput sound = readSound(path, earCount);
    MeasuredTail tail;
    tail.rule = rule;
    tail.rule.file = path.filename().string();
    tail.sha256 = sha256OfFile(path);
    tail.sampleRate = sound.sampleRate;
    tail.pairs = sound.samples;
    removeMean(tail.pairs);
    if (rule.startMs != 0.0) {
        cut(tail.pairs, rule.startMs ? 1e-3 * *rule.startMs : tailDesign(preset).startSeconds,
            sound.sampleRate);
    }
    const bool silent = std::all_of(tail.pairs.begin(), tail.pairs.end(),
                                    [](double sample) { return sample == 0.0; });
    if (silent) {
        throw DataError("{} has nothing left behind its direct sound and the cut", path.string());
    }
    return tail;
}

}  // namespace

TailImportRules parseTailsIni(const std::string& text, const std::string& name) {
    TailImportRules rules;
    TailImportRule* rule = nullptr;
    std::istringstream lines(text);
    std::string raw;
    for (int number = 1; std::getline(lines, raw); ++number) {
        const std::string line = trimmed(raw);
        const std::string place = fmt::format("{} line {}", name, number);
        if (line.empty() || line[0] == '#' || line[0] == ';') {
            continue;
        }
        if (line.front() == '[') {
            const std::optional<int> preset =
                line.back() == ']' ? presetIn(trimmed(line.substr(1, line.size() - 2)))
                                   : std::nullopt;
            if (!preset) {
                throw DataError("{}: found \"{}\", expected a section like [preset_15]", place,
                                line);
            }
            checkPreset(*preset, place);
            if (rules.count(*preset) != 0) {
                throw DataError("{}: preset {} has two sections", place, *preset);
            }
            rule = &rules[*preset];
            continue;
        }
        const std::size_t sign = line.find('=');
        if (sign == std::string::npos || rule == nullptr) {
            throw DataError("{}: found \"{}\", expected {}", place, line,
                            rule == nullptr ? "a section like [preset_15] first" : "key = value");
        }
        setKey(*rule, trimmed(line.substr(0, sign)), trimmed(line.substr(sign + 1)), place);
    }
    return rules;
}

MeasuredTails importTails(const fs::path& directory) {
    std::error_code error;
    if (!fs::is_directory(directory, error)) {
        throw DataError("{} is no directory, expected one with preset_15.wav to preset_60.wav",
                        directory.string());
    }
    const fs::path ini = directory / iniName;
    TailImportRules rules = parseTailsIni(readIfPresent(ini), ini.string());
    std::map<int, fs::path> files;
    for (const fs::directory_entry& entry : fs::directory_iterator(directory)) {
        const std::optional<int> preset = presetIn(entry.path().stem().string());
        if (preset && entry.path().extension() == tailSuffix) {
            checkPreset(*preset, entry.path().string());
            const auto [other, added] = files.emplace(*preset, entry.path());
            if (!added) {
                throw DataError("{} and {} are both for preset {}", other->second.string(),
                                entry.path().string(), *preset);
            }
        }
    }
    for (const auto& [preset, rule] : rules) {
        if (!rule.file.empty()) {
            files[preset] = directory / rule.file;
        } else if (files.count(preset) == 0) {
            throw DataError("{}: preset {} has no file: {}{}{} does not exist", ini.string(),
                            preset, tailPrefix, preset, tailSuffix);
        }
    }
    if (files.empty()) {
        throw DataError("no measured tail in {}, expected preset_15.wav to preset_60.wav",
                        directory.string());
    }
    MeasuredTails tails;
    for (const auto& [preset, path] : files) {
        tails[preset] = importTail(path, preset, rules[preset]);
    }
    return tails;
}

std::vector<double> convertMeasuredTail(const MeasuredTail& tail, int preset, int sampleRate) {
    const std::size_t frames = storedTailFrames(tailDesign(preset), sampleRate);
    std::vector<double> pairs =
        resampleResponse(tail.pairs, earCount, tail.sampleRate, sampleRate, frames);
    const double length = static_cast<double>(tail.pairs.size() / earCount) * sampleRate /
                          static_cast<double>(tail.sampleRate);
    if (length > static_cast<double>(frames)) {
        for (std::size_t i = 0; i < pairs.size(); ++i) {
            pairs[i] *= tailFade(i / earCount, frames);
        }
    }
    return pairs;
}

}  // namespace tessaly::data
