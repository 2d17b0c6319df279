// Works out the rows of the HRIR table, and states their limits.
#include "data/acceptance.h"

#include <algorithm>
#include <cmath>

#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr int logPoints = 400;
constexpr double lowestHertz = 200.0;
constexpr std::size_t wideTaps = 256;

/// Values of the reference set at one rate.
struct ReferenceValues {
    double highestHertz;  // of spectral comparisons
    int highestBand;
    double levelDifferenceHertz;
    double levelDifference;  // dB, phi 90, left less right
    double lowestEnergy;     // dB of the frontal ear
    double highestEnergy;
    double frontalEnergy;  // sum of squares of one ear
};

ReferenceValues referenceValues(int sampleRate) {
    switch (sampleRate) {
        case 24000:
            return {10000.0, band8kHz, 11000.0, 11.0, -10.4, 7.8, 0.860};
        case 48000:
            return {16000.0, band16kHz, 16000.0, 15.0, -16.4, 5.5, 1.781};
        default:
            return {16000.0, band16kHz, 16000.0, 15.0, -16.0, 5.6, 1.740};
    }
}

constexpr double referenceDcGain = 1.105;
constexpr double octaveDifferences[] = {3.0, 3.4, 5.1, 6.0, 7.1, 10.3, 19.7};  // dB, 125..8000 Hz

Range around(double value, double tolerance) { return {value - tolerance, value + tolerance}; }
Range within(double largest) { return {-std::numeric_limits<double>::infinity(), largest}; }
Range above(double lowest) { return {lowest, std::numeric_limits<double>::infinity()}; }

class FigureMaker {
public:
    FigureMaker(const HrirSet& set,
                const SetAnalysis& analysis,
                const SetExpectations& expectations)
        : set_(set),
          analysis_(analysis),
          expectations_(expectations),
          reference_(referenceValues(set.sampleRate)),
          hertz_(logSpaced(lowestHertz, reference_.highestHertz, logPoints)) {}

    std::vector<Figure> make() {
        polarity();
        if (expectations_.target != nullptr) {
            spectralDifference();
        }
        timeDifferences();
        levelDifferences();
        neighbours();
        energies();
        flatness();
        symmetry();
        return std::move(figures_);
    }

private:
    /// A limit that only the reference set is held to.
    Range ifReference(Range range) const { return expectations_.reference ? range : Range{}; }

    void add(std::string name,
             std::vector<double> values,
             std::vector<Range> ranges,
             int decimals = 2) {
        figures_.push_back({std::move(name), std::move(values), std::move(ranges), decimals});
    }

    const double* curve(std::size_t entry, int ear) const {
        return analysis_.levels.curve(entry, ear);
    }
    double level(std::size_t entry, int ear, double hertz) const {
        return levelAt(curve(entry, ear), analysis_.levels.bins, analysis_.levels.binHertz, hertz);
    }

    void polarity() {
        add("responses with a negative largest tap; frontal largest tap",
            {static_cast<double>(analysis_.negativeTaps), analysis_.frontalTap},
            {ifReference(within(0.0)), above(1e-6)});
        add("largest tap; largest sum of absolute taps",
            {analysis_.largestTap, analysis_.largestTapSum}, {Range{}, Range{}});
    }

