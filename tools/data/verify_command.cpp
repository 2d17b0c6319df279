// Checks a data directory against its manifest, its source and the limits.
#include "data/verify_command.h"

#include <fmt/core.h>

#include <algorithm>
#include <map>
#include <memory>
#include <optional>

#include "data/data_error.h"
#include "data/hrir_builder.h"
#include "data/import_sofa.h"
#include "data/library_reader.h"
#include "data/sha256.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

constexpr int wideTaps = 256;

/// Rebuilds what sets were made from, each source and option line once.
class Targets {
public:
    Targets(fs::path sofa, std::vector<std::string>& notes, Progress& progress)
        : sofa_(std::move(sofa)), notes_(notes), progress_(progress) {}

    /// @param entry  of the set's file; source and checksum may be empty
    /// @return null, with a note, if the source is not at hand
    const TargetField* find(const ManifestEntry& entry, const HrirOptions& options) {
        HrirOptions common = options;
        common.taps.reset();
        const std::string key = entry.sourceSha256 + " " + toText(common);
        const auto known = targets_.find(key);
        if (known != targets_.end()) {
            return known->second.get();
        }
        std::unique_ptr<TargetField>& target = targets_[key];
        const std::optional<Measurement> measurement = import(entry);
        if (measurement) {
            target = std::make_unique<TargetField>(buildTarget(*measurement, common, progress_));
        }
        return target.get();
    }

private:
    std::optional<Measurement> import(const ManifestEntry& entry) {
        if (!sofa_.empty()) {
            return importMeasurement({sofa_, {}});
        }
        const bool packaged = entry.sourceSha256.empty() || entry.sourceSha256 == kemarSha256;
        std::string reason = "is missing";
        for (const fs::path& path : {fs::path(entry.source), fs::path(defaultSofaPath)}) {
            std::error_code ignored;
            if (path.empty() || !fs::exists(path, ignored) ||
                (path == defaultSofaPath && !packaged)) {
                continue;
            }
            try {
                Measurement measurement =
                    importMeasurement(isHdf5(path) ? HrirSource{path, {}} : HrirSource{{}, path});
                if (entry.sourceSha256.empty() ||
                    measurement.provenance.sha256 == entry.sourceSha256) {
                    return measurement;
                }
                reason = "has changed since";
            } catch (const DataError& error) {
                reason = std::string("cannot be imported: ") + error.what();
            }
        }
        notes_.push_back(fmt::format(
            "not compared with the measurement: {} {}",
            entry.source.empty() ? std::string(defaultSofaPath) : entry.source, reason));
        return std::nullopt;
    }

    fs::path sofa_;
    std::vector<std::string>& notes_;
    Progress& progress_;
    std::map<std::string, std::unique_ptr<TargetField>> targets_;
};

void checkRecord(const ManifestEntry& entry, const fs::path& path, Verification& result) {
    const std::string bytes = readIfPresent(path);
    if (bytes.size() != entry.size || sha256(bytes) != entry.sha256) {
        result.failures.push_back(fmt::format(
            "{}: size {} and checksum {}..., {} says {} and {}...", entry.file, bytes.size(),
            sha256(bytes).substr(0, 12), manifestName, entry.size, entry.sha256.substr(0, 12)));
    }
}

void checkLength(const HrirSet& set, const HrirOptions& options, Verification& result) {
    const RateEntry& rate = rateEntry(set.sampleRate);
    const int taps = static_cast<int>(set.taps);
    const bool known =
        options.taps ? taps == *options.taps : taps == rate.hrirLength || taps == wideTaps;
    if (!known) {
        result.failures.push_back(fmt::format("{}: {} taps, expected {}", rate.fileName, taps,
                                              options.taps.value_or(rate.hrirLength)));
    }
}

bool isReference(const ManifestEntry& entry, HrirOptions options) {
    if (options.taps == wideTaps) {
        options.taps.reset();
    }
    return options == HrirOptions{} &&
           (entry.sourceSha256.empty() || entry.sourceSha256 == kemarSha256);
}

}  // namespace

