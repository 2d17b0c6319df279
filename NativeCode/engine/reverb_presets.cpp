// The tail table: gain, length and name of every room's measured tail.
#include "engine/reverb_presets.h"

#include <array>
#include <cstddef>

#include "base/numeric_conversion.h"

namespace tessaly {

namespace {

constexpr float per48000 = 2.0833333e-05f;  // 1 / 48000 Hz

// number, gain, frames at 48000 Hz, name. The first fourteen have no tail of their own.
// clang-format off
constexpr std::array<ReverbPreset, reverbPresetCount> rows = {{
    {1, 0.032f, 0, ""},
    {2, 0.032f, 0, ""},
    {3, 0.0132f, 0, ""},
    {4, 0.0132f, 0, ""},
    {5, 0.0132f, 0, ""},
    {6, 0.0132f, 0, ""},
    {7, 0.0132f, 0, ""},
    {8, 0.0132f, 0, ""},
    {9, 0.0132f, 0, ""},
    {10, 0.0132f, 0, ""},
    {11, 0.0132f, 0, ""},
    {12, 0.0132f, 0, ""},
    {13, 0.0135f, 0, ""},
    {14, 0.0135f, 0, ""},
    {15, 0.05306f, 23147, "/Bin_SmallRoomStone_V05eff"},
    {16, 0.011076f, 74340, "/Bin_FamousConcerthall_V02"},
    {17, 0.011f, 36750, "/Bin_SmallWoodRoom_V02m"},
    {18, 0.07f, 27312, "/Bin_Bath1_V05"},
    {19, 0.02736f, 30587, "/Bin_Cinema_V03"},
    {20, 0.037648f, 4096, "/Bin_CarD_V05"},
    {21, 0.00675f, 37572, "/Bin_EmptyRoom_V05eff"},
    {22, 0.0418852f, 220245, "/Bin_Warehouse_V02"},
    {23, 0.01073f, 22268, "/Bin_Small Livingroom_V02"},
    {24, 0.0093f, 68147, "/Bin_LargeRoom_V04"},
    {25, 0.01381f, 200302, "/Bin_CathedralB_V05eff"},
    {26, 0.036f, 174114, "/Bin_Chapel_V03"},
    {27, 0.0424f, 51637, "/Bin_Corridor_V05eff"},
    {28, 0.02583f, 22020, "/Bin_MediumRoomOffice_V04"},
    {29, 0.070597306f, 55656, "/Bin_Outdoor2_V05"},
    {30, 0.0336f, 81533, "/Bin_ConcerthallFinnland_S1r3_V02"},
    {31, 0.042f, 80037, "/Bin_AccousticGuitar_V04"},
    {32, 0.01185f, 29832, "/Bin_AmbiencePlate_V04"},
    {33, 0.051692557f, 23535, "/Bin_ShortEchos_V05"},
    {34, 0.036f, 118587, "/Bin_ConcertArena_V04"},
    {35, 0.007296088f, 120179, "/Bin_Dense Hall_V04"},
    {36, 0.0233f, 86655, "/Bin_DrumChamber_V04"},
    {37, 0.0177f, 126121, "/Bin_FamousStringHall_V04"},
    {38, 0.0097098f, 119211, "/Bin_Gold Hall_V04"},
    {39, 0.05f, 90418, "/Bin_HardDrumRoom_V04"},
    {40, 0.0283f, 45106, "/Bin_HeavyAmbience_V04"},
    {41, 0.0369081f, 12784, "/Bin_SpaceshipCabine_V05"},
    {42, 0.00977f, 70341, "/Bin_LiveStudioRoom_V04"},
    {43, 0.02831784f, 37391, "/Bin_MediumAmbience_V04"},
    {44, 0.0182f, 128975, "/Bin_NiceVocalPlate_V04"},
    {45, 0.03248f, 30312, "/Bin_PercussionAmbience_V04"},
    {46, 0.008208f, 71044, "/Bin_PercussionPlate_V04"},
    {47, 0.00931f, 100320, "/Bin_CathedralEngland_V04"},
    {48, 0.02524f, 32018, "/Bin_SmallAmbience_V04"},
    {49, 0.034f, 104480, "/Bin_StageHall_V04"},
    {50, 0.0121f, 127377, "/Bin_StringPlate_V04eff"},
    {51, 0.0572f, 36790, "/Bin_Bath2_V05"},
    {52, 0.21612f, 4096, "/Bin_CarB_V05"},
    {53, 0.0425f, 21590, "/Bin_SmallRoom_V05eff"},
    {54, 0.0228f, 128903, "/Bin_AulaAachen_V04"},
    {55, 0.0237f, 40378, "/Bin_LectureRoomAachen_V04"},
    {56, 0.02867f, 27201, "/Bin_MeetingRoomAachen_V04"},
    {57, 0.0287f, 32358, "/Bin_OfficeAachen_V04"},
    {58, 0.1227f, 47364, "/Bin_StairwayAachen_V04"},
    {59, 0.00767f, 106317, "/Bin_SendesaalLargeWDR_V04"},
    {60, 0.015f, 64691, "/Bin_SendesaalSmallWDR_V04"},
}};
// clang-format on

constexpr bool rowsAreInOrder() {
    for (std::size_t i = 0; i < rows.size(); ++i) {
        if (rows[i].number != static_cast<int>(i) + 1) {
            return false;
        }
    }
    return true;
}
static_assert(rowsAreInOrder());

}  // namespace

const ReverbPreset* findReverbPreset(int preset) noexcept {
    return preset >= 1 && preset <= reverbPresetCount ? &rows[static_cast<std::size_t>(preset - 1)]
                                                      : nullptr;
}

std::int32_t reverbFramesAt(int sampleRate, int length48000) noexcept {
    return truncateToInt32(static_cast<float>(sampleRate) * static_cast<float>(length48000) *
                           per48000);
}

}  // namespace tessaly
