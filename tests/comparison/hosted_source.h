// One source in a game, twice: an effect of the built library and the reference's spatializer.
#pragma once

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "comparison/deviation.h"
#include "minihost/effect_instance.h"
#include "minihost/plugin_library.h"
#include "minihost/pose.h"
#include "support/reference/reference_spatializer.h"

namespace tessaly::test {

/// Parameter indices of the spatializer.
namespace parameter {
inline constexpr int gain = 0;
inline constexpr int direct = 1;
inline constexpr int angle = 4;
inline constexpr int distanceFactor = 5;
inline constexpr int unityDistance = 6;
inline constexpr int auralization = 7;
inline constexpr int roomSelection = 8;
inline constexpr int occlusion = 9;
inline constexpr int reverbDisable = 10;
inline constexpr int inputChannel = 11;
inline constexpr int roomSize = 14;
inline constexpr int bassBoost = 15;
inline constexpr int bypass = 16;
}  // namespace parameter

/// The loaded library and the reference's process, told the same data directory. The library takes
/// its path once and keeps its process-wide values until the program ends: one of these a program.
class Game {
public:
    explicit Game(const std::string& directory);
    Game(const Game&) = delete;
    Game& operator=(const Game&) = delete;

    PluginLibrary library;
    reference::Process process;
    bool pathTaken = false;

private:
    std::map<std::pair<int, int>, reference::HrirFile> files_;  ///< each is read once
};

/// The effect with its host's records, and the reference's.
class HostedSource {
public:
    HostedSource(Game& game, int sampleRate, int blockLength);

    /// A parameter of both.
    void set(int index, float value);

    /// What the host says of the mixer from the next block on.
    void setFormat(int sampleRate, int blockLength);

    /// One block of this source's own noise with both poses as they stand, compared.
    /// @param frames  0 for the mixer's block length
    ::testing::AssertionResult play(Deviation& deviation, int inChannels = 2, int frames = 0);

    /// Starts the noise anew with a seed.
    void seedNoise(unsigned seed) { noise_.seed(seed); }

    reference::Handler& handler() { return reference_.handler; }
    /// The last block of the library, interleaved stereo.
    const std::vector<float>& heard() const { return out_; }

    Pose listener;
    Pose source{{0.0, 0.0, 1.0}};
    float attenuation = 1.0f;
    float noisePeak = 0.25f;

private:
    EffectInstance effect_;
    reference::Spatializer reference_;
    std::mt19937 noise_{5};
    std::vector<float> in_;
    std::vector<float> out_;
    std::vector<double> expected_;
    int block_ = 0;
};

/// Parameter indices of the return.
namespace return_parameter {
inline constexpr int gain = 0;
inline constexpr int reverb = 1;
inline constexpr int roomSelection = 2;
inline constexpr int mute = 3;
inline constexpr int roomSize = 5;
inline constexpr int bypass = 7;
inline constexpr int reverbId = 8;
}  // namespace return_parameter

/// A return: the effect of the library, and the reference's handler that reads the mix buffer of
/// its ID.
class HostedReturn {
public:
    /// @param id  above 0, taken by nobody else
    HostedReturn(Game& game, int sampleRate, int blockLength, int id);
    ~HostedReturn();
    HostedReturn(const HostedReturn&) = delete;
    HostedReturn& operator=(const HostedReturn&) = delete;

    /// A parameter of both, all but the ID.
    void set(int index, float value);

    /// One block, compared; what the sources have sent is taken from both.
    ::testing::AssertionResult play(Deviation& deviation);

    reference::Handler& handler() { return reference_; }
    /// The last block of the library, interleaved stereo.
    const std::vector<float>& heard() const { return out_; }

private:
    Game& game_;
    int id_;
    EffectInstance effect_;
    reference::Handler reference_;
    std::vector<float> in_;
    std::vector<float> out_;
    std::vector<double> expected_;
    int block_ = 0;
};

/// Listener and source walk and turn: where they are in this block.
void walk(HostedSource& one, int block);

}  // namespace tessaly::test
