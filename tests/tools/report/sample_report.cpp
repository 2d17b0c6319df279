// Plain models of what the ears receive: a delay and a gain for each.
#include "tools/report/sample_report.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>
#include <random>

#include "demo_sounds/demo_sounds.h"
#include "render/picture.h"
#include "render/source_path.h"

namespace tessaly {

namespace {

constexpr double hop = 0.05;  // seconds between the stops of a path

// Adds a sound that circles the head.
void addCircling(std::vector<float>& stereo,
                 DemoSound sound,
                 double startAzimuth,
                 double turns,
                 double gain,
                 int sampleRate) {
    const std::size_t frames = stereo.size() / 2;
    const std::vector<float> mono = makeDemoSound(sound, sampleRate, frames);
    for (std::size_t i = 0; i < frames; ++i) {
        const double part = static_cast<double>(i) / static_cast<double>(frames);
        const double azimuth = startAzimuth + 360.0 * turns * part;
        const double ahead = 0.001 * sphereTimeDifference({azimuth, 0.0, 1.0}) * sampleRate;
        const double side = std::sin(azimuth * std::numbers::pi / 180.0);
        for (std::size_t ear = 0; ear < 2; ++ear) {
            const double sign = ear == 0 ? -1.0 : 1.0;
            const double place = static_cast<double>(i) - 40.0 + 0.5 * sign * ahead;
            if (place < 0.0 || place + 1.0 >= static_cast<double>(frames)) {
                continue;
            }
            const auto whole = static_cast<std::size_t>(place);
            const double fraction = place - static_cast<double>(whole);
            const double sample = (1.0 - fraction) * static_cast<double>(mono[whole]) +
                                  fraction * static_cast<double>(mono[whole + 1]);
            stereo[2 * i + ear] += static_cast<float>(gain * std::exp2(1.2 * sign * side) * sample);
        }
    }
}

ReportPath circlePath(
    const std::string& name, double radius, double startAzimuth, double turns, double seconds) {
    ReportPath path;
    path.name = name;
    for (double time = 0.0; time <= seconds; time += hop) {
        path.times.push_back(time);
        path.positions.push_back(
            fromSpherical(startAzimuth + 360.0 * turns * time / seconds, 0.0, radius));
    }
    return path;
}

ReportResponse roomResponse(const std::string& label, double nearerGain, int sampleRate) {
    ReportResponse response;
    response.label = label;
    for (unsigned ear = 0; ear < 2; ++ear) {
        std::vector<float> samples = decayingNoise(0.9, 1.6, sampleRate, 11 + ear);
        const auto delay = static_cast<std::size_t>(0.0006 * sampleRate) * (1 - ear);
        const auto predelay = static_cast<std::size_t>(0.03 * sampleRate);
        std::vector<float> one(samples.size() + predelay, 0.0f);
        for (std::size_t i = 0; i < samples.size(); ++i) {
            one[i + predelay] = 0.02f * samples[i];
        }
        one[20 + delay] = static_cast<float>(ear == 1 ? nearerGain : 0.6 * nearerGain);
        one[21 + delay] = -0.4f * one[20 + delay];
        for (std::size_t k = 0; k < 6; ++k) {
            one[400 + 523 * k + 31 * ear] = 0.15f / static_cast<float>(k + 1);
        }
        (ear == 0 ? response.left : response.right) = std::move(one);
    }
    return response;
}

std::vector<float> silence(double seconds, int sampleRate) {
    return std::vector<float>(2 * static_cast<std::size_t>(std::lround(seconds * sampleRate)));
}

}  // namespace

std::vector<float> decayingNoise(double decaySeconds,
                                 double seconds,
                                 int sampleRate,
                                 unsigned seed) {
    std::mt19937 random(seed);
    std::vector<float> samples(static_cast<std::size_t>(std::lround(seconds * sampleRate)));
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const double noise = static_cast<double>(random()) / 2147483648.0 - 1.0;
        const double time = static_cast<double>(i) / sampleRate;
        samples[i] = static_cast<float>(noise * std::pow(10.0, -3.0 * time / decaySeconds));
    }
    return samples;
}

