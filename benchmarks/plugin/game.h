// A game for benchmarks: the built library with its data, and effects that are fed blocks.
#pragma once

#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "minihost/effect_instance.h"
#include "minihost/plugin_library.h"

namespace tessaly::bench {

inline constexpr std::uint32_t sampleRate = 48000;
inline constexpr int roomCount = 53;

/// The library, with the path set and one source played, so that its tables are there; null where
/// there is no data set. The set is looked for in the directory that the environment variable
/// TESSALY_DATA names, else in "data" beside the build folder. Says once what is missing.
const PluginLibrary* library();

/// Fails a benchmark after which the library reports an error.
void expectNoError(benchmark::State& state);

/// One effect with its host buffers.
class Played {
public:
    Played(const char* effect, std::uint32_t blockLength);

    EffectInstance& effect() { return effect_; }

    /// Puts the source by direction, degrees, and distance, metres.
    void place(double azimuth, double elevation, double distance);

    /// Noise of 0.25 peak from now on, or silence.
    void feed(bool noise);

    /// One block. @throws std::runtime_error if the callback fails
    void block();

private:
    std::uint32_t frames_;
    EffectInstance effect_;
    std::vector<float> in_;
    std::vector<float> out_;
};

}  // namespace tessaly::bench
