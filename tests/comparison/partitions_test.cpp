// Responses of many partitions: rings, crossfade blocks and plain blocks in any order.
#include <gtest/gtest.h>

#include <random>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

class EveryPartitionCount : public ComparisonFixture, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         EveryPartitionCount,
                         ::testing::Values(1, 2, 3, 4, 5, 8, 16, 46),
                         ::testing::PrintToStringParamName());

TEST_P(EveryPartitionCount, UpdatesAndPauses) {
    const int n = GetParam();
    for (const int blockLength : {64, 512}) {
        for (const int pattern : {0, 1, 2, 3}) {
            for (const bool fading : {true, false}) {
                if (!fading && pattern != 3) {
                    continue;  // one ring and no crossfade: any order will do
                }
                SCOPED_TRACE(::testing::Message()
                             << blockLength << " pattern " << pattern << " fading " << fading);
                restart();
                EngineOptions options;
                options.blockLength = blockLength;
                options.sampleRate = 44100;
                options.fading = fading;
                options.alwaysUpdateFilter = pattern == 0;
                // The synthetic tail gives any length, and sounds from 4096 frames on. What is
                // shorter than a room's response is filled by the fixed pair.
                const bool room = n * blockLength >= 1024;
                options.qvReverb = 1;
                options.defaultFirSize = n * blockLength;
                options.earlyFlexRefPreset = room ? 1 : 0;
                options.qvEarlyReflections = !room;
                const auto one = source(options);
                ASSERT_EQ(one->plain().partitions(), n);
                if (room) {
                    one->setRecords(roomRecords(14, n * blockLength - 150, 31));
                }
                std::mt19937 random(static_cast<unsigned>(32 + pattern));
                for (int block = 0; block < 2 * n + 16; ++block) {
                    // No update, every second block, or at random: with updates at rest the ring
                    // of the first convolver fills, after a pause both hold old windows.
                    const bool move = pattern == 1   ? block % 2 == 1
                                      : pattern == 2 ? block % (n + 2) == n
                                      : pattern == 3 ? random() % 3 == 0
                                                     : block % 4 == 0;
                    if (move) {
                        one->values.azimuth = wrapToInt16(static_cast<int>(random() % 360) - 180);
                    }
                    ASSERT_TRUE(one->play(deviation));
                }
            }
        }
    }
}

class LongBlocks : public ComparisonFixture {};

TEST_F(LongBlocks, ResponsesShorterAndLongerThanTheBlock) {
    for (const int blockLength : {1024, 2048, 4096}) {
        for (const int preset : {1, 15, 5, 25}) {
            restart();
            EngineOptions options;
            options.blockLength = blockLength;
            options.sampleRate = 24000;
            options.earlyFlexRefPreset = preset;
            const auto one = source(options);
            one->setRecords(roomRecords(12, one->plain().firSize() - 100, 33));
            for (int block = 0; block < 8; ++block) {
                one->values.azimuth = wrapToInt16(block * 40 - 160);
                one->values.distance = 1.0f + static_cast<float>(block % 3);
                ASSERT_TRUE(one->play(deviation));
            }
        }
    }
}

}  // namespace
}  // namespace tessaly::test
