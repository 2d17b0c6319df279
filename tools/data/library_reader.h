// Reads packed HRIR files and headphone filters the way the engine does.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "data/hrir_options.h"
#include "data/hrir_set.h"

namespace tessaly::data {

/// Checks the header strictly, then reads the samples through the library's own reader, which
/// applies the polarity rule.
/// @throws DataError if the file is missing or its layout, rate or size is not that of the rate
HrirSet readPackedSet(const std::filesystem::path& directory, const RateEntry& rate);

/// The same for a headphone filter: one channel of 256 frames.
/// @param sampleRate  that the header must tell
/// @throws DataError
std::vector<double> readHeadphoneFilter(const std::filesystem::path& directory,
                                        const std::string& name,
                                        int sampleRate);

}  // namespace tessaly::data
