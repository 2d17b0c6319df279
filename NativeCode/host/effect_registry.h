// What the library offers to the host: two effects and their parameters.
#pragma once

#include <span>

#include "host/audio_plugin_interface.h"
#include "host/parameter_tables.h"

namespace tessaly {

/// Registers all parameters of one effect in a definition and returns their number.
using ParameterRegistration = int (*)(UnityAudioEffectDefinition& definition);

/// Builds the definitions on the first call; every call gives the same ones. Load time.
/// @param table  receives the address of a table of definition pointers; lives as long as the
///               library
/// @return number of effects
int getAudioEffectDefinitions(UnityAudioEffectDefinition*** table);

/// Fills parameter record `index` of a definition, whose `paramdefs` has room for it. Load time:
/// allocates the description. Display scale and exponent are always 1.
/// @param description  null: the name serves; if that is null too there is none
void RegisterParameter(UnityAudioEffectDefinition& definition,
                       const char* name,
                       const char* unit,
                       float min,
                       float max,
                       float defaultval,
                       int index,
                       const char* description);

/// Allocates `paramdefs` and registers the rows in order. Load time. @return number of rows
int registerParameterRows(UnityAudioEffectDefinition& definition,
                          std::span<const ParameterRow> rows);

/// Fills `values`, one float a parameter, with the defaults of the effect's one table. Load time.
void InitParametersFromDefinitions(ParameterRegistration registerParameters, float* values);

/// Body of both effects' GetFloatParameter. Block time.
/// @param values    all parameters of the effect
/// @param value     receives the value, may be null
/// @param valuestr  receives an empty text, may be null
/// @return callbackUnsupported for an index outside `values`
int getFloatParameter(std::span<const float> values,
                      int index,
                      float* value,
                      char* valuestr) noexcept;

/// The GetFloatBuffer callback of both effects: touches nothing.
int TESSALY_HOST_CALL getFloatBufferStub(UnityAudioEffectState* state,
                                         const char* name,
                                         float* buffer,
                                         int numsamples);

/// The host's block size in frames, 0 if its record ends before it or is too old to have it.
/// Block time.
inline int hostBlockSize(const UnityAudioEffectState& state) noexcept {
    return hasSpatializerFields(state) ? static_cast<int>(state.dspbuffersize) : 0;
}

}  // namespace tessaly
