// Creation, parameters, placing and blocks of one effect instance.
#include "minihost/effect_instance.h"

#include <algorithm>
#include <stdexcept>
#include <string>

#include "minihost/no_allocation_scope.h"
#include "minihost/plugin_library.h"

namespace tessaly {

namespace {

constexpr std::uint32_t isPlayingFlag = 1;

}  // namespace

EffectInstance::EffectInstance(const UnityAudioEffectDefinition& effectDefinition,
                               std::uint32_t sampleRate,
                               std::uint32_t blockLength)
    : effect(&effectDefinition),
      spatialRecord(std::make_unique<UnityAudioSpatializerData>()),
      stateRecord(std::make_unique<UnityAudioEffectState>()) {
    stateRecord->structsize = sizeof(UnityAudioEffectState);
    stateRecord->samplerate = sampleRate;
    stateRecord->flags = isPlayingFlag;
    stateRecord->dspbuffersize = blockLength;
    stateRecord->hostapiversion = hostApiVersion;
    if ((effect->flags & effectFlagIsSpatializer) != 0) {
        spatialRecord->spatialblend = 1.0f;
        spatialRecord->reverbzonemix = 1.0f;
        stateRecord->spatializerdata = spatialRecord.get();
    }
    Pose ahead;
    ahead.position.z = 1.0;
    place(Pose{}, ahead);
    if (effect->create == nullptr || effect->create(stateRecord.get()) != 0) {
        throw std::runtime_error("effect \"" + std::string(fieldText(effect->name)) +
                                 "\" cannot be created");
    }
}

EffectInstance::~EffectInstance() {
    if (effect->release != nullptr) {
        effect->release(stateRecord.get());
    }
}

int EffectInstance::setParameter(int index, float value) {
    return effect->setfloatparameter(stateRecord.get(), index, value);
}

int EffectInstance::setParameter(std::string_view name, float value) {
    return setParameter(indexOrThrow(name), value);
}

std::optional<float> EffectInstance::parameter(int index) const {
    float value = 0.0f;
    if (effect->getfloatparameter(stateRecord.get(), index, &value, nullptr) != 0) {
        return std::nullopt;
    }
    return value;
}

float EffectInstance::parameter(std::string_view name) const {
    const std::optional<float> value = parameter(indexOrThrow(name));
    if (!value) {
        throw std::runtime_error("parameter \"" + std::string(name) + "\" cannot be read");
    }
    return *value;
}

void EffectInstance::setDefaults() {
    int index = 0;
    for (const UnityAudioParameterDefinition& one : parametersOf(*effect)) {
        setParameter(index, one.defaultval);
        ++index;
    }
}

void EffectInstance::place(const Pose& listener, const Pose& source) {
    const Matrix4 listenerMatrix = worldToLocal(listener);
    const Matrix4 sourceMatrix = localToWorld(source);
    std::copy(listenerMatrix.begin(), listenerMatrix.end(), spatialRecord->listenermatrix);
    std::copy(sourceMatrix.begin(), sourceMatrix.end(), spatialRecord->sourcematrix);
    sourceDistance = static_cast<float>(distanceBetween(listener.position, source.position));
}

void EffectInstance::askDistanceCallback() {
    UnityAudioSpatializerData* data = stateRecord->spatializerdata;
    const float curve = minimumDistance / std::max(sourceDistance, minimumDistance);
    lastAttenuation = curve;
    if (data != nullptr && data->distanceattenuationcallback != nullptr) {
        data->distanceattenuationcallback(stateRecord.get(), sourceDistance, curve,
                                          &lastAttenuation);
    }
}

int EffectInstance::processBlock(
    float* in, float* out, std::uint32_t frames, int inChannels, int outChannels) {
    int result = 0;
    {
        const NoAllocationScope scope;
        askDistanceCallback();
        result = effect->process(stateRecord.get(), in, out, frames, inChannels, outChannels);
        lastAllocations = scope.allocations();
        lastReleases = scope.releases();
    }
    stateRecord->prevdsptick = stateRecord->currdsptick;
    stateRecord->currdsptick += frames;
    return result;
}

int EffectInstance::indexOrThrow(std::string_view name) const {
    const int index = parameterIndex(*effect, name);
    if (index < 0) {
        throw std::runtime_error("unknown parameter \"" + std::string(name) + "\"");
    }
    return index;
}

}  // namespace tessaly
