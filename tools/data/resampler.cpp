// One call of the resampling library for a whole sound.
#include "data/resampler.h"

#include <soxr.h>

#include <algorithm>
#include <cmath>

#include "data/data_error.h"

namespace tessaly::data {

std::vector<double> resample(const std::vector<double>& samples,
                             std::size_t channels,
                             double fromRate,
                             double toRate,
                             std::size_t frames) {
    std::vector<double> result;
    if (fromRate == toRate) {
        result = samples;
    } else {
        // With less room than the whole result needs the library leaves input unread and the end
        // out.
        const double whole =
            std::ceil(static_cast<double>(samples.size() / channels) * toRate / fromRate);
        const std::size_t room = std::max(frames, static_cast<std::size_t>(whole) + 1);
        result.resize(room * channels);
        const soxr_io_spec_t format = soxr_io_spec(SOXR_FLOAT64_I, SOXR_FLOAT64_I);
        const soxr_quality_spec_t quality = soxr_quality_spec(SOXR_VHQ, 0);
        std::size_t used = 0;
        std::size_t made = 0;
        const soxr_error_t failure =
            soxr_oneshot(fromRate, toRate, static_cast<unsigned>(channels), samples.data(),
                         samples.size() / channels, &used, result.data(), room, &made, &format,
                         &quality, nullptr);
        if (failure != nullptr) {
            throw DataError("conversion from {} to {} Hz failed: {}", fromRate, toRate, failure);
        }
        result.resize(made * channels);
    }
    result.resize(frames * channels);
    return result;
}

std::vector<double> resampleResponse(const std::vector<double>& samples,
                                     std::size_t channels,
                                     double fromRate,
                                     double toRate,
                                     std::size_t frames) {
    std::vector<double> result = resample(samples, channels, fromRate, toRate, frames);
    if (fromRate != toRate) {
        for (double& sample : result) {
            sample *= fromRate / toRate;
        }
    }
    return result;
}

}  // namespace tessaly::data
