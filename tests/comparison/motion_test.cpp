// Still and moving sources: direction, distance, levels, delay line and input filters.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <vector>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

/// Round the listener and up and down, far steps and near ones, with every whole degree in reach.
void moveOn(SourceValues& values, int block) {
    values.azimuth = wrapToInt16((values.azimuth + 180 + 23 + block % 7) % 361 - 180);
    values.elevation = wrapToInt16((values.elevation + 90 + 11) % 181 - 90);
    values.distance = 0.3f + 3.0f * std::abs(std::sin(0.4f * static_cast<float>(block)));
}

class EveryBlockSize : public ComparisonFixture, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         EveryBlockSize,
                         ::testing::Values(2, 4, 8, 16, 32, 64, 128, 256, 512, 1024, 2048, 4096),
                         ::testing::PrintToStringParamName());

TEST_P(EveryBlockSize, StillAndMovingSourcesAtAllRates) {
    if (GetParam() < 32) {
        leastPeak = 1e-5;  // the onsets of the HRIRs lie behind the only partition
    }
    for (const int rate : sampleRates) {
        for (const bool always : {true, false}) {
            for (const bool fading : {true, false}) {
                SCOPED_TRACE(::testing::Message() << "always " << always << " fading " << fading);
                restart();
                EngineOptions options;
                options.blockLength = GetParam();
                options.sampleRate = rate;
                options.alwaysUpdateFilter = always;
                options.fading = fading;
                SourceValues start;
                start.azimuth = 67;
                start.elevation = -33;
                start.distance = 1.5f;
                const auto one = source(options, start);
                const int blocks = blocksOf(0.08, options.sampleRate, options.blockLength, 12);
                for (int block = 0; block < blocks; ++block) {
                    if (block >= blocks / 3 && block < blocks - blocks / 4) {
                        moveOn(one->values, block);
                    }
                    ASSERT_TRUE(one->play(deviation));
                }
            }
        }
    }
}

class Motion : public ComparisonFixture {};

TEST_F(Motion, EveryDirectionOfTheGridAndBetween) {
    EngineOptions options;
    options.blockLength = 64;
    const auto one = source(options);
    for (int elevation = -90; elevation <= 90; elevation += 7) {
        for (int azimuth = -180; azimuth <= 180; azimuth += 9) {
            one->values.azimuth = wrapToInt16(azimuth);
            one->values.elevation = wrapToInt16(elevation);
            ASSERT_TRUE(one->play(deviation)) << azimuth << " " << elevation;
        }
    }
}

TEST_F(Motion, LimitsStopTheSourceFourDegreesLate) {
    for (const int limitTheta : {90, 45, 0}) {
        for (const bool always : {true, false}) {
            restart();
            EngineOptions options;
            options.blockLength = 64;
            options.limitPhi = limitTheta == 90 ? 180 : 92;
            options.limitTheta = limitTheta;
            options.alwaysUpdateFilter = always;
            const auto one = source(options);
            for (int block = 0; block < 60; ++block) {
                one->values.azimuth = wrapToInt16(block * 7 % 360 - 180);
                one->values.elevation = wrapToInt16(block * 5 % 180 - 90);
                ASSERT_TRUE(one->play(deviation)) << limitTheta;
            }
        }
    }
}

TEST_F(Motion, DistanceLawsAcrossTheirThresholds) {
    const std::vector<float> distances = {1.5f,  0.05f,    0.0f,  0.1f,  0.11f, 0.12f, 0.5f,  0.99f,
                                          1.0f,  1.0001f,  2.5f,  7.0f,  7.01f, 9.99f, 10.0f, 13.7f,
                                          13.8f, 19.9f,    20.0f, 25.0f, 27.9f, 28.0f, 30.0f, 33.4f,
                                          39.9f, 6.99999f, 40.0f, 50.0f, 0.3f,  -2.0f, 12.0f, 1.0f};
    for (const int rate : sampleRates) {
        for (const bool always : {true, false}) {
            restart();
            EngineOptions options;
            options.blockLength = 128;
            options.sampleRate = rate;
            options.alwaysUpdateFilter = always;
            options.earlyFlexRefPreset = 15;
            const auto one = source(options);
            one->setRecords(roomRecords(9, 700, 3));
            for (const float distance : distances) {
                one->values.distance = distance;
                for (int block = 0; block < 3; ++block) {
                    ASSERT_TRUE(one->play(deviation)) << distance << " m";
                }
            }
        }
    }
}

TEST_F(Motion, HostAttenuationReplacesTheLaw) {
    EngineOptions options;
    options.blockLength = 256;
    options.doppler = true;
    const auto one = source(options);
    for (int block = 0; block < 60; ++block) {
        one->values.unityDistance = block / 10 % 2 == 1;
        one->values.distance = 0.5f + 0.7f * static_cast<float>(block);
        one->values.directGain = one->values.unityDistance ? 1.0f / one->values.distance : 1.0f;
        ASSERT_TRUE(one->play(deviation));
    }
}

