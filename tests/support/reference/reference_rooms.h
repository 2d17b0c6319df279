// Rooms of the reference: rows of the tests' own lists, tails, and the walls of a shoebox.
#pragma once

#include <array>
#include <functional>
#include <string>

#include "support/reference/reference_engine.h"

namespace tessaly::reference {

/// A room's row as the tests' lists have it; 0 and numbers without a row give an empty one.
PresetRow presetRowOf(int preset);

/// A room's tail with its gain and its length at a rate; empty for presets without one.
/// @param sample  of a preset, frame and ear (0 left), as it stands in the data file
Tail tailOf(int preset, int sampleRate, const std::function<float(int, int, int)>& sample);

/// The same from "/TSLdata510.dat", 511 or 512 (44100, 48000, 24000 Hz) of a directory, with the
/// reference's own reader: for preset p a 32-bit start frame at byte 2 + 4 (p - 1), and from byte
/// 242 + 8 * start on pairs of floats, left first. What the file does not hold is 0.
Tail packedTailOf(const std::string& directory, int preset, int sampleRate);

/// Where the source is among the walls.
struct WallScene {
    int phi = 0;            ///< degrees
    int theta = 0;          ///< degrees
    float distance = 0.0f;  ///< metres
    float samplesPerMetre = 0.0f;
    float roomSizeFactor = 1.0f;
    int earlyFlexRefPreset = 0;
    std::array<float, 6> roomDistances{};  ///< metres
};

/// Path, delay, gain and azimuth of the reflection of wall k, 0 to 5. Single precision, since all
/// of it becomes integers.
/// @return false if the source is outside the wall or there is none: nothing more happens to it
bool reflectAtWall(ReflectionRecord& record, int k, const WallScene& scene);

}  // namespace tessaly::reference
