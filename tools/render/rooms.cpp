// The table of rooms in the order of the menu.
#include "render/rooms.h"

#include <array>
#include <string>

#include "render/text_numbers.h"

namespace tessaly {

namespace {

// clang-format off
// preset, name; in menu order, number 0 first
constexpr std::array<Room, roomCount> rooms = {{
    {0, "dry"},
    {0, "dry"},
    {11, "reflections only"},
    {0, "dry"},
    {30, "ConcerthallFinnland"},
    {16, "FamousConcerthall"},
    {59, "SendesaalLargeWDR"},
    {60, "SendesaalSmallWDR"},
    {54, "AulaAachen"},
    {25, "CathedralB"},
    {26, "Chapel"},
    {47, "CathedralEngland"},
    {24, "LargeRoom"},
    {17, "SmallWoodRoom"},
    {53, "SmallRoom"},
    {0, "dry"},
    {28, "MediumRoomOffice"},
    {57, "OfficeAachen"},
    {56, "MeetingRoomAachen"},
    {55, "LectureRoomAachen"},
    {15, "SmallRoomStone"},
    {21, "EmptyRoom"},
    {23, "Small Livingroom"},
    {58, "StairwayAachen"},
    {27, "Corridor"},
    {18, "Bath1"},
    {51, "Bath2"},
    {20, "CarD"},
    {52, "CarB"},
    {41, "SpaceshipCabine"},
    {19, "Cinema"},
    {22, "Warehouse"},
    {29, "Outdoor2"},
    {33, "ShortEchos"},
    {0, "dry"},
    {42, "LiveStudioRoom"},
    {49, "StageHall"},
    {34, "ConcertArena"},
    {40, "HeavyAmbience"},
    {32, "AmbiencePlate"},
    {43, "MediumAmbience"},
    {48, "SmallAmbience"},
    {38, "Gold Hall"},
    {35, "Dense Hall"},
    {44, "NiceVocalPlate"},
    {39, "HardDrumRoom"},
    {36, "DrumChamber"},
    {46, "PercussionPlate"},
    {45, "PercussionAmbience"},
    {31, "AccousticGuitar"},
    {37, "FamousStringHall"},
    {50, "StringPlate"},
    {0, "dry"},
}};
// clang-format on

}  // namespace

const Room& roomAt(int number) noexcept { return rooms[static_cast<std::size_t>(number)]; }

std::optional<int> roomFromText(std::string_view text) {
    if (const std::optional<double> number = numberFromText(text)) {
        const bool known = *number >= 0.0 && *number < roomCount;
        if (!known || *number != static_cast<double>(static_cast<int>(*number))) {
            return std::nullopt;
        }
        return static_cast<int>(*number);
    }
    const std::string wanted = foldedName(text);
    for (int number = 0; number < roomCount; ++number) {
        if (foldedName(roomAt(number).name) == wanted) {
            return number;
        }
    }
    return std::nullopt;
}

}  // namespace tessaly
