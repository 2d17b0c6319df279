// The result of checking a data directory, and what its parts share.
#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "data/figure_table.h"
#include "data/hrir_set.h"
#include "data/manifest.h"
#include "data/progress.h"
#include "data/target_field.h"

namespace tessaly::data {

/// Result of a check of a directory.
struct Verification {
    std::vector<FigureColumn> columns;           ///< HRIR sets, a rate each
    std::vector<FigureColumn> tailColumns;       ///< least and greatest over all tails, a rate each
    std::string tailTable;                       ///< tails of one rate, a line each
    std::vector<FigureColumn> headphoneColumns;  ///< one, of all filters
    std::vector<std::string> notes;              ///< what could not be compared, and why
    std::vector<std::string> failures;           ///< empty: all is well
};

/// A directory under check.
struct VerifiedDirectory {
    std::filesystem::path path;
    std::vector<ManifestEntry> manifest;  ///< empty: none, taken for the default set
    std::map<int, HrirSet> sets;          ///< read so far, by rate

    /// Entry of a file whose size and checksum are compared; an empty one without a manifest.
    ManifestEntry entryOf(const std::string& file, Verification& result) const;
};

/// Checks the tail files that are there.
/// @throws DataError if one cannot be read at all
void verifyTails(const VerifiedDirectory& directory, Verification& result, Progress& progress);

/// Checks the headphone filters that are there.
/// @param target  that the HRIR set is made from, or null: the frontal row is not compared
/// @throws DataError if one cannot be read at all
void verifyHeadphones(const VerifiedDirectory& directory,
                      const TargetField* target,
                      Verification& result);

/// True if one of the headphone files is there.
bool hasHeadphones(const std::filesystem::path& directory);
/// True if one of the tail files is there.
bool hasTails(const std::filesystem::path& directory);

}  // namespace tessaly::data
