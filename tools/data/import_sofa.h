// Reads SOFA files of free-field impulse responses.
#pragma once

#include <filesystem>

#include "data/measurement.h"

struct MYSOFA_HRTF;

namespace tessaly::data {

/// The measured KEMAR set of the libmysofa package: the default source.
inline constexpr const char* defaultSofaPath = "/usr/share/libmysofa/MIT_KEMAR_normal_pinna.sofa";
inline constexpr const char* kemarSha256 =
    "2768ac841213a7ae11d1ea7fd0f25a69b39216102dc5dd913ea6ba0f0dc57e28";

/// Reads a SimpleFreeFieldHRIR file; of several distances the one nearest 1.4 m. The samples are
/// taken as they are: neither resampled nor scaled.
/// @return a set that has not been checked yet: `checkMeasurement`
/// @throws DataError for a file that is missing, no SOFA file, or of another convention or shape
Measurement importSofa(const std::filesystem::path& path);

/// The loaded form of a file to a set without provenance.
/// @param name  for messages
/// @throws DataError for another convention, or counts that do not fit each other
Measurement convertSofa(const MYSOFA_HRTF& file, const std::string& name);

/// True if the file begins as HDF5 files do, which SOFA files are.
bool isHdf5(const std::filesystem::path& path);

/// Keeps the directions whose distance belongs to the group nearest 1.4 m.
/// @param distances  metres, one a direction
/// @return indices to keep, ascending
std::vector<std::size_t> nearestDistanceGroup(const std::vector<double>& distances);

}  // namespace tessaly::data
