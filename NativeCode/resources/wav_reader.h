// Reads the sound files of the data directory: WAV layout at fixed offsets, and packed tails.
#pragma once

#include <cstdint>
#include <string>

namespace tessaly {

/// How a caller's name becomes a file. Filled by the engine for each read.
struct WavSource {
    std::string bundleBasePath;     ///< data directory, no trailing slash
    bool usePackedDatabase = true;  ///< names are complete; tails come from the packed file
    bool loadingReverb = false;     ///< a room's tail is being read
    std::string IRfilePath;         ///< the packed tail file of this rate
    int sampleRate = 0;             ///< Hz; picks the suffix of a tail's own file
    std::int16_t qvReverb = 0;      ///< tail preset, 1..60: entry of the packed file's index
    int reverbLength = 0;           ///< frames of the tail to read in packed form
    bool zeroMissing = false;       ///< packed tail: what the file does not hold becomes zero
};

/// Reads one sound file. Load time: opens a file.
/// Packed tail (`usePackedDatabase` and `loadingReverb`): `path`, `frames` and `channels` are
/// ignored, `reverbLength` raw float pairs are read. A short file leaves the rest untouched, unless
/// `zeroMissing` is set.
/// @param path         name with a leading "/", with or without extension
/// @param destination  frames * channels floats, interleaved, full scale 1.0
/// @param frames       frames wanted; a longer file is accepted, a shorter one is error -108
/// @param channels     channel count the file must have, 1 or 2
/// @return true if read; on false `essError` holds -105 or -107 to -110 and `destination` may be
///         partly filled
bool readWav(const WavSource& source,
             const std::string& path,
             float* destination,
             int frames,
             std::int16_t channels);

}  // namespace tessaly
