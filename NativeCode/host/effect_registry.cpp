// Builds the definitions that the host asks for.
#include "host/effect_registry.h"

#include <algorithm>
#include <array>
#include <cstring>

#include "host/reverb_effect.h"
#include "host/spatializer_effect.h"

namespace tessaly {

namespace {

constexpr std::size_t registryCapacity = 256;

// Written by the first call of the entry, read by the host for as long as the library lives.
constinit std::array<UnityAudioEffectDefinition, registryCapacity> definitions{};
constinit std::array<UnityAudioEffectDefinition*, registryCapacity> definitionTable{};
constinit int definitionCount = 0;

template <std::size_t size>
void boundedCopy(char (&field)[size], const char* text) {
    const std::size_t length = std::min(text != nullptr ? std::strlen(text) : 0, size - 1);
    std::fill(std::copy_n(text, length, field), field + size, '\0');
}

/// Heap copy that the host may keep; null stays null.
const char* copyText(const char* text) {
    if (text == nullptr) {
        return nullptr;
    }
    const std::size_t bytes = std::strlen(text) + 1;
    char* copy = new char[bytes];
    std::memcpy(copy, text, bytes);
    return copy;
}

struct EffectCallbacks {
    CreateCallback create;
    ReleaseCallback release;
    ProcessCallback process;
    SetFloatParameterCallback setfloatparameter;
    GetFloatParameterCallback getfloatparameter;
};

void addDefinition(const char* name,
                   const EffectCallbacks& callbacks,
                   ParameterRegistration registerParameters) {
    UnityAudioEffectDefinition& definition =
        definitions[static_cast<std::size_t>(definitionCount++)];
    definition = {};
    boundedCopy(definition.name, name);
    definition.structsize = sizeof(UnityAudioEffectDefinition);
    definition.paramstructsize = sizeof(UnityAudioParameterDefinition);
    definition.apiversion = hostApiVersion;
    definition.pluginversion = pluginVersion;
    definition.channels = 0;
    definition.create = callbacks.create;
    definition.release = callbacks.release;
    definition.process = callbacks.process;
    definition.setfloatparameter = callbacks.setfloatparameter;
    definition.getfloatparameter = callbacks.getfloatparameter;
    definition.getfloatbuffer = &getFloatBufferStub;
    registerParameters(definition);
}

}  // namespace

int getAudioEffectDefinitions(UnityAudioEffectDefinition*** table) {
    if (definitionCount == 0) {
        addDefinition("Tessaly Engine",
                      {&spatializerCreate, &spatializerRelease, &spatializerProcess,
                       &spatializerSetFloatParameter, &spatializerGetFloatParameter},
                      &registerSpatializerParameters);
        // No side-chain flag: its audio comes through our own mix buffers, not the host's sends.
        addDefinition("Tessaly Reverb",
                      {&reverbCreate, &reverbRelease, &reverbProcess, &reverbSetFloatParameter,
                       &reverbGetFloatParameter},
                      &registerReverbParameters);
    }
    for (std::size_t i = 0; i < static_cast<std::size_t>(definitionCount); ++i) {
        definitionTable[i] = &definitions[i];
    }
    if (table != nullptr) {
        *table = definitionTable.data();
    }
    return definitionCount;
}

void RegisterParameter(UnityAudioEffectDefinition& definition,
                       const char* name,
                       const char* unit,
                       float min,
                       float max,
                       float defaultval,
                       int index,
                       const char* description) {
    UnityAudioParameterDefinition& parameter = definition.paramdefs[index];
    boundedCopy(parameter.name, name);
    boundedCopy(parameter.unit, unit);
    parameter.description = copyText(description != nullptr ? description : name);
    parameter.defaultval = defaultval;
    parameter.displayscale = 1.0f;
    parameter.displayexponent = 1.0f;
    parameter.min = min;
    parameter.max = max;
    const auto number = static_cast<std::uint32_t>(index);
    if (number >= definition.numparameters) {
        definition.numparameters = number + 1;
    }
}

int registerParameterRows(UnityAudioEffectDefinition& definition,
                          std::span<const ParameterRow> rows) {
    definition.paramdefs = new UnityAudioParameterDefinition[rows.size()]{};
    int index = 0;
    for (const ParameterRow& row : rows) {
        RegisterParameter(definition, row.name, row.unit, row.min, row.max, row.defaultval, index++,
                          row.description);
    }
    return index;
}

void InitParametersFromDefinitions(ParameterRegistration registerParameters, float* values) {
    UnityAudioEffectDefinition scratch{};
    const int count = registerParameters(scratch);
    for (int i = 0; i < count; ++i) {
        values[i] = scratch.paramdefs[i].defaultval;
        delete[] scratch.paramdefs[i].description;
    }
    delete[] scratch.paramdefs;
}

int getFloatParameter(std::span<const float> values,
                      int index,
                      float* value,
                      char* valuestr) noexcept {
    if (static_cast<std::size_t>(index) >= values.size()) {  // a negative one wraps above it
        return callbackUnsupported;
    }
    if (value != nullptr) {
        *value = values[static_cast<std::size_t>(index)];
    }
    if (valuestr != nullptr) {
        valuestr[0] = '\0';
    }
    return callbackOk;
}

int TESSALY_HOST_CALL getFloatBufferStub(UnityAudioEffectState* /*state*/,
                                         const char* /*name*/,
                                         float* /*buffer*/,
                                         int /*numsamples*/) {
    return callbackOk;
}

}  // namespace tessaly
