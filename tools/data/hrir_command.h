// The command `tessaly-data hrir`.
#pragma once

#include <filesystem>
#include <vector>

#include "data/hrir_builder.h"

namespace tessaly::data {

struct HrirCommand {
    HrirSource source;
    std::filesystem::path directory;
    std::vector<int> rates;
    HrirOptions options;
};

/// Builds the files and says what was written on standard output.
/// @throws DataError; the directory is then as it was
void runHrir(const HrirCommand& command);

}  // namespace tessaly::data
