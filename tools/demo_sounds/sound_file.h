// Sound files in any format the sound library reads, brought to the rate wanted.
#pragma once

#include <cstddef>
#include <filesystem>
#include <vector>

namespace tessaly {

/// Interleaved samples, full scale 1.0.
struct Sound {
    std::vector<float> samples;  ///< frames * channels
    int channels = 1;            ///< 1 or 2
    double sampleRate = 0.0;     ///< Hz

    std::size_t frames() const noexcept {
        return channels > 0 ? samples.size() / static_cast<std::size_t>(channels) : 0;
    }
};

/// Reads a file. Mono and stereo stay as they are; of more channels the first two are kept.
/// @param maxSeconds  reads no further than this
/// @throws std::runtime_error with one line naming the file
Sound readSoundFile(const std::filesystem::path& file, double maxSeconds);

/// Brings a sound to another rate, level and timing kept.
/// @throws std::runtime_error if the resampler refuses
Sound resampled(const Sound& sound, double sampleRate);

}  // namespace tessaly
