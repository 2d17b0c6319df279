// Absorption of air and class factors on a logarithmic frequency axis.
#include "data/decay_time.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr std::size_t octaveCount = 8;
constexpr double lowestOctave = 125.0;  // Hz
using OctaveValues = std::array<double, octaveCount>;

constexpr double sixtyDecibels = 13.8155;        // 6 ln 10, of energy
constexpr double decibelsPerKilometre = 4343.0;  // of one neper of energy a metre
constexpr double lastFactor = 0.85;              // of the 8 kHz factor, at 16 kHz

// Absorption of air at 20 degrees and 50 % humidity, dB/km, 125 Hz to 16 kHz.
constexpr OctaveValues airDecibels = {0.44, 1.31, 2.73, 4.66, 9.86, 29.4, 104.0, 350.0};

// clang-format off
// class: 125, 250, 500, 1k, 2k, 4k, 8k Hz, in the order of RoomClass
constexpr std::array<std::array<double, octaveCount - 1>, 12> classFactors = {{
    /* stone     */ {1.20, 1.15, 1.05, 1.00, 0.95, 0.90, 0.85},
    /* hard      */ {1.10, 1.05, 1.00, 1.00, 0.97, 0.93, 0.88},
    /* wood      */ {0.85, 0.95, 1.00, 1.00, 0.95, 0.90, 0.80},
    /* hall      */ {1.20, 1.10, 1.02, 1.00, 0.93, 0.83, 0.72},
    /* furnished */ {1.35, 1.15, 1.05, 1.00, 0.90, 0.82, 0.72},
    /* treated   */ {1.50, 1.20, 1.00, 0.95, 0.90, 0.85, 0.75},
    /* tile      */ {0.90, 0.97, 1.00, 1.00, 1.00, 0.97, 0.90},
    /* car       */ {1.60, 1.25, 1.00, 0.95, 0.85, 0.75, 0.60},
    /* plate     */ {1.50, 1.35, 1.10, 1.00, 0.82, 0.62, 0.42},
    /* ambience  */ {0.95, 1.00, 1.00, 1.00, 0.95, 0.88, 0.75},
    /* outdoor   */ {0.80, 0.95, 1.00, 1.00, 0.85, 0.65, 0.40},
    /* metal     */ {0.90, 1.00, 1.05, 1.00, 1.00, 0.90, 0.80},
}};
// clang-format on

/// Straight lines between the octaves, both axes logarithmic; held outside.
double interpolate(const OctaveValues& values, double hertz) noexcept {
    const double place =
        std::clamp(std::log2(hertz / lowestOctave), 0.0, static_cast<double>(octaveCount - 1));
    const auto low = std::min(static_cast<std::size_t>(place), octaveCount - 2);
    const double part = place - static_cast<double>(low);
    return std::exp((1.0 - part) * std::log(values[low]) + part * std::log(values[low + 1]));
}

double airTime(double hertz) noexcept {
    return sixtyDecibels / (soundSpeed * interpolate(airDecibels, hertz) / decibelsPerKilometre);
}

double factor(RoomClass roomClass, double hertz) noexcept {
    const auto& row = classFactors[static_cast<std::size_t>(roomClass)];
    OctaveValues values{};
    std::copy(row.begin(), row.end(), values.begin());
    values.back() = lastFactor * row.back();
    return interpolate(values, hertz);
}

}  // namespace

DecayTime::DecayTime(RoomClass roomClass, double midSeconds)
    : roomClass_(roomClass),
      mid_(midSeconds),
      base_(1.0 / (1.0 / midSeconds - 1.0 / airTime(1000.0))),
      scale_(1.0) {
    scale_ = midSeconds / std::sqrt(unscaled(500.0) * unscaled(1000.0));
}

double DecayTime::unscaled(double hertz) const noexcept {
    return 1.0 / (1.0 / (base_ * factor(roomClass_, hertz)) + 1.0 / airTime(hertz));
}

double DecayTime::at(double hertz) const noexcept { return scale_ * unscaled(hertz); }

}  // namespace tessaly::data
