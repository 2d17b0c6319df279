// The engine's WAV layout: the one place of the 44-byte header and of the polarity rule.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace tessaly::data {

inline constexpr std::size_t waveHeaderBytes = 44;

/// Bytes of a file with 32-bit float samples. The engine's reader turns the sign of every 32-bit
/// file whose rate field is 48000; the rate field tells the truth here, and the samples of such a
/// file are stored negated, so that the engine gets them as they are given.
/// @param samples  interleaved frames as the engine shall see them
std::string waveImage(const std::vector<float>& samples, int channels, int sampleRate);

/// What a file's first 44 bytes say.
struct WaveHeader {
    int channels = 0;
    int sampleRate = 0;
    std::size_t frames = 0;
};

/// Strict check of a file made by `waveImage`: every field, and the size of the file.
/// @param bytes      the first 44 bytes, or fewer if the file is shorter
/// @param fileBytes  size of the whole file
/// @param name       for the message
/// @throws DataError naming the field
WaveHeader checkWaveHeader(const std::string& bytes,
                           std::size_t fileBytes,
                           const std::string& name);

}  // namespace tessaly::data
