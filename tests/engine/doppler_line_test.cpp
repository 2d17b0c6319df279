// The delay line against a plain one of unlimited length, and its reads at the ends.
#include "engine/doppler_line.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <memory>
#include <random>
#include <vector>

namespace tessaly::test {
namespace {

constexpr std::array<int, 3> sampleRates = {24000, 44100, 48000};
constexpr double perMetrePerHertz = 0.0029118863199580685;
constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

/// Everything that was ever written, newest last, and zeros before it.
class PlainLine {
public:
    PlainLine(int sampleRate, int block)
        : block_(block),
          length_(static_cast<int>(sampleRate * perMetrePerHertz * 25.0 + block)),
          perMetre_(sampleRate * perMetrePerHertz),
          samples_(static_cast<std::size_t>(length_), 0.0f) {}

    int length() const { return length_; }
    int delay(float distance) const {
        return static_cast<int>(perMetre_ * std::fmin(static_cast<double>(distance), 25.0));
    }

    std::vector<float> run(const std::vector<float>& interleaved,
                           float gain,
                           float distance,
                           float distanceOld) {
        const auto size = static_cast<std::size_t>(block_);
        std::vector<float> out(size);
        for (std::size_t i = 0; i < size; ++i) {
            samples_.push_back(interleaved[2 * i] * gain);
        }
        const int delta = delay(distanceOld) - delay(distance);
        const float rate = static_cast<float>(delta) / static_cast<float>(block_) + 1.0f;
        const std::size_t origin = samples_.size() - static_cast<std::size_t>(length_);
        for (std::size_t i = 0; i < size; ++i) {
            const float t = static_cast<float>(i) * rate;
            const float p = static_cast<float>(length_ - block_ - delay(distanceOld)) + t;
            const int j = static_cast<int>(p);
            const float f = std::fmod(t, 1.0f);
            const float here = read(origin, j);
            out[i] = f * (read(origin, j + 1) - here) + here;
        }
        return out;
    }

private:
    /// The nearest sample stands before and behind the line.
    float read(std::size_t origin, int j) const {
        return samples_[origin + static_cast<std::size_t>(std::clamp(j, 0, length_ - 1))];
    }

