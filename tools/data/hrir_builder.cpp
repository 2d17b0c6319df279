// Import, synthesis, manifest of the HRIR files.
#include "data/hrir_builder.h"

#include <algorithm>

#include "data/data_error.h"
#include "data/import_sofa.h"
#include "data/import_wav_list.h"
#include "data/synthesis.h"
#include "data/wave_image.h"

namespace tessaly::data {

Measurement importMeasurement(const HrirSource& source) {
    Measurement measurement =
        source.wavList.empty() ? importSofa(source.sofa) : importWavList(source.wavList);
    try {
        checkMeasurement(measurement);
    } catch (const DataError& error) {
        throw DataError("{}: {}", measurement.provenance.path.filename().string(), error.what());
    }
    return measurement;
}

std::vector<int> ratesToBuild(const std::vector<int>& wanted) {
    for (const int rate : wanted) {
        rateEntry(rate);
    }
    std::vector<int> rates;
    for (const RateEntry& entry : rateTable()) {
        const bool asked =
            std::find(wanted.begin(), wanted.end(), entry.sampleRate) != wanted.end();
        if (asked || entry.sampleRate == rateTable().front().sampleRate) {
            rates.push_back(entry.sampleRate);
        }
    }
    return rates;
}

std::size_t tapsFor(const HrirOptions& options, int sampleRate) {
    const int taps = options.taps.value_or(rateEntry(sampleRate).hrirLength);
    if (taps < fewestHrirTaps || taps > mostHrirTaps) {
        throw DataError("{} taps, expected {} to {}", taps, fewestHrirTaps, mostHrirTaps);
    }
    return static_cast<std::size_t>(taps);
}

std::vector<HrirSet> addHrirFiles(const Measurement& measurement,
                                  const TargetField& target,
                                  const HrirOptions& options,
                                  const std::vector<int>& rates,
                                  OutputDirectory& output,
                                  DirectoryRecords& records,
                                  Progress& progress) {
    const Provenance& provenance = measurement.provenance;
    std::vector<HrirSet> sets;
    for (const int rate : rates) {
        sets.push_back(synthesise(target.grid.field, rate, tapsFor(options, rate), progress));
        std::string bytes = waveImage(sets.back().pairs, earCount, rate);
        ManifestEntry entry;
        entry.file = rateEntry(rate).fileName;
        entry.content = fmt::format("HRIR set, {} Hz, {} taps, {} directions", rate,
                                    sets.back().taps, packedOrder().size());
        entry.source = provenance.path.string();
        entry.sourceSha256 = provenance.sha256;
        entry.licence = provenance.licence;
        entry.options = toText(options);
        records.add(output, std::move(entry), std::move(bytes));
    }
    records.addTerms(provenance.sha256, provenance.attribution);
    return sets;
}

}  // namespace tessaly::data
