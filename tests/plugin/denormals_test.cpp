// Denormal numbers: the host's floating-point mode comes back, and silence never gets slower.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "plugin/plugin_fixture.h"

#if defined(__SSE__)
#include <xmmintrin.h>
#endif

namespace tessaly::test {
namespace {

constexpr std::uint32_t rate = 48000;
constexpr std::uint32_t shortFrames = 64;

class DenormalsTest : public PluginTest {};

#if defined(__SSE__)

/// What the host sets: everything in the register but the flags that arithmetic leaves there.
constexpr unsigned int modeBits = 0xFFC0u;
constexpr unsigned int flushToZero = 0x8000u;
constexpr unsigned int denormalsAreZero = 0x0040u;
constexpr unsigned int roundDown = 0x2000u;

/// Runs a callback under several modes of the host and expects each to be there afterwards.
void expectModeKept(const std::string& what, const std::function<void()>& callback) {
    const unsigned int before = _mm_getcsr();
    for (const unsigned int set :
         {0u, flushToZero, denormalsAreZero, flushToZero | denormalsAreZero, roundDown}) {
        const unsigned int mode = (before & ~(flushToZero | denormalsAreZero | roundDown)) | set;
        _mm_setcsr(mode);
        callback();
        const unsigned int after = _mm_getcsr();
        _mm_setcsr(before);
        EXPECT_EQ(after & modeBits, mode & modeBits) << what << " under " << set;
    }
}

TEST_F(DenormalsTest, EveryWayOutOfAProcessCallKeepsTheHostsMode) {
    withData({rate}, [](const PluginLibrary& library) {
        std::vector<float> in(6 * shortFrames, 0.25f);
        std::vector<float> out(6 * shortFrames);
        const auto block = [&](EffectInstance& effect, int inChannels, int outChannels,
                               std::uint32_t length = shortFrames) {
            effect.processBlock(in.data(), out.data(), length, inChannels, outChannels);
        };

        Source played(library, rate, shortFrames);
        EffectInstance& source = played.effect();
        UnityAudioSpatializerData* const data = source.state().spatializerdata;
        source.setParameter("Room Selection", -1.0f);
        expectModeKept("source without a room", [&] { block(source, 2, 2); });
        source.setParameter("Room Selection", 2.0f);
        expectModeKept("source that loads and plays", [&] {
            source.setParameter("Room Selection", source.parameter("Room Selection") + 1.0f);
            block(source, 2, 2);
            EXPECT_FALSE(allZero(out));
        });
        expectModeKept("source", [&] { block(source, 2, 2); });
        expectModeKept("source with six outputs", [&] { block(source, 1, 6); });
        expectModeKept("source of a long block", [&] { block(source, 1, 2, 2 * shortFrames); });
        source.state().spatializerdata = nullptr;
        expectModeKept("source without data", [&] {
            source.definition().process(&source.state(), in.data(), out.data(), shortFrames, 2, 2);
        });
        source.state().spatializerdata = data;
        void* const effectData = source.state().effectdata;
        source.state().effectdata = nullptr;
        expectModeKept("source without an instance", [&] {
            source.definition().process(&source.state(), in.data(), out.data(), shortFrames, 2, 2);
        });
        source.state().effectdata = effectData;
        source.setParameter("Bypass", 1.0f);
        expectModeKept("bypassed source", [&] { block(source, 2, 2); });
        source.setParameter("Bypass", 0.0f);
        source.setParameter("Reverb disable", 1.0f);
        source.setParameter("Reverb Size", 1.0f);
        source.setParameter("Reverb ID", 5.0f);
        source.setParameter("Reverb Send", 0.0f);
        expectModeKept("source that sends", [&] { block(source, 2, 2); });

        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, shortFrames);
        expectModeKept("return without a room", [&] { block(reverb, 2, 2); });
        reverb.setParameter("Room Selection", 5.0f);
        expectModeKept("return without an ID", [&] { block(reverb, 2, 2); });
        reverb.setParameter("ReverbID", 5.0f);
        expectModeKept("return that loads", [&] {
            reverb.setParameter("Room Selection", reverb.parameter("Room Selection") + 1.0f);
            block(reverb, 2, 2);
        });
        expectModeKept("return", [&] { block(reverb, 2, 2); });
        expectModeKept("return with one input", [&] { block(reverb, 1, 2); });
        expectModeKept("return of a long block", [&] { block(reverb, 2, 2, 2 * shortFrames); });
        EXPECT_EQ(library.getErrorState(), 1);

        source.state().samplerate = 12345;
        expectModeKept("source that failed", [&] { block(source, 2, 2); });
        EXPECT_LT(library.getErrorState(), 0);
        expectModeKept("muted return", [&] { block(reverb, 2, 2); });
    });
}

#endif

/// Seconds of the median of block times.
double median(std::vector<double> times) {
    const auto middle = times.begin() + static_cast<std::ptrdiff_t>(times.size() / 2);
    std::nth_element(times.begin(), middle, times.end());
    return *middle;
}

bool anyDenormal(const std::vector<float>& samples) {
    return std::any_of(samples.begin(), samples.end(),
                       [](float sample) { return std::fpclassify(sample) == FP_SUBNORMAL; });
}

/// A burst, then a minute without input. Every filter runs in the source: occlusion, bass, distance
/// and those of the room.
void expectSilenceToStayCheap(EffectInstance& effect, const std::function<void()>& beforeBlock) {
    constexpr std::uint32_t frames = 1024;
    constexpr std::size_t second = rate / frames;
    std::vector<float> in(2 * frames);
    std::vector<float> out(2 * frames);
    std::vector<double> times;
    std::uint32_t seed = 1;
    float peak = 0.0f;
    for (std::size_t block = 0; block < 61 * second; ++block) {
        const bool burst = block < second;
        for (float& sample : in) {
            seed = seed * 1664525u + 1013904223u;
            sample = burst ? static_cast<float>(seed >> 8) / 16777216.0f - 0.5f : 0.0f;
        }
        if (burst) {
            beforeBlock();
        }
        const auto start = std::chrono::steady_clock::now();
        effect.processBlock(in.data(), out.data(), frames);
        times.push_back(
            std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
        ASSERT_FALSE(anyDenormal(out)) << block;
        ASSERT_TRUE(allFinite(out)) << block;
        for (const float sample : out) {
            peak = std::max(peak, std::fabs(sample));
        }
    }
    EXPECT_GT(peak, 0.01f);
    EXPECT_TRUE(allZero(out)) << "all has died away";
    const auto part = [&times](std::size_t from, std::size_t to) {
        return median({times.begin() + static_cast<std::ptrdiff_t>(from * second),
                       times.begin() + static_cast<std::ptrdiff_t>(to * second)});
    };
    // An order of magnitude is what denormals cost; a busy machine costs less in a median.
    constexpr double clockGrain = 2e-6;  // seconds
    EXPECT_LT(part(56, 61), 3.0 * part(1, 2) + clockGrain) << "against the first silent second";
    EXPECT_LT(part(56, 61), 3.0 * part(0, 1) + clockGrain) << "against the burst";
}

TEST_F(DenormalsTest, AMinuteOfSilenceAfterABurstNeverGetsSlower) {
    withData({rate}, [](const PluginLibrary& library) {
        for (const float room : {0.0f, 2.0f}) {
            SCOPED_TRACE(room);
            EffectInstance source(library.effect("Tessaly Engine"), rate, 1024);
            source.setParameter("Room Selection", room);
            source.setParameter("Occlusion", 0.5f);
            source.setParameter("Bass Boost", 0.0f);
            expectSilenceToStayCheap(source, [] {});
        }
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

TEST_F(DenormalsTest, AReturnThatNobodyPlaysToNeverGetsSlower) {
    const TempDirectory data;
    writePackedHrirSet(data.path(), static_cast<int>(rate));
    writePackedTails(data.path(), static_cast<int>(rate), {20});
    writeFile(data.file("/TSLdata120.dat"), std::vector<char>{'x'});
    withLibrary([&](const PluginLibrary& library) {
        ASSERT_TRUE(library.setStreamingAssetsPath(data.path()));
        constexpr std::uint32_t frames = 1024;
        constexpr float roomOfTail20 = 27.0f;
        EffectInstance reverb(library.effect("Tessaly Reverb"), rate, frames);
        reverb.setParameter("Room Selection", roomOfTail20);
        reverb.setParameter("ReverbID", 5.0f);
        Source source(library, rate, frames);
        source.effect().setParameter("Reverb disable", 1.0f);
        source.effect().setParameter("Reverb Size", 1.0f);
        source.effect().setParameter("Reverb ID", 5.0f);
        source.effect().setParameter("Reverb Send", 0.0f);
        expectSilenceToStayCheap(reverb, [&] { source.block(); });
        EXPECT_EQ(library.getErrorState(), 1);
    });
}

}  // namespace
}  // namespace tessaly::test
