// Reads a measured set from a text list of WAV pairs.
#pragma once

#include <filesystem>

#include "data/measurement.h"

namespace tessaly::data {

/// Reads a list with lines `file azimuth elevation`: a two-channel sound file, left ear first,
/// beside the list; azimuth in degrees counter-clockwise, 90 at the left. Empty lines and lines
/// that begin with # are skipped. All files have one rate and one length.
/// @return a set that has not been checked yet: `checkMeasurement`
/// @throws DataError naming file and line
Measurement importWavList(const std::filesystem::path& list);

}  // namespace tessaly::data