TEST_F(Motion, DelayLineGlidesJumpsAndStopsAtTwentyFiveMetres) {
    for (const int rate : sampleRates) {
        for (const int blockLength : {32, 64, 256, 1024, 4096}) {
            for (const bool smooth : {false, true}) {
                SCOPED_TRACE(::testing::Message() << blockLength << " smooth " << smooth);
                restart();
                EngineOptions options;
                options.blockLength = blockLength;
                options.sampleRate = rate;
                options.doppler = true;
                options.qvSmoothSteps = smooth;
                SourceValues start;
                start.distance = 3.0f;
                const auto one = source(options, start);
                const float metresPerBlock =
                    30.0f * static_cast<float>(blockLength) / static_cast<float>(rate);
                const int blocks = 28;
                for (int block = 0; block < blocks; ++block) {
                    float& distance = one->values.distance;
                    if (block < 8) {
                        distance += metresPerBlock;  // away at 30 m/s
                    } else if (block < 14) {
                        distance = std::max(0.2f, distance - 1.7f * metresPerBlock);
                    } else if (block == 16) {
                        distance = 24.0f;  // farther than a block of samples: the head runs back
                    } else if (block == 19) {
                        distance = 26.5f;
                    } else if (block == 22) {
                        distance = 0.05f;  // and skips ahead
                    }
                    ASSERT_TRUE(one->play(deviation));
                }
            }
        }
    }
}

TEST_F(Motion, OcclusionAndBassShelfFilterTheInput) {
    for (const int rate : sampleRates) {
        restart();
        EngineOptions options;
        options.blockLength = 512;
        options.sampleRate = rate;
        const auto one = source(options);
        for (int block = 0; block < 60; ++block) {
            const float ramp = 0.05f * static_cast<float>(block % 24);
            one->values.occlusion = std::min(ramp, 1.0f);
            one->values.gainDb = -24.0f * one->values.occlusion;
            one->values.bassBoost = block / 7 % 2 == 1;
            ASSERT_TRUE(one->play(deviation));
        }
    }
}

TEST_F(Motion, LevelsFollowAtOnceOrWithTheNextChange) {
    for (const bool always : {true, false}) {
        restart();
        EngineOptions options;
        options.blockLength = 128;
        options.alwaysUpdateFilter = always;
        options.earlyFlexRefPreset = 1;
        const auto one = source(options);
        one->setRecords(roomRecords(8, 600, 5));
        for (int block = 0; block < 90; ++block) {
            SourceValues& values = one->values;
            values.gainDb = block % 5 == 0 ? -6.0f : 3.5f;
            switch (block / 3 % 9) {
                case 1:
                    values.directGain = 0.3f;
                    break;
                case 2:
                    values.earlyGain = 0.1f;
                    break;
                case 3:
                    values.reverbGain = 0.4f;
                    break;
                case 4:
                    values.unityDistance = true;
                    break;
                case 5:
                    values.unityAttenuation = 0.6f;
                    break;
                case 6:
                    values.roomSize = 0.5f;
                    break;
                case 7:
                    values.reverbLP = 900.0f;
                    break;
                default:
                    values = SourceValues{};
                    break;
            }
            ASSERT_TRUE(one->play(deviation));
        }
    }
}

TEST_F(Motion, ImpulsesSilenceAndTones) {
    for (const int blockLength : {64, 1024}) {
        restart();
        EngineOptions options;
        options.blockLength = blockLength;
        options.sampleRate = 44100;
        const auto one = source(options);
        for (int block = 0; block < 24; ++block) {
            std::vector<float> signal(static_cast<std::size_t>(blockLength), 0.0f);
            if (block % 6 == 0) {
                signal[static_cast<std::size_t>(blockLength / 2 + 5)] = 0.8f;
            } else if (block % 6 == 2) {
                for (int i = 0; i < blockLength; ++i) {
                    signal[static_cast<std::size_t>(i)] =
                        0.4f * std::sin(0.11f * static_cast<float>(i + 1));
                }
            }
            moveOn(one->values, block);
            ASSERT_TRUE(one->play(deviation, signal));
        }
    }
}

TEST_F(Motion, SmoothStepsLimitAngleAndDistance) {
    for (const int interval : {1, 2, 3}) {
        for (const bool interpolate : {false, true}) {
            SCOPED_TRACE(::testing::Message() << interval << " interpolate " << interpolate);
            restart();
            EngineOptions options;
            options.blockLength = 64;
            options.qvSmoothSteps = true;
            options.qvInterpolateFilters = interpolate;
            options.qvUpdateInterval = interval;
            options.doppler = true;
            SourceValues start;
            start.azimuth = 20;
            start.distance = 0.9f;
            const auto one = source(options, start);
            for (int block = 0; block < 150; ++block) {
                if (block % 25 == 0) {
                    one->values.azimuth = wrapToInt16(block % 50 == 0 ? 60 : -170);
                    one->values.elevation = wrapToInt16(block % 75 == 0 ? 40 : -12);
                    one->values.distance = block % 50 == 0 ? 4.0f : 0.2f;
                }
                ASSERT_TRUE(one->play(deviation));
            }
        }
    }
}

TEST_F(Motion, AFailedProcessRepeatsTheLastBlockAndRecovers) {
    EngineOptions options;
    options.blockLength = 128;
    const auto one = source(options);
    for (int block = 0; block < 20; ++block) {
        const int error = block >= 6 && block < 11 ? -110 : 1;
        essError = error;
        process.essError = error;
        moveOn(one->values, block);
        one->values.gainDb = static_cast<float>(block % 3) - 3.0f;
        ASSERT_TRUE(one->play(deviation));
    }
}

}  // namespace
}  // namespace tessaly::test
