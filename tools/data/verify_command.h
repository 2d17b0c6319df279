// The command `tessaly-data verify`.
#pragma once

#include <filesystem>

#include "data/verification.h"

namespace tessaly::data {

/// Reads all files of a directory through the library's reader and measures them.
/// @param sofa  measured set to compare with; empty: the one that the manifest names
/// @throws DataError if there is nothing to check or a file cannot be read at all
Verification verifyDirectory(const std::filesystem::path& directory,
                             const std::filesystem::path& sofa);

/// Prints table, notes and failures on standard output.
/// @return true if there is no failure
bool runVerify(const std::filesystem::path& directory, const std::filesystem::path& sofa);

}  // namespace tessaly::data
