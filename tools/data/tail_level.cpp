// Energy by transform, and the level rule.
#include "data/tail_level.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <sstream>

#include "base/precision.h"
#include "data/data_error.h"
#include "data/thread_transform.h"

namespace tessaly::data {

namespace {

constexpr double lowestMiddle = 354.0;    // Hz
constexpr double highestMiddle = 2828.0;  // Hz
constexpr std::size_t shortestTransform = 16384;
constexpr double directGain = 0.6636;  // of the engine at 1 m
constexpr double storedPeak = 0.9;
constexpr double largestWetDb = 40.0;

}  // namespace

std::string toText(const TailOptions& options) {
    return fmt::format("level={} wet={}", options.level == TailLevel::rule ? "rule" : "peak",
                       options.wetDb);
}

TailLevel tailLevelFromText(const std::string& text) {
    if (text == "rule" || text == "peak") {
        return text == "rule" ? TailLevel::rule : TailLevel::peak;
    }
    throw DataError("level is \"{}\", expected rule or peak", text);
}

TailOptions tailOptionsFromText(const std::string& text) {
    TailOptions options;
    std::istringstream words(text);
    std::string word;
    while (words >> word) {
        const std::size_t sign = word.find('=');
        const std::string key = word.substr(0, sign);
        const std::string value = sign == std::string::npos ? "" : word.substr(sign + 1);
        if (key == "level") {
            options.level = tailLevelFromText(value);
            continue;
        }
        const char* end = value.data() + value.size();
        const auto [stop, error] = std::from_chars(value.data(), end, options.wetDb);
        if (key != "wet" || error != std::errc() || stop != end) {
            throw DataError("options \"{}\": \"{}\" is unknown", text, word);
        }
    }
    return options;
}

void checkTailOptions(const TailOptions& options) {
    if (!(std::abs(options.wetDb) <= largestWetDb)) {
        throw DataError("level of the tails is {} dB, expected -{} to {}", options.wetDb,
                        largestWetDb, largestWetDb);
    }
}

double middleEnergy(const std::vector<double>& pairs, int sampleRate) {
    const std::size_t frames = pairs.size() / earCount;
    RealTransform& transform = threadTransform(nextPowerOfTwo(std::max(frames, shortestTransform)));
    const double binHertz = sampleRate / static_cast<double>(transform.length());
    const auto first = static_cast<std::size_t>(std::ceil(lowestMiddle / binHertz));
    const auto last = static_cast<std::size_t>(std::floor(highestMiddle / binHertz));
    std::vector<Complex> spectrum(transform.bins());
    double sum = 0.0;
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        std::vector<double> time(transform.length());
        for (std::size_t i = 0; i < frames; ++i) {
            time[i] = pairs[earCount * i + ear];
        }
        transform.forward(time.data(), spectrum.data());
        for (std::size_t k = first; k <= last; ++k) {
            sum += std::norm(spectrum[k]);
        }
    }
    return sum * binHertz / earCount;
}

double directEnergy(const HrirSet& hrirs) {
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    std::vector<double> pairs(hrirs.taps * earCount);
    for (std::size_t i = 0; i < pairs.size(); ++i) {
        pairs[i] = directGain * wide(hrirs.pairs[front * hrirs.taps * earCount + i]);
    }
    return middleEnergy(pairs, hrirs.sampleRate);
}

double storedGain(const TailDesign& design,
                  const TailOptions& options,
                  const std::vector<double>& pairs,
                  double direct) {
    if (options.level == TailLevel::peak) {
        double peak = 0.0;
        for (const double sample : pairs) {
            peak = std::max(peak, std::abs(sample));
        }
        return storedPeak * std::pow(10.0, options.wetDb / 20.0) / peak;
    }
    const double wanted = direct * std::pow(10.0, (options.wetDb - design.directToTail()) / 10.0);
    return std::sqrt(wanted / middleEnergy(pairs, tailDesignRate)) / wide(design.presetGain);
}

}  // namespace tessaly::data
