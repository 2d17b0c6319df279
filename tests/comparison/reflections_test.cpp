// The fixed pair and a room's records in the response.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

class ReflectionComparison : public ComparisonFixture {
protected:
    /// Plays with a slow turn; `change` may alter the values before each block.
    template <typename Change>
    void turn(ComparedSource& one, int blocks, Change change) {
        for (int block = 0; block < blocks; ++block) {
            one.values.azimuth = wrapToInt16((block * 13 + 180) % 360 - 180);
            one.values.elevation = wrapToInt16(block * 17 % 180 - 90);
            change(one.values, block);
            ASSERT_TRUE(one.play(deviation));
        }
    }
    void turn(ComparedSource& one, int blocks) {
        turn(one, blocks, [](SourceValues&, int) {});
    }
};

TEST_F(ReflectionComparison, FixedPairAtItsPlaceAndPulledForward) {
    for (const int rate : sampleRates) {
        for (const int blockLength : {32, 64, 256, 512, 1024}) {
            for (const int preset : {0, 1, 15}) {
                SCOPED_TRACE(::testing::Message() << blockLength << " preset " << preset);
                restart();
                EngineOptions options;
                options.blockLength = blockLength;
                options.sampleRate = rate;
                options.qvEarlyReflections = true;
                options.earlyFlexRefPreset = preset;
                const auto one = source(options);
                turn(*one, blocksOf(0.05, options.sampleRate, options.blockLength, 8),
                     [](SourceValues& values, int block) {
                         values.distance = 0.5f + 0.9f * static_cast<float>(block % 12);
                         values.earlyGain = block % 4 == 3 ? 0.4f : 1.0f;
                     });
            }
        }
    }
}

TEST_F(ReflectionComparison, FixedPairBeyondTheLimitsTakesHrirsOfItsOwn) {
    for (const bool use256 : {false, true}) {
        for (const bool track : {false, true}) {
            SCOPED_TRACE(::testing::Message() << use256 << " track " << track);
            restart();
            EngineOptions options;
            options.blockLength = 1024;
            options.qvEarlyReflections = true;
            options.qvUse256HRIR = use256;
            options.qvTrackDirection = track;
            options.limitPhi = 60;
            options.limitTheta = 30;
            const auto one = source(options);
            turn(*one, 10);
        }
    }
}

class EveryFilterClass : public ReflectionComparison, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(
    Comparison, EveryFilterClass, ::testing::Values(-1, 0, 1), [](const auto& each) {
        return each.param < 0 ? std::string("None") : "Class" + std::to_string(each.param);
    });

TEST_P(EveryFilterClass, RecordsWithWallsDelaysAndCutOffs) {
    for (const int rate : sampleRates) {
        for (const int preset : {1, 15, 5}) {
            for (const int blockLength : {64, 512}) {
                SCOPED_TRACE(::testing::Message() << preset << " block " << blockLength);
                restart();
                EngineOptions options;
                options.blockLength = blockLength;
                options.sampleRate = rate;
                options.earlyFlexRefPreset = preset;
                options.presetRow.earlyPresetGain = 1.3f;
                const auto one = source(options);
                const int size = one->plain().firSize();
                const int taps = one->plain().hrirLength();
                std::vector<RecordValues> records;
                // Delays around every bound: before the response, at its start, its last place,
                // one too far, out of sight, wrapped.
                const std::vector<int> delays = {-1,  0,        300,   size - taps - 1, size - taps,
                                                 777, 3 - taps, -taps, -taps - 1,       size,
                                                 90,  -32768,   3000};
                for (std::size_t k = 0; k < delays.size(); ++k) {
                    RecordValues record;
                    record.relativePhi = static_cast<int>(k) * 31 - 170;
                    record.relativeTheta = static_cast<int>(k) * 14 - 85;
                    record.delay = delays[k];
                    record.gain = 0.1f + 0.02f * static_cast<float>(k);
                    record.filterClass = GetParam();
                    // Among the first six a negative distance is a wall that is not there; from
                    // the seventh record on it means nothing.
                    record.wallDistance = k == 2 || k == 9 ? -1.0f : 1.0f;
                    records.push_back(record);
                }
                one->setRecords(records);
                turn(*one, blocksOf(0.06, options.sampleRate, options.blockLength, 14),
                     [](SourceValues& values, int block) {
                         values.reflectionLP = block % 3 == 0 ? 800.0f : 6000.0f;
                         values.reflectionLP2 = block % 4 == 0 ? 20000.0f : 2500.0f;
                         values.distance = block % 5 == 4 ? 18.0f : 0.8f;
                     });
            }
        }
    }
}

TEST_F(ReflectionComparison, TwentyRecordsOverLongResponses) {
    for (const int preset : {7, 25}) {
        restart();
        EngineOptions options;
        options.blockLength = 256;
        options.earlyFlexRefPreset = preset;
        const auto one = source(options);
        one->setRecords(roomRecords(20, one->plain().firSize() - 200, 21));
        turn(*one, one->plain().partitions() + 12, [](SourceValues& values, int) {
            values.reflectionLP = 3000.0f;
            values.reflectionLP2 = 1500.0f;
        });
    }
}

TEST_F(ReflectionComparison, RecordsOfNarrowLimitsFallOnEmptyCells) {
    EngineOptions options;
    options.blockLength = 128;
    options.earlyFlexRefPreset = 1;
    options.limitPhi = 90;
    options.limitTheta = 60;
    const auto one = source(options);
    one->setRecords(roomRecords(10, 700, 22));
    turn(*one, 30);
}

}  // namespace
}  // namespace tessaly::test
