// Levels of tails: energy in the middle octaves, and the gain that gives a room its balance.
#pragma once

#include <string>
#include <vector>

#include "data/hrir_set.h"
#include "data/tail_design.h"

namespace tessaly::data {

enum class TailLevel {
    rule,  ///< direct-to-reverberant ratio by volume and decay
    peak   ///< every stored tail at a peak of 0.9: the balance is left to the engine's gains
};

/// What a user can choose about the tails; the defaults give the reference tails.
struct TailOptions {
    TailLevel level = TailLevel::rule;
    double wetDb = 0.0;  ///< on top, of all tails

    bool operator==(const TailOptions&) const = default;
};

/// One line for the manifest, e.g. "level=rule wet=0".
std::string toText(const TailOptions& options);

/// Reads `toText` back.
/// @throws DataError for anything else
TailOptions tailOptionsFromText(const std::string& text);

/// "rule" or "peak".
/// @throws DataError for another word
TailLevel tailLevelFromText(const std::string& text);

/// @throws DataError if the gain is no number or out of range
void checkTailOptions(const TailOptions& options);

/// Energy between 354 and 2828 Hz, mean of both ears: integral over frequency of the squared
/// magnitude, so that responses of different rates compare.
/// @param pairs  interleaved frames of two channels
double middleEnergy(const std::vector<double>& pairs, int sampleRate);

/// The same of the frontal direction as the engine plays it at 1 m.
double directEnergy(const HrirSet& hrirs);

/// Gain from a tail without level to stored samples.
/// @param pairs   the tail at 48000 Hz
/// @param direct  directEnergy() of the set of that rate
double storedGain(const TailDesign& design,
                  const TailOptions& options,
                  const std::vector<double>& pairs,
                  double direct);

}  // namespace tessaly::data
