// The records of one effect instance as a host keeps them, for calling callbacks directly.
#pragma once

#include <cstdint>
#include <vector>

#include "host/audio_plugin_interface.h"

namespace tessaly::test {

/// A state record of 80 bytes with spatializer data behind it: listener at the origin looking
/// along +z, source one metre ahead.
struct HostInstance {
    HostInstance(std::uint32_t rate, std::uint32_t blocklenght) {
        state.structsize = sizeof(UnityAudioEffectState);
        state.samplerate = rate;
        state.dspbuffersize = blocklenght;
        state.hostapiversion = 0x10300;
        state.spatializerdata = &spatial;
        for (const int diagonal : {0, 5, 10, 15}) {
            spatial.listenermatrix[diagonal] = 1.0f;
            spatial.sourcematrix[diagonal] = 1.0f;
        }
        spatial.reverbzonemix = 1.0f;
        place(0.0f, 0.0f, 1.0f);
    }
    HostInstance(const HostInstance&) = delete;
    HostInstance& operator=(const HostInstance&) = delete;

    /// Source position in the listener's frame, metres.
    void place(float x, float y, float z) {
        spatial.sourcematrix[12] = x;
        spatial.sourcematrix[13] = y;
        spatial.sourcematrix[14] = z;
    }

    UnityAudioSpatializerData spatial{};
    UnityAudioEffectState state{};
};

/// 1, 2, 3 ... so that every sample tells where it came from.
inline std::vector<float> countedSamples(std::size_t count) {
    std::vector<float> samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        samples[i] = static_cast<float>(i + 1);
    }
    return samples;
}

}  // namespace tessaly::test
