// The host's records, as its mixer lays them out in 32-bit and in 64-bit processes.
#pragma once

#include <cstddef>
#include <cstdint>

/// The host calls its callbacks with this convention. It matters in 32-bit Windows processes only.
#if defined(_WIN32)
#define TESSALY_HOST_CALL __stdcall
#else
#define TESSALY_HOST_CALL
#endif

namespace tessaly {

struct UnityAudioEffectState;

// Every callback returns 0 for success and 1 for "unsupported". Buffers are interleaved floats.
using CreateCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state);
using ReleaseCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state);
using ResetCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state);
using ProcessCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state,
                                                float* inbuffer,
                                                float* outbuffer,
                                                unsigned int length,
                                                int inchannels,
                                                int outchannels);
using SetPositionCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state, unsigned int pos);
using SetFloatParameterCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state,
                                                          int index,
                                                          float value);
using GetFloatParameterCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state,
                                                          int index,
                                                          float* value,
                                                          char* valuestr);
using GetFloatBufferCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state,
                                                       const char* name,
                                                       float* buffer,
                                                       int numsamples);
using DistanceAttenuationCallback = int(TESSALY_HOST_CALL*)(UnityAudioEffectState* state,
                                                            float distanceIn,
                                                            float attenuationIn,
                                                            float* attenuationOut);

/// Version of the host's interface that this library is written for; older hosts hand over no
/// spatializer data.
inline constexpr std::uint32_t hostApiVersion = 0x10300;
/// Our own version, shown by the host.
inline constexpr std::uint32_t pluginVersion = 0x10000;
/// An effect state of this size or more has the fields from `spatializerdata` on.
inline constexpr std::uint32_t spatializerStateSize = 80;
/// Bit of UnityAudioEffectDefinition::flags: the effect takes over a source's panning.
inline constexpr std::uint64_t effectFlagIsSpatializer = 2;

/// Results of callbacks.
inline constexpr int callbackOk = 0;
inline constexpr int callbackUnsupported = 1;

/// One parameter, as the host shows it.
struct UnityAudioParameterDefinition {
    char name[16];            ///< label
    char unit[16];            ///< unit text
    const char* description;  ///< heap copy
    float min;
    float max;
    float defaultval;
    float displayscale;
    float displayexponent;
};

/// One effect. The 8-byte alignment gives its `flags` the same place and the whole the same size
/// on every 32-bit platform, also where a 64-bit word is aligned to 4 bytes inside a record.
struct alignas(8) UnityAudioEffectDefinition {
    std::uint32_t structsize;
    std::uint32_t paramstructsize;
    std::uint32_t apiversion;
    std::uint32_t pluginversion;
    std::uint32_t channels;
    std::uint32_t numparameters;
    std::uint64_t flags;
    char name[32];
    CreateCallback create;
    ReleaseCallback release;
    ResetCallback reset;
    ProcessCallback process;
    SetPositionCallback setposition;
    UnityAudioParameterDefinition* paramdefs;
    SetFloatParameterCallback setfloatparameter;
    GetFloatParameterCallback getfloatparameter;
    GetFloatBufferCallback getfloatbuffer;
};

/// What the host knows about one spatialized source. Older hosts end it after the callback.
struct UnityAudioSpatializerData {
    float listenermatrix[16];  ///< column-major, world to listener: +x right, +y up, +z forward
    float sourcematrix[16];    ///< column-major, source to world; 12..14 is the position, metres
    float spatialblend;
    float reverbzonemix;
    float spread;
    float stereopan;
    DistanceAttenuationCallback distanceattenuationcallback;  ///< written by the library
    float minDistance;
    float maxDistance;
};

/// The host's record of one effect instance, passed to every callback.
struct UnityAudioEffectState {
    std::uint32_t structsize;
    std::uint32_t samplerate;  ///< Hz
    std::uint64_t currdsptick;
    std::uint64_t prevdsptick;
    float* sidechainbuffer;
    void* effectdata;  ///< written by Create: the effect's own record
    std::uint32_t flags;
    void* internal;
    UnityAudioSpatializerData* spatializerdata;
    std::uint32_t dspbuffersize;  ///< frames of a block, 0 if not known
    std::uint32_t hostapiversion;
    void* ambisonicdata;
#if UINTPTR_MAX == 0xFFFFFFFFu
    unsigned char reserved[24];  ///< the host pads the record to 80 bytes everywhere
#endif
};

/// Whether the host's record reaches to `spatializerdata` and beyond. The version stands among
/// those fields, so the size is looked at first. Block time.
inline bool hasSpatializerFields(const UnityAudioEffectState& state) noexcept {
    return state.structsize >= spatializerStateSize && state.hostapiversion >= hostApiVersion;
}

/// Places in the records, once for 4-byte and once for 8-byte pointers.
constexpr std::size_t recordOffset(std::size_t in32Bit, std::size_t in64Bit) {
    return sizeof(void*) == 4 ? in32Bit : in64Bit;
}

