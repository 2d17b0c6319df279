// Analysis of all responses of a set.
#include "data/set_analysis.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr std::size_t analysisLength = 4096;
constexpr double smallestMagnitude = 1e-10;
constexpr double onsetShare = 0.1;  // of the largest sample: -20 dB
constexpr double onsetLeadSeconds = 0.1e-3;
constexpr double wideSearchSeconds = 1e-3;
constexpr double noEnergyDecibels = -200.0;

double decibelsOf(double share) {
    return share > 0.0 ? 10.0 * std::log10(share) : noEnergyDecibels;
}

/// Energy before the onset less 0.1 ms.
double preOnset(const std::vector<double>& response, int sampleRate, double largest) {
    std::size_t onset = 0;
    while (onset < response.size() && std::abs(response[onset]) < onsetShare * largest) {
        ++onset;
    }
    const auto lead = static_cast<std::size_t>(std::lround(onsetLeadSeconds * sampleRate));
    double before = 0.0;
    for (std::size_t i = 0; i + lead < onset; ++i) {
        before += response[i] * response[i];
    }
    return before;
}

void countUnusable(const HrirSet& set, SetAnalysis& analysis) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        for (int ear = 0; ear < earCount; ++ear) {
            bool silent = true;
            for (std::size_t i = 0; i < set.taps; ++i) {
                const float sample = set.sample(entry, ear, i);
                analysis.notFinite += std::isfinite(sample) ? 0 : 1;
                silent = silent && sample == 0.0f;
            }
            analysis.silentResponses += silent ? 1 : 0;
        }
    }
}

void mirrorCheck(const HrirSet& set, SetAnalysis& analysis) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const auto mirror = static_cast<std::size_t>(mirrorIndex(static_cast<int>(entry)));
        for (std::size_t i = 0; i < set.taps; ++i) {
            const double difference =
                std::abs(static_cast<double>(set.sample(entry, leftEar, i)) -
                         static_cast<double>(set.sample(mirror, rightEar, i)));
            analysis.mirrorError = std::max(analysis.mirrorError, difference);
        }
    }
}

}  // namespace

Spread spreadOf(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    Spread spread;
    for (const double value : values) {
        spread.mean += value;
    }
    spread.mean /= static_cast<double>(values.size());
    spread.percentile95 =
        values[static_cast<std::size_t>(std::floor(0.95 * static_cast<double>(values.size() - 1)))];
    spread.largest = values.back();
    return spread;
}

SetAnalysis analyseSet(const HrirSet& set, Progress& progress) {
    const std::size_t count = packedOrder().size();
    SetAnalysis analysis;
    countUnusable(set, analysis);
    if (analysis.notFinite > 0 || analysis.silentResponses > 0) {
        return analysis;
    }
    RealTransform transform(analysisLength);
    ItdEstimator estimator(set.sampleRate, set.taps);
    std::vector<Complex> spectrum(transform.bins());
    std::vector<double> padded(analysisLength);
    analysis.levels.bins = transform.bins();
    analysis.levels.binHertz = set.sampleRate / static_cast<double>(analysisLength);
    analysis.levels.resize(count);
    analysis.energies.assign(earCount, std::vector<double>(count, 0.0));
    analysis.worstPreOnsetDecibels = noEnergyDecibels;
    double beforeOnsets = 0.0;
    double allEnergy = 0.0;
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    progress.stage(fmt::format("measuring {} Hz", set.sampleRate), count);
    for (std::size_t entry = 0; entry < count; ++entry) {
        std::vector<double> responses[earCount];
        for (int ear = 0; ear < earCount; ++ear) {
            std::vector<double>& response = responses[ear];
            response = set.response(entry, ear);
            double energy = 0.0;
            double sum = 0.0;
            double absolute = 0.0;
            double largest = 0.0;
            for (const double sample : response) {
                energy += sample * sample;
                sum += sample;
                absolute += std::abs(sample);
                largest = std::abs(sample) > std::abs(largest) ? sample : largest;
            }
            analysis.energies[static_cast<std::size_t>(ear)][entry] = energy;
            analysis.negativeTaps += largest > 0.0 ? 0 : 1;
            analysis.largestTap = std::max(analysis.largestTap, std::abs(largest));
            analysis.largestTapSum = std::max(analysis.largestTapSum, absolute);
            if (entry == front) {
                analysis.frontalDcGain += sum / earCount;
                analysis.frontalTap =
                    ear == leftEar ? largest : std::min(analysis.frontalTap, largest);
            }
            const double before = preOnset(response, set.sampleRate, std::abs(largest));
            analysis.worstPreOnsetDecibels =
                std::max(analysis.worstPreOnsetDecibels, decibelsOf(before / energy));
            beforeOnsets += before;
            allEnergy += energy;
            std::fill(padded.begin(), padded.end(), 0.0);
            std::copy(response.begin(), response.end(), padded.begin());
            transform.forward(padded.data(), spectrum.data());
            double* curve = analysis.levels.curve(entry, ear);
            for (std::size_t k = 0; k < spectrum.size(); ++k) {
                curve[k] = 20.0 * std::log10(std::max(std::abs(spectrum[k]), smallestMagnitude));
            }
        }
        const GridEntry& direction = packedOrder()[entry];
        const double expected =
            woodworth({static_cast<double>(direction.phi), static_cast<double>(direction.theta)});
        // Without a peak in the range the estimate counts as far off, not as right.
        analysis.itdSeconds.push_back(estimator
                                          .estimate(responses[leftEar].data(),
                                                    responses[rightEar].data(), expected,
                                                    itdSearchSeconds)
                                          .value_or(expected + itdSearchSeconds));
        progress.step();
    }
    const auto side = static_cast<std::size_t>(packedIndex(90, 0));
    analysis.sideItdSeconds =
        estimator
            .estimate(set.response(side, leftEar).data(), set.response(side, rightEar).data(), 0.0,
                      wideSearchSeconds)
            .value_or(0.0);
    analysis.preOnsetDecibels = decibelsOf(beforeOnsets / allEnergy);
    mirrorCheck(set, analysis);
    return analysis;
}

std::vector<double> logSpaced(double fromHertz, double toHertz, int points) {
    std::vector<double> values;
    for (int i = 0; i < points; ++i) {
        values.push_back(fromHertz *
                         std::pow(toHertz / fromHertz, static_cast<double>(i) / (points - 1)));
    }
    return values;
}

}  // namespace tessaly::data
