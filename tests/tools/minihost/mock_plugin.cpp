// A stand-in for the built library: two effects, a handful of parameters, a gain and a head shadow.
// "Misbehave" makes its blocks break one rule each, so that the host's watching can be tested.
#include <array>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "host/audio_plugin_interface.h"

#define MOCK_EXPORT extern "C" __attribute__((visibility("default")))

namespace tessaly {
namespace {

enum Parameter { Gain, Direct, RoomSelection, InputChannel, Misbehave, ParameterCount };
enum Misbehaviour { None = 0, Allocates = 1, Fails = 2, StaysSilent = 3, Chatters = 4 };

constexpr std::size_t shadowDelay = 30;  // samples by which the far ear is late

struct Instance {
    std::array<float, ParameterCount> values{};
    std::array<float, shadowDelay> farEar{};
    std::size_t farPosition = 0;
    float attenuationIn = -1.0f;
};

int errorState = 1;
bool pathFound = false;
std::array<float, 6> roomDistances{};

// clang-format off
std::array<UnityAudioParameterDefinition, ParameterCount> parameters = {{
    {"Gain",           "dB",    "Level of everything", -96.0f, 24.0f,  0.0f, 1.0f, 1.0f},
    {"Direct",         "dB",    "Another level",       -96.0f, 24.0f,  0.0f, 1.0f, 1.0f},
    {"Room Selection", "No",    "Room",                  0.0f, 60.0f,  0.0f, 1.0f, 1.0f},
    {"Input Channel",  "LR",    "Left to right",        -1.0f,  1.0f, -1.0f, 1.0f, 1.0f},
    {"Misbehave",      "",      "Rule to break",         0.0f,  4.0f,  0.0f, 1.0f, 1.0f},
}};
// clang-format on

int onDistance(UnityAudioEffectState* state, float, float attenuationIn, float*) {
    static_cast<Instance*>(state->effectdata)->attenuationIn = attenuationIn;
    return 0;
}

int onCreate(UnityAudioEffectState* state) {
    auto instance = std::make_unique<Instance>();
    state->effectdata = instance.release();
    if (state->spatializerdata != nullptr) {
        state->spatializerdata->distanceattenuationcallback = onDistance;
    }
    return 0;
}

int onRelease(UnityAudioEffectState* state) {
    const std::unique_ptr<Instance> owned(static_cast<Instance*>(state->effectdata));
    state->effectdata = nullptr;
    return 0;
}

int onSet(UnityAudioEffectState* state, int index, float value) {
    if (index < 0 || index >= ParameterCount) {
        return 1;
    }
    static_cast<Instance*>(state->effectdata)->values[index] = value;
    return 0;
}

int onGet(UnityAudioEffectState* state, int index, float* value, char* text) {
    if (index < 0 || index >= ParameterCount) {
        return 1;
    }
    if (value != nullptr) {
        *value = static_cast<Instance*>(state->effectdata)->values[index];
    }
    if (text != nullptr) {
        *text = '\0';
    }
    return 0;
}

void breakARule(Misbehaviour rule) {
    if (rule == Allocates) {
        // Handing the addresses on keeps the compiler from removing the pair.
        const std::vector<float> needless(1000);
        const std::string text(100 + needless.size(), 'x');
        asm volatile("" : : "g"(needless.data()), "g"(text.data()) : "memory");
    }
    if (rule == Fails) {
        errorState = -105;
    }
    if (rule == Chatters) {
        std::fputs("chatter of the library\n", stderr);
    }
}

// The near ear hears the input at once, the far ear later and at a quarter; ahead, both at once.
int onProcess(
    UnityAudioEffectState* state, float* in, float* out, unsigned int length, int channels, int) {
    Instance& instance = *static_cast<Instance*>(state->effectdata);
    const auto rule = static_cast<Misbehaviour>(static_cast<int>(instance.values[Misbehave]));
    breakARule(rule);
    const bool silent = errorState != 1 || rule == StaysSilent;
    const float gain = silent ? 0.0f : std::pow(10.0f, instance.values[Gain] * 0.05f);
    float side = 0.0f;
    if (const UnityAudioSpatializerData* data = state->spatializerdata; data != nullptr) {
        const float* listener = data->listenermatrix;
        const float* source = data->sourcematrix;
        side = listener[0] * source[12] + listener[4] * source[13] + listener[8] * source[14] +
               listener[12];
    }
    const auto stride = static_cast<std::size_t>(channels);
    for (std::size_t i = 0; i < length; ++i) {
        const float near = in[i * stride] * gain;
        float& cell = instance.farEar[instance.farPosition];
        const float far = 0.25f * cell;
        cell = near;
        instance.farPosition = (instance.farPosition + 1) % shadowDelay;
        const bool ahead = std::abs(side) < 0.05f;
        out[2 * i] = ahead || side < 0.0f ? near : far;
        out[2 * i + 1] = ahead || side > 0.0f ? near : far;
    }
    return 0;
}

UnityAudioEffectDefinition definitionOf(const char* name, unsigned int flags) {
    UnityAudioEffectDefinition definition{};
    definition.structsize = sizeof(UnityAudioEffectDefinition);
    definition.paramstructsize = sizeof(UnityAudioParameterDefinition);
    definition.apiversion = 0x10300;
    definition.pluginversion = 0x10000;
    definition.numparameters = ParameterCount;
    definition.flags = flags;
    std::strncpy(definition.name, name, sizeof(definition.name) - 1);
    definition.create = onCreate;
    definition.release = onRelease;
    definition.process = onProcess;
    definition.paramdefs = parameters.data();
    definition.setfloatparameter = onSet;
    definition.getfloatparameter = onGet;
    return definition;
}

bool findData(const char* directory) {
    const std::string file = std::string(directory) + "/TSLdata120.dat";
    std::FILE* opened = std::fopen(file.c_str(), "rb");
    if (opened != nullptr) {
        std::fclose(opened);
        pathFound = true;
    }
    return opened != nullptr;
}

}  // namespace
}  // namespace tessaly

