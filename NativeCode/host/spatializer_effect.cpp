// Callbacks of the spatializer effect.
#include "host/spatializer_effect.h"

#include <algorithm>
#include <cmath>

#include "base/flush_denormals.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "convolution/simd/kernels.h"
#include "handler/block_copy.h"
#include "handler/process_state.h"
#include "host/effect_registry.h"
#include "host/reverb_mix_buffers.h"

namespace tessaly {

constinit std::int32_t spatInstanceCount = 0;
constinit std::uint32_t processTick = 0;

namespace {

/// 240 dB, far above what parameters within their ranges can add up to.
constexpr float highestSendGain = 1e12f;

using namespace spatializer;

SpatializerEffect* effectOf(UnityAudioEffectState* state) noexcept {
    return static_cast<SpatializerEffect*>(state->effectdata);
}

/// The handler's side of a parameter.
void setHandlerParameter(InstanceHandler& handler, int index, float value) noexcept {
    switch (index) {
        case P_GAIN:
            handler.masterGainDb = value;
            break;
        case P_DIRECT:
            handler.directGainDb = value;
            break;
        case P_EARLY:
            handler.earlyGainDb = value;
            break;
        case P_REVERB:
            handler.reverbGainDb = value;
            break;
        case P_ANGLE:
            handler.angleExponent = value;
            break;
        case P_DISTANCE:
            handler.distanceScale = value;
            break;
        case P_UNITY_DISTANCE:
            handler.unityDistance = switchedOn(value);
            break;
        case P_AURALIZATION:
            handler.auralisation = switchedOn(value);
            break;
        case P_ROOM_SELECTION:
            handler.roomPreset = truncateToInt32(value);
            break;
        case P_OCCLUSION:
            handler.occlusionTarget = value;
            break;
        case P_REVERB_DISABLE:
            handler.reverbActive = value < 1.0f;
            break;
        case P_INPUT_CHANNEL:
            handler.inputChannel = value;
            break;
        case P_REFLECTION_LP:
            if (value < lowPassOff) {
                handler.reflectionLP = value;
            }
            break;
        case P_REVERB_LP:
            if (value < lowPassOff) {
                handler.reverbLP = value;
            }
            break;
        case P_ROOM_SIZE:
            handler.roomSize = roomSizeFactor(value);
            break;
        case P_BASS_BOOST:
            handler.bassBoost = value < 1.0f;
            break;
        case P_BYPASS:
            handler.bypassExternal = switchedOn(value);
            break;
        default:
            break;
    }
}

/// Sends are told by three parameters in turn: "Reverb Size" starts anew, then each send comes as
/// "Reverb ID" and "Reverb Send", of which the last one moves on. What is beyond the last place
/// is ignored.
void setSendParameter(SpatializerEffect& effect, int index, float value) noexcept {
    const auto position = static_cast<std::size_t>(effect.reverbSendPos);
    const bool hasPlace = position < maximumSends;
    if (index == P_REVERB_SIZE) {
        effect.reverbSendPos = 0;
        effect.reverbSendCount = truncateToInt32(value);
    } else if (index == P_SEND_REVERB_ID && hasPlace) {
        effect.reverbSendId[position] = truncateToInt32(value);
    } else if (index == P_REVERB_SEND && hasPlace) {
        effect.reverbSendDb[position] = truncateToInt32(value);
        effect.reverbSendPos += 1;
    }
}

/// Buffers go through as they are when the host does not want panning or says too little for it.
void passThrough(const float* in,
                 float* out,
                 std::size_t length,
                 int inchannels,
                 int outchannels) noexcept TESSALY_NONBLOCKING {
    if (inchannels != 1 || in == nullptr || out == nullptr) {
        copyOrZero(in, floatsIn(length, inchannels), out, floatsIn(length, outchannels));
        return;
    }
    const std::size_t stride = floatsIn(1, outchannels);
    for (std::size_t i = 0; i < length; ++i) {
        std::fill_n(out + i * stride, stride, in[i]);
    }
}

/// Gain by distance of what a source sends.
float sendDistanceGain(const InstanceHandler& handler) noexcept TESSALY_NONBLOCKING {
    if (handler.unityDistance) {
        return handler.unityReverbMix;
    }
    const SpatialEngine* engine = handler.isLoaded ? handler.activeEngine() : nullptr;
    return engine != nullptr ? engine->getReverbDistanceGain() : 1.0f;
}

/// Adds the dry input to the mix buffers of the source's reverbs, whatever the engine's state.
void sendToReverbs(SpatializerEffect& effect,
                   const float* in,
                   std::size_t length,
                   int inchannels) noexcept TESSALY_NONBLOCKING {
    const InstanceHandler& handler = *effect.handler;
    if (handler.reverbActive || effect.reverbSendCount <= 0 || handler.bypassExternal ||
        in == nullptr) {
        return;
    }
    const float reverbGain = effect.sendReverbGain.of(handler.reverbGainDb);
    const float masterGain = effect.sendMasterGain.of(handler.masterGainDb);
    const float distanceGain = sendDistanceGain(handler);

    const std::size_t count =
        std::min(static_cast<std::size_t>(effect.reverbSendCount), maximumSends);
    effect.reverbSends.clear();
    for (std::size_t i = 0; i < count; ++i) {
        effect.reverbSends.push_back(
            {effect.reverbSendId[i], static_cast<float>(effect.reverbSendDb[i])});
    }
    // Silence adds nothing; any other channel count than these two neither. What the handler found
    // does not count: a host may use one buffer for both directions.
    const bool adds = (inchannels == 1 || inchannels == 2) &&
                      !selectKernels().signal->isSilent(floatsIn(length, inchannels), in);
    for (std::size_t i = 0; i < count; ++i) {
        const ReverbSend& send = effect.reverbSends[i];
        ReverbMixBuffer* mix = findMixBuffer(send.id);
        if (mix == nullptr) {
            logTrace("Tessaly_s: Reverb ID ", send.id,
                     " does not exist in Tessaly Reverb Plugins ");
            continue;
        }
        const float gain =
            effect.sendGains[i].of(send.levelDb) * reverbGain * masterGain * distanceGain;
        // One source without a proper level must not spoil the reverb of all others: whatever is
        // no number, or would overflow on its way through the return, is dropped.
        if (adds && std::fabs(gain) <= highestSendGain) {
            addToMixBuffer(*mix, in, length, inchannels, gain);
        }
    }
}

}  // namespace

int registerSpatializerParameters(UnityAudioEffectDefinition& definition) {
    const int count = registerParameterRows(definition, parameterRows);
    definition.flags |= effectFlagIsSpatializer;
    return count;
}

int TESSALY_HOST_CALL spatializerCreate(UnityAudioEffectState* state) {
    auto* effect = new SpatializerEffect;
    state->effectdata = effect;
    if (hasSpatializerFields(*state) && state->spatializerdata != nullptr) {
        state->spatializerdata->distanceattenuationcallback = &spatializerDistanceAttenuation;
    }
    InitParametersFromDefinitions(&registerSpatializerParameters, effect->p.data());
    effect->instanceNo = spatInstanceCount++;
    effect->reverbSends.reserve(maximumSends);
    effect->handler = std::make_unique<InstanceHandler>(static_cast<int>(state->samplerate),
                                                        hostBlockSize(*state));
    return callbackOk;
}

int TESSALY_HOST_CALL spatializerRelease(UnityAudioEffectState* state) {
    delete effectOf(state);
    state->effectdata = nullptr;
    return callbackOk;
}

int TESSALY_HOST_CALL spatializerSetFloatParameter(UnityAudioEffectState* state,
                                                   int index,
                                                   float value) {
    SpatializerEffect* effect = effectOf(state);
    if (effect == nullptr || index < 0 || index >= P_COUNT) {
        return callbackUnsupported;
    }
    if (effect->handler != nullptr) {
        setHandlerParameter(*effect->handler, index, value);
        setSendParameter(*effect, index, value);
    }
    effect->p[static_cast<std::size_t>(index)] =
        index == P_SEND_REVERB_ID ? static_cast<float>(truncateToInt32(value)) : value;
    return callbackOk;
}

int TESSALY_HOST_CALL spatializerGetFloatParameter(UnityAudioEffectState* state,
                                                   int index,
                                                   float* value,
                                                   char* valuestr) {
    const SpatializerEffect* effect = effectOf(state);
    return effect != nullptr ? getFloatParameter(effect->p, index, value, valuestr)
                             : callbackUnsupported;
}

int TESSALY_HOST_CALL spatializerDistanceAttenuation(UnityAudioEffectState* state,
                                                     float distanceIn,
                                                     float attenuationIn,
                                                     float* /*attenuationOut*/) {
    const SpatializerEffect* effect = effectOf(state);
    if (effect == nullptr || effect->handler == nullptr) {
        logTrace("Tessaly_s: Tessaly_instance not constructed yet, so no distance is transmitted!");
        return callbackOk;
    }
    InstanceHandler& handler = *effect->handler;
    handler.unityAttenuation = attenuationIn;
    if (hasSpatializerFields(*state) && state->spatializerdata != nullptr) {
        handler.unityReverbMix = state->spatializerdata->reverbzonemix;
    }
    handler.distance = distanceIn;
    handler.unityDistanceMute = attenuationIn <= 0.0f && handler.unityDistance;
    return callbackOk;
}

int TESSALY_HOST_CALL spatializerProcess(UnityAudioEffectState* state,
                                         float* inbuffer,
                                         float* outbuffer,
                                         unsigned int length,
                                         int inchannels,
                                         int outchannels) {
    const FlushDenormalsScope flushDenormals;
    ++processTick;
    if (outchannels != 2 || !hasSpatializerFields(*state) || state->spatializerdata == nullptr) {
        passThrough(inbuffer, outbuffer, length, inchannels, outchannels);
        return callbackOk;
    }
    SpatializerEffect* effect = effectOf(state);
    if (effect == nullptr || effect->handler == nullptr) {
        logTrace("Tessaly_s: ProcessCallback: Tessaly_instance not existing yet!");
        copyOrZero(nullptr, 0, outbuffer, floatsIn(length, outchannels));
        return callbackOk;
    }

    InstanceHandler& handler = *effect->handler;
    if (state->dspbuffersize != 0) {
        buffersizeSpat = static_cast<int>(state->dspbuffersize);
    }
    handler.checkForChanges(static_cast<int>(state->samplerate), buffersizeSpat);

    const UnityAudioSpatializerData& spatial = *state->spatializerdata;
    const SourceAngles& angles = effect->angles.of(spatial.listenermatrix, spatial.sourcematrix);
    handler.azimuth = angles.azimuth;
    handler.elevation = angles.elevation;

    if (handler.isLoaded) {
        effect->lastResult =
            handler.processBlock(inbuffer, outbuffer, length, inchannels, outchannels);
    } else {
        logTrace("Tessaly_s: WARNING: set Buffer No ", processTick, " to 0");
        copyOrZero(nullptr, 0, outbuffer, floatsIn(length, outchannels));
    }
    sendToReverbs(*effect, inbuffer, length, inchannels);
    return callbackOk;
}

}  // namespace tessaly
