// The room menu.
#include "render/rooms.h"

#include <gtest/gtest.h>

#include <set>

namespace tessaly {
namespace {

TEST(Rooms, EveryPresetWithATailStandsInTheMenuOnce) {
    std::multiset<int> presets;
    for (int number = 0; number < roomCount; ++number) {
        presets.insert(roomAt(number).preset);
    }
    for (int preset = 15; preset <= 60; ++preset) {
        EXPECT_EQ(presets.count(preset), 1u) << preset;
    }
    EXPECT_EQ(presets.count(11), 1u);
    EXPECT_EQ(presets.count(0), 6u);
}

TEST(Rooms, MenuOrderIsNotPresetOrder) {
    EXPECT_EQ(roomAt(4).preset, 30);
    EXPECT_EQ(roomAt(9).preset, 25);
    EXPECT_EQ(roomAt(31).preset, 22);
    EXPECT_EQ(roomAt(51).preset, 50);
    EXPECT_EQ(roomAt(52).preset, 0);
}

TEST(Rooms, AreFoundByNumberAndByName) {
    EXPECT_EQ(roomFromText("0"), 0);
    EXPECT_EQ(roomFromText("52"), 52);
    EXPECT_EQ(roomFromText("Warehouse"), 31);
    EXPECT_EQ(roomFromText("warehouse"), 31);
    EXPECT_EQ(roomFromText("small living room"), 22);
    EXPECT_EQ(roomFromText("Gold_Hall"), 42);
    EXPECT_EQ(roomFromText("dry"), 0);
}

TEST(Rooms, WhatIsNoneIsRefused) {
    for (const char* text : {"53", "-1", "1.5", "1e9", "Kitchen", ""}) {
        EXPECT_EQ(roomFromText(text), std::nullopt) << text;
    }
}

}  // namespace
}  // namespace tessaly