MOCK_EXPORT int UnityGetAudioEffectDefinitions(tessaly::UnityAudioEffectDefinition*** table) {
    static std::array<tessaly::UnityAudioEffectDefinition, 2> definitions = {
        tessaly::definitionOf("Tessaly Engine", 2), tessaly::definitionOf("Tessaly Reverb", 0)};
    static std::array<tessaly::UnityAudioEffectDefinition*, 2> pointers = {&definitions[0],
                                                                           &definitions[1]};
    *table = pointers.data();
    return 2;
}

MOCK_EXPORT bool SetStreamingAssetsPath(const char* path) { return tessaly::findData(path); }

MOCK_EXPORT bool SetStreamingAssetsPathReverbIOS(const char* path) {
    return tessaly::findData(path);
}

MOCK_EXPORT int SetBuffersize(int size) { return size; }

MOCK_EXPORT int SetBuffersizeReverb(int size) { return -size; }

MOCK_EXPORT unsigned char Set3DBypass(bool bypass) { return bypass ? 1 : 0; }

MOCK_EXPORT int SetRoomDistances(float a, float b, float c, float d, float e, float f) {
    tessaly::roomDistances = {a, b, c, d, e, f};
    return 1;
}

MOCK_EXPORT float MockRoomDistance(int index) { return tessaly::roomDistances[index]; }

MOCK_EXPORT int GetErrorState() { return tessaly::errorState; }

MOCK_EXPORT int TestMethode(int value) { return value == 7 ? 1 : 0; }

MOCK_EXPORT float MockAttenuation(const tessaly::UnityAudioEffectState* state) {
    return static_cast<const tessaly::Instance*>(state->effectdata)->attenuationIn;
}
