// Means over bands and over the sphere.
#include "data/response_field.h"

#include <algorithm>
#include <cmath>

#include "data/minimum_phase.h"

namespace tessaly::data {

double levelAt(const double* curve, std::size_t bins, double binHertz, double hertz) noexcept {
    const double place = std::max(0.0, hertz / binHertz);
    const double last = static_cast<double>(bins - 1);
    if (place >= last) {
        return curve[bins - 1];
    }
    const auto lower = static_cast<std::size_t>(place);
    const double share = place - static_cast<double>(lower);
    return curve[lower] + share * (curve[lower + 1] - curve[lower]);
}

double bandCentre(int band) noexcept { return 1000.0 * std::exp2(band / 3.0); }

double powerOf(double decibels) noexcept { return std::exp(decibels * (2.0 * neperPerDecibel)); }

double bandLevel(const double* curve, std::size_t bins, double binHertz, int band) noexcept {
    const double halfBand = std::exp2(1.0 / 6.0);
    const auto first = static_cast<std::size_t>(std::ceil(bandCentre(band) / halfBand / binHertz));
    const auto end =
        std::min(bins, static_cast<std::size_t>(std::ceil(bandCentre(band) * halfBand / binHertz)));
    if (first >= end) {
        return levelAt(curve, bins, binHertz, bandCentre(band));
    }
    double sum = 0.0;
    for (std::size_t k = first; k < end; ++k) {
        sum += powerOf(curve[k]);
    }
    return 10.0 * std::log10(sum / static_cast<double>(end - first));
}

std::vector<double> diffuseLevel(const LevelCurves& levels) {
    const std::vector<double>& weights = areaWeights();
    std::vector<double> power(levels.bins, 0.0);
    double total = 0.0;
    for (std::size_t entry = 0; entry < weights.size(); ++entry) {
        for (int ear = 0; ear < earCount; ++ear) {
            const double* curve = levels.curve(entry, ear);
            for (std::size_t k = 0; k < levels.bins; ++k) {
                power[k] += weights[entry] * powerOf(curve[k]);
            }
            total += weights[entry];
        }
    }
    for (double& value : power) {
        value = 10.0 * std::log10(value / total);
    }
    return power;
}

}  // namespace tessaly::data
