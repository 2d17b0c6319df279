// Runs each test on a freshly loaded library with small data sets at hand.
#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "minihost/effect_instance.h"
#include "minihost/plugin_library.h"
#include "support/test_data.h"

namespace tessaly::test {

/// The three rates that engines take, Hz.
inline constexpr std::uint32_t allRates[] = {24000, 44100, 48000};

/// Process-wide state of the library, above all the path that only counts once, makes every test
/// one for a process of its own.
class PluginTest : public ::testing::Test {
protected:
    /// Runs `body` with the library in a fresh process; its failures become this test's.
    static void withLibrary(const std::function<void(const PluginLibrary&)>& body);

    /// The same, with HRIR sets for these rates in a directory that the library was told.
    static void withData(const std::vector<std::uint32_t>& rates,
                         const std::function<void(const PluginLibrary&)>& body);
};

/// Everything that `body` writes to the process's standard error, the library's debug log included.
std::string standardErrorOf(const std::function<void()>& body);

/// How often `part` occurs.
std::size_t occurrences(std::string_view text, std::string_view part);

/// A spatializer with room 0 and its host buffers, driven block by block.
class Source {
public:
    Source(const PluginLibrary& library, std::uint32_t rate, std::uint32_t blockLength);

    EffectInstance& effect() { return instance; }

    /// Puts the source by direction, degrees, and distance, metres, before a listener at the
    /// origin.
    void place(double azimuth, double elevation, double distance);

    /// Fills the next input with seeded noise of 0.25 peak, both channels alike, and processes it.
    /// @return interleaved stereo output
    const std::vector<float>& block();

    /// Processes this input.
    const std::vector<float>& block(const std::vector<float>& input, int inchannels = 2);

    /// Interleaved output of so many noise blocks.
    std::vector<float> blocks(int count);

private:
    std::uint32_t frames;
    std::uint32_t seed = 1;
    EffectInstance instance;
    std::vector<float> in;
    std::vector<float> out;
};

/// Sum of squares of one channel of interleaved stereo, 0 left, 1 right.
double energy(const std::vector<float>& stereo, std::size_t channel);

/// No NaN, no infinity.
bool allFinite(const std::vector<float>& samples);

/// Nothing but zeros.
bool allZero(const std::vector<float>& samples);

}  // namespace tessaly::test
