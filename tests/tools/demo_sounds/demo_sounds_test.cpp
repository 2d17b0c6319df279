// The built-in signals: level, length, repeatability, and what each one is known by.
#include "demo_sounds/demo_sounds.h"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

namespace tessaly {
namespace {

constexpr DemoSound allSounds[] = {DemoSound::Pluck, DemoSound::Drums, DemoSound::Bursts};

// Power of one band by the two-term recursion at frequencies spread evenly over it.
double bandPower(const std::vector<float>& samples, double rate, double low, double high) {
    constexpr int probes = 100;
    double power = 0.0;
    for (int probe = 0; probe < probes; ++probe) {
        const double frequency = low + (high - low) * (probe + 0.5) / probes;
        const double factor = 2.0 * std::cos(2.0 * std::numbers::pi * frequency / rate);
        double last = 0.0;
        double beforeLast = 0.0;
        for (const float sample : samples) {
            const double now = static_cast<double>(sample) + factor * last - beforeLast;
            beforeLast = last;
            last = now;
        }
        power += last * last + beforeLast * beforeLast - factor * last * beforeLast;
    }
    return power / probes * (high - low);
}

double rmsBetween(const std::vector<float>& samples, double rate, double from, double to) {
    const auto at = [&](double seconds) {
        return samples.begin() + static_cast<std::ptrdiff_t>(std::lround(seconds * rate));
    };
    return rmsOf(std::vector<float>(at(from), at(to)));
}

TEST(DemoSounds, EachHasTheDeclaredLevelAndLengthAtEveryRate) {
    for (const DemoSound sound : allSounds) {
        for (const double rate : {24000.0, 44100.0, 48000.0}) {
            const std::size_t frames = static_cast<std::size_t>(rate * 2.5);
            const std::vector<float> samples = makeDemoSound(sound, rate, frames);
            EXPECT_EQ(samples.size(), frames);
            EXPECT_NEAR(20.0 * std::log10(rmsOf(samples)), -12.0, 0.001);
        }
    }
}

TEST(DemoSounds, SameRequestGivesTheSameSamples) {
    for (const DemoSound sound : allSounds) {
        EXPECT_EQ(makeDemoSound(sound, 44100.0, 30000), makeDemoSound(sound, 44100.0, 30000));
    }
}

TEST(DemoSounds, EmptyAndSingleFrameRequestsAreServed) {
    for (const DemoSound sound : allSounds) {
        EXPECT_TRUE(makeDemoSound(sound, 48000.0, 0).empty());
        EXPECT_EQ(makeDemoSound(sound, 48000.0, 1).size(), 1u);
    }
}

TEST(DemoSounds, NamesAreKnown) {
    EXPECT_EQ(demoSoundByName("pluck"), DemoSound::Pluck);
    EXPECT_EQ(demoSoundByName("drums"), DemoSound::Drums);
    EXPECT_EQ(demoSoundByName("bursts"), DemoSound::Bursts);
    EXPECT_EQ(demoSoundByName("speech"), std::nullopt);
    EXPECT_EQ(demoSoundByName(""), std::nullopt);
}

TEST(DemoSounds, BurstsAreOn200AndOff300Milliseconds) {
    const std::vector<float> samples = makeDemoSound(DemoSound::Bursts, 48000.0, 96000);
    for (int period = 0; period < 4; ++period) {
        const double start = 0.5 * period;
        EXPECT_GT(rmsBetween(samples, 48000.0, start + 0.01, start + 0.19), 0.2);
        EXPECT_EQ(rmsBetween(samples, 48000.0, start + 0.201, start + 0.499), 0.0);
        // The ramps: no step at either end.
        EXPECT_LT(std::abs(samples[static_cast<std::size_t>(24000 * period + 1)]), 0.02f);
        EXPECT_LT(std::abs(samples[static_cast<std::size_t>(24000 * period + 9598)]), 0.02f);
    }
}

TEST(DemoSounds, BurstsAreEquallyStrongInEachOctave) {
    for (const double rate : {24000.0, 48000.0}) {
        const std::vector<float> samples =
            makeDemoSound(DemoSound::Bursts, rate, static_cast<std::size_t>(rate * 2.0));
        const double reference = bandPower(samples, rate, 1000.0, 2000.0);
        for (const double low : {250.0, 500.0, 2000.0, 4000.0}) {
            const double level =
                10.0 * std::log10(bandPower(samples, rate, low, 2.0 * low) / reference);
            // 100 probes of a noise spectrum scatter by about half a dB.
            EXPECT_NEAR(level, 0.0, 1.5) << rate << " Hz, octave from " << low;
        }
    }
}

TEST(DemoSounds, PluckHasTheFirstNotesPitchAndDecays) {
    const std::vector<float> samples = makeDemoSound(DemoSound::Pluck, 48000.0, 24000);
    // 48000 / 220 rounds to a period of 218 samples: strong correlation at it, less at half of it.
    const auto correlation = [&](std::size_t lag) {
        double sum = 0.0;
        for (std::size_t i = 2400; i < 12000; ++i) {
            sum += static_cast<double>(samples[i]) * static_cast<double>(samples[i + lag]);
        }
        return sum;
    };
    EXPECT_GT(correlation(218), 0.9 * correlation(0));
    EXPECT_LT(correlation(109), 0.6 * correlation(0));
    EXPECT_LT(rmsBetween(samples, 48000.0, 0.4, 0.48),
              0.7 * rmsBetween(samples, 48000.0, 0.0, 0.08));
}

TEST(DemoSounds, DrumsBeatAt110PerMinute) {
    const std::vector<float> samples = makeDemoSound(DemoSound::Drums, 48000.0, 48000 * 5);
    const double beat = 60.0 / 110.0;
    // The kick on the first beat of the bar, the snare on the second; between eighths it is quiet.
    EXPECT_GT(rmsBetween(samples, 48000.0, 0.0, 0.05), 0.2);
    EXPECT_GT(rmsBetween(samples, 48000.0, beat, beat + 0.05), 0.2);
    EXPECT_LT(rmsBetween(samples, 48000.0, 1.45 * beat, 1.49 * beat), 0.01);
    // One bar is four beats: the next kick stands where the first one stood.
    EXPECT_GT(rmsBetween(samples, 48000.0, 4.0 * beat, 4.0 * beat + 0.05), 0.2);
}

}  // namespace
}  // namespace tessaly
