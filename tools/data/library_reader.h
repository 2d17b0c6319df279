// Reads packed HRIR files the way the engine does.
#pragma once

#include <filesystem>

#include "data/hrir_options.h"
#include "data/hrir_set.h"

namespace tessaly::data {

/// Checks the header strictly, then reads the samples through the library's own reader, which
/// applies the polarity rule.
/// @throws DataError if the file is missing or its layout, rate or size is not that of the rate
HrirSet readPackedSet(const std::filesystem::path& directory, const RateEntry& rate);

}  // namespace tessaly::data
