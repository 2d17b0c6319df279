// Builds the packed HRIR files of a measured set.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "data/directory_records.h"
#include "data/hrir_set.h"
#include "data/target_field.h"

namespace tessaly::data {

/// Where measured responses come from: one of both.
struct HrirSource {
    std::filesystem::path sofa;     ///< SOFA file
    std::filesystem::path wavList;  ///< text list of WAV pairs, taken if not empty
};

/// Imports and checks.
/// @throws DataError
Measurement importMeasurement(const HrirSource& source);

/// The file's rates in table order without repetition. 44100 Hz is always among them: the engine
/// looks for that file to see whether the directory is right, whatever its rate.
/// @throws DataError for an unknown rate
std::vector<int> ratesToBuild(const std::vector<int>& wanted);

/// Taps of a set at a rate.
/// @throws DataError if the option is out of range
std::size_t tapsFor(const HrirOptions& options, int sampleRate);

/// Synthesises the sets and adds them, with their records, to the directory. Does not commit.
/// Equal input gives equal bytes.
/// @return the sets, in the order of `rates`
std::vector<HrirSet> addHrirFiles(const Measurement& measurement,
                                  const TargetField& target,
                                  const HrirOptions& options,
                                  const std::vector<int>& rates,
                                  OutputDirectory& output,
                                  DirectoryRecords& records,
                                  Progress& progress);

}  // namespace tessaly::data
