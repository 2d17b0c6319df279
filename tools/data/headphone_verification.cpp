// Reads the headphone filters through the engine's reader and compares them with their curves.
#include <algorithm>
#include <cmath>

#include "data/data_error.h"
#include "data/headphone_builder.h"
#include "data/headphone_table.h"
#include "data/library_reader.h"
#include "data/set_analysis.h"
#include "data/synthesis.h"
#include "data/verification.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

constexpr double lowestHertz = 200.0;
constexpr double highestHertz = 16000.0;
constexpr double highestShare = 0.45;  // of the rate
constexpr int points = 400;
constexpr int highestFrontalBand = 10;  // third-octave around 10 kHz, below 12 kHz

using Level = std::function<double(double hertz)>;

constexpr double infinite = std::numeric_limits<double>::infinity();

struct Difference {
    double rms = 0.0;
    double largest = 0.0;
};

Difference differenceOf(const Level& found, const Level& wanted, int sampleRate) {
    Difference result;
    const double top = std::min(highestHertz, highestShare * sampleRate);
    for (const double hertz : logSpaced(lowestHertz, top, points)) {
        const double off = found(hertz) - wanted(hertz);
        result.rms += off * off / points;
        result.largest = std::max(result.largest, std::abs(off));
    }
    result.rms = std::sqrt(result.rms);
    return result;
}

/// Third-octave levels of the frontal direction through its filter, re their mean.
Difference frontalFlatness(const Level& filter, const ResponseField& field, int sampleRate) {
    constexpr std::size_t taps = 256;
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    const Level left =
        responseLevel(synthesiseResponse(field, sampleRate, taps, front, leftEar), sampleRate);
    const Level right =
        responseLevel(synthesiseResponse(field, sampleRate, taps, front, rightEar), sampleRate);
    std::vector<double> bands;
    for (int band = lowestBand - 1; band <= highestFrontalBand; ++band) {
        const double centre = bandCentre(band);
        double power = 0.0;
        const std::vector<double> within =
            logSpaced(centre * std::exp2(-1.0 / 6.0), centre * std::exp2(1.0 / 6.0), 32);
        for (const double hertz : within) {
            power += powerOf(filter(hertz)) * (powerOf(left(hertz)) + powerOf(right(hertz)));
        }
        bands.push_back(10.0 * std::log10(power));
    }
    double mean = 0.0;
    for (const double band : bands) {
        mean += band / static_cast<double>(bands.size());
    }
    Difference result;
    for (const double band : bands) {
        result.rms += (band - mean) * (band - mean) / static_cast<double>(bands.size());
        result.largest = std::max(result.largest, std::abs(band - mean));
    }
    result.rms = std::sqrt(result.rms);
    return result;
}

class HeadphoneChecker {
public:
    HeadphoneChecker(const VerifiedDirectory& directory,
                     const TargetField* target,
                     Verification& result)
        : directory_(directory), target_(target), result_(result) {}

    void check(int row, const std::string& name) {
        if (!fs::exists(directory_.path / name)) {
            result_.failures.push_back(fmt::format("{} is missing", name));
            return;
        }
        const ManifestEntry entry = directory_.entryOf(name, result_);
        const HeadphoneOptions options =
            entry.options.empty() ? HeadphoneOptions{} : headphoneOptionsFromText(entry.options);
        const bool imported = entry.options.find(importedWord) != std::string::npos;
        const std::vector<double> taps =
            readHeadphoneFilter(directory_.path, name, options.sampleRate);
        const bool finite =
            std::all_of(taps.begin(), taps.end(), [](double tap) { return std::isfinite(tap); });
        if (!finite) {
            result_.failures.push_back(fmt::format("{} has samples that are no numbers", name));
            return;
        }
        if (name == smallFilterName) {
            checkSmall(taps, name, options, imported);
        } else {
            checkFilter(row, name, taps, options, imported);
        }
    }

    FigureColumn column{"headphones", {}};

private:
    void add(std::string name, std::vector<double> values, std::vector<Range> ranges) {
        column.figures.push_back({std::move(name), std::move(values), std::move(ranges), 2});
    }

    void checkSmall(const std::vector<double>& taps,
                    const std::string& name,
                    const HeadphoneOptions& options,
                    bool imported) {
        constexpr std::size_t zeros = 128;
        double before = 0.0;
        double behind = 0.0;
        for (std::size_t i = 0; i < taps.size(); ++i) {
            (i < zeros ? before : behind) += taps[i] * taps[i];
        }
        add(name + ": energy of the first half; of the second", {before, behind},
            {{0.0, 0.0}, {1e-6, infinite}});
        if (!imported) {
            const HeadphoneCurve wanted = builtInCurve(smallFilterRow, options, {});
            const Difference off = differenceOf(
                responseLevel(taps, options.sampleRate),
                [&wanted](double hertz) { return wanted.at(hertz); }, options.sampleRate);
            add(name + ": error from 200 Hz up: rms / max dB", {off.rms, off.largest},
                {{-infinite, 0.8}, {-infinite, 4.0}});
        }
    }

    void checkFilter(int row,
                     const std::string& name,
                     const std::vector<double>& taps,
                     const HeadphoneOptions& options,
                     bool imported) {
        const Level found = responseLevel(taps, options.sampleRate);
        double peak = -infinite;
        const double top = std::min(highestHertz, highestShare * options.sampleRate);
        for (const double hertz : logSpaced(20.0, top, points)) {
            peak = std::max(peak, found(hertz));
        }
        add(name + ": middle; highest level, dB", {middleLevel(found), peak},
            {{headphoneMiddleDb - 0.5, headphoneMiddleDb + 0.5},
             imported ? Range{} : Range{headphoneMiddleDb, headphoneMiddleDb + 10.5}});
        if (imported) {
            return;
        }
        if (row == frontalRow && target_ == nullptr) {
            result_.notes.push_back(
                fmt::format("{}: not compared, the measured set is not at hand", name));
            return;
        }
        const ResponseField none;
        const ResponseField& field = target_ != nullptr ? target_->grid.field : none;
        const HeadphoneCurve wanted = builtInCurve(row, options, field);
        const Difference off = differenceOf(
            found, [&wanted](double hertz) { return wanted.at(hertz); }, options.sampleRate);
        add(name + ": error from 200 Hz up: rms / max dB", {off.rms, off.largest},
            {{-infinite, 0.4}, {-infinite, 2.0}});
        if (row == frontalRow) {
            const Difference flat = frontalFlatness(found, field, options.sampleRate);
            add(name + ": frontal direction through it, third-octave: rms / max dB",
                {flat.rms, flat.largest}, {{-infinite, 1.0}, {-infinite, 3.5}});
        }
    }

    const VerifiedDirectory& directory_;
    const TargetField* target_;
    Verification& result_;
};

}  // namespace

bool hasHeadphones(const fs::path& directory) {
    const auto& rows = headphoneTable();
    return fs::exists(directory / smallFilterName) ||
           std::any_of(rows.begin(), rows.end(),
                       [&](const HeadphoneRow& row) { return fs::exists(directory / row.file); });
}

void verifyHeadphones(const VerifiedDirectory& directory,
                      const TargetField* target,
                      Verification& result) {
    HeadphoneChecker checker(directory, target, result);
    for (const HeadphoneRow& row : headphoneTable()) {
        checker.check(row.number, row.file);
    }
    checker.check(smallFilterRow, smallFilterName);
    result.headphoneColumns.push_back(checker.column);
    for (std::string& line : failedFigures(result.headphoneColumns)) {
        result.failures.push_back(std::move(line));
    }
}

}  // namespace tessaly::data
