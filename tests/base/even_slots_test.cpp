// Work on the even slots of interleaved stereo against plain loops.
#include "base/even_slots.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

namespace tessaly {
namespace {

constexpr std::size_t longest = 37;

struct Blocks {
    std::vector<float> in;
    std::vector<float> out;
    std::vector<float> wanted;
};

/// Values of all sizes, zeros of both signs among them. One frame more than is worked on.
Blocks blocksOf(std::size_t frames, unsigned seed) {
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> exponent(-30, 20);
    std::uniform_real_distribution<float> mantissa(-1.0f, 1.0f);
    const auto fill = [&](std::vector<float>& samples) {
        samples.resize(2 * frames + 2);
        for (float& sample : samples) {
            const float value = std::ldexp(mantissa(random), exponent(random));
            sample = random() % 8 == 0 ? std::copysign(0.0f, value) : value;
        }
    };
    Blocks blocks;
    fill(blocks.in);
    fill(blocks.out);
    blocks.wanted = blocks.out;
    return blocks;
}

bool sameBits(const std::vector<float>& a, const std::vector<float>& b) {
    return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(float)) == 0;
}

TEST(EvenSlots, EqualPlainLoopsAndLeaveTheOddSlots) {
    for (std::size_t frames = 0; frames <= longest; ++frames) {
        SCOPED_TRACE(frames);
        const auto seed = static_cast<unsigned>(frames);
        for (const float gain : {0.3f, -1.7f, 0.0f}) {
            Blocks b = blocksOf(frames, seed);
            blendToEven(b.in.data(), frames, 1.0f - gain, gain, b.out.data());
            for (std::size_t i = 0; i < frames; ++i) {
                b.wanted[2 * i] = b.in[2 * i] * (1.0f - gain) + b.in[2 * i + 1] * gain;
            }
            EXPECT_TRUE(sameBits(b.out, b.wanted)) << "blend";

            b = blocksOf(frames, seed + 100);
            addSumsToEven(b.in.data(), frames, gain, b.out.data());
            for (std::size_t i = 0; i < frames; ++i) {
                b.wanted[2 * i] += (b.in[2 * i] + b.in[2 * i + 1]) * gain;
            }
            EXPECT_TRUE(sameBits(b.out, b.wanted)) << "sums";

            b = blocksOf(frames, seed + 200);
            addToEven(b.in.data(), frames, gain, b.out.data());
            for (std::size_t i = 0; i < frames; ++i) {
                b.wanted[2 * i] += b.in[i] * gain;
            }
            EXPECT_TRUE(sameBits(b.out, b.wanted)) << "mono";
        }
        Blocks b = blocksOf(frames, seed + 300);
        spreadToEven(b.in.data(), frames, b.out.data());
        for (std::size_t i = 0; i < frames; ++i) {
            b.wanted[2 * i] = b.in[i];
        }
        EXPECT_TRUE(sameBits(b.out, b.wanted)) << "spread";
    }
}

}  // namespace
}  // namespace tessaly
