// The parameters of both effects as they were announced, typed anew for comparison.
#pragma once

#include <array>

namespace tessaly::test {

struct ExpectedParameter {
    const char* name;
    const char* unit;
    double min;
    double max;
    double defaultval;
    const char* description;
};

// clang-format off
inline constexpr std::array<ExpectedParameter, 20> expectedEngineParameters = {{
    {"Gain", "dB", -96, 24, 0, "Set allover Gain-Level"},
    {"Direct", "dB", -96, 24, 0, "Fill me with text"},
    {"Early", "dB", -96, 24, 0, "Fill me with text"},
    {"Reverb", "dB", -96, 24, 0, "Fill me with text"},
    {"Angle", "x", 0.1, 10, 1, "Fill me with text"},
    {"Distance", "x", 0.01, 10, 1, "Fill me with text"},
    {"UnityDistance", "OnOff", 0, 2, 0, "Fill me with text"},
    {"Auralization", "OnOff", 0, 2, 0, "Fill me with text"},
    {"Room Selection", "No", 0, 60, 0, "Selected Room-Preset"},
    {"Occlusion", "a", 0, 1, 0, "Fill me with Text"},
    {"Reverb disable", "OnOff", 0, 2, 0, "Bool"},
    {"Input Channel", "LR", -1, 1, -1, "Fill me with text"},
    {"ReflectionLP", "Hz", 500, 20000, 20000, "Fill me with text"},
    {"ReverbLP", "Hz", 500, 20000, 20000, "Fill me with text"},
    {"RoomSize", "", 50, 100, 100, "Fill me with text"},
    {"Bass Boost", "OnOff", 0, 2, 0, "Fill me with text"},
    {"Bypass", "OnOff", 0, 2, 0, "Fill me with text"},
    {"Reverb Size", "No", 0, 100, 0, "Fill me with text"},
    {"Reverb ID", "No", 0, 100, 0, "Fill me with text"},
    {"Reverb Send", "dB", -96, 24, 0, "Fill me with text"},
}};

inline constexpr std::array<ExpectedParameter, 9> expectedReverbParameters = {{
    {"Gain", "dB", -96, 24, 0, "Set allover Gain-Level"},
    {"Reverb", "dB", -96, 24, 0, "Fill me with text"},
    {"Room Selection", "No", 0, 60, 0, "Selected Room-Preset"},
    {"Mute", "OnOff", 0, 2, 0, "Fill me with Text"},
    {"ReverbLP", "Hz", 500, 20000, 20000, "Fill me with text"},
    {"RoomSize", "", 50, 100, 100, "Fill me with text"},
    {"Bass Boost", "OnOff", 0, 2, 0, "Fill me with text"},
    {"Bypass", "OnOff", 0, 2, 0, "Fill me with text"},
    {"ReverbID", "No", 0, 100, 0, "Fill me with text"},
}};
// clang-format on

}  // namespace tessaly::test
