// What a user can choose about a set, and the set's own sizes and rates.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace tessaly::data {

enum class Symmetry { automatic, on, off };

/// Options of one HRIR set; the defaults give the reference set.
struct HrirOptions {
    bool diffuseFieldEqualisation = true;
    Symmetry symmetry = Symmetry::automatic;
    std::optional<int> taps;  ///< else the engine's length for the rate
    double gainDb = 0.0;
    std::optional<double> lowestElevation;  ///< degrees; else where the measurement closes

    bool operator==(const HrirOptions&) const = default;
};

/// One line for the manifest, e.g. "dfeq=on symmetry=auto taps=default gain=0 lowest=auto".
std::string toText(const HrirOptions& options);

/// Reads `toText` back.
/// @throws DataError for anything else
HrirOptions hrirOptionsFromText(const std::string& text);

/// "auto", "on" or "off".
/// @throws DataError for another word
Symmetry symmetryFromText(const std::string& text);

/// A sample rate of the engine: its file and the length of its HRIRs.
struct RateEntry {
    int sampleRate;
    int hrirLength;
    const char* fileName;
};

/// The engine's three rates, 44100 first.
const std::vector<RateEntry>& rateTable();

/// @throws DataError for a rate the engine does not know
const RateEntry& rateEntry(int sampleRate);

/// @throws DataError for text that is no rate of the engine
int rateFromText(const std::string& text);

inline constexpr int fewestHrirTaps = 32;
inline constexpr int mostHrirTaps = 256;

}  // namespace tessaly::data