    int block_;
    int length_;
    double perMetre_;
    std::vector<float> samples_;
};

std::vector<float> noiseFrames(std::mt19937& random, int frames) {
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    std::vector<float> samples(2 * static_cast<std::size_t>(frames));
    for (float& sample : samples) {
        sample = noise(random);
    }
    return samples;
}

/// One line, its plain counterpart and a source on a path of distances.
void expectPath(int sampleRate, int block, const std::vector<float>& path) {
    DopplerLine line;
    line.prepare(sampleRate, block);
    PlainLine plain(sampleRate, block);
    ASSERT_EQ(line.dopplerLineLength, plain.length());
    std::mt19937 random(5);
    float old = path.front();
    for (const float distance : path) {
        const std::vector<float> input = noiseFrames(random, block);
        std::vector<float> output(static_cast<std::size_t>(block), 9.0f);
        line.process(input.data(), 0.5f, distance, old, output.data());
        EXPECT_EQ(output, plain.run(input, 0.5f, distance, old))
            << sampleRate << "/" << block << " from " << old << " to " << distance;
        EXPECT_EQ(line.dopplerDelayNew, plain.delay(distance));
        EXPECT_EQ(line.dopplerDelayOld, plain.delay(old));
        EXPECT_EQ(line.dopplerDelta, plain.delay(old) - plain.delay(distance));
        old = distance;
    }
}

TEST(DopplerLine, HoldsTwentyFiveMetresAndOneBlock) {
    for (const int sampleRate : sampleRates) {
        DopplerLine line;
        line.prepare(sampleRate, 256);
        const double frames = sampleRate * perMetrePerHertz * 25.0 + 256.0;
        EXPECT_EQ(line.dopplerLineLength, static_cast<int>(frames));
        EXPECT_EQ(line.dopplerLine.size(), static_cast<std::size_t>(line.dopplerLineLength));
        EXPECT_EQ(line.dopplerBlock.size(), 256u);
        EXPECT_EQ(line.dopplerRate, 1.0f);
        EXPECT_EQ(line.dopplerLine[0], 0.0f);
    }
}

TEST(DopplerLine, SlowlyMovingSourceIsReadBetweenTwoSamples) {
    for (const int sampleRate : sampleRates) {
        for (const int block : {32, 256, 1024}) {
            std::vector<float> path;
            path.reserve(40);
            for (int n = 0; n < 40; ++n) {
                path.push_back(10.0f + 4.0f * std::sin(0.3f * static_cast<float>(n)));
            }
            expectPath(sampleRate, block, path);
        }
    }
}

TEST(DopplerLine, StandingSourceIsDelayedByWholeSamples) {
    for (const int sampleRate : sampleRates) {
        DopplerLine line;
        line.prepare(sampleRate, 64);
        const int delay = static_cast<int>(sampleRate * perMetrePerHertz * 2.0);
        std::vector<float> sent;
        std::vector<float> heard;
        std::mt19937 random(6);
        for (int n = 0; n < 20; ++n) {
            const std::vector<float> input = noiseFrames(random, 64);
            std::vector<float> output(64);
            line.process(input.data(), 1.0f, 2.0f, 2.0f, output.data());
            for (std::size_t i = 0; i < 64; ++i) {
                sent.push_back(input[2 * i]);
                heard.push_back(output[i]);
            }
            EXPECT_EQ(line.dopplerRate, 1.0f);
        }
        for (std::size_t i = 0; i < heard.size(); ++i) {
            const auto late = static_cast<std::size_t>(delay);
            EXPECT_EQ(heard[i], i < late ? 0.0f : sent[i - late]) << sampleRate << " at " << i;
        }
    }
}

TEST(DopplerLine, ApproachRaisesThePitch) {
    // A sine of 1000 Hz from a source that comes nearer by 5 m/s sounds at 1000 * (1 + 5 / 343.42).
    const int sampleRate = 48000;
    const int block = 1024;
    DopplerLine line;
    line.prepare(sampleRate, block);
    const double perBlock = 5.0 * block / sampleRate;
    double distance = 20.0;
    int crossings = 0;
    int blocks = 0;
    double before = 0.0;
    for (int n = 0; n < 80; ++n) {
        std::vector<float> input(std::size_t{2} * block);
        for (int i = 0; i < block; ++i) {
            const double phase = 2.0 * 3.14159265358979 * 1000.0 * (n * block + i) / sampleRate;
            input[2 * static_cast<std::size_t>(i)] = static_cast<float>(std::sin(phase));
        }
        std::vector<float> output(block);
        const double next = distance - perBlock;
        line.process(input.data(), 1.0f, static_cast<float>(next), static_cast<float>(distance),
                     output.data());
        distance = next;
        if (n < 10) {
            continue;  // the line fills
        }
        ++blocks;
        for (const float sample : output) {
            crossings += before < 0.0 && sample >= 0.0f ? 1 : 0;
            before = static_cast<double>(sample);
        }
    }
    const double heard = static_cast<double>(crossings) * sampleRate / (blocks * block);
    EXPECT_NEAR(heard, 1000.0 * (1.0 + 5.0 / 343.42), 2.0);
}

TEST(DopplerLine, BeyondTwentyFiveMetresTheDelayStands) {
    expectPath(44100, 128, {25.0f, 26.0f, 100.0f, 24.9f, 1000.0f, 25.0f});
}

TEST(DopplerLine, JumpsRunBackwardsOrSkip) {
    for (const int sampleRate : sampleRates) {
        for (const int block : {32, 256, 2048}) {
            expectPath(sampleRate, block, {0.1f, 25.0f, 0.1f, 12.0f, 24.0f, 0.5f});
        }
    }
    DopplerLine line;
    line.prepare(48000, 256);
    std::vector<float> input(512, 1.0f);
    std::vector<float> output(256);
    line.process(input.data(), 1.0f, 25.0f, 0.1f, output.data());
    EXPECT_LT(line.dopplerRate, 0.0f) << "away by more than a block runs backwards";
    line.process(input.data(), 1.0f, 0.1f, 25.0f, output.data());
    EXPECT_GT(line.dopplerRate, 2.0f) << "towards by more than a block skips";
}

TEST(DopplerLine, TopOfTheLineStandsForWhatLiesBehindIt) {
    // Distance 0 reads the newest sample, and the one behind it with weight 0.
    DopplerLine line;
    line.prepare(44100, 32);
    std::vector<float> input(64, 0.0f);
    for (std::size_t i = 0; i < 32; ++i) {
        input[2 * i] = static_cast<float>(i + 1);
    }
    std::vector<float> output(32);
    line.process(input.data(), 1.0f, 0.0f, 0.0f, output.data());
    for (std::size_t i = 0; i < 32; ++i) {
        EXPECT_EQ(output[i], static_cast<float>(i + 1));
    }
    // From a far delay to one in front of the head the read runs past the newest sample.
    line.process(input.data(), 1.0f, -20.0f, 0.0f, output.data());
    EXPECT_EQ(output.back(), 32.0f);
}

TEST(DopplerLine, FarthestDelayReadsTheOldestSample) {
    DopplerLine line;
    line.prepare(24000, 32);
    std::vector<float> input(64, 0.0f);
    std::vector<float> output(32);
    for (std::size_t i = 0; i < line.dopplerLine.size(); ++i) {
        line.dopplerLine[i] = 0.25f;
    }
    line.process(input.data(), 1.0f, 25.0f, 0.1f, output.data());
    line.process(input.data(), 1.0f, 25.0f, 25.0f, output.data());
    EXPECT_EQ(output.front(), 0.25f);
}

TEST(DopplerLine, AnyDistanceIsSafe) {
    const std::array<float, 9> odd = {nan,    infinity, -infinity, -1.0f, 0.0f,
                                      -1e30f, 1e30f,    -1e6f,     3e38f};
    for (const int block : {2, 32, 512}) {
        DopplerLine line;
        line.prepare(48000, block);
        std::vector<float> input(2 * static_cast<std::size_t>(block), 0.5f);
        const auto output = std::make_unique<float[]>(static_cast<std::size_t>(block));
        for (const float distance : odd) {
            for (const float old : odd) {
                line.process(input.data(), 1.0f, distance, old, output.get());
                for (int i = 0; i < block; ++i) {
                    EXPECT_TRUE(std::isfinite(output[static_cast<std::size_t>(i)]))
                        << old << " to " << distance;
                }
            }
        }
    }
}

TEST(DopplerLine, UnpreparedWritesNothing) {
    DopplerLine line;
    float output = 7.0f;
    const float input = 1.0f;
    line.process(&input, 1.0f, 1.0f, 2.0f, &output);
    EXPECT_EQ(output, 7.0f);
}

TEST(DopplerLine, KeepsTheLastReadPosition) {
    DopplerLine line;
    line.prepare(48000, 64);
    std::vector<float> input(128, 0.0f);
    std::vector<float> output(64);
    line.process(input.data(), 1.0f, 10.0f, 10.0f, output.data());
    const int start = line.dopplerLineLength - 64 - line.dopplerDelayOld;
    EXPECT_EQ(line.dopplerReadIndex, start + 63 - 64 + 1);
}

}  // namespace
}  // namespace tessaly::test
