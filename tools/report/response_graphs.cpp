// Graphs over the time of a response.
#include "report/response_graphs.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <span>
#include <vector>

#include "report/plot.h"
#include "report/response_decay.h"

namespace tessaly {

namespace {

constexpr double firstSeconds = 0.08;      // shown of the samples themselves
constexpr double leadSeconds = 0.004;      // before the onset
constexpr double shownDecay = 80.0;        // dB
constexpr double leastDecaySeconds = 0.1;  // on the axis of decays
constexpr std::size_t columns = 600;

using Ears = std::array<std::vector<float>, 2>;

// Both ears with the shorter one's length, without samples that are no numbers.
Ears earsOf(const ReportResponse& response) {
    const std::size_t frames = std::min(response.left.size(), response.right.size());
    Ears ears = {response.left, response.right};
    for (std::vector<float>& ear : ears) {
        ear.resize(frames);
        std::replace_if(
            ear.begin(), ear.end(), [](float sample) { return !std::isfinite(sample); }, 0.0f);
    }
    return ears;
}

float peakOf(const Ears& ears) {
    float peak = 0.0f;
    for (const std::vector<float>& ear : ears) {
        for (const float sample : ear) {
            peak = std::max(peak, std::abs(sample));
        }
    }
    return peak;
}

const LineStyle& lineOf(std::size_t ear, bool thin) {
    static constexpr std::array<LineStyle, 4> styles = {{{.colour = leftColour, .width = 3.0},
                                                         {.colour = rightColour, .width = 1.6},
                                                         {.colour = leftColour, .width = 1.2},
                                                         {.colour = rightColour, .width = 1.2}}};
    return styles[ear + (thin ? 2 : 0)];
}

// Samples of a range, as lowest and highest of each column where there are many.
std::vector<Point> samplesOf(std::span<const float> ear,
                             std::size_t begin,
                             std::size_t end,
                             double millisecondsPerSample) {
    std::vector<Point> run;
    const std::size_t step = std::max<std::size_t>(1, (end - begin) / columns);
    for (std::size_t i = begin; i < end; i += step) {
        const auto part = ear.subspan(i, std::min(step, end - i));
        const auto [low, high] = std::minmax_element(part.begin(), part.end());
        const double place = static_cast<double>(i) * millisecondsPerSample;
        const bool fallsFirst = low < high;
        run.push_back({place, static_cast<double>(fallsFirst ? *low : *high)});
        if (low != high) {
            run.push_back({place, static_cast<double>(fallsFirst ? *high : *low)});
        }
    }
    return run;
}

std::string arrivalWords(const Ears& ears, int sampleRate) {
    std::string words;
    for (std::size_t ear = 0; ear < ears.size(); ++ear) {
        const char* name = ear == 0 ? "left" : "right";
        float peak = 0.0f;
        for (const float sample : ears[ear]) {
            peak = std::max(peak, std::abs(sample));
        }
        words +=
            peak > 0.0f
                ? fmt::format(
                      " The {} ear is reached after {} milliseconds, peak {}.", name,
                      shownNumber(1000.0 * static_cast<double>(onsetOf(ears[ear])) / sampleRate, 2),
                      shownNumber(static_cast<double>(peak), 3))
                : fmt::format(" The {} ear is silent.", name);
    }
    return words;
}

std::string arrivalGraph(const Ears& ears, int sampleRate) {
    const std::size_t frames = ears[0].size();
    const std::size_t onset = std::min(onsetOf(ears[0]), onsetOf(ears[1]));
    const auto lead = static_cast<std::size_t>(leadSeconds * sampleRate);
    const std::size_t begin = onset - std::min(onset, lead);
    const auto shown = static_cast<std::size_t>(firstSeconds * sampleRate);
    const std::size_t end = std::min(frames, begin + shown);
    const double milliseconds = 1000.0 / sampleRate;
    const AxisRange times{static_cast<double>(begin) * milliseconds,
                          static_cast<double>(begin + shown) * milliseconds};
    // One lane an ear, the left one above, both with the same scale.
    const double peak = std::max(static_cast<double>(peakOf(ears)), 1e-30);
    const AxisRange lanes{-2.2, 2.2};
    std::vector<Curve> curves(2);
    for (std::size_t ear = 0; ear < ears.size(); ++ear) {
        curves[ear].style = {.colour = ear == 0 ? leftColour : rightColour, .width = 1.5};
        curves[ear].run = samplesOf(ears[ear], begin, end, milliseconds);
        for (Point& point : curves[ear].run) {
            // A square root keeps weak reflections in sight beside the direct sound.
            point.y = std::copysign(std::sqrt(std::abs(point.y) / peak), point.y) +
                      (ear == 0 ? 1.1 : -1.1);
        }
    }
    Plot plot;
    plot.title = "Impulse response";
    plot.unit = "first 80 ms, square-root scale";
    plot.kind = "high";
    plot.label = "Impulse response, its first 80 milliseconds." + arrivalWords(ears, sampleRate);
    plot.across = ticksOf(times, 6, "ms");
    plot.upright = {{lanes.place(1.1, 0.0, 1.0), "left"}, {lanes.place(-1.1, 0.0, 1.0), "right"}};
    plot.body = curvesMarkup(times, lanes, plot.across, plot.upright, curves);
    return plotMarkup(plot);
}

// Level of each column relative to the loudest one of both ears.
std::vector<Point> levelsOf(std::span<const float> ear,
                            std::size_t step,
                            double secondsPerSample,
                            double reference) {
    std::vector<Point> run;
    for (std::size_t i = 0; i + step <= ear.size(); i += step) {
        double energy = 0.0;
        for (const float sample : ear.subspan(i, step)) {
            energy += static_cast<double>(sample) * static_cast<double>(sample);
        }
        const double level =
            energy > 0.0 ? 10.0 * std::log10(energy / reference) : -2.0 * shownDecay;
        run.push_back(
            {(static_cast<double>(i) + 0.5 * static_cast<double>(step)) * secondsPerSample,
             std::max(level, -2.0 * shownDecay)});
    }
    return run;
}

double loudestColumn(const Ears& ears, std::size_t step) {
    double loudest = 1e-300;
    for (const std::vector<float>& ear : ears) {
        for (std::size_t i = 0; i + step <= ear.size(); i += step) {
            double energy = 0.0;
            for (const float sample : std::span(ear).subspan(i, step)) {
                energy += static_cast<double>(sample) * static_cast<double>(sample);
            }
            loudest = std::max(loudest, energy);
        }
    }
    return loudest;
}

// First sample at which a curve is at or below a level; its length if it never is.
std::size_t fallenBelow(const std::vector<double>& curve, double level) {
    return static_cast<std::size_t>(
        std::find_if(curve.begin(), curve.end(), [&](double one) { return one <= level; }) -
        curve.begin());
}

std::string decayGraph(const Ears& ears, int sampleRate) {
    const std::array<std::vector<double>, 2> decays = {energyDecay(ears[0]), energyDecay(ears[1])};
    const double period = 1.0 / sampleRate;
    std::size_t shown = 0;
    std::string words;
    for (std::size_t ear = 0; ear < decays.size(); ++ear) {
        shown = std::max(shown, fallenBelow(decays[ear], -shownDecay));
        const char* name = ear == 0 ? "left" : "right";
        const bool silent = decays[ear].empty() || decays[ear].front() <= decayFloorDb;
        words += silent ? fmt::format(" The {} ear is silent.", name)
                        : fmt::format(
                              " The {} ear has lost 20 dB after {} and 60 dB after {} "
                              "milliseconds.",
                              name,
                              shownNumber(1000.0 * period *
                                              static_cast<double>(fallenBelow(decays[ear], -20.0)),
                                          0),
                              shownNumber(1000.0 * period *
                                              static_cast<double>(fallenBelow(decays[ear], -60.0)),
                                          0));
    }
    const double seconds = std::max(1.05 * static_cast<double>(shown) * period, leastDecaySeconds);
    const auto frames = std::min(static_cast<std::size_t>(seconds * sampleRate), ears[0].size());
    const std::size_t step = std::max<std::size_t>(1, frames / columns);
    const std::size_t wideStep = std::max<std::size_t>(1, frames / (columns / 3));
    const AxisRange times{0.0, seconds};
    const AxisRange levels{-shownDecay, 2.0};
    const double reference = loudestColumn(ears, wideStep);
    std::vector<Curve> curves;
    for (std::size_t ear = 0; ear < ears.size(); ++ear) {
        curves.push_back({lineOf(ear, true), levelsOf(std::span(ears[ear]).first(frames), wideStep,
                                                      period, reference)});
    }
    for (std::size_t ear = 0; ear < ears.size(); ++ear) {
        Curve curve;
        curve.style = lineOf(ear, false);
        for (std::size_t i = 0; i < frames; i += step) {
            curve.run.push_back({static_cast<double>(i) * period, decays[ear][i]});
        }
        curves.push_back(std::move(curve));
    }
    Plot plot;
    plot.title = "Energy decay";
    plot.unit = "dB, thin: level";
    plot.ears = true;
    plot.kind = "high";
    plot.label = "Energy decay curve of both ears." + words;
    plot.across = ticksOf(times, 6, "s");
    plot.upright = ticksOf(levels, 5, "");
    plot.body = curvesMarkup(times, levels, plot.across, plot.upright, curves);
    return plotMarkup(plot);
}

std::string secondsCell(const std::optional<double>& seconds) {
    return seconds ? fmt::format("<td>{:.2f}</td>", *seconds)
                   : std::string("<td>&#8211;<span class=\"unseen\"> cannot be told</span></td>");
}

std::string decayTable(const Ears& ears, int sampleRate) {
    const auto left = octaveDecays(ears[0], sampleRate);
    const auto right = octaveDecays(ears[1], sampleRate);
    std::string rows;
    for (std::size_t octave = 0; octave < left.size(); ++octave) {
        const double hertz = left[octave].hertz;
        const std::string name = hertz < 1000.0 ? fmt::format("{:g} Hz", hertz)
                                                : fmt::format("{:g} kHz", hertz / 1000.0);
        rows += fmt::format("<tr><th scope=\"row\">{}</th>{}{}{}{}</tr>\n", name,
                            secondsCell(left[octave].t20), secondsCell(right[octave].t20),
                            secondsCell(left[octave].t30), secondsCell(right[octave].t30));
    }
    return fmt::format(
        "<div class=\"decay\"><table class=\"numbers\">\n<caption>Reverberation time "
        "<span class=\"unit\">seconds</span></caption>\n"
        "<thead><tr><th scope=\"col\" rowspan=\"2\">Octave</th>"
        "<th scope=\"colgroup\" colspan=\"2\">T20</th><th scope=\"colgroup\" colspan=\"2\">T30</th>"
        "</tr><tr><th scope=\"col\" class=\"left\">left</th><th scope=\"col\" class=\"right\">right"
        "</th><th scope=\"col\" class=\"left\">left</th><th scope=\"col\" "
        "class=\"right\">right</th>"
        "</tr></thead>\n<tbody>\n{}</tbody></table>\n"
        "<p class=\"note\">From the decay between &#8722;5 and &#8722;25 dB (T20) or &#8722;35 dB "
        "(T30), without the first {} ms. A dash: the response does not show it.</p></div>\n",
        rows, shownNumber(1000.0 * directSeconds, 0));
}

}  // namespace

std::string responseMarkup(const ReportResponse& response, int sampleRate) {
    const Ears ears = earsOf(response);
    std::string markup = fmt::format("<h3>Response: {}</h3>\n", escapedXml(response.label));
    if (ears[0].empty()) {
        return markup + "<p class=\"note\">The response is empty.</p>\n";
    }
    return markup + "<div class=\"response\">\n" + arrivalGraph(ears, sampleRate) +
           decayGraph(ears, sampleRate) + decayTable(ears, sampleRate) + "</div>\n";
}

}  // namespace tessaly
