// "Tessaly Reverb", the return effect that renders one room for many sources.
#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "handler/instance_handler.h"
#include "host/audio_plugin_interface.h"
#include "host/parameter_tables.h"

namespace tessaly {

/// What `effectdata` points at.
struct ReverbEffect {
    /// Parameters as the host sees them; `p[P_REVERB_ID]` is a whole number, 0 meaning none.
    std::array<float, reverb::P_COUNT> p{};
    std::unique_ptr<InstanceHandler> handler;
    std::uint8_t lastResult = 0;
    std::int32_t instanceNo = 0;
};

/// Reverbs created so far, never less. Written by Create.
extern constinit std::int32_t reverbInstanceCount;

/// Registers the 9 parameters. Load time.
int registerReverbParameters(UnityAudioEffectDefinition& definition);

// The callbacks. All return callbackOk, those with an index callbackUnsupported outside its range.

/// Load time.
int TESSALY_HOST_CALL reverbCreate(UnityAudioEffectState* state);
/// Load time. Erases the mix buffer of its ID, also where another reverb shares it.
int TESSALY_HOST_CALL reverbRelease(UnityAudioEffectState* state);
/// Renders what the sources have sent to the reverb's ID and empties that buffer; the host's own
/// input does not count. Block time, except in the block that loads an engine.
int TESSALY_HOST_CALL reverbProcess(UnityAudioEffectState* state,
                                    float* inbuffer,
                                    float* outbuffer,
                                    unsigned int length,
                                    int inchannels,
                                    int outchannels);
/// "ReverbID" allocates and moves mix buffers; all others only store.
int TESSALY_HOST_CALL reverbSetFloatParameter(UnityAudioEffectState* state, int index, float value);
int TESSALY_HOST_CALL reverbGetFloatParameter(UnityAudioEffectState* state,
                                              int index,
                                              float* value,
                                              char* valuestr);

}  // namespace tessaly
