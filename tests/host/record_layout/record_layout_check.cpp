// Measures the host's records in this process and compares them with the host's own figures; built
// once for 64-bit and once for 32-bit processes, so it needs nothing but the C library.
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "host/audio_plugin_interface.h"

namespace {

using namespace tessaly;

struct Row {
    const char* name;
    std::size_t measuredOffset;
    std::size_t measuredSize;
    std::size_t offset32;
    std::size_t offset64;
    std::size_t size32;
    std::size_t size64;
};

// Distances are taken between addresses in a real record: what counts is where the compiled code
// reads and writes.
template <class Record, class Field>
Row measured(const char* name,
             const Record& record,
             const Field& field,
             std::size_t offset32,
             std::size_t offset64,
             std::size_t size32,
             std::size_t size64) {
    const auto distance =
        reinterpret_cast<std::uintptr_t>(&field) - reinterpret_cast<std::uintptr_t>(&record);
    return {name,  static_cast<std::size_t>(distance), sizeof field, offset32, offset64, size32,
            size64};
}

UnityAudioEffectDefinition definitions[2];
UnityAudioParameterDefinition parameters[2];
UnityAudioEffectState states[2];
UnityAudioSpatializerData spatial[2];

#define FIELD(record, field, offset32, offset64, size32, size64) \
    measured(#record "." #field, record[0], record[0].field, offset32, offset64, size32, size64)

// The second element of an array begins where the first one ends, padding included.
#define WHOLE(record, size32, size64) \
    measured(#record "[1]", record[0], record[1], size32, size64, size32, size64)

// clang-format off
const Row rows[] = {
    //     record,     field,                offset 32, 64, size 32, 64
    FIELD(definitions, structsize,                  0,   0,  4,  4),
    FIELD(definitions, paramstructsize,             4,   4,  4,  4),
    FIELD(definitions, apiversion,                  8,   8,  4,  4),
    FIELD(definitions, pluginversion,              12,  12,  4,  4),
    FIELD(definitions, channels,                   16,  16,  4,  4),
    FIELD(definitions, numparameters,              20,  20,  4,  4),
    FIELD(definitions, flags,                      24,  24,  8,  8),
    FIELD(definitions, name,                       32,  32, 32, 32),
    FIELD(definitions, create,                     64,  64,  4,  8),
    FIELD(definitions, release,                    68,  72,  4,  8),
    FIELD(definitions, reset,                      72,  80,  4,  8),
    FIELD(definitions, process,                    76,  88,  4,  8),
    FIELD(definitions, setposition,                80,  96,  4,  8),
    FIELD(definitions, paramdefs,                  84, 104,  4,  8),
    FIELD(definitions, setfloatparameter,          88, 112,  4,  8),
    FIELD(definitions, getfloatparameter,          92, 120,  4,  8),
    FIELD(definitions, getfloatbuffer,             96, 128,  4,  8),
    WHOLE(definitions,                                      104, 136),
    FIELD(parameters,  name,                        0,   0, 16, 16),
    FIELD(parameters,  unit,                       16,  16, 16, 16),
    FIELD(parameters,  description,                32,  32,  4,  8),
    FIELD(parameters,  min,                        36,  40,  4,  4),
    FIELD(parameters,  max,                        40,  44,  4,  4),
    FIELD(parameters,  defaultval,                 44,  48,  4,  4),
    FIELD(parameters,  displayscale,               48,  52,  4,  4),
    FIELD(parameters,  displayexponent,            52,  56,  4,  4),
    WHOLE(parameters,                                        56, 64),
    FIELD(states,      structsize,                  0,   0,  4,  4),
    FIELD(states,      samplerate,                  4,   4,  4,  4),
    FIELD(states,      currdsptick,                 8,   8,  8,  8),
    FIELD(states,      prevdsptick,                16,  16,  8,  8),
    FIELD(states,      sidechainbuffer,            24,  24,  4,  8),
    FIELD(states,      effectdata,                 28,  32,  4,  8),
    FIELD(states,      flags,                      32,  40,  4,  4),
    FIELD(states,      internal,                   36,  48,  4,  8),
    FIELD(states,      spatializerdata,            40,  56,  4,  8),
    FIELD(states,      dspbuffersize,              44,  64,  4,  4),
    FIELD(states,      hostapiversion,             48,  68,  4,  4),
    FIELD(states,      ambisonicdata,              52,  72,  4,  8),
    WHOLE(states,                                            80, 80),
    FIELD(spatial,     listenermatrix,              0,   0, 64, 64),
    FIELD(spatial,     sourcematrix,               64,  64, 64, 64),
    FIELD(spatial,     spatialblend,              128, 128,  4,  4),
    FIELD(spatial,     reverbzonemix,             132, 132,  4,  4),
    FIELD(spatial,     spread,                    136, 136,  4,  4),
    FIELD(spatial,     stereopan,                 140, 140,  4,  4),
    FIELD(spatial,     distanceattenuationcallback, 144, 144, 4, 8),
    FIELD(spatial,     minDistance,               148, 152,  4,  4),
    FIELD(spatial,     maxDistance,               152, 156,  4,  4),
};
// clang-format on

}  // namespace

/// usage: record_layout_check POINTER_BITS; the argument keeps a program built for the wrong width
/// from passing in the other's place.
int main(int count, char** arguments) {
    const char* bits = sizeof(void*) == 4 ? "32" : "64";
    if (count != 2 || std::strcmp(arguments[1], bits) != 0) {
        std::printf("built for %s-bit processes, asked for %s\n", bits,
                    count == 2 ? arguments[1] : "nothing");
        return 1;
    }
    int wrong = 0;
    for (const Row& row : rows) {
        const std::size_t offset = sizeof(void*) == 4 ? row.offset32 : row.offset64;
        const std::size_t size = sizeof(void*) == 4 ? row.size32 : row.size64;
        if (row.measuredOffset != offset || row.measuredSize != size) {
            std::printf("%s: at %u with %u bytes, the host has it at %u with %u bytes\n", row.name,
                        static_cast<unsigned>(row.measuredOffset),
                        static_cast<unsigned>(row.measuredSize), static_cast<unsigned>(offset),
                        static_cast<unsigned>(size));
            ++wrong;
        }
    }
    std::printf("%s-bit records: %u places compared, %d wrong\n", bits,
                static_cast<unsigned>(sizeof rows / sizeof rows[0]), wrong);
    return wrong == 0 ? 0 : 1;
}
