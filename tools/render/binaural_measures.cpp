// Windowed levels and cross-correlation of the two ears.
#include "render/binaural_measures.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>

namespace tessaly {

namespace {

constexpr double windowSeconds = 0.06;
constexpr double bandLow = 500.0;    // Hz; the time difference is steady in this band and the
constexpr double bandHigh = 3000.0;  // fine structure of one cycle does not mislead
constexpr double gateDb = 25.0;      // below the loudest window: no differences
constexpr double leastCorrelation =
    0.4;  // of the two ears, normalised; below it no time difference

// Second-order Butterworth section, the same for both ears, so that it moves neither against the
// other.
class Section {
public:
    static Section lowPass(double corner, double rate) { return Section(corner, rate, false); }
    static Section highPass(double corner, double rate) { return Section(corner, rate, true); }

    double next(double x) noexcept {
        const double y = b0 * x + state1;
        state1 = b1 * x - a1 * y + state2;
        state2 = b0 * x - a2 * y;
        return y;
    }

private:
    Section(double corner, double rate, bool high) {
        const double w = 2.0 * std::numbers::pi * corner / rate;
        const double alpha = std::sin(w) / std::numbers::sqrt2;
        const double scale = 1.0 + alpha;
        const double edge = high ? 1.0 + std::cos(w) : 1.0 - std::cos(w);
        b0 = 0.5 * edge / scale;
        b1 = (high ? -edge : edge) / scale;
        a1 = -2.0 * std::cos(w) / scale;
        a2 = (1.0 - alpha) / scale;
    }

    double b0 = 0.0;
    double b1 = 0.0;
    double a1 = 0.0;
    double a2 = 0.0;
    double state1 = 0.0;
    double state2 = 0.0;
};

struct Ears {
    std::vector<double> left;
    std::vector<double> right;
};

Ears bandLimited(std::span<const float> stereo, double rate) {
    const std::size_t frames = stereo.size() / 2;
    Ears ears;
    for (std::vector<double>* ear : {&ears.left, &ears.right}) {
        const std::size_t offset = ear == &ears.right ? 1 : 0;
        Section high = Section::highPass(bandLow, rate);
        Section low = Section::lowPass(bandHigh, rate);
        ear->resize(frames);
        for (std::size_t i = 0; i < frames; ++i) {
            (*ear)[i] = low.next(high.next(static_cast<double>(stereo[2 * i + offset])));
        }
    }
    return ears;
}

// Raised cosine over a window: what lies in its middle decides, not a burst that just ended at its
// edge.
double windowWeight(std::ptrdiff_t index, std::ptrdiff_t begin, std::ptrdiff_t end) {
    const double x = (static_cast<double>(index - begin) + 0.5) / static_cast<double>(end - begin);
    return 0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * x);
}

// Window [begin, end) of the right ear against the left one shifted by up to the longest lag.
std::optional<double> timeDifference(const Ears& ears,
                                     std::ptrdiff_t begin,
                                     std::ptrdiff_t end,
                                     double rate) {
    const auto frames = static_cast<std::ptrdiff_t>(ears.left.size());
    const auto longest =
        static_cast<std::ptrdiff_t>(std::ceil(longestTimeDifference * 0.001 * rate));
    std::vector<double> correlation(static_cast<std::size_t>(2 * longest + 1));
    std::vector<double> leftEnergy(correlation.size());
    double rightEnergy = 0.0;
    for (std::ptrdiff_t i = std::max<std::ptrdiff_t>(begin, 0); i < std::min(end, frames); ++i) {
        const double weight = windowWeight(i, begin, end);
        const double right = weight * ears.right[i];
        rightEnergy += right * ears.right[i];
        const std::ptrdiff_t first = std::max(-longest, -i);
        const std::ptrdiff_t last = std::min(longest, frames - 1 - i);
        for (std::ptrdiff_t lag = first; lag <= last; ++lag) {
            const double left = ears.left[i + lag];
            correlation[lag + longest] += right * left;
            leftEnergy[lag + longest] += weight * left * left;
        }
    }
    // Each lag by its own energy: else a decaying sound would draw the peak to its louder start.
    for (std::size_t i = 0; i < correlation.size(); ++i) {
        const double reference = std::sqrt(rightEnergy * leftEnergy[i]);
        correlation[i] = reference > 0.0 ? correlation[i] / reference : 0.0;
    }
    const auto peak = std::max_element(correlation.begin(), correlation.end());
    if (*peak < leastCorrelation || peak == correlation.begin() || peak + 1 == correlation.end()) {
        return std::nullopt;
    }
    const double before = *(peak - 1);
    const double after = *(peak + 1);
    const double bend = before - 2.0 * *peak + after;
    const double fraction = bend < 0.0 ? 0.5 * (before - after) / bend : 0.0;
    const auto lag = static_cast<double>(peak - correlation.begin() - longest);
    return (lag + fraction) * 1000.0 / rate;
}

double decibels(double meanSquare) {
    return meanSquare > 0.0 ? std::max(10.0 * std::log10(meanSquare), silenceDb) : silenceDb;
}

}  // namespace

std::optional<double> interauralTime(std::span<const float> stereo, double sampleRate) {
    const Ears ears = bandLimited(stereo, sampleRate);
    return timeDifference(ears, 0, static_cast<std::ptrdiff_t>(ears.left.size()), sampleRate);
}

std::vector<BinauralPoint> measureBinaural(std::span<const float> stereo,
                                           double sampleRate,
                                           double hopSeconds) {
    const auto frames = static_cast<std::ptrdiff_t>(stereo.size() / 2);
    const auto half = static_cast<std::ptrdiff_t>(std::lround(0.5 * windowSeconds * sampleRate));
    const Ears ears = bandLimited(stereo, sampleRate);
    std::vector<BinauralPoint> points;
    double loudest = silenceDb;
    for (std::size_t index = 0;; ++index) {
        BinauralPoint point;
        point.time = static_cast<double>(index) * hopSeconds;
        const auto middle = static_cast<std::ptrdiff_t>(std::lround(point.time * sampleRate));
        if (middle >= frames) {
            break;
        }
        std::array<double, 2> sums{};
        double weights = 0.0;
        for (std::ptrdiff_t i = std::max<std::ptrdiff_t>(middle - half, 0);
             i < std::min(middle + half, frames); ++i) {
            const double weight = windowWeight(i, middle - half, middle + half);
            for (std::ptrdiff_t ear = 0; ear < 2; ++ear) {
                const auto sample = static_cast<double>(stereo[2 * i + ear]);
                sums[ear] += weight * sample * sample;
            }
            weights += weight;
        }
        point.leftDb = decibels(sums[0] / weights);
        point.rightDb = decibels(sums[1] / weights);
        loudest = std::max({loudest, point.leftDb, point.rightDb});
        points.push_back(point);
    }
    for (BinauralPoint& point : points) {
        const double level = std::max(point.leftDb, point.rightDb);
        if (level <= silenceDb || level < loudest - gateDb) {
            continue;
        }
        if (std::min(point.leftDb, point.rightDb) > silenceDb) {
            point.levelDifference = point.rightDb - point.leftDb;
        }
        const auto middle = static_cast<std::ptrdiff_t>(std::lround(point.time * sampleRate));
        point.timeDifference = timeDifference(ears, middle - half, middle + half, sampleRate);
    }
    return points;
}

}  // namespace tessaly
