// A measured set of head-related impulse responses, as imported.
#pragma once

#include <cstddef>
#include <filesystem>
#include <string>
#include <vector>

#include "data/sphere.h"

namespace tessaly::data {

inline constexpr int leftEar = 0;
inline constexpr int rightEar = 1;
inline constexpr int earCount = 2;

/// Where a set comes from and on what terms; goes into the manifest and the attribution.
struct Provenance {
    std::filesystem::path path;
    std::string sha256;
    std::string licence;      ///< one line
    std::string attribution;  ///< several lines: authors, terms as quoted
};

/// Impulse responses of both ears for a list of directions at one distance.
struct Measurement {
    double sampleRate = 0.0;
    std::size_t taps = 0;
    std::vector<Direction> directions;
    std::vector<double> samples;       ///< direction by direction, left then right, `taps` each
    std::vector<double> extraSeconds;  ///< a direction: delay of right less left beside the samples
    Provenance provenance;

    std::size_t count() const noexcept { return directions.size(); }
    const double* response(std::size_t direction, int ear) const {
        return samples.data() + (direction * earCount + static_cast<std::size_t>(ear)) * taps;
    }
};

/// Rejects what cannot become a set, by the samples and not by what a file says about itself:
/// too few directions, samples that are no numbers, a silent ear, low rates, swapped ears or a
/// mirrored or turned azimuth. Removes repeated directions.
/// @throws DataError
void checkMeasurement(Measurement& measurement);

}  // namespace tessaly::data
