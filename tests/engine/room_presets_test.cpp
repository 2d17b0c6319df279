// Every row of the room table, the tail table and the response lengths against the tests' lists.
#include "engine/room_presets.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <string>
#include <vector>

#include "engine/fir_size.h"
#include "engine/reflections.h"
#include "engine/reverb_presets.h"
#include "support/room_tables.h"

namespace tessaly::test {
namespace {

template <typename T>
std::vector<T> listOf(const PresetList<T>& list) {
    return {list.values.begin(), list.values.begin() + list.size};
}

TEST(RoomPresets, EveryRowIsAsItWasAuthored) {
    const std::vector<RoomLine> rooms = readRoomLines();
    ASSERT_EQ(rooms.size(), 60u);
    for (int number = 1; number <= 60; ++number) {
        SCOPED_TRACE("preset " + std::to_string(number));
        const RoomLine& line = rooms[static_cast<std::size_t>(number - 1)];
        ASSERT_EQ(line.preset, number);
        RoomPreset preset;
        ASSERT_TRUE(lookUpRoomPreset(number, preset));
        EXPECT_EQ(preset.flexReflectionCount, line.records);
        EXPECT_EQ(listOf(preset.presetPhi), line.azimuths);
        EXPECT_EQ(listOf(preset.presetTheta), line.elevations);
        EXPECT_EQ(listOf(preset.presetDelay), line.delays);
        EXPECT_EQ(listOf(preset.presetGain), line.gains);
        EXPECT_EQ(listOf(preset.presetFilterClass), line.classes);
        EXPECT_EQ(preset.earlyFlexFirSize, line.firSize);
        EXPECT_EQ(preset.earlyPresetGain, line.gain);
        EXPECT_EQ(std::vector<float>(preset.roomDistances.begin(), preset.roomDistances.end()),
                  line.walls);
        EXPECT_EQ((std::vector<float>{preset.reflectionLP_Fc, preset.reflectionLP2_Fc,
                                      preset.reverbLP_Fc}),
                  line.cutOffs);
        EXPECT_EQ(preset.presetUsesFilters, line.filtersRecords);
        EXPECT_EQ(preset.hasReverbLowPass, line.filtersTail);
    }
}

TEST(RoomPresets, ListsAreAsLongAsTheRecordCount) {
    for (const RoomLine& line : readRoomLines()) {
        const auto records = static_cast<std::size_t>(line.records);
        EXPECT_EQ(line.azimuths.size(), records) << line.preset;
        EXPECT_EQ(line.elevations.size(), records) << line.preset;
        EXPECT_EQ(line.delays.size(), records) << line.preset;
        EXPECT_EQ(line.gains.size(), records) << line.preset;
        EXPECT_EQ(line.classes.size(), records) << line.preset;
        EXPECT_EQ(line.walls.size(), 6u) << line.preset;
        EXPECT_EQ(line.cutOffs.size(), 3u) << line.preset;
        EXPECT_LE(line.records, Reflections::capacity) << line.preset;
    }
}

TEST(RoomPresets, WallsComeFirstFromTheirFixedDirections) {
    const std::vector<int> azimuths = {-5, 5, 10, -175, -70, 75};
    const std::vector<int> elevations = {60, -30, 0, 0, 0, 5};
    for (int number = 13; number <= 60; ++number) {
        RoomPreset preset;
        ASSERT_TRUE(lookUpRoomPreset(number, preset));
        for (std::size_t k = 0; k < 6; ++k) {
            EXPECT_EQ(preset.presetPhi[k], azimuths[k]) << number << " wall " << k;
            EXPECT_EQ(preset.presetTheta[k], elevations[k]) << number << " wall " << k;
            EXPECT_EQ(preset.presetFilterClass[k], 0) << number << " wall " << k;
        }
    }
}

void expectDefaults(const RoomPreset& preset) {
    EXPECT_EQ(preset.flexReflectionCount, 0);
    EXPECT_EQ(preset.presetPhi.size, 0u);
    EXPECT_EQ(preset.earlyFlexFirSize, 0);
    EXPECT_EQ(preset.earlyPresetGain, 1.0f);
    for (const float wall : preset.roomDistances) {
        EXPECT_EQ(wall, 1.0f);
    }
    EXPECT_EQ(preset.reflectionLP_Fc, 20000.0f);
    EXPECT_EQ(preset.reflectionLP2_Fc, 20000.0f);
    EXPECT_EQ(preset.reverbLP_Fc, 20000.0f);
    EXPECT_FALSE(preset.presetUsesFilters);
    EXPECT_FALSE(preset.hasReverbLowPass);
}

TEST(RoomPresets, ZeroAndUnknownNumbersHaveNoRow) {
    RoomPreset preset;
    ASSERT_TRUE(lookUpRoomPreset(29, preset));
    EXPECT_TRUE(lookUpRoomPreset(0, preset));
    expectDefaults(preset);
    for (const int number : {-1, 61, 32767, -32768}) {
        ASSERT_TRUE(lookUpRoomPreset(29, preset));
        EXPECT_FALSE(lookUpRoomPreset(number, preset)) << number;
        expectDefaults(preset);
    }
}

TEST(RoomPresets, ResponseLengthsAgreeWithTheRowsButForTheSeventh) {
    for (const RoomLine& line : readRoomLines()) {
        EXPECT_EQ(earlyFlexFirSizeOf(line.preset), line.preset == 7 ? 8192 : line.firSize)
            << line.preset;
    }
    EXPECT_EQ(readRoomLines()[6].firSize, 8182);
}

TEST(RoomPresets, LongestDelayFitsSixteenBitsAtEveryRate) {
    int longest = 0;
    for (const RoomLine& line : readRoomLines()) {
        for (const int delay : line.delays) {
            longest = std::max(longest, delay);
        }
    }
    EXPECT_EQ(longest, 15400);
    EXPECT_EQ(static_cast<int>(static_cast<float>(longest) * 1.0884354f), 16761);
}

TEST(ReverbPresets, EveryTailIsAsItWasAuthored) {
    const std::vector<TailLine> tails = readTailLines();
    ASSERT_EQ(tails.size(), 60u);
    for (int number = 1; number <= 60; ++number) {
        SCOPED_TRACE("preset " + std::to_string(number));
        const TailLine& line = tails[static_cast<std::size_t>(number - 1)];
        ASSERT_EQ(line.preset, number);
        const ReverbPreset* const row = findReverbPreset(number);
        ASSERT_NE(row, nullptr);
        EXPECT_EQ(row->number, number);
        EXPECT_EQ(row->reverbPresetGain, line.gain);
        EXPECT_EQ(row->length48000, line.length48000);
        EXPECT_EQ(row->name, line.name);
        EXPECT_EQ(line.name.empty(), number < 15);
    }
}

TEST(ReverbPresets, LengthsAtEveryRateAreTruncatedInSinglePrecision) {
    constexpr std::array<int, 3> rates = {24000, 44100, 48000};
    int shortened = 0;
    for (const TailLine& line : readTailLines()) {
        if (line.length48000 == 0) {
            continue;
        }
        ASSERT_EQ(line.frames.size(), rates.size());
        for (std::size_t i = 0; i < rates.size(); ++i) {
            EXPECT_EQ(reverbFramesAt(rates[i], line.length48000), line.frames[i])
                << "preset " << line.preset << " at " << rates[i];
        }
        shortened += line.frames[2] == line.length48000 - 1 ? 1 : 0;
    }
    EXPECT_GE(shortened, 1) << "a frame is lost where the product rounds down";
    EXPECT_EQ(reverbFramesAt(48000, 220245), 220244);
    EXPECT_EQ(reverbFramesAt(44100, 23147), 21266);
    EXPECT_EQ(reverbFramesAt(24000, 4096), 2048);
    EXPECT_EQ(reverbFramesAt(44100, 4096), 3763);
}

TEST(ReverbPresets, OtherNumbersHaveNoTail) {
    for (const int number : {0, -1, 61, 32767, -32768}) {
        EXPECT_EQ(findReverbPreset(number), nullptr) << number;
    }
}

}  // namespace
}  // namespace tessaly::test
