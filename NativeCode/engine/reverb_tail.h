// The room's late sound: loading it, and adding it to the composed response.
#pragma once

#include <cstdint>
#include <string>

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "convolution/simd/kernels.h"
#include "engine/biquad.h"
#include "resources/wav_reader.h"

namespace tessaly {

class ReverbTail {
public:
    /// Load time: reads a file. Sets length, samples and gain of a preset.
    /// @param preset  0..60; any other resets `qvReverb` to 0
    /// @param source  data directory, packed file and sample rate
    void loadIReverb(std::int16_t preset, std::int16_t& qvReverb, WavSource source);

    /// The measured tail into both ears, low-passed if the room says so. Block time.
    /// @param bufferSize  floats behind `left` and `right`; samples beyond are dropped
    void addTail(float* left,
                 float* right,
                 int bufferSize,
                 float reverbLP_Fc,
                 int sampleRate,
                 float gain) noexcept TESSALY_NONBLOCKING;
    /// Memory for the filtered form of the first frames, if the room has a filter. Load time:
    /// allocates.
    void prepareStart(int frames);
    /// Frames at the start that `addStart` can give.
    int startFrames(float reverbLP_Fc) const noexcept;
    /// Filters the start anew. Block time.
    void refreshStart(float reverbLP_Fc, int sampleRate) noexcept TESSALY_NONBLOCKING;
    /// Adds some of the first frames only, as `addTail` does. Block time.
    /// @param left, right  frames from `begin` on
    /// @param begin, end   up to `startFrames`
    void addStart(float* left, float* right, int begin, int end, float reverbLP_Fc, float gain)
        const noexcept TESSALY_NONBLOCKING;
    /// The synthetic tail of 26 sparse HRIRs. Block time.
    void addSyntheticTail(float* left,
                          float* right,
                          int bufferSize,
                          int hrirLength,
                          int limitTheta,
                          float reverbMixGain) noexcept TESSALY_NONBLOCKING;
    /// Cuts the summed response to the room's size; direct sound that lies there is cut too.
    /// Block time.
    void cutToRoomSize(float* left,
                       float* right,
                       int bufferSize,
                       float roomSizeFactor) const noexcept TESSALY_NONBLOCKING;

    int reverbLength = 0;          ///< frames
    AlignedArray<float> reverbIR;  ///< pairs, left first
    float reverbPresetGain = 0.0f;
    std::int16_t reverbTableEntries = 60;
    bool loadingReverb = false;
    std::string reverbDataName;
    std::string IRfilePath;
    bool hasReverbLowPass = false;
    Biquad reverbLowPass;

private:
    const SignalKernels* kernels_ = selectKernels().signal;
    AlignedArray<float> filteredLeft_;   ///< the start through the low-pass, without a gain
    AlignedArray<float> filteredRight_;  ///< likewise
    bool filtered(float reverbLP_Fc) const noexcept;
};

}  // namespace tessaly
