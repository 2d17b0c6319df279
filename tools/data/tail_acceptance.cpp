// Limits of tails, and their tables.
#include "data/tail_acceptance.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

#include "base/precision.h"
#include "data/room_composition.h"

namespace tessaly::data {

namespace {

constexpr double longDecay = 1.5;   // s: enough degrees of freedom for closer limits
constexpr double shortDecay = 0.1;  // s: falls within one window or frame
constexpr double infinite = std::numeric_limits<double>::infinity();

Range around(double value, double tolerance) { return {value - tolerance, value + tolerance}; }
Range within(double largest) { return {-infinite, largest}; }

/// Single echoes, and decays as long as an octave filter rings, follow no line.
bool decayIsLimited(const TailDesign& design) {
    return design.shape != TailShape::outdoor && design.shape != TailShape::echoes &&
           design.decay.mid() >= shortDecay;
}

double decayTolerance(std::size_t octave, bool isLong) {
    if (isLong || octave >= 2) {
        return 12.0;
    }
    return octave == 1 ? 25.0 : 40.0;
}

void add(TailMeasures& tail,
         std::string name,
         std::vector<double> values,
         Range range,
         int decimals = 2) {
    std::vector<Range> ranges(values.size(), range);
    tail.figures.push_back({std::move(name), std::move(values), std::move(ranges), decimals});
}

void addDecay(TailMeasures& tail) {
    const bool isLong = tail.design->decay.mid() >= longDecay;
    for (std::size_t octave = 0; octave < decayOctaves; ++octave) {
        const double hertz = lowestDecayHertz * std::exp2(static_cast<double>(octave));
        add(tail,
            fmt::format("decay re design, {:.0f} Hz, T {} s: %", hertz,
                        isLong ? ">= 1.5" : "< 1.5"),
            {100.0 * (tail.times[octave] / tail.designed[octave] - 1.0)},
            around(0.0, decayTolerance(octave, isLong)), 1);
    }
}

void addCoherence(TailMeasures& tail) {
    const bool isLong = tail.design->decay.mid() >= longDecay;
    std::vector<double> values(
        tail.coherence.begin(),
        tail.coherence.begin() + static_cast<std::ptrdiff_t>(tail.coherenceCount));
    add(tail,
        fmt::format("coherence by octaves less the set's, T {} s", isLong ? ">= 1.5" : "< 1.5"),
        std::move(values), around(0.0, isLong ? 0.12 : 0.2));
}

void addLevels(TailMeasures& tail, const TailOptions& options) {
    const bool balanced = options.level == TailLevel::rule && !std::isnan(tail.directToTail);
    if (!balanced) {
        return;
    }
    add(tail, "direct to tail less the rule, dB", {tail.directToTail - tail.wantedDirectToTail},
        around(0.0, 0.1));
    if (tail.design->enclosed && !tail.measured && options.wetDb == 0.0) {
        add(tail, "direct to all of the room less the target, dB",
            {tail.directToRoom - tail.design->directToReverb}, around(0.0, 2.5));
    }
}

void addFigures(TailMeasures& tail, const TailOptions& options, bool levelIsKnown) {
    const TailSamplesCheck& samples = tail.samples;
    add(tail, "samples that are no numbers", {static_cast<double>(samples.notFinite)}, within(0.0),
        0);
    if (samples.notFinite > 0) {
        return;
    }
    if (!tail.measured) {
        if (decayIsLimited(*tail.design)) {
            addDecay(tail);
        }
        if (tail.design->decay.mid() >= shortDecay) {
            add(tail, "echo density after twice the onset", {tail.density.late}, {0.8, 1.15});
            if (tail.coherenceCount > 0 && tail.design->enclosed) {
                addCoherence(tail);
            }
        }
        add(tail, "sum of samples re root of energy, dB", {samples.sumDecibels}, within(-100.0), 0);
        add(tail, "sounding samples before the start",
            {static_cast<double>(samples.soundingBefore)}, within(0.0), 0);
        add(tail, "last sample", {samples.last}, within(0.0), 0);
        add(tail, "largest step in the last 60 re peak", {samples.lastJump}, within(1e-4), -1);
        // As dense as at the design rate: responses grow as their samples get fewer.
        const double peak = samples.peak * tail.sampleRate / tailDesignRate;
        const bool reference = options == TailOptions{};
        add(tail, "peak, as at 48000 Hz", {peak}, reference ? Range{0.1, 9.0} : Range{});
    }
    if (levelIsKnown) {
        addLevels(tail, options);
    }
}

double decibels(double ratio) { return 10.0 * std::log10(ratio); }

}  // namespace

SetCoherence::SetCoherence(const HrirSet& hrirs)
    : enclosed_(diffuseCoherence(hrirs, directionWeights(TailDesign{}))), corridor_(), open_() {
    TailDesign design;
    design.corridor = true;
    corridor_ = diffuseCoherence(hrirs, directionWeights(design));
    design.corridor = false;
    design.enclosed = false;
    open_ = diffuseCoherence(hrirs, directionWeights(design));
}

const Coherence& SetCoherence::of(const TailDesign& design) const {
    if (design.corridor) {
        return corridor_;
    }
    return design.enclosed ? enclosed_ : open_;
}

TailMeasures measureTail(const TailDesign& design,
                         const std::vector<float>& tail,
                         int sampleRate,
                         const HrirSet* hrirs,
                         const SetCoherence* coherence,
                         const TailOptions& options,
                         const TailOrigin& origin) {
    TailMeasures result;
    result.design = &design;
    result.sampleRate = sampleRate;
    result.measured = !origin.file.empty();
    result.samples = checkTailSamples(tail, sampleRate, design);
    result.directToTail = result.directToRoom = std::numeric_limits<double>::quiet_NaN();
    result.wantedDirectToTail = design.directToTail() - options.wetDb - origin.askedDb;
    if (result.samples.notFinite == 0) {
        result.times = measuredTimes(tail, sampleRate, design);
        result.designed = designedTimes(tail.size() / earCount, sampleRate, design);
        result.density = echoDensity(tail, sampleRate, design);
        if (hrirs != nullptr && coherence != nullptr) {
            result.coherence = tailCoherence(tail, sampleRate, 2.0 * design.onsetSeconds);
            while (result.coherenceCount < coherenceBands &&
                   lowestCoherenceHertz *
                           std::exp2(static_cast<double>(result.coherenceCount + 1)) <=
                       0.5 * sampleRate) {
                const std::size_t band = result.coherenceCount++;
                result.coherence[band] -= coherence->of(design)[band];
            }
            std::vector<double> pairs(tail.size());
            std::transform(tail.begin(), tail.end(), pairs.begin(), [&design](float sample) {
                return wide(sample) * wide(design.presetGain);
            });
            const double direct = directEnergy(*hrirs);
            result.directToTail = decibels(direct / middleEnergy(pairs, sampleRate));
            result.directToRoom =
                decibels(direct / middleEnergy(composeRoom(design, *hrirs, tail), sampleRate));
        }
    }
    addFigures(result, options, origin.matchLevel);
    return result;
}

FigureColumn summariseTails(const std::string& title, const std::vector<TailMeasures>& tails) {
    FigureColumn column{title, {}};
    for (const TailMeasures& tail : tails) {
        for (const Figure& figure : tail.figures) {
            const auto known =
                std::find_if(column.figures.begin(), column.figures.end(),
                             [&figure](const Figure& other) { return other.name == figure.name; });
            Figure& summary = known != column.figures.end()
                                  ? *known
                                  : column.figures.emplace_back(
                                        Figure{figure.name,
                                               {infinite, -infinite},
                                               {figure.ranges.front(), figure.ranges.front()},
                                               figure.decimals});
            for (const double value : figure.values) {
                // A NaN stays: it is out of every range.
                summary.values[0] = value >= summary.values[0] ? summary.values[0] : value;
                summary.values[1] = value <= summary.values[1] ? summary.values[1] : value;
            }
        }
    }
    return column;
}

std::string tailTable(const std::vector<TailMeasures>& tails) {
    std::string text = fmt::format("{:<28}{:>6}{:>8}{:>7}  {:<42}{:>8}{:>7}{:>10}{:>8}{:>8}{:>8}\n",
                                   "tail", "T s", "V m3", "on ms", "decay s at 125 .. 8000 Hz",
                                   "density", "peak", "coherence", "target", "tail", "total");
    for (const TailMeasures& tail : tails) {
        const TailDesign& design = *tail.design;
        std::string times;
        for (const double seconds : tail.times) {
            times += fmt::format("{:<6.2f}", seconds);
        }
        double coherence = 0.0;
        for (const double value : tail.coherence) {
            coherence = std::max(coherence, std::abs(value));
        }
        text += fmt::format(
            "{:<28}{:>6.2f}{:>8.0f}{:>7.0f}  {:<42}{:>8.2f}{:>7.2f}{:>10.2f}{:>8.1f}{:>8.1f}"
            "{:>8.1f}{}\n",
            fmt::format("{} {}", design.preset, design.name), design.decay.mid(), design.volume,
            1e3 * design.onsetSeconds, times, tail.density.late, tail.samples.peak, coherence,
            design.directToReverb, tail.directToTail, tail.directToRoom,
            tail.measured ? "  measured" : "");
    }
    return text;
}

}  // namespace tessaly::data
