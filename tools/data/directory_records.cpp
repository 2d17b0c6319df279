// Merge with what the directory has.
#include "data/directory_records.h"

#include <algorithm>

#include "data/sha256.h"

namespace tessaly::data {

namespace {

bool names(const ManifestEntry& entry, const std::string& sourceSha256) {
    return entry.sourceSha256 == sourceSha256 ||
           std::any_of(entry.parts.begin(), entry.parts.end(), [&](const std::string& part) {
               return part.find(sourceSha256) != std::string::npos;
           });
}

}  // namespace

void DirectoryRecords::add(OutputDirectory& output, ManifestEntry entry, std::string bytes) {
    entry.size = bytes.size();
    entry.sha256 = sha256(bytes);
    output.add(entry.file, std::move(bytes));
    entries_.push_back(std::move(entry));
}

void DirectoryRecords::addTerms(const std::string& sourceSha256, const std::string& terms) {
    terms_[sourceSha256] = terms;
}

void DirectoryRecords::write(OutputDirectory& output) const {
    std::vector<ManifestEntry> kept = parseManifest(readIfPresent(output.path() / manifestName));
    std::erase_if(kept, [&output](const ManifestEntry& entry) {
        std::error_code ignored;
        return !std::filesystem::exists(output.path() / entry.file, ignored);
    });
    const std::vector<ManifestEntry> entries = mergeManifest(std::move(kept), entries_);

    Attributions attributions = parseAttributions(readIfPresent(output.path() / attributionName));
    for (const auto& [checksum, terms] : terms_) {
        attributions[checksum] = terms;
    }
    std::erase_if(attributions, [&entries](const auto& item) {
        return std::none_of(entries.begin(), entries.end(), [&item](const ManifestEntry& entry) {
            return names(entry, item.first);
        });
    });
    output.add(manifestName, manifestText(entries));
    output.add(attributionName, attributionText(attributions));
}

}  // namespace tessaly::data
