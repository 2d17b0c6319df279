// Reads a user's sound file whole.
#pragma once

#include <filesystem>
#include <vector>

namespace tessaly::data {

struct SoundInput {
    int sampleRate = 0;
    int channels = 0;
    std::vector<double> samples;  ///< interleaved

    std::size_t frames() const { return samples.size() / static_cast<std::size_t>(channels); }
};

inline constexpr int lowestImportRate = 24000;  ///< Hz

/// Any format of the sound library.
/// @param channels  that the file must have
/// @throws DataError for a missing, unreadable, empty, silent or far too long file, another channel
///         count, a rate below 24000 Hz, or samples that are no numbers
SoundInput readSound(const std::filesystem::path& path, int channels);

}  // namespace tessaly::data