ReportEntry orbitEntry(double seconds, int sampleRate) {
    ReportEntry entry;
    entry.title = "Round the head";
    entry.description =
        "A plucked string circles the head at two metres, once to the right. Both ears should "
        "agree with where it is drawn.";
    entry.sampleRate = sampleRate;
    entry.stereo = silence(seconds, sampleRate);
    addCircling(entry.stereo, DemoSound::Pluck, 0.0, 1.0, 0.4, sampleRate);
    entry.sources = {circlePath("string", 2.0, 0.0, 1.0, seconds)};
    entry.listener.name = "listener";
    entry.responses = {roomResponse("string at 2.0 s", 0.7, sampleRate)};
    entry.parameters = {{"string", "Gain", "dB", "-6"},
                        {"string", "Room Selection", "No", "5 (FamousConcerthall)"},
                        {"string", "Reverb", "dB", "0 s: -20, 4 s: 0, linear"},
                        {"scene", "sample rate", "Hz", fmt::format("{}", sampleRate)},
                        {"scene", "block", "frames", "1024"}};
    return entry;
}

ReportEntry crowdEntry(double seconds, int sampleRate) {
    ReportEntry entry;
    entry.title = "Six sources, one shared reverb";
    entry.description = "Six sounds at once while the listener turns by half a circle.";
    entry.sampleRate = sampleRate;
    entry.stereo = silence(seconds, sampleRate);
    constexpr std::array<DemoSound, 3> sounds = {DemoSound::Drums, DemoSound::Pluck,
                                                 DemoSound::Bursts};
    for (std::size_t i = 0; i < 6; ++i) {
        const double azimuth = 60.0 * static_cast<double>(i);
        addCircling(entry.stereo, sounds[i % 3], azimuth, -0.5, 0.5, sampleRate);
        const double radius = 2.0 + static_cast<double>(i);
        entry.sources.push_back(circlePath(fmt::format("voice {}", i + 1), radius, azimuth,
                                           i % 2 == 0 ? 0.0 : 0.2, seconds));
        entry.parameters.push_back({fmt::format("voice {}", i + 1), "Reverb Send", "dB", "-3"});
        entry.parameters.push_back({fmt::format("voice {}", i + 1), "Gain", "dB", "-6"});
    }
    entry.listener.name = "listener";
    for (double time = 0.0; time <= seconds; time += hop) {
        entry.listener.times.push_back(time);
        entry.listener.positions.push_back({0.5 * time / seconds, 0.0, 0.0});
        entry.listener.headings.push_back(180.0 * time / seconds);
    }
    entry.remarks = {"voice 3: the input ends before the scene; silence follows."};
    return entry;
}

ReportEntry hostileEntry() {
    constexpr int sampleRate = 24000;
    ReportEntry entry;
    entry.title = hostileName;
    entry.description = hostileName;
    entry.sampleRate = sampleRate;
    entry.stereo = silence(0.4, sampleRate);
    addCircling(entry.stereo, DemoSound::Bursts, 40.0, 0.0, 0.5, sampleRate);
    ReportPath fixed;
    fixed.name = hostileName;
    fixed.times = {0.0};
    fixed.positions = {fromSpherical(40.0, 0.0, 1.0)};
    entry.sources = {fixed};
    ReportResponse dry;
    dry.label = hostileName;
    dry.left.assign(256, 0.0f);
    dry.right.assign(256, 0.0f);
    dry.left[12] = 0.5f;
    dry.right[5] = 0.9f;
    entry.responses = {dry};
    entry.parameters = {{hostileName, hostileName, hostileName, hostileName}};
    entry.remarks = {hostileName};
    return entry;
}

Report sampleReport() {
    Report report;
    report.title = "Sample report";
    report.introduction =
        "Put on headphones. Each section has its player at the top; a click on a graph over time "
        "goes to that moment.";
    report.entries = {orbitEntry(6.0, 48000), crowdEntry(5.0, 44100), hostileEntry()};
    return report;
}

}  // namespace tessaly
