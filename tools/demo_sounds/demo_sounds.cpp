// Plucked string, drum loop and pink-noise bursts.
#include "demo_sounds/demo_sounds.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <numbers>
#include <random>

namespace tessaly {

namespace {

constexpr double twoPi = 2.0 * std::numbers::pi;

// The generator's sequence is fixed by the language, a distribution's is not: take its top bits.
class Noise {
public:
    explicit Noise(std::uint64_t seed) : generator(seed) {}

    /// Uniform in [-1, 1).
    double next() {
        constexpr double unitsPerHalf = 4503599627370496.0;  // 2^52
        return static_cast<double>(generator() >> 11) / unitsPerHalf - 1.0;
    }

private:
    std::mt19937_64 generator;
};

std::size_t framesOf(double seconds, double sampleRate) {
    return static_cast<std::size_t>(std::llround(seconds * sampleRate));
}

void scaleToRms(std::vector<float>& samples, double rms) {
    const double present = rmsOf(samples);
    if (present > 0.0) {
        const double factor = rms / present;
        for (float& sample : samples) {
            sample = static_cast<float>(static_cast<double>(sample) * factor);
        }
    }
}

// One string: a noise burst of one period, each pass the mean of two neighbours, a little shorter.
std::vector<float> pluck(double sampleRate, std::size_t frames) {
    // clang-format off
    constexpr std::array<double, 8> notes =  // Hz, A minor pentatonic; below 500 Hz, so that one
        {220.00, 261.63, 329.63, 293.66,     // period is longer than any interaural delay
         392.00, 329.63, 261.63, 196.00};
    // clang-format on
    constexpr double noteSeconds = 0.5;
    constexpr double loss = 0.996;
    constexpr double releaseSeconds = 0.01;
    std::vector<float> samples(frames, 0.0f);
    Noise noise(1);
    const std::size_t noteFrames = std::max<std::size_t>(framesOf(noteSeconds, sampleRate), 1);
    const double releaseFrames = releaseSeconds * sampleRate;
    for (std::size_t start = 0, index = 0; start < frames; start += noteFrames, ++index) {
        const double frequency = notes[index % notes.size()];
        std::vector<double> line(std::max<std::size_t>(framesOf(1.0 / frequency, sampleRate), 2));
        for (double& cell : line) {
            cell = noise.next();
        }
        std::size_t position = 0;
        for (std::size_t i = 0; i < noteFrames && start + i < frames; ++i) {
            const std::size_t following = position + 1 < line.size() ? position + 1 : 0;
            const double remaining = static_cast<double>(noteFrames - i);
            const double release = std::min(1.0, remaining / releaseFrames);
            samples[start + i] = static_cast<float>(line[position] * release);
            line[position] = loss * 0.5 * (line[position] + line[following]);
            position = following;
        }
    }
    return samples;
}

// Adds one stroke: source(seconds since the stroke) for as long as it lasts.
template <typename Source>
void addStroke(std::vector<float>& samples,
               double sampleRate,
               double startSeconds,
               double lengthSeconds,
               Source source) {
    const std::size_t start = framesOf(startSeconds, sampleRate);
    const std::size_t length = framesOf(lengthSeconds, sampleRate);
    for (std::size_t i = 0; i < length && start + i < samples.size(); ++i) {
        samples[start + i] += static_cast<float>(source(static_cast<double>(i) / sampleRate));
    }
}

void addKick(std::vector<float>& samples, double sampleRate, double start) {
    constexpr double length = 0.25;
    addStroke(samples, sampleRate, start, length, [](double t) {
        // 120 Hz sinking to 50 Hz: the phase is the integral of the frequency.
        constexpr double sink = 25.0;
        const double phase = 50.0 * t + 70.0 * (1.0 - std::exp(-sink * t)) / sink;
        return std::sin(twoPi * phase) * (1.0 - t / length);
    });
}

void addSnare(std::vector<float>& samples, double sampleRate, double start, Noise& noise) {
    constexpr double length = 0.15;
    // Band noise: a one-pole low-pass at 6 kHz less one at 700 Hz.
    const double upper = 1.0 - std::exp(-twoPi * 6000.0 / sampleRate);
    const double lower = 1.0 - std::exp(-twoPi * 700.0 / sampleRate);
    double fast = 0.0;
    double slow = 0.0;
    addStroke(samples, sampleRate, start, length, [&](double t) {
        const double white = noise.next();
        fast += upper * (white - fast);
        slow += lower * (white - slow);
        const double decay = std::exp(-22.0 * t) * (1.0 - t / length);
        return (1.1 * (fast - slow) + 0.35 * std::sin(twoPi * 180.0 * t)) * decay;
    });
}

void addHat(std::vector<float>& samples, double sampleRate, double start, Noise& noise) {
    constexpr double length = 0.04;
    const double corner = 1.0 - std::exp(-twoPi * 7000.0 / sampleRate);
    double low = 0.0;
    addStroke(samples, sampleRate, start, length, [&](double t) {
        const double white = noise.next();
        low += corner * (white - low);
        return 0.5 * (white - low) * std::exp(-70.0 * t) * (1.0 - t / length);
    });
}

std::vector<float> drums(double sampleRate, std::size_t frames) {
    constexpr double stepSeconds = 60.0 / 110.0 / 2.0;  // an eighth at 110 beats per minute
    constexpr std::array<bool, 8> kicks = {true, false, false, false, true, true, false, false};
    constexpr std::array<bool, 8> snares = {false, false, true, false, false, false, true, false};
    std::vector<float> samples(frames, 0.0f);
    Noise noise(2);
    for (std::size_t step = 0;
         framesOf(static_cast<double>(step) * stepSeconds, sampleRate) < frames; ++step) {
        const double start = static_cast<double>(step) * stepSeconds;
        if (kicks[step % kicks.size()]) {
            addKick(samples, sampleRate, start);
        }
        if (snares[step % snares.size()]) {
            addSnare(samples, sampleRate, start, noise);
        }
        addHat(samples, sampleRate, start, noise);
    }
    return samples;
}

// White noise through alternating poles and zeros an octave apart: -3 dB per octave from 20 Hz up.
class PinkNoise {
public:
    PinkNoise(std::uint64_t seed, double sampleRate) : white(seed) {
        double corner = 20.0;
        for (Section& section : sections) {
            section.pole = std::exp(-twoPi * corner / sampleRate);
            section.zero = std::exp(-twoPi * 2.0 * corner / sampleRate);
            corner *= 4.0;
        }
    }

