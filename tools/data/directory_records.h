// Collects what MANIFEST.txt and ATTRIBUTION.txt say about the files of one command.
#pragma once

#include <string>
#include <vector>

#include "data/manifest.h"
#include "data/output_directory.h"

namespace tessaly::data {

class DirectoryRecords {
public:
    /// Adds a file to the directory and its entry to the manifest; size and checksum are filled in.
    void add(OutputDirectory& output, ManifestEntry entry, std::string bytes);

    /// Terms of a source that entries or their parts name by its checksum.
    void addTerms(const std::string& sourceSha256, const std::string& terms);

    /// Joins with the records that are there already and adds both texts to the directory. Entries
    /// of files that are gone and terms of sources that nothing names any more are dropped.
    void write(OutputDirectory& output) const;

private:
    std::vector<ManifestEntry> entries_;
    Attributions terms_;
};

}  // namespace tessaly::data
