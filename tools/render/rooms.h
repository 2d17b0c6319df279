// The room menu: what each value of "Room Selection" stands for.
#pragma once

#include <optional>
#include <string_view>

namespace tessaly {

/// Rooms are numbered from 0 to roomCount - 1.
inline constexpr int roomCount = 53;

struct Room {
    int preset;             ///< number of the reflections and of the tail; 0: no room
    std::string_view name;  ///< plain name of the preset, "dry" where there is none
};

/// @param number  0 to roomCount - 1
const Room& roomAt(int number) noexcept;

/// Looks a room up by its number as text or by its name; case, blanks and underscores do not count.
/// @returns the number, or nothing if there is no such room
std::optional<int> roomFromText(std::string_view text);

}  // namespace tessaly
