// A game for benchmarks: the built library with its data, and effects that are fed blocks.
#pragma once

#include <benchmark/benchmark.h>

#include <cstdint>
#include <string>
#include <vector>

#include "minihost/effect_instance.h"
#include "minihost/plugin_library.h"
#include "minihost/pose.h"

namespace tessaly::bench {

inline constexpr std::uint32_t sampleRate = 48000;
inline constexpr std::uint32_t blockLengths[] = {256, 1024};
/// Room of the reflections and of the tail that most rows play: 8192 frames and 1.5 s.
inline constexpr float hallSelection = 5.0f;

/// A library whose rows stand side by side with those of the other.
struct Candidate {
    std::string name;  ///< in the rows' names: "tessaly", or "against" for the other one
    PluginLibrary library;
};

/// The built library and, if the environment variable TESSALY_AGAINST names the file of another
/// one, that as well; each with the path set and the files in memory. Empty where there is no data
/// set; it is looked for in the directory that TESSALY_DATA names, else in "data" beside the build
/// folder. Says once what is missing.
const std::vector<Candidate>& candidates();

/// Fails a benchmark after which the library reports an error.
void expectNoError(benchmark::State& state, const PluginLibrary& library);

/// Seconds of processor time that this thread has used: what other programs do meanwhile does not
/// count, as it would not beside an audio thread of real-time priority.
double threadSeconds();

/// Where one of several sources that walk round the head is in this block: 7 degrees further than
/// in the last one, which is fast (330 degrees a second at 1024), 1 to 3 m away. Left-handed,
/// metres.
Vector3 walk(int step, int source, int sources);

/// Interleaved stereo blocks. A mixer hands the same few buffers to one effect after the other, so
/// that they are in the cache: all effects share these.
struct HostBuffers {
    std::vector<float> noise;  ///< 0.25 peak
    std::vector<float> silence;
    std::vector<float> out;
};

/// One effect, fed with noise or silence; at first with silence.
class Played {
public:
    Played(const PluginLibrary& library, const char* effect, std::uint32_t blockLength);

    EffectInstance& effect() { return effect_; }

    /// Puts the source somewhere, seen from the listener, metres.
    void place(const Vector3& position);

    /// Noise from now on, or silence.
    void feed(bool noise);

    /// One block. @throws std::runtime_error if the callback fails
    void block();

private:
    std::uint32_t frames_;
    EffectInstance effect_;
    HostBuffers& buffers_;
    float* in_;
};

}  // namespace tessaly::bench
