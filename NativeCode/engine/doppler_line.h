// A delay line of 25 metres of travel that bends the pitch of a moving source.
#pragma once

#include <cstdint>

#include "base/aligned_array.h"
#include "base/audio_thread.h"

namespace tessaly {

class DopplerLine {
public:
    /// Load time: allocates the line, 25 m of travel and one block.
    void prepare(int sampleRate, int blocklenght);

    /// One block: the read head starts at the old distance's delay and arrives at the new one's.
    /// Reads are bounded to the line: in front of it and behind it the nearest sample stands.
    /// Block time.
    /// @param input          samples, read at every second slot
    /// @param inputGain      factor on the input
    /// @param distance       metres, now
    /// @param distanceOld    metres, in the block before
    /// @param output         `blocklenght` floats
    void process(const float* input,
                 float inputGain,
                 float distance,
                 float distanceOld,
                 float* output) noexcept TESSALY_NONBLOCKING;

    AlignedArray<float> dopplerLine;   ///< newest sample last
    AlignedArray<float> dopplerBlock;  ///< one block, reserved
    int dopplerLineLength = 0;
    std::int32_t dopplerDelayNew = 0;   ///< samples
    std::int32_t dopplerDelayOld = 0;   ///< samples
    std::int32_t dopplerDelta = 0;      ///< samples, old less new
    float dopplerRate = 1.0f;           ///< read speed in this block
    std::int32_t dopplerReadIndex = 0;  ///< kept for a debugger

private:
    int sampleRate_ = 0;
    int blocklenght_ = 0;
};

}  // namespace tessaly
