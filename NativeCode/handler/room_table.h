// From the room menu to preset numbers.
#pragma once

#include <array>
#include <cstdint>

namespace tessaly {

/// Preset of reflections and tail by "Room Selection", in the order of the room menu. 0: no room.
// clang-format off
inline constexpr std::array<std::int16_t, 53> roomTable = {
    // +0  +1  +2  +3  +4  +5  +6  +7  +8  +9
        0,  0, 11,  0, 30, 16, 59, 60, 54, 25,  //  0
       26, 47, 24, 17, 53,  0, 28, 57, 56, 55,  // 10
       15, 21, 23, 58, 27, 18, 51, 20, 52, 41,  // 20
       19, 22, 29, 33,  0, 42, 49, 34, 40, 32,  // 30
       43, 48, 38, 35, 44, 39, 36, 46, 45, 31,  // 40
       37, 50,  0,                              // 50
};
// clang-format on

/// The outdoor preset: it has reflections and never a tail.
inline constexpr std::int16_t presetWithoutTail = 11;

/// @return the preset for a "Room Selection"; 0 beyond both ends of the menu
constexpr std::int16_t roomPresetFor(int selection) noexcept {
    return selection >= 0 && selection < static_cast<int>(roomTable.size())
               ? roomTable[static_cast<std::size_t>(selection)]
               : std::int16_t{0};
}

}  // namespace tessaly
