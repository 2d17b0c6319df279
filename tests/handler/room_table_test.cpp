// The room menu.
#include "handler/room_table.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <set>

namespace {

using tessaly::roomPresetFor;

TEST(RoomTable, FollowsTheMenu) {
    // Typed from the menu, one room after the other.
    const int menu[] = {0,  0,  11, 0,  30, 16, 59, 60, 54, 25, 26, 47, 24, 17, 53, 0,  28, 57,
                        56, 55, 15, 21, 23, 58, 27, 18, 51, 20, 52, 41, 19, 22, 29, 33, 0,  42,
                        49, 34, 40, 32, 43, 48, 38, 35, 44, 39, 36, 46, 45, 31, 37, 50, 0};
    ASSERT_EQ(std::size(menu), 53u);
    for (int room = 0; room < 53; ++room) {
        EXPECT_EQ(roomPresetFor(room), menu[room]) << "room " << room;
    }
}

TEST(RoomTable, NamesEveryMeasuredPresetOnce) {
    std::multiset<int> presets;
    for (int room = 0; room < 53; ++room) {
        if (roomPresetFor(room) != 0) {
            presets.insert(roomPresetFor(room));
        }
    }
    EXPECT_EQ(presets.size(), 47u);
    for (int preset = 15; preset <= 60; ++preset) {
        EXPECT_EQ(presets.count(preset), 1u) << "preset " << preset;
    }
    EXPECT_EQ(presets.count(11), 1u);
}

TEST(RoomTable, HasNoRoomOutsideTheMenu) {
    for (int room : {-1, 53, 60, 32767, -32768, std::numeric_limits<int>::max()}) {
        EXPECT_EQ(roomPresetFor(room), 0) << "room " << room;
    }
}

}  // namespace
