// From a measurement on disk to packed files.
#include "data/hrir_command.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>

#include "data/data_error.h"

namespace tessaly::data {

namespace {

constexpr double largestGain = 40.0;  // dB

void report(const HrirCommand& command,
            const Measurement& measurement,
            const TargetField& target,
            const std::vector<HrirSet>& sets,
            const OutputDirectory& output) {
    fmt::print("{}: {} directions, {} taps at {} Hz; measured from elevation {} to {}\n",
               measurement.provenance.path.filename().string(), measurement.count(),
               measurement.taps, measurement.sampleRate, target.grid.lowestElevation,
               target.grid.highestElevation);
    fmt::print(
        "{}; sides differ by {:.2f} dB rms{}; gain {:+.2f} dB\n",
        command.options.diffuseFieldEqualisation ? "diffuse-field equalised" : "not equalised",
        target.grid.mirrorDecibels, target.grid.symmetric ? " and are averaged" : "",
        target.equalisation.gainDb);
    for (const HrirSet& set : sets) {
        fmt::print("{}  {} Hz, {} taps\n",
                   (output.path() / rateEntry(set.sampleRate).fileName).string(), set.sampleRate,
                   set.taps);
    }
    const int always = rateTable().front().sampleRate;
    if (std::find(command.rates.begin(), command.rates.end(), always) == command.rates.end()) {
        fmt::print("{} Hz was built too: the plug-in knows a data directory by that file\n",
                   always);
    }
    fmt::print("{} and {} tell sources and terms\n", manifestName, attributionName);
}

}  // namespace

void runHrir(const HrirCommand& command) {
    // Everything that can be refused without work is refused first.
    const std::vector<int> rates = ratesToBuild(command.rates);
    for (const int rate : rates) {
        tapsFor(command.options, rate);
    }
    if (!(std::abs(command.options.gainDb) <= largestGain)) {
        throw DataError("gain is {} dB, expected -{} to {}", command.options.gainDb, largestGain,
                        largestGain);
    }
    Progress progress(stderr);
    OutputDirectory output(command.directory);
    progress.stage("importing", 1);
    const Measurement measurement = importMeasurement(command.source);
    const TargetField target = buildTarget(measurement, command.options, progress);
    const std::vector<HrirSet> sets =
        addHrirFiles(measurement, target, command.options, rates, output, progress);
    output.commit();
    progress.finish();
    report(command, measurement, target, sets, output);
}

}  // namespace tessaly::data
