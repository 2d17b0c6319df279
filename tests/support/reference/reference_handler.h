// Instance handler of the reference: host values to engine inputs, reloads, render, bypass,
// silence.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <vector>

#include "support/reference/reference_engine.h"

namespace tessaly::reference {

/// The preset that a "Room Selection" value stands for, 0 for none and for anything above 52.
int roomPresetOf(int roomSelection);

/// One handler. The fields of the host side are written freely between blocks.
class Handler {
public:
    explicit Handler(Process& process) : process_(process) {}

    // Settings that cause a reload.
    int roomPreset = -1;
    bool fading = true;
    bool auralisation = false;
    bool doppler = false;
    bool reverbActive = true;

    // Live values.
    float azimuth = 0.0f;
    float elevation = 0.0f;
    float reverbGainDb = 0.0f;
    float earlyGainDb = 0.0f;
    float masterGainDb = 0.0f;
    float directGainDb = 0.0f;
    float occlusion = 0.0f;
    float occlusionTarget = 0.0f;
    float distance = 9.0f;
    float roomSize = 1.0f;
    float distanceScale = 1.0f;
    float angleExponent = 1.0f;
    float reflectionLP = 20000.0f;
    float reverbLP = 20000.0f;
    bool unityDistance = false;
    float unityAttenuation = 0.0f;
    float unityReverbMix = 1.0f;
    bool unityDistanceMute = false;
    bool bassBoost = true;
    float inputChannel = 0.0f;
    bool bypassExternal = false;
    bool alwaysUpdateFilter = true;  ///< a return's handler clears it

    /// Changes the options of every engine that is about to be built: preset rows, tails.
    std::function<void(EngineOptions&)> adjustOptions;

    /// @return true if a load was made
    bool checkForChanges(int sampleRate, int blockSize);

    /// One block through the render, the bypass or the silence path.
    /// @param output  interleaved stereo, 2 * frames; rewritten
    void processBlock(std::span<const double> input,
                      int frames,
                      int inputChannels,
                      std::vector<double>& output);
    void processBlock(std::span<const float> input,
                      int frames,
                      int inputChannels,
                      std::vector<double>& output);

    bool isLoaded() const { return isLoaded_; }
    const SourceInputs& inputs() const { return inputs_; }
    const MixLevels& mix() const { return mix_; }
    /// The engine in use, null before the first load.
    const Engine* engine() const { return engine_.get(); }
    Engine* engine() { return engine_.get(); }

private:
    void load(int sampleRate, int blockSize);
    void setAngleAndDistance();
    void setMix();
    void fillInput(std::span<const double> input, int frames, int inputChannels);

    Process& process_;
    SourceInputs inputs_;
    MixLevels mix_;
    std::unique_ptr<Engine> engine_;
    std::vector<double> inputBlock_;
    bool isLoaded_ = false;
    bool attempted_ = false;

    // What the engine in use was built with.
    int sampleRate_ = 0;
    int blockSize_ = 0;
    std::int16_t roomPresetIn_ = -1;
    bool fadingIn_ = false;
    bool auralisationIn_ = false;
    bool dopplerIn_ = false;
    bool reverbActiveIn_ = false;
    bool bypass3DAudioIn_ = false;
};

}  // namespace tessaly::reference
