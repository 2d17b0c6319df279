// The input side of a block: delay line and filters into the convolver's sliding window.
#pragma once

#include <cstdint>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "convolution/simd/kernels.h"
#include "engine/biquad.h"
#include "engine/doppler_line.h"

namespace tessaly {

class InputFrontEnd {
public:
    /// Designs the four filters at their start cut-offs. Load time: logs.
    void prepareFilters(int sampleRate);
    /// Load time: allocates the window of 2 * `blocklenght` floats.
    void prepareWindow(int blocklenght);

    /// The next block is known to be zeros. Block time.
    void expectSilence() noexcept { expectsSilence_ = true; }
    /// All of the window is zeros. Block time.
    bool windowSilent() const noexcept { return silentBlocks_ == 2; }

    /// Whether the next call of `process`, with the same arguments, leaves nothing but zeros in the
    /// window. Only redesigns of the distance filters may come between. Block time.
    bool seesSilence(const float* input,
                     int inputChannel,
                     bool bassBoost,
                     bool dopplerOn) noexcept TESSALY_NONBLOCKING;

    /// One block of input into the upper half of `inputHistory`. Silence through filters that have
    /// come to rest is not computed. Block time.
    /// @param input         interleaved stereo, `blocklenght` frames
    /// @param inputChannel  0 or 1: which slot of a frame is read
    void process(const float* input,
                 int inputChannel,
                 bool bassBoost,
                 bool dopplerOn,
                 float distance,
                 float distanceOld) noexcept TESSALY_NONBLOCKING;

    /// Air absorption and near-field bass: both cut-offs follow the distance; the filters' state
    /// runs on. Block time.
    void followDistance(float distance) noexcept TESSALY_NONBLOCKING;

    /// Occlusion 0..1 to a cut-off from 20000 to 200 Hz. Block time. @return the former level
    float setInputLowPass(float level) noexcept TESSALY_NONBLOCKING;

    AlignedArray<float> inputHistoryBuffer;
    float* inputHistory = nullptr;  ///< 2 * `blocklenght` floats, newest block in the upper half
    float inputGain = 1.0f;
    float inputLowPassLevel = 0.0f;
    float inputLowPass_Fc = 20000.0f;    ///< Hz
    float highCut_Fc = 20000.0f;         ///< Hz
    float lowCut_Fc = 10.0f;             ///< Hz
    float bassShelveFilter_Fc = 400.0f;  ///< Hz
    Biquad highCutFilter;
    Biquad lowCutFilter;
    Biquad bassShelveFilter;
    Biquad inputLowPass;
    DopplerLine doppler;

private:
    bool staysAtRest(const float* channel, bool bassBoost, bool dopplerOn) noexcept;
    void keepSilence() noexcept;

    const SignalKernels* kernels_ = selectKernels().signal;
    int silentBlocks_ = 0;  ///< newest blocks in the window that are zero throughout, 2 at most
    /// What `seesSilence` found in the block that `process` has not taken yet.
    enum class Ahead : std::uint8_t { Unknown, Silence, Sound };
    Ahead ahead_ = Ahead::Unknown;
    bool expectsSilence_ = false;  ///< of the block that `process` has not taken yet
    int sampleRate_ = 0;
    int blocklenght_ = 0;
};

}  // namespace tessaly
