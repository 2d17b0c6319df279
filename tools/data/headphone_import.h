// A user's own headphone filters.
#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "data/headphone_design.h"

namespace tessaly::data {

/// A filter that replaces the built-in one of a row.
struct ImportedFilter {
    std::filesystem::path path;
    std::string sha256;
    std::string kind;              ///< for the manifest, e.g. "parametric"
    std::vector<float> taps;       ///< 256
    std::vector<float> smallTaps;  ///< 256, the form for short responses
};

/// By row number, 1 to 10.
using ImportedFilters = std::map<int, ImportedFilter>;

/// Reads "ROW=FILE": a mono sound file, or a text of equaliser filters.
/// @param argument      e.g. "3=my_headphone.txt"
/// @param sampleRate    of the filters
/// @param minimumPhase  for sound files: keep the level, drop the phase
/// @throws DataError for a bad row, a file that is neither, or a response that does not fit
void importFilter(const std::string& argument,
                  int sampleRate,
                  bool minimumPhase,
                  ImportedFilters& filters);

}  // namespace tessaly::data