ManifestEntry VerifiedDirectory::entryOf(const std::string& file, Verification& result) const {
    const auto recorded =
        std::find_if(manifest.begin(), manifest.end(),
                     [&file](const ManifestEntry& other) { return other.file == file; });
    if (recorded != manifest.end()) {
        checkRecord(*recorded, path / file, result);
        return *recorded;
    }
    if (!manifest.empty()) {
        result.failures.push_back(fmt::format("{} is not in {}", file, manifestName));
    }
    return {};
}

Verification verifyDirectory(const fs::path& path, const fs::path& sofa) {
    Verification result;
    Progress progress(stderr);
    if (!fs::is_directory(path)) {
        throw DataError("{} is no directory", path.string());
    }
    VerifiedDirectory directory{path, parseManifest(readIfPresent(path / manifestName)), {}};
    if (directory.manifest.empty()) {
        result.notes.push_back(fmt::format("no {}: taken for the default set", manifestName));
    }
    Targets targets(sofa, result.notes, progress);
    const TargetField* headphoneTarget = nullptr;
    for (const RateEntry& rate : rateTable()) {
        if (!fs::exists(path / rate.fileName)) {
            continue;
        }
        const ManifestEntry entry = directory.entryOf(rate.fileName, result);
        const HrirOptions options = hrirOptionsFromText(entry.options);
        const HrirSet& set = directory.sets[rate.sampleRate] = readPackedSet(path, rate);
        checkLength(set, options, result);
        SetExpectations expectations;
        expectations.target = targets.find(entry, options);
        expectations.reference = isReference(entry, options);
        expectations.equalised = options.diffuseFieldEqualisation;
        expectations.symmetric = expectations.target != nullptr
                                     ? expectations.target->grid.symmetric
                                     : expectations.reference || options.symmetry == Symmetry::on;
        headphoneTarget = headphoneTarget != nullptr ? headphoneTarget : expectations.target;
        result.columns.push_back({fmt::format("{}/{}", rate.sampleRate, set.taps),
                                  hrirFigures(set, expectations, progress)});
    }
    for (const ManifestEntry& entry : directory.manifest) {
        if (!fs::exists(path / entry.file)) {
            result.failures.push_back(
                fmt::format("{} is missing, {} lists it", entry.file, manifestName));
        }
    }
    if (result.columns.empty() && !hasTails(path) && !hasHeadphones(path)) {
        throw DataError("no HRIR file in {}; expected {}", path.string(),
                        rateTable().front().fileName);
    }
    if (!fs::exists(path / rateTable().front().fileName)) {
        result.failures.push_back(
            fmt::format("{} is missing: the plug-in knows a data directory by it",
                        rateTable().front().fileName));
    }
    for (std::string& line : failedFigures(result.columns)) {
        result.failures.push_back(std::move(line));
    }
    verifyTails(directory, result, progress);
    if (hasHeadphones(path)) {
        verifyHeadphones(directory, headphoneTarget, result);
    }
    return result;
}

bool runVerify(const fs::path& directory, const fs::path& sofa) {
    const Verification result = verifyDirectory(directory, sofa);
    if (!result.columns.empty()) {
        fmt::print("{}\n", figureTable(result.columns));
    }
    if (!result.tailColumns.empty()) {
        fmt::print("{}\nleast / greatest over all tails\n{}\n", result.tailTable,
                   figureTable(result.tailColumns));
    }
    if (!result.headphoneColumns.empty()) {
        fmt::print("{}\n", figureTable(result.headphoneColumns));
    }
    for (const std::string& note : result.notes) {
        fmt::print("{}\n", note);
    }
    for (const std::string& failure : result.failures) {
        fmt::print("FAILED {}\n", failure);
    }
    if (result.failures.empty()) {
        fmt::print("all figures are within their limits\n");
    }
    return result.failures.empty();
}

}  // namespace tessaly::data
