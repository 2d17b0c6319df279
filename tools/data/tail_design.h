// What each room's tail is made to be: decay, onset, level, directions.
#pragma once

#include <cstddef>
#include <vector>

#include "data/decay_time.h"
#include "engine/reverb_presets.h"
#include "engine/room_presets.h"

namespace tessaly::data {

inline constexpr int firstTailPreset = 15;
inline constexpr int tailPresetCount = reverbPresetCount - firstTailPreset + 1;
inline constexpr int tailDesignRate = 48000;  ///< Hz; other rates are converted from it

enum class TailShape { room, plate, outdoor, echoes };

/// One room's tail. Time 0 is the direct sound.
struct TailDesign {
    int preset = 0;
    const char* name = "";
    DecayTime decay{RoomClass::hard, 1.0};
    TailShape shape = TailShape::room;
    bool corridor = false;           ///< sound comes along its axis
    bool enclosed = true;            ///< has all its walls
    double volume = 0.0;             ///< cubic metres, 0 without walls all around
    double onsetSeconds = 0.0;       ///< where the engine's wall reflections have ended
    double startSeconds = 0.0;       ///< silent before
    double directToReverb = 0.0;     ///< dB at 1 m, of all the room's sound
    bool directToReverbSet = false;  ///< by hand; else by volume and decay
    std::size_t frames48000 = 0;     ///< length by the engine's table
    float presetGain = 0.0f;         ///< the engine's gain for the stored samples
    RoomPreset room;                 ///< the engine's early reflections

    /// Direct sound to the tail alone in dB: the rest of the reverberant energy is reflections.
    double directToTail() const noexcept;
};

/// All tails in order, presets 15 to 60.
const std::vector<TailDesign>& tailDesigns();

/// @param preset  15 to 60
const TailDesign& tailDesign(int preset);

/// Frames of a stored tail at a rate: rounded up, so never fewer than the engine reads.
std::size_t storedTailFrames(const TailDesign& design, int sampleRate) noexcept;

/// Share of each of the 2522 directions, not normalised.
std::vector<double> directionWeights(const TailDesign& design);

}  // namespace tessaly::data
