// The parameters of both effects, as the host shows them.
#pragma once

#include <array>

namespace tessaly {

/// One parameter. Texts are host-visible as they stand: projects refer to parameters by name.
struct ParameterRow {
    const char* name;  ///< at most 15 characters
    const char* unit;  ///< at most 15 characters
    float min;
    float max;
    float defaultval;
    const char* description;
};

namespace spatializer {

/// Indices of "Tessaly Engine".
enum Parameter : int {
    P_GAIN,
    P_DIRECT,
    P_EARLY,
    P_REVERB,
    P_ANGLE,
    P_DISTANCE,
    P_UNITY_DISTANCE,
    P_AURALIZATION,
    P_ROOM_SELECTION,
    P_OCCLUSION,
    P_REVERB_DISABLE,
    P_INPUT_CHANNEL,
    P_REFLECTION_LP,
    P_REVERB_LP,
    P_ROOM_SIZE,
    P_BASS_BOOST,
    P_BYPASS,
    P_REVERB_SIZE,
    P_SEND_REVERB_ID,
    P_REVERB_SEND,
    P_COUNT
};

// clang-format off
inline constexpr std::array<ParameterRow, P_COUNT> parameterRows = {{
    // name             unit     min     max       default   description
    {"Gain",            "dB",    -96.0f, 24.0f,    0.0f,     "Set allover Gain-Level"},
    {"Direct",          "dB",    -96.0f, 24.0f,    0.0f,     "Fill me with text"},
    {"Early",           "dB",    -96.0f, 24.0f,    0.0f,     "Fill me with text"},
    {"Reverb",          "dB",    -96.0f, 24.0f,    0.0f,     "Fill me with text"},
    {"Angle",           "x",     0.1f,   10.0f,    1.0f,     "Fill me with text"},
    {"Distance",        "x",     0.01f,  10.0f,    1.0f,     "Fill me with text"},
    {"UnityDistance",   "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"Auralization",    "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"Room Selection",  "No",    0.0f,   60.0f,    0.0f,     "Selected Room-Preset"},
    {"Occlusion",       "a",     0.0f,   1.0f,     0.0f,     "Fill me with Text"},
    {"Reverb disable",  "OnOff", 0.0f,   2.0f,     0.0f,     "Bool"},
    {"Input Channel",   "LR",    -1.0f,  1.0f,     -1.0f,    "Fill me with text"},
    {"ReflectionLP",    "Hz",    500.0f, 20000.0f, 20000.0f, "Fill me with text"},
    {"ReverbLP",        "Hz",    500.0f, 20000.0f, 20000.0f, "Fill me with text"},
    {"RoomSize",        "",      50.0f,  100.0f,   100.0f,   "Fill me with text"},
    {"Bass Boost",      "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"Bypass",          "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"Reverb Size",     "No",    0.0f,   100.0f,   0.0f,     "Fill me with text"},
    {"Reverb ID",       "No",    0.0f,   100.0f,   0.0f,     "Fill me with text"},
    {"Reverb Send",     "dB",    -96.0f, 24.0f,    0.0f,     "Fill me with text"},
}};
// clang-format on

}  // namespace spatializer

namespace reverb {

/// Indices of "Tessaly Reverb".
enum Parameter : int {
    P_GAIN,
    P_REVERB,
    P_ROOM_SELECTION,
    P_MUTE,
    P_REVERB_LP,
    P_ROOM_SIZE,
    P_BASS_BOOST,
    P_BYPASS,
    P_REVERB_ID,
    P_COUNT
};

// clang-format off
inline constexpr std::array<ParameterRow, P_COUNT> parameterRows = {{
    // name             unit     min     max       default   description
    {"Gain",            "dB",    -96.0f, 24.0f,    0.0f,     "Set allover Gain-Level"},
    {"Reverb",          "dB",    -96.0f, 24.0f,    0.0f,     "Fill me with text"},
    {"Room Selection",  "No",    0.0f,   60.0f,    0.0f,     "Selected Room-Preset"},
    {"Mute",            "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with Text"},
    {"ReverbLP",        "Hz",    500.0f, 20000.0f, 20000.0f, "Fill me with text"},
    {"RoomSize",        "",      50.0f,  100.0f,   100.0f,   "Fill me with text"},
    {"Bass Boost",      "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"Bypass",          "OnOff", 0.0f,   2.0f,     0.0f,     "Fill me with text"},
    {"ReverbID",        "No",    0.0f,   100.0f,   0.0f,     "Fill me with text"},
}};
// clang-format on

}  // namespace reverb

static_assert(spatializer::P_COUNT == 20 && reverb::P_COUNT == 9);

/// At this value a low-pass slider stands at its top and is not forwarded: the handler stays at
/// the last value below.
inline constexpr float lowPassOff = 20000.0f;

/// Switches count as on from here.
constexpr bool switchedOn(float value) noexcept { return value >= 1.0f; }

/// "RoomSize" 50..100 to the factor 0..1 that handlers take.
constexpr float roomSizeFactor(float value) noexcept {
    return static_cast<float>((static_cast<double>(value) - 50.0) * 0.02);
}

}  // namespace tessaly
