// Names of the settings that a source with an engine of its own may have.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

#include "engine/engine_settings.h"

namespace tessaly {

struct EngineSwitch {
    std::string_view key;
    std::uint8_t EngineSettings::*field;
};
// clang-format off
inline constexpr std::array<EngineSwitch, 12> engineSwitches = {{
    {"interpolateSpectra", &EngineSettings::qvInterpolateSpectra},
    {"interpolateFilters", &EngineSettings::qvInterpolateFilters},
    {"earlyReflections",   &EngineSettings::qvEarlyReflections},
    {"flexReflections",    &EngineSettings::qvFlexReflections},
    {"smoothSteps",        &EngineSettings::qvSmoothSteps},
    {"fading",             &EngineSettings::fading},
    {"trackDirection",     &EngineSettings::qvTrackDirection},
    {"use256HRIR",         &EngineSettings::qvUse256HRIR},
    {"alwaysUpdateFilter", &EngineSettings::alwaysUpdateFilter},
    {"auralisation",       &EngineSettings::auralisation},
    {"doppler",            &EngineSettings::doppler},
    {"bypass3DAudio",      &EngineSettings::bypass3DAudio},
}};
// clang-format on

struct EngineNumber {
    std::string_view key;
    std::int16_t EngineSettings::*field;
    int low;
    int high;
};
// clang-format off
inline constexpr std::array<EngineNumber, 4> engineNumbers = {{
    {"headphone",      &EngineSettings::qvHpTFcompSelect, 0, 10},
    {"limitPhi",       &EngineSettings::limitPhi,         0, 180},
    {"limitTheta",     &EngineSettings::limitTheta,       0, 90},
    {"updateInterval", &EngineSettings::qvUpdateInterval, 1, 1000},
}};
// clang-format on

}  // namespace tessaly
