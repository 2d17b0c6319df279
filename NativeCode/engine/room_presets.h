// The room table: early reflections, cut-offs and walls of presets 1 to 60.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <initializer_list>

namespace tessaly {

/// A short list of constants that knows its length.
template <typename T>
struct PresetList {
    static constexpr std::size_t capacity = 14;

    constexpr PresetList() = default;
    constexpr PresetList(std::initializer_list<T> list) : size(list.size()) {
        std::size_t i = 0;
        for (const T& value : list) {
            values[i++] = value;  // a longer list does not compile
        }
    }
    constexpr const T& operator[](std::size_t i) const noexcept { return values[i]; }

    std::array<T, capacity> values{};
    std::size_t size = 0;
};

/// One room as the engine takes it. A room without a row has the values below.
struct RoomPreset {
    std::int16_t flexReflectionCount = 0;
    PresetList<std::int32_t> presetPhi;          ///< degrees from the source's azimuth
    PresetList<std::int32_t> presetTheta;        ///< degrees from the source's elevation
    PresetList<std::int32_t> presetDelay;        ///< samples at 44100 Hz
    PresetList<float> presetGain;                ///< linear
    PresetList<std::int32_t> presetFilterClass;  ///< 0 or 1
    std::int32_t earlyFlexFirSize = 0;           ///< response length the room needs, frames
    float earlyPresetGain = 1.0f;                ///< overall gain of the reflections
    /// Metres: above, below, front, back, positive side, negative side; -1: no such wall.
    std::array<float, 6> roomDistances = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};
    float reflectionLP_Fc = 20000.0f;   ///< Hz, class 0
    float reflectionLP2_Fc = 20000.0f;  ///< Hz, class 1; stands until the first block only
    float reverbLP_Fc = 20000.0f;       ///< Hz, the tail
    bool presetUsesFilters = false;     ///< off: no record is filtered
    bool hasReverbLowPass = false;
};

inline constexpr int roomPresetCount = 60;

/// The room of a number. @return false for numbers outside 0..60; `preset` is then a room without
/// a row, as it is for 0.
bool lookUpRoomPreset(int number, RoomPreset& preset) noexcept;

}  // namespace tessaly
