// The packed tail file: index and samples.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "data/tail_design.h"

namespace tessaly::data {

inline constexpr std::size_t tailHeaderBytes = 242;  ///< 2 unused, 60 offsets of 4
inline constexpr std::size_t tailFrameBytes = 8;     ///< left, right

/// "TSLdata510.dat" for 44100 Hz, 511 for 48000, 512 for 24000.
/// @throws DataError for another rate
const char* tailFileName(int sampleRate);

/// @param tails  presets 15 to 60 in order, interleaved (left, right), storedTailFrames() each
std::string packTails(const std::vector<std::vector<float>>& tails);

/// Reads all tails of a file the way the engine does, frame counts rounded up. The index and the
/// size are checked strictly before, and what the engine's reader gives is compared with the file.
/// @throws DataError if the file is missing or its layout is not that of the rate
std::vector<std::vector<float>> readPackedTails(const std::filesystem::path& directory,
                                                int sampleRate);

}  // namespace tessaly::data
