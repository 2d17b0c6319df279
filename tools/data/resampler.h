// Sample-rate conversion of whole sounds and impulse responses.
#pragma once

#include <cstddef>
#include <vector>

namespace tessaly::data {

/// Converts interleaved frames at very high quality, the filter's delay taken out: time 0 stays.
/// Equal rates copy.
/// @param frames  frames of the result: zeros behind the sound's end, or cut
/// @throws DataError if the converter fails
std::vector<double> resample(const std::vector<double>& samples,
                             std::size_t channels,
                             double fromRate,
                             double toRate,
                             std::size_t frames);

/// The same for an impulse response, whose samples shrink as they become denser.
std::vector<double> resampleResponse(const std::vector<double>& samples,
                                     std::size_t channels,
                                     double fromRate,
                                     double toRate,
                                     std::size_t frames);

}  // namespace tessaly::data
