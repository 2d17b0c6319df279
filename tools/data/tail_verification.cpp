// Reads and measures the tail files of a directory.
#include <algorithm>
#include <memory>
#include <mutex>

#include "data/data_error.h"
#include "data/hrir_options.h"
#include "data/packed_tails.h"
#include "data/tail_acceptance.h"
#include "data/verification.h"
#include "data/worker_pool.h"

namespace tessaly::data {

namespace {

namespace fs = std::filesystem;

constexpr int shownRate = tailDesignRate;  // of the table with a line a tail

/// By preset; synthetic where the manifest says nothing.
std::vector<TailOrigin> originsOf(const ManifestEntry& entry) {
    std::vector<TailOrigin> origins(tailPresetCount);
    for (const std::string& part : entry.parts) {
        const TailOrigin origin = tailOriginFromText(part);
        origins[static_cast<std::size_t>(origin.preset - firstTailPreset)] = origin;
    }
    return origins;
}

}  // namespace

bool hasTails(const fs::path& directory) {
    return std::any_of(rateTable().begin(), rateTable().end(), [&](const RateEntry& rate) {
        return fs::exists(directory / tailFileName(rate.sampleRate));
    });
}

void verifyTails(const VerifiedDirectory& directory, Verification& result, Progress& progress) {
    for (const RateEntry& rate : rateTable()) {
        const std::string file = tailFileName(rate.sampleRate);
        if (!fs::exists(directory.path / file)) {
            continue;
        }
        const ManifestEntry entry = directory.entryOf(file, result);
        const TailOptions options = tailOptionsFromText(entry.options);
        const std::vector<TailOrigin> origins = originsOf(entry);
        const std::vector<std::vector<float>> tails =
            readPackedTails(directory.path, rate.sampleRate);
        const auto set = directory.sets.find(rate.sampleRate);
        const HrirSet* hrirs = set != directory.sets.end() ? &set->second : nullptr;
        std::unique_ptr<SetCoherence> coherence;
        if (hrirs != nullptr) {
            coherence = std::make_unique<SetCoherence>(*hrirs);
        } else {
            result.notes.push_back(fmt::format(
                "{}: levels and coherence not compared, {} is missing", file, rate.fileName));
        }
        std::vector<TailMeasures> measures(tails.size());
        std::mutex progressGuard;
        progress.stage(fmt::format("measuring tails {} Hz", rate.sampleRate), tails.size());
        forEachParallel(tails.size(), [&](std::size_t i) {
            measures[i] = measureTail(tailDesigns()[i], tails[i], rate.sampleRate, hrirs,
                                      coherence.get(), options, origins[i]);
            const std::lock_guard lock(progressGuard);
            progress.step();
        });
        for (const TailMeasures& tail : measures) {
            const std::string title =
                fmt::format("{} preset {} {}", file, tail.design->preset, tail.design->name);
            for (std::string& line : failedFigures({{title, tail.figures}})) {
                result.failures.push_back(std::move(line));
            }
        }
        result.tailColumns.push_back(
            summariseTails(fmt::format("tails {}", rate.sampleRate), measures));
        if (result.tailTable.empty() || rate.sampleRate == shownRate) {
            result.tailTable = tailTable(measures);
        }
    }
}

}  // namespace tessaly::data
