// Equalisation of level curves.
#include "data/equalisation.h"

#include <algorithm>
#include <cmath>

namespace tessaly::data {

namespace {

constexpr double largestCorrection = 40.0;  // dB
constexpr double lowHoldHertz = 150.0;
constexpr double lowBlendHertz = 300.0;
constexpr double highMeanHertz = 15000.0;
constexpr double highBlendHertz = 18000.0;
constexpr double highHoldHertz = 20500.0;

double meanBetween(const double* curve, std::size_t bins, double binHertz, double from, double to) {
    const auto first = static_cast<std::size_t>(std::ceil(from / binHertz));
    const auto last = std::min(bins - 1, static_cast<std::size_t>(std::floor(to / binHertz)));
    double sum = 0.0;
    for (std::size_t k = first; k <= last; ++k) {
        sum += curve[k];
    }
    return sum / static_cast<double>(last - first + 1);
}

}  // namespace

void subtractLimited(LevelCurves& levels, const std::vector<double>& curve) {
    for (std::size_t i = 0; i < levels.decibels.size(); i += levels.bins) {
        for (std::size_t k = 0; k < levels.bins; ++k) {
            levels.decibels[i + k] -= std::clamp(curve[k], -largestCorrection, largestCorrection);
        }
    }
}

void holdBandEnds(double* curve, std::size_t bins, double binHertz) noexcept {
    const double low = meanBetween(curve, bins, binHertz, lowHoldHertz, lowBlendHertz);
    const double high = meanBetween(curve, bins, binHertz, highMeanHertz, highBlendHertz);
    for (std::size_t k = 0; k < bins; ++k) {
        const double hertz = static_cast<double>(k) * binHertz;
        if (hertz < lowBlendHertz) {
            const double own = (hertz - lowHoldHertz) / (lowBlendHertz - lowHoldHertz);
            curve[k] = low + std::max(0.0, own) * (curve[k] - low);
        } else if (hertz > highBlendHertz) {
            const double held = (hertz - highBlendHertz) / (highHoldHertz - highBlendHertz);
            curve[k] += std::min(1.0, held) * (high - curve[k]);
        }
    }
}

double frontalLevel(const LevelCurves& levels) {
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    double sum = 0.0;
    int count = 0;
    for (int ear = 0; ear < earCount; ++ear) {
        for (int band = lowestBand; band <= band8kHz; ++band) {
            sum += bandLevel(levels.curve(front, ear), levels.bins, levels.binHertz, band);
            ++count;
        }
    }
    return sum / count;
}

Equalisation equalise(LevelCurves& levels, bool diffuseField, double gainDb) {
    Equalisation done;
    done.subtracted.assign(levels.bins, 0.0);
    if (diffuseField) {
        done.subtracted = diffuseLevel(levels);
        for (double& value : done.subtracted) {
            value = std::clamp(value, -largestCorrection, largestCorrection);
        }
        subtractLimited(levels, done.subtracted);
    }
    for (std::size_t i = 0; i < levels.decibels.size(); i += levels.bins) {
        holdBandEnds(levels.decibels.data() + i, levels.bins, levels.binHertz);
    }
    done.gainDb = gainDb - frontalLevel(levels);
    for (double& value : levels.decibels) {
        value += done.gainDb;
    }
    return done;
}

}  // namespace tessaly::data