    double next() {
        double value = white.next();
        for (Section& section : sections) {
            const double out = value - section.zero * section.input + section.pole * section.output;
            section.input = value;
            section.output = out;
            value = out;
        }
        return value;
    }

private:
    struct Section {
        double pole = 0.0;
        double zero = 0.0;
        double input = 0.0;
        double output = 0.0;
    };

    Noise white;
    std::array<Section, 5> sections;
};

std::vector<float> bursts(double sampleRate, std::size_t frames) {
    constexpr double onSeconds = 0.2;
    constexpr double periodSeconds = 0.5;
    constexpr double rampSeconds = 0.005;
    std::vector<float> samples(frames, 0.0f);
    PinkNoise noise(3, sampleRate);
    for (std::size_t i = 0; i < frames; ++i) {
        const double t = std::fmod(static_cast<double>(i) / sampleRate, periodSeconds);
        const double value = noise.next();
        const double ramp = std::clamp(std::min(t, onSeconds - t) / rampSeconds, 0.0, 1.0);
        samples[i] = static_cast<float>(value * ramp);
    }
    return samples;
}

}  // namespace

std::optional<DemoSound> demoSoundByName(std::string_view name) noexcept {
    if (name == "pluck") {
        return DemoSound::Pluck;
    }
    if (name == "drums") {
        return DemoSound::Drums;
    }
    if (name == "bursts") {
        return DemoSound::Bursts;
    }
    return std::nullopt;
}

std::vector<float> makeDemoSound(DemoSound sound, double sampleRate, std::size_t frames) {
    std::vector<float> samples;
    switch (sound) {
        case DemoSound::Pluck:
            samples = pluck(sampleRate, frames);
            break;
        case DemoSound::Drums:
            samples = drums(sampleRate, frames);
            break;
        case DemoSound::Bursts:
            samples = bursts(sampleRate, frames);
            break;
    }
    scaleToRms(samples, demoSoundRms);
    return samples;
}

double rmsOf(const std::vector<float>& samples) noexcept {
    if (samples.empty()) {
        return 0.0;
    }
    double sum = 0.0;
    for (const float sample : samples) {
        sum += static_cast<double>(sample) * static_cast<double>(sample);
    }
    return std::sqrt(sum / static_cast<double>(samples.size()));
}

}  // namespace tessaly
