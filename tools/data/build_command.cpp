// From a measurement on disk to all files of a data directory.
#include "data/build_command.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>

#include "data/data_error.h"
#include "data/headphone_table.h"
#include "data/packed_tails.h"
#include "data/synthesis.h"
#include "data/tail_builder.h"
#include "data/wave_image.h"

namespace tessaly::data {

namespace {

constexpr double largestGain = 40.0;  // dB

/// All that a user gives, read and checked: nothing is refused once building has begun.
struct Inputs {
    std::vector<int> hrirRates;
    std::vector<int> tailRates;
    MeasuredTails measuredTails;
    ImportedFilters filters;
    Measurement measurement;
};

std::vector<int> wantedRates(const BuildCommand& command) {
    std::vector<int> rates;
    for (const int rate : ratesToBuild(command.rates)) {
        if (std::find(command.rates.begin(), command.rates.end(), rate) != command.rates.end()) {
            rates.push_back(rate);
        }
    }
    return rates;
}

Inputs readInputs(const BuildCommand& command) {
    Inputs inputs;
    inputs.hrirRates = ratesToBuild(command.rates);
    inputs.tailRates = wantedRates(command);
    for (const int rate : inputs.hrirRates) {
        tapsFor(command.hrirOptions, rate);
    }
    if (!(std::abs(command.hrirOptions.gainDb) <= largestGain)) {
        throw DataError("gain is {} dB, expected -{} to {}", command.hrirOptions.gainDb,
                        largestGain, largestGain);
    }
    checkTailOptions(command.tailOptions);
    if (command.tails && !command.measuredTails.empty()) {
        inputs.measuredTails = importTails(command.measuredTails);
    }
    for (const std::string& filter : command.filters) {
        importFilter(filter, command.headphoneOptions.sampleRate, command.minimumPhaseFilters,
                     inputs.filters);
    }
    inputs.measurement = importMeasurement(command.source);
    return inputs;
}

class Build {
public:
    explicit Build(const BuildCommand& command)
        : command_(command), output_(command.directory), progress_(stderr) {
        progress_.stage("importing", 1);
        inputs_ = readInputs(command);
    }

    void run() {
        target_ = buildTarget(inputs_.measurement, command_.hrirOptions, progress_);
        if (command_.hrir) {
            buildHrir();
        }
        if (command_.tails) {
            buildTailFiles();
        }
        if (command_.headphones) {
            buildHeadphoneFiles();
        }
        records_.write(output_);
        progress_.stage("writing", 1);
        output_.commit();
        progress_.finish();
        for (const std::string& line : report_) {
            fmt::print("{}\n", line);
        }
        fmt::print("{} and {} tell sources and terms\n", manifestName, attributionName);
    }

private:
    std::string pathOf(const std::string& file) const { return (output_.path() / file).string(); }

    void buildHrir() {
        sets_ = addHrirFiles(inputs_.measurement, target_, command_.hrirOptions, inputs_.hrirRates,
                             output_, records_, progress_);
        report_.push_back(fmt::format(
            "{}: {} directions, {} taps at {} Hz; measured from elevation {} to {}",
            inputs_.measurement.provenance.path.filename().string(), inputs_.measurement.count(),
            inputs_.measurement.taps, inputs_.measurement.sampleRate, target_.grid.lowestElevation,
            target_.grid.highestElevation));
        report_.push_back(fmt::format(
            "{}; sides differ by {:.2f} dB rms{}; gain {:+.2f} dB",
            command_.hrirOptions.diffuseFieldEqualisation ? "diffuse-field equalised"
                                                          : "not equalised",
            target_.grid.mirrorDecibels, target_.grid.symmetric ? " and are averaged" : "",
            target_.equalisation.gainDb));
        for (const HrirSet& set : sets_) {
            report_.push_back(fmt::format("{}  {} Hz, {} taps",
                                          pathOf(rateEntry(set.sampleRate).fileName),
                                          set.sampleRate, set.taps));
        }
        const int always = rateTable().front().sampleRate;
        if (std::find(command_.rates.begin(), command_.rates.end(), always) ==
            command_.rates.end()) {
            report_.push_back(fmt::format(
                "{} Hz was built too: the plug-in knows a data directory by that file", always));
        }
    }