static_assert(sizeof(void*) == 4 || sizeof(void*) == 8);
static_assert(sizeof(float) == 4 && sizeof(unsigned int) == 4 && sizeof(int) == 4);

static_assert(sizeof(UnityAudioParameterDefinition) == recordOffset(56, 64));
static_assert(offsetof(UnityAudioParameterDefinition, name) == 0);
static_assert(offsetof(UnityAudioParameterDefinition, unit) == 16);
static_assert(offsetof(UnityAudioParameterDefinition, description) == 32);
static_assert(offsetof(UnityAudioParameterDefinition, min) == recordOffset(36, 40));
static_assert(offsetof(UnityAudioParameterDefinition, max) == recordOffset(40, 44));
static_assert(offsetof(UnityAudioParameterDefinition, defaultval) == recordOffset(44, 48));
static_assert(offsetof(UnityAudioParameterDefinition, displayscale) == recordOffset(48, 52));
static_assert(offsetof(UnityAudioParameterDefinition, displayexponent) == recordOffset(52, 56));

static_assert(sizeof(UnityAudioEffectDefinition) == recordOffset(104, 136));
static_assert(offsetof(UnityAudioEffectDefinition, structsize) == 0);
static_assert(offsetof(UnityAudioEffectDefinition, paramstructsize) == 4);
static_assert(offsetof(UnityAudioEffectDefinition, apiversion) == 8);
static_assert(offsetof(UnityAudioEffectDefinition, pluginversion) == 12);
static_assert(offsetof(UnityAudioEffectDefinition, channels) == 16);
static_assert(offsetof(UnityAudioEffectDefinition, numparameters) == 20);
static_assert(offsetof(UnityAudioEffectDefinition, flags) == 24);
static_assert(offsetof(UnityAudioEffectDefinition, name) == 32);
static_assert(offsetof(UnityAudioEffectDefinition, create) == 64);
static_assert(offsetof(UnityAudioEffectDefinition, release) == recordOffset(68, 72));
static_assert(offsetof(UnityAudioEffectDefinition, reset) == recordOffset(72, 80));
static_assert(offsetof(UnityAudioEffectDefinition, process) == recordOffset(76, 88));
static_assert(offsetof(UnityAudioEffectDefinition, setposition) == recordOffset(80, 96));
static_assert(offsetof(UnityAudioEffectDefinition, paramdefs) == recordOffset(84, 104));
static_assert(offsetof(UnityAudioEffectDefinition, setfloatparameter) == recordOffset(88, 112));
static_assert(offsetof(UnityAudioEffectDefinition, getfloatparameter) == recordOffset(92, 120));
static_assert(offsetof(UnityAudioEffectDefinition, getfloatbuffer) == recordOffset(96, 128));

static_assert(sizeof(UnityAudioSpatializerData) == recordOffset(156, 160));
static_assert(offsetof(UnityAudioSpatializerData, listenermatrix) == 0);
static_assert(offsetof(UnityAudioSpatializerData, sourcematrix) == 64);
static_assert(offsetof(UnityAudioSpatializerData, spatialblend) == 128);
static_assert(offsetof(UnityAudioSpatializerData, reverbzonemix) == 132);
static_assert(offsetof(UnityAudioSpatializerData, spread) == 136);
static_assert(offsetof(UnityAudioSpatializerData, stereopan) == 140);
static_assert(offsetof(UnityAudioSpatializerData, distanceattenuationcallback) == 144);
static_assert(offsetof(UnityAudioSpatializerData, minDistance) == recordOffset(148, 152));
static_assert(offsetof(UnityAudioSpatializerData, maxDistance) == recordOffset(152, 156));

static_assert(sizeof(UnityAudioEffectState) == 80);
static_assert(offsetof(UnityAudioEffectState, structsize) == 0);
static_assert(offsetof(UnityAudioEffectState, samplerate) == 4);
static_assert(offsetof(UnityAudioEffectState, currdsptick) == 8);
static_assert(offsetof(UnityAudioEffectState, prevdsptick) == 16);
static_assert(offsetof(UnityAudioEffectState, sidechainbuffer) == 24);
static_assert(offsetof(UnityAudioEffectState, effectdata) == recordOffset(28, 32));
static_assert(offsetof(UnityAudioEffectState, flags) == recordOffset(32, 40));
static_assert(offsetof(UnityAudioEffectState, internal) == recordOffset(36, 48));
static_assert(offsetof(UnityAudioEffectState, spatializerdata) == recordOffset(40, 56));
static_assert(offsetof(UnityAudioEffectState, dspbuffersize) == recordOffset(44, 64));
static_assert(offsetof(UnityAudioEffectState, hostapiversion) == recordOffset(48, 68));
static_assert(offsetof(UnityAudioEffectState, ambisonicdata) == recordOffset(52, 72));

}  // namespace tessaly
