// The room menu.
#include "handler/room_table.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <set>
#include <vector>

#include "support/room_tables.h"

namespace {

using tessaly::roomPresetFor;

TEST(RoomTable, FollowsTheMenu) {
    const std::vector<int> menu = tessaly::test::readRoomMenu();
    ASSERT_EQ(menu.size(), 53u);
    for (int room = 0; room < 53; ++room) {
        EXPECT_EQ(roomPresetFor(room), menu[static_cast<std::size_t>(room)]) << "room " << room;
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