    /// The set that tails are made from.
    const HrirSet& tailSet() {
        auto found = std::find_if(sets_.begin(), sets_.end(), [](const HrirSet& set) {
            return set.sampleRate == tailDesignRate;
        });
        if (found == sets_.end()) {
            sets_.push_back(synthesise(target_.grid.field, tailDesignRate,
                                       tapsFor(command_.hrirOptions, tailDesignRate), progress_));
            found = sets_.end() - 1;
        }
        return *found;
    }

    void buildTailFiles() {
        BuiltTails built = buildTails(tailSet(), command_.tailOptions, inputs_.measuredTails,
                                      inputs_.tailRates, progress_);
        const Provenance& provenance = inputs_.measurement.provenance;
        for (const int rate : inputs_.tailRates) {
            ManifestEntry entry;
            entry.file = tailFileName(rate);
            entry.content = fmt::format("reverb tails of presets {} to {}, {} Hz", firstTailPreset,
                                        reverbPresetCount, rate);
            entry.source = fmt::format("made from the HRIR set of {}", provenance.path.string());
            entry.sourceSha256 = provenance.sha256;
            entry.licence = provenance.licence;
            entry.options = toText(command_.tailOptions);
            for (const TailOrigin& origin : built.origins) {
                entry.parts.push_back(toText(origin));
            }
            records_.add(output_, std::move(entry), std::move(built.images[rate]));
            report_.push_back(fmt::format(
                "{}  {} Hz, {} tails{}", pathOf(tailFileName(rate)), rate, tailPresetCount,
                inputs_.measuredTails.empty()
                    ? ""
                    : fmt::format(", {} of them measured", inputs_.measuredTails.size())));
        }
        records_.addTerms(provenance.sha256, provenance.attribution);
        for (const auto& [preset, tail] : inputs_.measuredTails) {
            records_.addTerms(
                tail.sha256,
                fmt::format("{}: measured tail of preset {}.\nSource: {}\n"
                            "Licence: {}\n",
                            tail.rule.file, preset, tail.rule.source, tail.rule.licence));
        }
    }

    void buildHeadphoneFiles() {
        progress_.stage("making headphone filters", 1);
        const Provenance& provenance = inputs_.measurement.provenance;
        for (const HeadphoneFile& file :
             buildHeadphones(command_.headphoneOptions, inputs_.filters, target_.grid.field)) {
            ManifestEntry entry;
            entry.file = file.name;
            entry.content = file.content;
            entry.options = toText(command_.headphoneOptions);
            if (file.imported != nullptr) {
                entry.source = file.imported->path.string();
                entry.sourceSha256 = file.imported->sha256;
                entry.licence = "not stated; see the origin of the file";
                entry.options += " " + std::string(importedWord) + " " + file.imported->kind;
                records_.addTerms(entry.sourceSha256,
                                  fmt::format("{}, imported as a headphone filter; its terms are "
                                              "not stated.\n",
                                              file.imported->path.filename().string()));
            } else if (file.row == frontalRow) {
                entry.source = provenance.path.string();
                entry.sourceSha256 = provenance.sha256;
                entry.licence = provenance.licence;
                records_.addTerms(provenance.sha256, provenance.attribution);
            } else {
                const HeadphoneRow& row = headphoneTable()[static_cast<std::size_t>(file.row - 1)];
                entry.source = fmt::format("AutoEq, measured by {}", row.measuredBy);
                entry.sourceSha256 = headphoneTableSha256();
                entry.licence = headphoneTableLicence();
                records_.addTerms(entry.sourceSha256, headphoneTableAttribution());
            }
            records_.add(output_, std::move(entry),
                         waveImage(file.taps, 1, command_.headphoneOptions.sampleRate));
        }
        report_.push_back(fmt::format("{}  {} headphone filters of {} taps at {} Hz, and {}",
                                      output_.path().string(), headphoneRowCount, headphoneTaps,
                                      command_.headphoneOptions.sampleRate, smallFilterName));
    }

    const BuildCommand& command_;
    OutputDirectory output_;
    Progress progress_;
    Inputs inputs_;
    TargetField target_;
    DirectoryRecords records_;
    std::vector<HrirSet> sets_;
    std::vector<std::string> report_;
};

}  // namespace

void runBuild(const BuildCommand& command) { Build(command).run(); }

}  // namespace tessaly::data
