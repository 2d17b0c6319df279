// Small deterministic data sets: a temporary data directory and the files that go into it.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <vector>

namespace tessaly::test {

/// A directory of its own under the system's temporary one; goes with everything in it.
class TempDirectory {
public:
    TempDirectory();
    ~TempDirectory();
    TempDirectory(const TempDirectory&) = delete;
    TempDirectory& operator=(const TempDirectory&) = delete;

    /// Absolute, without a trailing slash: what the system takes as its data directory.
    const std::string& path() const { return path_; }
    /// The path of a file in it; `name` has a leading "/".
    std::string file(const std::string& name) const { return path_ + name; }

private:
    std::string path_;
};

// ---- Plain files ----

/// Writes `bytes` as a file, replacing an old one. Throws std::runtime_error if it cannot.
void writeFile(const std::string& path, std::span<const char> bytes);

/// A whole sound file in memory: the 44-byte header with "data" at byte 36, then the samples.
/// @param bits     16: samples are scaled by 32768, rounded and limited; else stored as 32-bit
///                 floats as they stand, whatever depth the header tells
/// @param samples  interleaved; stored as given: whoever writes a 32-bit file of 48000 Hz has to
///                 negate them, since the library's reader will
std::vector<char> wavBytes(int channels, int rate, int bits, std::span<const float> samples);

/// wavBytes() as a file.
void writeWav(
    const std::string& path, int channels, int rate, int bits, std::span<const float> samples);

/// As writeWav() with 32 bits, but the reader will return exactly `samples` at every rate.
void writeWavForReader(const std::string& path,
                       int channels,
                       int rate,
                       std::span<const float> samples);

// ---- HRIR set ----

inline constexpr int testHrirCount = 2522;

/// A direction of the stored set, degrees, engine sign (`phi` positive to the listener's left).
struct TestDirection {
    int phi;    ///< -175..180
    int theta;  ///< -90..90
    bool operator==(const TestDirection&) const = default;
};

/// The direction of HRIR number k, 0..2521, enumerated anew from the order of the file.
TestDirection testHrirDirection(int k);

/// The HRIR number of a direction on the 5-degree grid; -180 and 180 are one, and so are all
/// azimuths of a pole. Multiples of 5 only.
int testHrirNumber(int phi, int theta);

/// Taps per HRIR that go with a rate: 70, 128, 139 at 24000, 44100, 48000 Hz.
int testHrirTaps(int sampleRate);

/// What the engine gets to see of HRIR k: a peak of 0.35 to 0.95 at 6 to 34 frames (the nearer
/// ear louder and earlier), noise before it below 0.002 and decaying noise behind it, always
/// below 1 in magnitude and never zero. The same at every rate and length.
/// @param k      0..2521
/// @param frame  0..255
/// @param ear    0 right, 1 left: the order within a stored pair
float testHrirSample(int k, int frame, int ear);

/// Writes "/TSLdata120.dat", 121 or 122 for 44100, 48000 or 24000 Hz, true rate in the header,
/// so that the reader returns testHrirSample() at each of them.
/// @param taps  frames per HRIR; 0 takes testHrirTaps(sampleRate)
void writePackedHrirSet(const std::string& directory, int sampleRate, int taps = 0);

// ---- Reverb tails ----

/// Length of a tail at 48000 Hz in frames, presets 15..60; 0 for all others.
int testTailFrames48000(int preset);

/// Frames that writePackedTails() gives a tail: the length at this rate, rounded up.
int testTailFrames(int preset, int sampleRate);

/// Noise of the preset's own, peak below 0.5, halved every 8192 frames, never zero.
/// @param channel  0 left, 1 right: the order within a stored pair
float testTailSample(int preset, int frame, int channel);

/// Writes "/TSLdata510.dat", 511 or 512 with these presets (15..60) in the order given. Index
/// entries of presets 1 to 14 are 0; those of tails not given point at the end of the file.
void writePackedTails(const std::string& directory,
                      int sampleRate,
                      const std::vector<int>& presets);

}  // namespace tessaly::test
