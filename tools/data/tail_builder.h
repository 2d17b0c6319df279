// Builds the packed tail files: synthetic tails, and measured ones in their place.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "data/hrir_set.h"
#include "data/progress.h"
#include "data/tail_import.h"
#include "data/tail_level.h"

namespace tessaly::data {

/// Where one stored tail comes from; a line of the manifest.
struct TailOrigin {
    int preset = 0;
    std::string file;  ///< of a measured tail; empty: synthetic
    std::string sha256;
    bool matchLevel = true;  ///< level as a synthetic tail would have it
    double askedDb = 0.0;    ///< by the user, on top
    double gainDb = 0.0;     ///< applied in all
    std::string licence;
    std::string source;
};

/// One line, e.g. "15 SmallRoomStone: synthetic; gain -20.31 dB".
std::string toText(const TailOrigin& origin);

/// Reads the parts of `toText` back that checks need: preset, file, checksum, level, asked gain.
/// @throws DataError for anything else
TailOrigin tailOriginFromText(const std::string& text);

/// One tail, stored at each rate.
struct BuiltTail {
    TailOrigin origin;
    std::vector<std::vector<float>> stored;  ///< (left, right), in the order of the rates
};

/// Makes the tail of one preset, as `buildTails` does.
/// @param direct    directEnergy(hrirs)
/// @param measured  null: synthetic
BuiltTail buildTail(const TailDesign& design,
                    const HrirSet& hrirs,
                    double direct,
                    const TailOptions& options,
                    const MeasuredTail* measured,
                    const std::vector<int>& rates);

struct BuiltTails {
    std::map<int, std::string> images;  ///< file contents by rate
    std::vector<TailOrigin> origins;
};

/// Makes all 46 tails, several at a time. Equal input gives equal bytes.
/// @param hrirs     the set of 48000 Hz
/// @param measured  tails that replace synthetic ones
BuiltTails buildTails(const HrirSet& hrirs,
                      const TailOptions& options,
                      const MeasuredTails& measured,
                      const std::vector<int>& rates,
                      Progress& progress);

}  // namespace tessaly::data
