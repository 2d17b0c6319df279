// The synthetic and the measured tail in the response.
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

class TailComparison : public ComparisonFixture {};

TEST_F(TailComparison, SyntheticTailInItsElevationLimits) {
    for (const int rate : sampleRates) {
        for (const int limitTheta : {90, 45}) {
            for (const int size : {4096, 8192}) {
                SCOPED_TRACE(::testing::Message() << limitTheta << " size " << size);
                restart();
                EngineOptions options;
                options.blockLength = 256;
                options.sampleRate = rate;
                options.qvReverb = 1;
                options.limitTheta = limitTheta;
                options.defaultFirSize = size;
                const auto one = source(options);
                for (int block = 0; block < 40; ++block) {
                    one->values.reverbGain = block < 20 ? 2.0f : 0.7f;
                    one->values.azimuth = wrapToInt16(block * 9 - 180);
                    ASSERT_TRUE(one->play(deviation));
                }
            }
        }
    }
}

struct TailCase {
    bool filter;
    float cutOff;
    float roomSize;
};

std::ostream& operator<<(std::ostream& out, const TailCase& one) {
    return out << (one.filter ? "low-pass " : "plain ") << one.cutOff << " Hz, size "
               << one.roomSize;
}

class EveryTail : public ComparisonFixture, public ::testing::WithParamInterface<TailCase> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         EveryTail,
                         ::testing::Values(TailCase{false, 3000.0f, 1.0f},
                                           TailCase{true, 3000.0f, 1.0f},
                                           TailCase{true, 20000.0f, 1.0f},
                                           TailCase{true, 19999.0f, 0.4f},
                                           TailCase{false, 500.0f, 0.0f},
                                           TailCase{true, 700.0f, 0.99f}),
                         [](const auto& each) {
                             return (each.param.filter ? "LowPass" : "Plain") +
                                    std::to_string(static_cast<int>(each.param.cutOff)) + "Size" +
                                    std::to_string(static_cast<int>(100.0f * each.param.roomSize));
                         });

TEST_P(EveryTail, MeasuredTailOverDistanceAndSize) {
    for (const int rate : sampleRates) {
        for (const int blockLength : {128, 1024}) {
            SCOPED_TRACE(::testing::Message() << blockLength);
            restart();
            EngineOptions options;
            options.blockLength = blockLength;
            options.sampleRate = rate;
            options.qvReverb = 20;
            options.earlyFlexRefPreset = 20;  // reflections on: the tail follows the distance
            options.presetRow.hasReverbLowPass = GetParam().filter;
            options.tail = tailOf(5003, 0.06f, 41);
            const auto one = source(options);
            one->setRecords(roomRecords(7, 800, 42));
            one->values.reverbLP = GetParam().cutOff;
            const std::vector<float> distances = {1.0f,  13.0f, 14.0f, 22.0f, 29.9f,
                                                  31.0f, 39.0f, 41.0f, 2.0f};
            const int each = blocksOf(0.05, options.sampleRate, options.blockLength, 2);
            for (const float distance : distances) {
                one->values.distance = distance;
                for (int block = 0; block < each; ++block) {
                    one->values.azimuth = wrapToInt16(block * 50 - 100);
                    one->values.roomSize = block % 2 == 0 ? GetParam().roomSize : 1.0f;
                    one->values.reverbGain = distance > 20.0f ? 4.0f : 1.0f;
                    ASSERT_TRUE(one->play(deviation)) << distance;
                }
            }
        }
    }
}

TEST_F(TailComparison, TailSoundsInResponsesOf4096FramesAndMore) {
    for (const int frames : {1000, 4000, 4090}) {
        restart();
        EngineOptions options;
        options.blockLength = 64;
        options.qvReverb = 30;
        options.tail = tailOf(frames, 0.2f, 43);
        const auto one = source(options);
        for (int block = 0; block < 90; ++block) {
            ASSERT_TRUE(one->play(deviation)) << frames;
        }
    }
}

TEST_F(TailComparison, AStillSourceRunsThroughTheWholeTail) {
    EngineOptions options;
    options.blockLength = 512;
    options.alwaysUpdateFilter = false;
    options.qvReverb = 30;
    options.tail = tailOf(23147, 0.06f, 44);
    const auto one = source(options);
    ASSERT_EQ(one->plain().partitions(), 46);
    for (int block = 0; block < 60; ++block) {
        if (block == 52) {
            one->values.azimuth = 90;
        }
        ASSERT_TRUE(one->play(deviation));
    }
}

}  // namespace
}  // namespace tessaly::test
