// The quality ladder step by step, and the two interpolations apart from it.
#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <string>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

class EveryQuality : public ComparisonFixture, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         EveryQuality,
                         // Above 10 the ladder asks for headphone compensation too, which the
                         // short blocks here do not have.
                         ::testing::Values(-1, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 1000),
                         [](const auto& each) {
                             return each.param < 0 ? std::string("Negative")
                                                   : std::to_string(each.param);
                         });

/// A source that walks, leaps, stands and turns back.
void walk(SourceValues& values, int block) {
    const int phase = block / 12 % 6;
    const int step = phase == 0 ? 1 : phase == 1 ? 3 : phase == 2 ? -1 : phase == 3 ? 0 : -9;
    values.azimuth = wrapToInt16((values.azimuth + step + 540) % 360 - 180);
    if (phase >= 4) {
        values.elevation = wrapToInt16((values.elevation + (phase == 4 ? 1 : -2) + 90) % 180 - 90);
    }
    if (block % 9 == 0) {
        values.distance = 0.4f + 0.3f * static_cast<float>(block % 17);
    }
}

TEST_P(EveryQuality, MovingSource) {
    for (const int rate : sampleRates) {
        for (const bool shared : {false, true}) {
            for (const bool always : {true, false}) {
                SCOPED_TRACE(::testing::Message() << "shared " << shared << " always " << always);
                restart();
                const int blockLength = shared ? 256 : 64;
                // The lower steps have narrow limits, which leave most of the table empty unless
                // an engine before them has filled it.
                std::unique_ptr<ComparedSource> first;
                if (shared) {
                    EngineOptions full;
                    full.blockLength = blockLength;
                    full.sampleRate = rate;
                    full.qvUse256HRIR = usesLongHrirs(GetParam());
                    first = source(full);
                }
                EngineOptions options;
                options.qualityValue = GetParam();
                options.blockLength = blockLength;
                options.sampleRate = rate;
                options.alwaysUpdateFilter = always;
                // A room without tracking maps files of its own; that is not compared here.
                options.earlyFlexRefPreset = GetParam() > 3 ? 1 : 0;
                SourceValues start;
                start.azimuth = -14;
                start.elevation = 8;
                const auto one = source(options, start);
                if (options.earlyFlexRefPreset > 0) {
                    one->setRecords(roomRecords(10, 800, 11));
                }
                for (int block = 0; block < 72; ++block) {
                    walk(one->values, block);
                    ASSERT_TRUE(one->play(deviation));
                    if (first != nullptr) {
                        ASSERT_TRUE(first->play(deviation));
                    }
                }
            }
        }
    }
}

/// Single degrees on both axes at once, to and fro over the grid.
void drift(SourceValues& values, int block) {
    values.azimuth = wrapToInt16(values.azimuth + (block / 40 % 2 == 0 ? 1 : -1));
    values.elevation = wrapToInt16(values.elevation + (block / 13 % 3 - 1));
    if (block % 3 == 2) {
        values.azimuth = wrapToInt16(values.azimuth + 1);
    }
}

class Interpolation : public ComparisonFixture, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         Interpolation,
                         ::testing::Values(32, 64, 128, 1024),
                         ::testing::PrintToStringParamName());

TEST_P(Interpolation, BlendedFiltersFollowTheSource) {
    for (const int rate : sampleRates) {
        for (const bool always : {true, false}) {
            SCOPED_TRACE(::testing::Message() << "always " << always);
            restart();
            EngineOptions options;
            options.blockLength = GetParam();
            options.sampleRate = rate;
            options.qvInterpolateFilters = true;
            options.alwaysUpdateFilter = always;
            options.earlyFlexRefPreset = GetParam() == 128 ? 1 : 0;
            const auto one = source(options);
            if (options.earlyFlexRefPreset > 0) {
                one->setRecords(roomRecords(6, 500, 12));
            }
            for (int block = 0; block < 72; ++block) {
                walk(one->values, block);
                ASSERT_TRUE(one->play(deviation));
            }
        }
    }
}

TEST_P(Interpolation, OnsetsGlideOnBothAxesAtOnce) {
    EngineOptions options;
    options.blockLength = GetParam();
    options.qvInterpolateFilters = true;
    SourceValues start;
    start.azimuth = -80;
    const auto one = source(options, start);
    for (int block = 0; block < 240; ++block) {
        drift(one->values, block);
        ASSERT_TRUE(one->play(deviation));
    }
}

TEST_P(Interpolation, DirectFeedHearsTwoBlocksOfTheResponse) {
    for (const int rate : sampleRates) {
        for (const int preset : {0, 1, 15}) {
            SCOPED_TRACE(::testing::Message() << "preset " << preset);
            restart();
            EngineOptions options;
            options.blockLength = GetParam();
            options.sampleRate = rate;
            options.qvInterpolateSpectra = true;
            options.qvInterpolateFilters = preset == 15;  // gives way to the spectra
            options.alwaysUpdateFilter = preset != 0;
            options.earlyFlexRefPreset = preset;
            const auto one = source(options);
            if (preset > 0) {
                one->setRecords(roomRecords(8, 700, 13));
            }
            for (int block = 0; block < 72; ++block) {
                walk(one->values, block);
                ASSERT_TRUE(one->play(deviation));
            }
        }
    }
}

class UpdateInterval : public ComparisonFixture {};

TEST_F(UpdateInterval, DirectionAndDistanceAreReadOnTicksOnly) {
    for (const int interval : {1, 2, 3, 4, 7}) {
        for (const bool always : {true, false}) {
            restart();
            EngineOptions options;
            options.blockLength = 128;
            options.qvUpdateInterval = interval;
            options.alwaysUpdateFilter = always;
            options.doppler = true;
            const auto one = source(options);
            for (int block = 0; block < 60; ++block) {
                walk(one->values, block);
                ASSERT_TRUE(one->play(deviation)) << interval;
            }
        }
    }
}

TEST_F(UpdateInterval, FixedDirectionIgnoresTheSource) {
    for (const int azimuth : {0, 40}) {
        for (const bool use256 : {false, true}) {
            restart();
            EngineOptions options;
            options.blockLength = 64;
            options.qvTrackDirection = false;
            options.qvUse256HRIR = use256;
            SourceValues start;
            start.azimuth = wrapToInt16(azimuth);
            const auto one = source(options, start);
            for (int block = 0; block < 40; ++block) {
                walk(one->values, block);
                one->values.directGain = 0.5f;  // not applied to a fixed direction
                ASSERT_TRUE(one->play(deviation));
            }
        }
    }
}

}  // namespace
}  // namespace tessaly::test
