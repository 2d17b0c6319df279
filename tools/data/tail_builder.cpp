// One piece of work a preset.
#include "data/tail_builder.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <mutex>
#include <sstream>

#include "base/precision.h"
#include "data/data_error.h"
#include "data/packed_tails.h"
#include "data/resampler.h"
#include "data/tail_envelope.h"
#include "data/tail_synthesis.h"
#include "data/worker_pool.h"

namespace tessaly::data {

namespace {

constexpr const char* syntheticWord = "synthetic";

/// Fields are separated by semicolons.
std::string field(std::string text) {
    std::replace(text.begin(), text.end(), ';', ',');
    return text;
}

std::vector<float> rounded(const std::vector<double>& samples) {
    std::vector<float> result(samples.size());
    std::transform(samples.begin(), samples.end(), result.begin(),
                   [](double sample) { return single(sample); });
    return result;
}

/// A synthetic tail at another rate.
std::vector<double> converted(const std::vector<double>& pairs,
                              const TailDesign& design,
                              int sampleRate) {
    if (sampleRate == tailDesignRate) {
        return pairs;
    }
    std::vector<double> result = resampleResponse(pairs, earCount, tailDesignRate, sampleRate,
                                                  storedTailFrames(design, sampleRate));
    const TailEnvelope envelope(design, sampleRate);
    envelope.silenceEnds(result, earCount);
    envelope.removeSum(result, earCount);
    return result;
}

void scale(std::vector<double>& pairs, double gain) {
    for (double& sample : pairs) {
        sample *= gain;
    }
}

double measuredGain(const TailDesign& design,
                    double direct,
                    const TailOptions& options,
                    const MeasuredTail& measured) {
    const double asked = std::pow(10.0, measured.rule.gainDb / 20.0);
    if (!measured.rule.matchLevel) {
        return asked;
    }
    const std::vector<double> pairs = convertMeasuredTail(measured, design.preset, tailDesignRate);
    if (!(middleEnergy(pairs, tailDesignRate) > 0.0)) {
        throw DataError("{} has no energy from 354 to 2828 Hz to match its level by",
                        measured.rule.file);
    }
    return asked * storedGain(design, options, pairs, direct);
}

BuiltTail buildMeasured(const TailDesign& design,
                        double direct,
                        const TailOptions& options,
                        const MeasuredTail& measured,
                        const std::vector<int>& rates) {
    const double gain = measuredGain(design, direct, options, measured);
    BuiltTail tail;
    tail.origin = {design.preset,         measured.rule.file,
                   measured.sha256,       measured.rule.matchLevel,
                   measured.rule.gainDb,  20.0 * std::log10(gain),
                   measured.rule.licence, measured.rule.source};
    for (const int rate : rates) {
        std::vector<double> pairs = convertMeasuredTail(measured, design.preset, rate);
        scale(pairs, gain);
        tail.stored.push_back(rounded(pairs));
    }
    return tail;
}

}  // namespace

std::string toText(const TailOrigin& origin) {
    std::string text = fmt::format("{} {}: ", origin.preset, tailDesign(origin.preset).name);
    if (origin.file.empty()) {
        return text + fmt::format("{}; gain {:.2f} dB", syntheticWord, origin.gainDb);
    }
    return text + fmt::format("measured; {}; {}; {}; {} dB; gain {:.2f} dB; licence {}; source {}",
                              field(origin.file), origin.sha256,
                              origin.matchLevel ? "match" : "keep", origin.askedDb, origin.gainDb,
                              field(origin.licence), field(origin.source));
}

TailOrigin tailOriginFromText(const std::string& text) {
    TailOrigin origin;
    const char* end = text.data() + text.size();
    const auto number = std::from_chars(text.data(), end, origin.preset);
    const std::size_t colon = text.find(": ");
    std::vector<std::string> fields;
    if (colon != std::string::npos) {
        std::istringstream rest(text.substr(colon + 2));
        for (std::string part; std::getline(rest, part, ';');) {
            fields.push_back(part.substr(part.find_first_not_of(' ') == 1 ? 1 : 0));
        }
    }
    const bool known = number.ec == std::errc() && origin.preset >= firstTailPreset &&
                       origin.preset <= reverbPresetCount && !fields.empty();
    if (known && fields[0] == syntheticWord) {
        return origin;
    }
    if (known && fields[0] == "measured" && fields.size() >= 5) {
        origin.file = fields[1];
        origin.sha256 = fields[2];
        origin.matchLevel = fields[3] == "match";
        const char* last = fields[4].data() + fields[4].size();
        if (std::from_chars(fields[4].data(), last, origin.askedDb).ec == std::errc()) {
            return origin;
        }
    }
    throw DataError("the manifest's line about a tail, \"{}\", cannot be read", text);
}

BuiltTail buildTail(const TailDesign& design,
                    const HrirSet& hrirs,
                    double direct,
                    const TailOptions& options,
                    const MeasuredTail* measured,
                    const std::vector<int>& rates) {
    if (measured != nullptr) {
        return buildMeasured(design, direct, options, *measured, rates);
    }
    std::vector<double> pairs = synthesiseTail(design, hrirs);
    const double gain = storedGain(design, options, pairs, direct);
    scale(pairs, gain);
    BuiltTail tail;
    tail.origin.preset = design.preset;
    tail.origin.gainDb = 20.0 * std::log10(gain);
    for (const int rate : rates) {
        tail.stored.push_back(rounded(converted(pairs, design, rate)));
    }
    return tail;
}

BuiltTails buildTails(const HrirSet& hrirs,
                      const TailOptions& options,
                      const MeasuredTails& measured,
                      const std::vector<int>& rates,
                      Progress& progress) {
    const double direct = directEnergy(hrirs);
    const std::vector<TailDesign>& designs = tailDesigns();
    // The longest first, so that no core works alone at the end.
    std::vector<std::size_t> order(designs.size());
    for (std::size_t i = 0; i < order.size(); ++i) {
        order[i] = i;
    }
    std::stable_sort(order.begin(), order.end(), [&designs](std::size_t a, std::size_t b) {
        return designs[a].frames48000 > designs[b].frames48000;
    });

    BuiltTails built;
    std::vector<BuiltTail> tails(designs.size());
    std::mutex progressGuard;
    progress.stage("making tails", designs.size());
    forEachParallel(order.size(), [&](std::size_t place) {
        const std::size_t i = order[place];
        const auto found = measured.find(designs[i].preset);
        tails[i] = buildTail(designs[i], hrirs, direct, options,
                             found != measured.end() ? &found->second : nullptr, rates);
        const std::lock_guard lock(progressGuard);
        progress.step();
    });
    for (const BuiltTail& tail : tails) {
        built.origins.push_back(tail.origin);
    }
    for (std::size_t r = 0; r < rates.size(); ++r) {
        std::vector<std::vector<float>> stored;
        for (BuiltTail& tail : tails) {
            stored.push_back(std::move(tail.stored[r]));
        }
        built.images[rates[r]] = packTails(stored);
    }
    return built;
}

}  // namespace tessaly::data
