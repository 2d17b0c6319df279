// Builds the ten headphone files and the one for short responses.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "data/headphone_import.h"
#include "data/target_field.h"

namespace tessaly::data {

struct HeadphoneOptions {
    int sampleRate = 48000;  ///< that the filters are made for
    bool flatBass = false;   ///< without the first low shelf of the settings

    bool operator==(const HeadphoneOptions&) const = default;
};

/// One line for the manifest, e.g. "rate=48000 flat-bass=off".
std::string toText(const HeadphoneOptions& options);

/// Reads `toText` back; further words are for people.
/// @throws DataError for anything else
HeadphoneOptions headphoneOptionsFromText(const std::string& text);

/// In a manifest's options: the filter is a user's own.
inline constexpr const char* importedWord = "imported";

/// One file.
struct HeadphoneFile {
    std::string name;
    int row = 0;
    std::string content;  ///< for the manifest
    const ImportedFilter* imported = nullptr;
    std::vector<float> taps;
};

/// The wanted curve of a built-in row.
/// @param field  that the HRIR set is made from; for the frontal row
HeadphoneCurve builtInCurve(int row, const HeadphoneOptions& options, const ResponseField& field);

/// All eleven files.
std::vector<HeadphoneFile> buildHeadphones(const HeadphoneOptions& options,
                                           const ImportedFilters& imported,
                                           const ResponseField& field);

}  // namespace tessaly::data
