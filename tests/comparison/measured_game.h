// The game with the measured data set, and its rooms for the reference.
#pragma once

#include <array>

#include "comparison/hosted_source.h"

namespace tessaly::test {

inline constexpr int roomCount = 53;

/// Whether the set was built; without it no room can be played.
bool measuredSetThere();

/// The one game of this program.
Game& measuredGame();

/// Gives a handler of the reference the rows and tails of its rooms.
void takeRooms(reference::Handler& handler);

/// The walls of the library and of the reference.
void setWalls(const std::array<float, 6>& metres);

}  // namespace tessaly::test
