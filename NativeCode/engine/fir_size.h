// The length of the composed response and everything that follows from it.
#pragma once

#include <cstdint>

namespace tessaly {

/// Sizes of one engine, in frames. `FIR_size` may be raised once after `fdlCount` was derived;
/// then the buffers grow and the partition count stays.
struct FirSizes {
    int blocklenght = 0;        ///< B
    int fftLength = 0;          ///< 2B
    int FIR_size = 0;           ///< length that composition may fill
    int firBufferSize = 0;      ///< `FIR_size` + B: the buffers' length
    std::int16_t fdlCount = 0;  ///< N, partitions of B frames
    int earlyFlexFirSize = 0;   ///< what the room's reflections need
};

/// Reflection buffer of a preset, 1 to 60, in frames; 0 for any other.
int earlyFlexFirSizeOf(int preset) noexcept;

/// Derives the sizes. Load time: logs.
/// @param sizes               `blocklenght` set; the rest is written
/// @param defaultFirSize      length before the room decides
/// @param qvReverb            tail preset in effect
/// @param reverbLength        frames of the tail as loaded
/// @param earlyFlexRefPreset  reflection preset; set to 0 if outside the table
void deriveFirSizes(FirSizes& sizes,
                    int defaultFirSize,
                    std::int16_t qvReverb,
                    int reverbLength,
                    std::int16_t& earlyFlexRefPreset);

}  // namespace tessaly
