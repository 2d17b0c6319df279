// Response length, partitions and buffer sizes.
#include "engine/fir_size.h"

#include <gtest/gtest.h>

#include <map>
#include <vector>

#include "support/log_capture.h"

namespace tessaly::test {
namespace {

FirSizes derive(
    int blocklenght, int qvReverb, int reverbLength, int preset, int defaultFirSize = 4096) {
    FirSizes sizes;
    sizes.blocklenght = blocklenght;
    auto earlyFlexRefPreset = static_cast<std::int16_t>(preset);
    deriveFirSizes(sizes, defaultFirSize, static_cast<std::int16_t>(qvReverb), reverbLength,
                   earlyFlexRefPreset);
    return sizes;
}

TEST(FirSize, WithoutARoomTheResponseIsOneBlock) {
    for (const int block : {32, 256, 1024, 4096}) {
        const FirSizes sizes = derive(block, 0, 0, 0);
        EXPECT_EQ(sizes.FIR_size, block);
        EXPECT_EQ(sizes.fdlCount, 1);
        EXPECT_EQ(sizes.firBufferSize, 2 * block);
        EXPECT_EQ(sizes.fftLength, 2 * block);
    }
}

TEST(FirSize, ATailIsRoundedUpToWholeBlocks) {
    LogCapture log;
    const FirSizes sizes = derive(512, 15, 23147, 15);
    EXPECT_EQ(sizes.fdlCount, 46);
    EXPECT_EQ(sizes.FIR_size, 23552);
    EXPECT_EQ(log.outputLines(), (std::vector<std::string>{
                                     "tempFDLcount = 45 + tempFDLrest = 107",
                                     "tempFDLrest is higher than 0 => 107 so inc tempFDLcout to 46",
                                     "FIR_size = 23552"}));
}

TEST(FirSize, ATailOfWholeBlocksStays) {
    LogCapture log;
    const FirSizes sizes = derive(512, 20, 4096, 20);
    EXPECT_EQ(sizes.fdlCount, 8);
    EXPECT_EQ(sizes.FIR_size, 4096);
    EXPECT_EQ(log.count(LogStream::output, "tempFDLrest is higher"), 0u);
}

TEST(FirSize, ATailOfOneFrameIsOneBlock) {
    const FirSizes sizes = derive(1024, 2, 1, 0);
    EXPECT_EQ(sizes.FIR_size, 1024);
    EXPECT_EQ(sizes.fdlCount, 1);
}

TEST(FirSize, TheSyntheticTailKeepsTheDefault) {
    const FirSizes sizes = derive(512, 1, 0, 15);
    EXPECT_EQ(sizes.FIR_size, 4096);
    EXPECT_EQ(sizes.fdlCount, 8);
}

TEST(FirSize, ReflectionsAloneTakeTheRoomsSize) {
    // By size, so that the table has a second form.
    const std::map<int, std::vector<int>> bySize = {
        {1024, {1, 2, 3, 9, 20, 52}},
        {2048, {4, 11, 15, 17, 18, 23, 28, 41, 51, 53, 55, 56}},
        {4096, {5, 6, 8, 10, 12, 14, 21, 27, 32, 36, 39, 40, 42, 43, 45, 46, 48, 57, 58}},
        {8192,
         {7, 13, 16, 19, 22, 24, 26, 29, 30, 31, 33, 34, 35, 37, 38, 44, 47, 49, 50, 54, 59, 60}},
        {16384, {25}}};
    int presets = 0;
    for (const auto& [size, list] : bySize) {
        for (const int preset : list) {
            EXPECT_EQ(earlyFlexFirSizeOf(preset), size) << preset;
            EXPECT_EQ(derive(256, 0, 0, preset).FIR_size, size) << preset;
            ++presets;
        }
    }
    EXPECT_EQ(presets, 60);
    EXPECT_EQ(earlyFlexFirSizeOf(0), 0);
    EXPECT_EQ(earlyFlexFirSizeOf(61), 0);
    EXPECT_EQ(earlyFlexFirSizeOf(-1), 0);
}

TEST(FirSize, ABlockLongerThanTheRoomStandsAlone) {
    const FirSizes sizes = derive(8192, 0, 0, 1);
    EXPECT_EQ(sizes.FIR_size, 8192);
    EXPECT_EQ(sizes.fdlCount, 1);
}

TEST(FirSize, AnUnknownRoomIsReportedAndDropped) {
    LogCapture log;
    FirSizes sizes;
    sizes.blocklenght = 512;
    std::int16_t preset = 61;
    deriveFirSizes(sizes, 4096, 0, 0, preset);
    EXPECT_EQ(preset, 0);
    EXPECT_EQ(sizes.FIR_size, 512);
    EXPECT_EQ(log.outputLines(),
              std::vector<std::string>{"ERROR: earlyFlexRefPreset to high with 61"});
}

TEST(FirSize, PartitionCountStaysInItsField) {
    const FirSizes sizes = derive(2, 22, 220244, 22);
    EXPECT_EQ(sizes.fdlCount, 32767);
    EXPECT_GE(sizes.FIR_size, int{sizes.fdlCount} * 2);
}

}  // namespace
}  // namespace tessaly::test
