// One effect instance with the records a host keeps for it, driven block by block.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>

#include "host/audio_plugin_interface.h"
#include "minihost/pose.h"

namespace tessaly {

/// Plays the mixer for one instance: owns its state record and, for a spatializer, the matrices;
/// creates it, sets its parameters, asks its distance callback before each block and processes.
/// The host's own volume curve is asked for and handed over, but not applied to the audio, so
/// that what is heard is the library alone.
class EffectInstance {
public:
    /// Calls the effect's create callback. A spatializer starts with the source one metre ahead.
    /// @param sampleRate   Hz
    /// @param blockLength  frames, as told to the effect; 0 is a host that does not say
    /// @throws std::runtime_error if the callback is missing or fails
    EffectInstance(const UnityAudioEffectDefinition& effectDefinition,
                   std::uint32_t sampleRate,
                   std::uint32_t blockLength);

    /// Calls the release callback.
    ~EffectInstance();
    EffectInstance(const EffectInstance&) = delete;
    EffectInstance& operator=(const EffectInstance&) = delete;

    const UnityAudioEffectDefinition& definition() const noexcept { return *effect; }

    /// The records themselves, for a test that plays an unusual host.
    UnityAudioEffectState& state() noexcept { return *stateRecord; }
    UnityAudioSpatializerData& spatializerData() noexcept { return *spatialRecord; }

    /// @returns what the callback returned: 0, or 1 for an index it does not know
    int setParameter(int index, float value);

    /// @throws std::runtime_error if there is no parameter of that name
    int setParameter(std::string_view name, float value);

    /// @returns the value, or nothing if the callback refuses the index
    std::optional<float> parameter(int index) const;

    /// @throws std::runtime_error if there is no parameter of that name
    float parameter(std::string_view name) const;

    /// Sets every parameter to its declared default, in index order, as a host does that restores
    /// a saved effect. Create alone leaves some of the library's inner values elsewhere.
    void setDefaults();

    /// Writes both matrices and the distance of the blocks to come.
    void place(const Pose& listener, const Pose& source);

    /// Metres from listener to source, as last placed.
    float distance() const noexcept { return sourceDistance; }

    /// Distance up to which the host's 1/d curve is 1. Metres, above 0.
    void setMinimumDistance(float metres) noexcept { minimumDistance = metres; }

    /// The attenuation after the last block's callback: the curve, or what the effect replaced it
    /// by.
    float attenuation() const noexcept { return lastAttenuation; }

    /// One mixer block. Block time: allocates nothing itself; what the effect does is counted.
    /// @param in   frames * inChannels floats, interleaved
    /// @param out  frames * outChannels floats, interleaved
    /// @returns what the process callback returned
    int processBlock(
        float* in, float* out, std::uint32_t frames, int inChannels = 2, int outChannels = 2);

    /// Allocations and releases inside the last processBlock, distance callback included.
    std::uint64_t blockAllocations() const noexcept { return lastAllocations; }
    std::uint64_t blockReleases() const noexcept { return lastReleases; }

private:
    void askDistanceCallback();
    int indexOrThrow(std::string_view name) const;

    const UnityAudioEffectDefinition* effect;
    std::unique_ptr<UnityAudioSpatializerData> spatialRecord;
    std::unique_ptr<UnityAudioEffectState> stateRecord;
    float sourceDistance = 1.0f;
    float minimumDistance = 1.0f;
    float lastAttenuation = 1.0f;
    std::uint64_t lastAllocations = 0;
    std::uint64_t lastReleases = 0;
};

}  // namespace tessaly
