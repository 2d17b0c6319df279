// Measured tails from a user's directory.
#pragma once

#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace tessaly::data {

/// How one preset's measured tail is taken over: a section of tails.ini, or its defaults.
struct TailImportRule {
    std::string file;               ///< relative to the directory
    std::optional<double> startMs;  ///< from the direct sound on; 0: everything, as it is
    double gainDb = 0.0;
    bool matchLevel = true;  ///< to the level of the built-in tail; else as measured
    std::string licence = "not stated";
    std::string source = "not stated";
};

/// By preset number.
using TailImportRules = std::map<int, TailImportRule>;

/// Reads the text of a tails.ini: sections `[preset_15]` to `[preset_60]`.
/// @param name  for messages
/// @throws DataError naming the line
TailImportRules parseTailsIni(const std::string& text, const std::string& name);

/// A measured tail at its own rate, direct sound at time 0 unless everything is kept.
struct MeasuredTail {
    TailImportRule rule;
    std::string sha256;
    int sampleRate = 0;
    std::vector<double> pairs;  ///< (left, right)
};

using MeasuredTails = std::map<int, MeasuredTail>;

/// Reads `preset_15.wav` to `preset_60.wav` of a directory and what its tails.ini, if there is
/// one, says about them.
/// @throws DataError for a bad file, section or name, and if there is no tail at all
MeasuredTails importTails(const std::filesystem::path& directory);

/// The tail as stored at a rate, without level: converted, padded or cut with a fade.
std::vector<double> convertMeasuredTail(const MeasuredTail& tail, int preset, int sampleRate);

}  // namespace tessaly::data
