// Mixes a block out: crossfade after a change of response, normalisation, ambience.
#pragma once

#include <cmath>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "convolution/simd/kernels.h"
#include "engine/ambience.h"

namespace tessaly {

class OutputStage {
public:
    static constexpr int crossfadeLength = 64;  ///< samples

    /// Load time: allocates the result buffers, the second pair and the ramp only for `fading`.
    void prepare(int blocklenght, bool fading);
    /// Zeroes the result buffers.
    void clear() noexcept;

    /// Sets the block's scale. Block time.
    /// @param gainDb      overall level
    /// @param fftLength   transform length: undoes the unscaled transforms
    /// @param compensated headphone compensation is on: a third as loud
    void setBlockGain(float gainDb, int fftLength, bool compensated) noexcept TESSALY_NONBLOCKING;

    /// First 64 samples of the block: the old response's output fades into the new one's. Blocks
    /// shorter than that stop at their end, on an unchanged ramp. Block time.
    void crossfade() noexcept TESSALY_NONBLOCKING;

    /// Block time. @param output 2 * `blocklenght` interleaved floats, left first
    void write(float* output,
               const Ambience& ambience,
               int atmoSelect,
               unsigned int block) const noexcept TESSALY_NONBLOCKING;

    /// A silent result stays silent on its way out: there is no ambience, and the scale is finite.
    /// Block time.
    bool keepsSilence(int atmoSelect) const noexcept TESSALY_NONBLOCKING {
        return atmoSelect == 0 && std::isfinite(1.0f / outputNormalisation);
    }
    int blockLength() const noexcept { return blocklenght_; }

    AlignedArray<float> firstOutLeftBuffer;
    AlignedArray<float> firstOutRightBuffer;
    AlignedArray<float> secondOutLeftBuffer;
    AlignedArray<float> secondOutRightBuffer;
    float* firstOutLeft = nullptr;  ///< 2 * `blocklenght` floats; the upper half is the block
    float* firstOutRight = nullptr;
    float* secondOutLeft = nullptr;  ///< null without `fading`
    float* secondOutRight = nullptr;
    AlignedArray<float> crossfadeRamp;  ///< 128 values: up over the first half, down the second
    bool secondOLSactive = false;       ///< this block is a crossfade block
    float blockGainLinear = 1.0f;
    float outputNormalisation = 1.0f;  ///< divisor of every output sample

private:
    const SignalKernels* kernels_ = selectKernels().signal;
    int blocklenght_ = 0;
};

}  // namespace tessaly