    /// Rms over frequency of each response at the measured directions, in dB.
    void spectralDifference() {
        const TargetField& target = *expectations_.target;
        const LevelCurves& measured = target.measured.levels;
        std::vector<double> narrow;
        std::vector<double> third;
        std::vector<double> wanted(measured.bins);
        for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
            if (target.grid.measuredAt[entry] < 0) {
                continue;
            }
            const auto source = static_cast<std::size_t>(target.grid.measuredAt[entry]);
            for (int ear = 0; ear < earCount; ++ear) {
                for (std::size_t k = 0; k < measured.bins; ++k) {
                    wanted[k] = measured.curve(source, ear)[k] - target.equalisation.subtracted[k] +
                                target.equalisation.gainDb;
                }
                double sum = 0.0;
                for (const double hertz : hertz_) {
                    const double difference =
                        level(entry, ear, hertz) -
                        levelAt(wanted.data(), wanted.size(), measured.binHertz, hertz);
                    sum += difference * difference;
                }
                narrow.push_back(std::sqrt(sum / logPoints));
                sum = 0.0;
                for (int band = lowestBand; band <= reference_.highestBand; ++band) {
                    const double difference =
                        bandLevel(curve(entry, ear), analysis_.levels.bins,
                                  analysis_.levels.binHertz, band) -
                        bandLevel(wanted.data(), wanted.size(), measured.binHertz, band);
                    sum += difference * difference;
                }
                third.push_back(std::sqrt(sum / (reference_.highestBand - lowestBand + 1)));
            }
        }
        if (narrow.empty()) {
            return;
        }
        // An unequalised response is as long as the loudspeaker's and cannot be kept so closely.
        const bool limited = expectations_.equalised;
        const bool wide = set_.taps >= wideTaps;
        const Spread n = spreadOf(narrow);
        const Spread t = spreadOf(third);
        const auto only = [limited](double largest) { return limited ? within(largest) : Range{}; };
        add("difference to the measurement, narrow: mean / p95 / max dB",
            {n.mean, n.percentile95, n.largest},
            {only(wide ? 0.8 : 1.0), only(2.2), only(wide ? 3.0 : 3.5)});
        add("difference to the measurement, third-octave: mean / p95 / max dB",
            {t.mean, t.percentile95, t.largest}, {only(0.3), only(0.7), only(1.2)});
    }

    void timeDifferences() {
        constexpr double micro = 1e6;
        double largest = 0.0;
        double squares = 0.0;
        double offTarget = 0.0;
        double step = 0.0;
        const std::vector<double>& itd = analysis_.itdSeconds;
        for (std::size_t entry = 0; entry < itd.size(); ++entry) {
            const GridEntry& at = packedOrder()[entry];
            const double deviation = itd[entry] - woodworth({static_cast<double>(at.phi),
                                                             static_cast<double>(at.theta)});
            largest = std::max(largest, std::abs(deviation));
            squares += deviation * deviation;
            if (expectations_.target != nullptr) {
                const double wanted = expectations_.target->grid.field.itdSeconds[entry];
                offTarget = std::max(offTarget, std::abs(itd[entry] - wanted));
            }
            for (const int next : {packedIndex(at.phi + gridStepDegrees, at.theta),
                                   packedIndex(at.phi, at.theta + gridStepDegrees)}) {
                step = std::max(step, std::abs(itd[entry] - itd[static_cast<std::size_t>(next)]));
            }
        }
        add("ITD less the sphere's: max / rms us",
            {micro * largest, micro * std::sqrt(squares / static_cast<double>(itd.size()))},
            {ifReference(within(70.0)), ifReference(within(30.0))}, 1);
        if (expectations_.target != nullptr) {
            add("ITD less its target: max us", {micro * offTarget}, {within(5.0)}, 1);
        }
        add("ITD at phi 90; largest step to a 5-degree neighbour, us",
            {micro * analysis_.sideItdSeconds, micro * step},
            {expectations_.reference ? Range{640.0, 690.0} : above(0.0), ifReference(within(60.0))},
            1);
    }

    double bandDifference(std::size_t entry, double fromHertz, double toHertz) const {
        double power[earCount] = {};
        const double step = analysis_.levels.binHertz;
        for (auto k = static_cast<std::size_t>(std::ceil(fromHertz / step));
             k < analysis_.levels.bins && static_cast<double>(k) * step <= toHertz; ++k) {
            for (int ear = 0; ear < earCount; ++ear) {
                power[ear] += powerOf(curve(entry, ear)[k]);
            }
        }
        return 10.0 * std::log10(power[leftEar] / power[rightEar]);
    }

    void levelDifferences() {
        const auto side = static_cast<std::size_t>(packedIndex(90, 0));
        add("level left - right at phi 90, dB",
            {bandDifference(side, lowestHertz, reference_.levelDifferenceHertz)},
            {expectations_.reference ? around(reference_.levelDifference, 1.0) : above(0.0)}, 1);
        std::vector<double> values;
        std::vector<Range> ranges;
        double centre = 125.0;
        for (const double expected : octaveDifferences) {
            values.push_back(
                bandDifference(side, centre / std::sqrt(2.0), centre * std::sqrt(2.0)));
            ranges.push_back(ifReference(around(expected, 1.5)));
            centre *= 2.0;
        }
        add("same by octave 125..8000, dB", values, ranges, 1);
    }

    void neighbours() {
        std::vector<double> azimuth;
        std::vector<double> elevation;
        for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
            const GridEntry& at = packedOrder()[entry];
            if (at.theta == 90) {
                continue;
            }
            const int right = packedIndex(at.phi - gridStepDegrees, at.theta);
            const int higher = packedIndex(at.phi, at.theta + gridStepDegrees);
            for (int ear = 0; ear < earCount; ++ear) {
                if (at.theta > -90) {
                    azimuth.push_back(difference(entry, right, ear));
                }
                elevation.push_back(difference(entry, higher, ear));
            }
        }
        const Spread a = spreadOf(azimuth);
        const Spread e = spreadOf(elevation);
        add("difference of neighbours in azimuth: mean / max dB", {a.mean, a.largest},
            {ifReference(within(0.9)), ifReference(within(5.5))});
        add("difference of neighbours in elevation: mean / max dB", {e.mean, e.largest},
            {ifReference(within(1.3)), ifReference(within(3.5))});
    }

    double difference(std::size_t entry, int other, int ear) const {
        double sum = 0.0;
        for (const double hertz : hertz_) {
            const double value =
                level(entry, ear, hertz) - level(static_cast<std::size_t>(other), ear, hertz);
            sum += value * value;
        }
        return std::sqrt(sum / logPoints);
    }

    void energies() {
        add("energy before the onsets: all responses; worst, dB re total",
            {analysis_.preOnsetDecibels, analysis_.worstPreOnsetDecibels},
            {within(-20.0), within(-15.0)}, 1);
        const auto front = static_cast<std::size_t>(packedIndex(0, 0));
        const double frontal = analysis_.energies[leftEar][front];
        const double otherEar = analysis_.energies[rightEar][front];
        double lowest = frontal;
        double highest = frontal;
        for (const std::vector<double>& ear : analysis_.energies) {
            lowest = std::min(lowest, *std::min_element(ear.begin(), ear.end()));
            highest = std::max(highest, *std::max_element(ear.begin(), ear.end()));
        }
        add("energy re frontal: min / max dB",
            {10.0 * std::log10(lowest / frontal), 10.0 * std::log10(highest / frontal)},
            {ifReference(around(reference_.lowestEnergy, 1.0)),
             ifReference(around(reference_.highestEnergy, 1.0))},
            1);
        const double energy = reference_.frontalEnergy;
        add("frontal: sum of squares left, right; DC gain",
            {frontal, otherEar, analysis_.frontalDcGain},
            {ifReference(around(energy, 0.05 * energy)), ifReference(around(energy, 0.05 * energy)),
             ifReference(around(referenceDcGain, 0.05 * referenceDcGain))},
            3);
    }

    void flatness() {
        const std::vector<double> diffuse = diffuseLevel(analysis_.levels);
        std::vector<double> bands;
        double mean = 0.0;
        for (int band = lowestBand; band <= reference_.highestBand; ++band) {
            bands.push_back(
                bandLevel(diffuse.data(), diffuse.size(), analysis_.levels.binHertz, band));
            mean += bands.back();
        }
        mean /= static_cast<double>(bands.size());
        double worst = 0.0;
        for (const double band : bands) {
            worst = std::max(worst, std::abs(band - mean));
        }
        add("diffuse field: mean; largest third-octave deviation, dB", {mean, worst},
            {Range{}, expectations_.equalised ? within(0.2) : Range{}});
    }

    void symmetry() {
        add("mirror error", {analysis_.mirrorError},
            {expectations_.symmetric ? within(1e-6) : Range{}}, -1);
    }

    const HrirSet& set_;
    const SetAnalysis& analysis_;
    const SetExpectations& expectations_;
    ReferenceValues reference_;
    std::vector<double> hertz_;
    std::vector<Figure> figures_;
};

}  // namespace

bool Range::limited() const noexcept { return std::isfinite(low) || std::isfinite(high); }

bool Figure::passed() const noexcept {
    for (std::size_t i = 0; i < values.size(); ++i) {
        if (!ranges[i].contains(values[i])) {
            return false;
        }
    }
    return true;
}

std::vector<Figure> hrirFigures(const HrirSet& set,
                                const SetExpectations& expectations,
                                Progress& progress) {
    const SetAnalysis analysis = analyseSet(set, progress);
    if (analysis.notFinite > 0 || analysis.silentResponses > 0) {
        return {{"samples that are no numbers; silent responses",
                 {static_cast<double>(analysis.notFinite),
                  static_cast<double>(analysis.silentResponses)},
                 {within(0.0), within(0.0)},
                 0}};
    }
    return FigureMaker(set, analysis, expectations).make();
}

}  // namespace tessaly::data
