// "Tessaly Engine", the effect the host puts on each sound source in place of its panning.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "base/linear_level.h"
#include "handler/instance_handler.h"
#include "host/audio_plugin_interface.h"
#include "host/parameter_tables.h"
#include "host/source_angles.h"

namespace tessaly {

/// Sends that one source can have.
inline constexpr std::size_t maximumSends = 50;

/// One send of a block.
struct ReverbSend {
    std::int32_t id;
    float levelDb;
};

/// What `effectdata` points at.
struct SpatializerEffect {
    std::array<float, spatializer::P_COUNT> p{};  ///< parameters as the host sees them
    std::vector<ReverbSend> reverbSends;          ///< rebuilt in each block
    std::unique_ptr<InstanceHandler> handler;
    std::uint8_t lastResult = 0;
    std::int32_t instanceNo = 0;
    std::int32_t reverbSendPos = 0;    ///< where the next "Reverb ID" and "Reverb Send" go
    std::int32_t reverbSendCount = 0;  ///< "Reverb Size", unchecked
    std::array<std::int32_t, maximumSends> reverbSendId{};
    std::array<std::int32_t, maximumSends> reverbSendDb{};  ///< whole dB

    // What Process keeps from block to block.

    KeptSourceAngles angles;
    LinearLevel sendReverbGain;
    LinearLevel sendMasterGain;
    std::array<LinearLevel, maximumSends> sendGains;
};

/// Spatializers created so far, never less. Written by Create.
extern constinit std::int32_t spatInstanceCount;
/// Process calls of all spatializers, for log text.
extern constinit std::uint32_t processTick;

/// Registers the 20 parameters and marks the effect as a spatializer. Load time.
int registerSpatializerParameters(UnityAudioEffectDefinition& definition);

// The callbacks. All return callbackOk, those with an index callbackUnsupported outside its range.

/// Load time.
int TESSALY_HOST_CALL spatializerCreate(UnityAudioEffectState* state);
/// Load time.
int TESSALY_HOST_CALL spatializerRelease(UnityAudioEffectState* state);
/// Block time, except in the block that loads an engine.
int TESSALY_HOST_CALL spatializerProcess(UnityAudioEffectState* state,
                                         float* inbuffer,
                                         float* outbuffer,
                                         unsigned int length,
                                         int inchannels,
                                         int outchannels);
/// Values are not clamped; switches are on from 1.0, numbers truncate toward zero.
int TESSALY_HOST_CALL spatializerSetFloatParameter(UnityAudioEffectState* state,
                                                   int index,
                                                   float value);
int TESSALY_HOST_CALL spatializerGetFloatParameter(UnityAudioEffectState* state,
                                                   int index,
                                                   float* value,
                                                   char* valuestr);
/// Takes the host's distance and attenuation; leaves `attenuationOut`, so that the host's curve
/// stays in force for the host.
int TESSALY_HOST_CALL spatializerDistanceAttenuation(UnityAudioEffectState* state,
                                                     float distanceIn,
                                                     float attenuationIn,
                                                     float* attenuationOut);

}  // namespace tessaly
