// Graphs over the time of the sound.
#include "report/time_graphs.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <functional>
#include <limits>
#include <optional>
#include <vector>

#include "render/binaural_measures.h"
#include "report/base64.h"
#include "report/plot.h"
#include "report/sound_data.h"
#include "report/spectrogram.h"

namespace tessaly {

namespace {

constexpr double finestHop = 0.02;  // seconds between the points of a curve
constexpr double mostPoints = 500.0;
constexpr double shownLevels = 60.0;        // dB from the top of the level graph to its foot
constexpr double shownSpectrum = 80.0;      // dB from the brightest colour to the darkest
constexpr double quietestSpectrum = -60.0;  // dB; the brightest colour is never below it
constexpr int timeTicks = 8;

// Where both ears receive the same, the right one's line lies within the left one's.
constexpr LineStyle leftLine{.colour = leftColour, .width = 2.8};
constexpr LineStyle rightLine{.colour = rightColour, .width = 1.6};
constexpr LineStyle differenceLine{.colour = "var(--ink)", .width = 2.0};

using Value = std::function<std::optional<double>(const BinauralPoint&)>;

Curve curveOf(const std::vector<BinauralPoint>& points,
              const LineStyle& style,
              const Value& value) {
    Curve curve;
    curve.style = style;
    for (const BinauralPoint& point : points) {
        curve.run.push_back(
            {point.time, value(point).value_or(std::numeric_limits<double>::quiet_NaN())});
    }
    return curve;
}

// Below the foot of the graph there is nothing to see.
Value shownLevel(double BinauralPoint::*level, double foot) {
    return [=](const BinauralPoint& point) {
        return point.*level < foot ? std::nullopt : std::optional(point.*level);
    };
}

double loudestLevel(const std::vector<BinauralPoint>& points, double BinauralPoint::*level) {
    double loudest = silenceDb;
    for (const BinauralPoint& point : points) {
        loudest = std::max(loudest, point.*level);
    }
    return loudest;
}

std::string earWords(const char* ear,
                     const std::vector<BinauralPoint>& points,
                     double BinauralPoint::*level) {
    const auto loudest = std::max_element(
        points.begin(), points.end(),
        [&](const BinauralPoint& a, const BinauralPoint& b) { return a.*level < b.*level; });
    if (loudest == points.end() || (*loudest).*level <= silenceDb) {
        return fmt::format("The {} ear is silent.", ear);
    }
    return fmt::format("The {} ear is loudest at {} seconds with {} dBFS.", ear,
                       shownNumber(loudest->time, 1), shownNumber((*loudest).*level, 1));
}

// Smallest and largest of what could be measured.
std::string rangeWords(const std::vector<BinauralPoint>& points,
                       std::optional<double> BinauralPoint::*value,
                       const char* unit,
                       int decimals) {
    std::optional<double> low;
    std::optional<double> high;
    for (const BinauralPoint& point : points) {
        if (const std::optional<double>& one = point.*value) {
            low = std::min(low.value_or(*one), *one);
            high = std::max(high.value_or(*one), *one);
        }
    }
    if (!low) {
        return "Nothing could be measured.";
    }
    return fmt::format("It lies between {} and {} {}.", shownNumber(*low, decimals),
                       shownNumber(*high, decimals), unit);
}

AxisRange differenceRange(const std::vector<BinauralPoint>& points) {
    double largest = 0.0;
    for (const BinauralPoint& point : points) {
        largest = std::max(largest, std::abs(point.levelDifference.value_or(0.0)));
    }
    const double edge = std::clamp(10.0 * std::ceil((largest + 1.0) / 10.0), 10.0, 40.0);
    return {-edge, edge};
}

std::string graphOf(Plot plot,
                    const AxisRange& values,
                    double duration,
                    std::span<const Curve> curves) {
    const AxisRange times{0.0, duration};
    plot.across = ticksOf(times, timeTicks, "s");
    plot.upright = ticksOf(values, 4, "");
    plot.seconds = duration;
    plot.body = curvesMarkup(times, values, plot.across, plot.upright, curves);
    return plotMarkup(plot);
}

// A few round frequencies; the first and the last are the edges.
std::vector<Tick> frequencyTicks() {
    constexpr std::array<std::pair<double, const char*>, 8> marks = {{{100.0, "100"},
                                                                      {200.0, "200"},
                                                                      {500.0, "500"},
                                                                      {1000.0, "1 k"},
                                                                      {2000.0, "2 k"},
                                                                      {5000.0, "5 k"},
                                                                      {10000.0, "10 k"},
                                                                      {20000.0, "20 k"}}};
    std::vector<Tick> ticks;
    ticks.reserve(marks.size());
    for (const auto& [hertz, label] : marks) {
        ticks.push_back(
            {std::log(hertz / lowestShownHertz) / std::log(highestShownHertz / lowestShownHertz),
             label});
    }
    return ticks;
}

std::string strongestWords(const Spectrogram& spectrogram, double duration) {
    const auto loudest = std::max_element(spectrogram.decibels.begin(), spectrogram.decibels.end());
    if (static_cast<double>(*loudest) <= silenceDb) {
        return "It is silent.";
    }
    const auto place = loudest - spectrogram.decibels.begin();
    const auto row = static_cast<int>(place / spectrogram.columns);
    const auto column = static_cast<int>(place % spectrogram.columns);
    const double seconds = (column + 0.5) * duration / spectrogram.columns;
    const double height = 1.0 - (row + 0.5) / spectrogram.rows;
    const double hertz = lowestShownHertz * std::pow(highestShownHertz / lowestShownHertz, height);
    return fmt::format("It is strongest near {:.2g} kilohertz at {} seconds, {} dB.",
                       hertz / 1000.0, shownNumber(seconds, 1),
                       shownNumber(static_cast<double>(*loudest), 0));
}

}  // namespace

std::string binauralGraphs(std::span<const float> stereo, int sampleRate) {
    const double duration = secondsOf(stereo, sampleRate);
    const double hop = std::max(finestHop, duration / mostPoints);
    const std::vector<BinauralPoint> points =
        measureBinaural(stereo, static_cast<double>(sampleRate), hop);

    const double loudest = std::max(loudestLevel(points, &BinauralPoint::leftDb),
                                    loudestLevel(points, &BinauralPoint::rightDb));
    const double top = std::max(10.0 * std::ceil((loudest + 2.0) / 10.0), silenceDb + shownLevels);
    const AxisRange levels{top - shownLevels, top};
    const std::array<Curve, 2> levelCurves = {
        curveOf(points, leftLine, shownLevel(&BinauralPoint::leftDb, levels.low)),
        curveOf(points, rightLine, shownLevel(&BinauralPoint::rightDb, levels.low))};
    const std::array<Curve, 1> timeCurve = {
        curveOf(points, differenceLine, [](const BinauralPoint& p) { return p.timeDifference; })};
    const std::array<Curve, 1> levelCurve = {
        curveOf(points, differenceLine, [](const BinauralPoint& p) { return p.levelDifference; })};

    Plot level;
    level.title = "Level at the ears";
    level.unit = "dBFS rms";
    level.ears = true;
    level.kind = "middle";
    level.label = fmt::format("Level at the ears over {} seconds. {} {}", shownNumber(duration, 1),
                              earWords("left", points, &BinauralPoint::leftDb),
                              earWords("right", points, &BinauralPoint::rightDb));
    Plot time;
    time.title = "Time difference";
    time.unit = "ms, above zero the right ear is first";
    time.kind = "low";
    time.label = "Interaural time difference, above zero the right ear is first. " +
                 rangeWords(points, &BinauralPoint::timeDifference, "milliseconds", 2);
    Plot difference;
    difference.title = "Level difference";
    difference.unit = "dB, above zero the right ear is louder";
    difference.kind = "low";
    difference.label = "Interaural level difference, above zero the right ear is louder. " +
                       rangeWords(points, &BinauralPoint::levelDifference, "dB", 1);
    return graphOf(level, levels, duration, levelCurves) +
           graphOf(time, {-longestTimeDifference, longestTimeDifference}, duration, timeCurve) +
           graphOf(difference, differenceRange(points), duration, levelCurve);
}

std::string spectrumGraphs(std::span<const float> stereo, int sampleRate) {
    const double duration = secondsOf(stereo, sampleRate);
    const std::array<Spectrogram, 2> ears = {spectrogramOf(stereo, 0, sampleRate),
                                             spectrogramOf(stereo, 1, sampleRate)};
    const double loudest = std::max(loudestOf(ears[0]), loudestOf(ears[1]));
    const double high = std::max(5.0 * std::ceil(loudest / 5.0), quietestSpectrum);
    const double low = high - shownSpectrum;
    std::string markup;
    for (std::size_t ear = 0; ear < ears.size(); ++ear) {
        const char* name = ear == 0 ? "left" : "right";
        Plot plot;
        plot.title = fmt::format("Spectrum at the {} ear", name);
        plot.unit = "Hz";
        plot.kind = "tall";
        plot.seconds = duration;
        plot.across = ticksOf({0.0, duration}, timeTicks, "s");
        plot.upright = frequencyTicks();
        plot.label = fmt::format(
            "Spectrogram of the {} ear from 50 hertz to 20 kilohertz over {} seconds. {}", name,
            shownNumber(duration, 1), strongestWords(ears[ear], duration));
        plot.body = fmt::format(
            "<img alt=\"\" src=\"{}\">\n",
            dataUri("image/png", encodePng(imageOf(ears[ear], low, high), levelColours())));
        plot.below = fmt::format(
            "<div class=\"scale\" aria-hidden=\"true\"><span>{} dB</span>"
            "<span class=\"bar levels\"></span><span>{} dB</span></div>\n",
            shownNumber(low, 0), shownNumber(high, 0));
        markup += plotMarkup(plot);
    }
    return markup;
}

}  // namespace tessaly
