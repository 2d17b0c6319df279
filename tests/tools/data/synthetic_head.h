// A made-up measurement for tests: a sphere without ears, delays by Woodworth, a level shadow.
#pragma once

#include <algorithm>
#include <cmath>
#include <numbers>

#include "data/interaural_time.h"
#include "data/measurement.h"

namespace tessaly::data {

inline constexpr double syntheticShadowDb = 6.0;  // either ear, at the sides

/// Band-limited impulse at a fractional place, Hann window of 24 samples around it.
inline double impulseAt(double sample, double place) {
    const double x = sample - place;
    if (std::abs(x) >= 12.0) {
        return 0.0;
    }
    const double window = 0.5 + 0.5 * std::cos(std::numbers::pi * x / 12.0);
    const double angle = std::numbers::pi * x;
    return window * (std::abs(x) < 1e-9 ? 1.0 : std::sin(angle) / angle);
}

/// Rings every `step` degrees from `lowest` up, each with 360 / step azimuths, and the upper pole.
inline Measurement syntheticHead(int step = 15, int lowest = -45, int highest = 90) {
    Measurement head;
    head.sampleRate = 44100.0;
    head.taps = 96;
    const auto add = [&head](double azimuth, double elevation) {
        const Direction direction{azimuth, elevation};
        head.directions.push_back(direction);
        head.extraSeconds.push_back(0.0);
        const EarDelays delays = earDelays(woodworth(direction));
        const double side = toVector(direction)[1];
        for (int ear = 0; ear < earCount; ++ear) {
            const double delay = ear == leftEar ? delays.left : delays.right;
            const double gainDb = syntheticShadowDb * (ear == leftEar ? side : -side);
            const double gain = std::pow(10.0, gainDb / 20.0);
            const double place = 40.0 + delay * head.sampleRate;
            for (std::size_t i = 0; i < head.taps; ++i) {
                head.samples.push_back(gain * impulseAt(static_cast<double>(i), place));
            }
        }
    };
    for (int elevation = lowest; elevation <= highest && elevation < 90; elevation += step) {
        for (int azimuth = 0; azimuth < 360; azimuth += step) {
            add(azimuth, elevation);
        }
    }
    if (highest == 90) {
        add(0.0, 90.0);
    }
    return head;
}

/// The same responses with left and right exchanged.
inline void swapEars(Measurement& head) {
    for (std::size_t i = 0; i < head.count(); ++i) {
        double* left = head.samples.data() + i * earCount * head.taps;
        std::swap_ranges(left, left + head.taps, left + head.taps);
        head.extraSeconds[i] = -head.extraSeconds[i];
    }
}

}  // namespace tessaly::data
