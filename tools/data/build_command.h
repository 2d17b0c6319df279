// The commands `tessaly-data all`, `hrir`, `tails` and `headphones`.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "data/headphone_builder.h"
#include "data/hrir_builder.h"
#include "data/tail_level.h"

namespace tessaly::data {

/// What to build, of what.
struct BuildCommand {
    bool hrir = false;
    bool tails = false;
    bool headphones = false;
    std::filesystem::path directory;
    std::vector<int> rates;
    HrirSource source;
    HrirOptions hrirOptions;
    TailOptions tailOptions;
    std::filesystem::path measuredTails;  ///< directory, or empty
    HeadphoneOptions headphoneOptions;
    std::vector<std::string> filters;  ///< ROW=FILE
    bool minimumPhaseFilters = false;
};

/// Builds the files and says what was written on standard output.
/// @throws DataError; the directory is then as it was
void runBuild(const BuildCommand& command);

}  // namespace tessaly::data
