// Callbacks of the reverb effect.
#include "host/reverb_effect.h"

#include <algorithm>

#include "base/flush_denormals.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "handler/block_copy.h"
#include "handler/process_state.h"
#include "host/effect_registry.h"
#include "host/reverb_mix_buffers.h"

namespace tessaly {

constinit std::int32_t reverbInstanceCount = 0;

namespace {

using namespace reverb;

/// Takes direct sound and reflections out of a return's response.
constexpr float silentDb = -96.0f;

ReverbEffect* effectOf(UnityAudioEffectState* state) noexcept {
    return static_cast<ReverbEffect*>(state->effectdata);
}

std::int32_t reverbIdOf(const ReverbEffect& effect) noexcept {
    return truncateToInt32(effect.p[P_REVERB_ID]);
}

/// Makes a fresh handler one of a return: nothing but the tail, from straight ahead, at the start
/// distance of 9 m for its whole life, since no distance callback exists. Its `inputChannel` stays
/// in the middle, so the sends, which are on the left only, enter at half level: this is part of
/// the level design.
void makeReverbHandler(InstanceHandler& handler) noexcept {
    handler.fading = false;
    handler.earlyGainDb = silentDb;
    handler.directGainDb = silentDb;
    handler.auralisation = false;
    handler.reverbActive = true;
    handler.azimuthIn = 0;
    handler.distanceIn = 1.0f;
    handler.alwaysUpdateFilter = false;
}

/// The handler's side of a parameter.
void setHandlerParameter(InstanceHandler& handler, int index, float value) noexcept {
    switch (index) {
        case P_GAIN:
            handler.masterGainDb = value;
            break;
        case P_REVERB:
            handler.reverbGainDb = value;
            break;
        case P_ROOM_SELECTION:
            handler.roomPreset = truncateToInt32(value);
            break;
        case P_MUTE:
            // A room without a tail: the change loads a new engine.
            handler.reverbActive = value < 1.0f;
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

/// The mix buffer to render, null if there is nothing to take part in.
ReverbMixBuffer* mixBufferOf(const ReverbEffect& effect) noexcept TESSALY_NONBLOCKING {
    const std::int32_t id = reverbIdOf(effect);
    return effect.handler->isLoaded && id != 0 ? findMixBuffer(id) : nullptr;
}

}  // namespace

int registerReverbParameters(UnityAudioEffectDefinition& definition) {
    return registerParameterRows(definition, parameterRows);
}

int TESSALY_HOST_CALL reverbCreate(UnityAudioEffectState* state) {
    auto* effect = new ReverbEffect;
    state->effectdata = effect;
    InitParametersFromDefinitions(&registerReverbParameters, effect->p.data());
    effect->instanceNo = reverbInstanceCount++;
    effect->handler = std::make_unique<InstanceHandler>(static_cast<int>(state->samplerate),
                                                        hostBlockSize(*state));
    makeReverbHandler(*effect->handler);
    return callbackOk;
}

int TESSALY_HOST_CALL reverbRelease(UnityAudioEffectState* state) {
    const ReverbEffect* effect = effectOf(state);
    if (effect != nullptr) {
        reverbmixbuffermap.erase(reverbIdOf(*effect));
        delete effect;
        state->effectdata = nullptr;
    }
    return callbackOk;
}

int TESSALY_HOST_CALL reverbSetFloatParameter(UnityAudioEffectState* state,
                                              int index,
                                              float value) {
    ReverbEffect* effect = effectOf(state);
    if (effect == nullptr || index < 0 || index >= P_COUNT) {
        return callbackUnsupported;
    }
    if (index == P_REVERB_ID) {
        const std::int32_t newId = truncateToInt32(value);
        changeReverbId(reverbIdOf(*effect), newId);
        effect->p[P_REVERB_ID] = static_cast<float>(newId);
        logTrace("Tessaly_sr: set float P_REVERB_ID to ", value, " equals valueIn ", newId);
        return callbackOk;
    }
    if (effect->handler != nullptr) {
        setHandlerParameter(*effect->handler, index, value);
    }
    effect->p[static_cast<std::size_t>(index)] = value;
    return callbackOk;
}

int TESSALY_HOST_CALL reverbGetFloatParameter(UnityAudioEffectState* state,
                                              int index,
                                              float* value,
                                              char* valuestr) {
    const ReverbEffect* effect = effectOf(state);
    return effect != nullptr ? getFloatParameter(effect->p, index, value, valuestr)
                             : callbackUnsupported;
}

int TESSALY_HOST_CALL reverbProcess(UnityAudioEffectState* state,
                                    float* inbuffer,
                                    float* outbuffer,
                                    unsigned int length,
                                    int inchannels,
                                    int outchannels) {
    const FlushDenormalsScope flushDenormals;
    const std::size_t wanted = floatsIn(length, outchannels);
    ReverbEffect* effect = effectOf(state);
    if (inchannels != 2 || outchannels != 2 || effect == nullptr) {
        copyOrZero(inbuffer, floatsIn(length, inchannels), outbuffer, wanted);
        return callbackOk;
    }

    InstanceHandler& handler = *effect->handler;
    if (const int size = hostBlockSize(*state); size != 0) {
        buffersizeReverb = size;
    }
    handler.checkForChanges(static_cast<int>(state->samplerate), buffersizeReverb);

    ReverbMixBuffer* mix = mixBufferOf(*effect);
    // A block longer than the mix buffer cannot have been filled and is silent too.
    if (mix == nullptr || length > mixBufferFrames) {
        logTrace("Tessaly_sr: WARNING mute buffer in ReverbID ", reverbIdOf(*effect),
                 " cause isLoaded = ", handler.isLoaded, " or ID == 0 = ", reverbIdOf(*effect) == 0,
                 " or -> second = ", mix != nullptr);
        copyOrZero(nullptr, 0, outbuffer, wanted);
        return callbackOk;
    }
    effect->lastResult = handler.processBlock(mix->data(), outbuffer, length, 2, 2);
    // A return that nobody plays to finds zeros and leaves them.
    if (!handler.inputWasSilent()) {
        std::fill_n(mix->begin(), wanted, 0.0f);
    }
    return callbackOk;
}

}  // namespace tessaly
