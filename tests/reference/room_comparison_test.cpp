// Engines with rooms, block by block against those of the double-precision reference.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/reference/reference_hrir.h"
#include "support/reference/reference_process.h"
#include "support/reference/reference_rooms.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

/// Of a full scale of 1.0, or of the loudest sample where a room of noise exceeds it: sums in
/// single precision end near 1e-6, a wrong tap or gain is heard from 1e-4 on.
constexpr double tolerance = 1e-5;
constexpr int presetWithoutTail = 11;

struct Scene {
    int preset = 0;
    int sampleRate = 48000;
    int blockLength = 1024;
    bool reverb = true;
    bool auralisation = false;
    int blocks = 10;
};

class RoomComparison : public EngineFixture {
protected:
    /// Walks round the head and away while the room gets smaller, through both engines.
    void play(const Scene& scene) {
        resetProcess();
        const TempDirectory directory;
        const bool measured = scene.reverb && scene.preset >= 15;
        writePackedHrirSet(directory.path(), scene.sampleRate);
        writePackedTails(directory.path(), scene.sampleRate,
                         measured ? std::vector<int>{scene.preset} : std::vector<int>{});
        const int qvReverb = scene.reverb && scene.preset != presetWithoutTail ? scene.preset : 0;

        EngineRig rig(directory.path(), scene.sampleRate, scene.blockLength);
        rig.settings.earlyFlexRefPreset = static_cast<std::int16_t>(scene.preset);
        rig.settings.qvReverb = static_cast<std::int16_t>(qvReverb);
        rig.settings.auralisation = scene.auralisation ? 1 : 0;
        rig.build();
        ASSERT_EQ(essError, essErrorNone);

        reference::Process process;
        process.hrirSource = reference::packedFilesIn(directory.path());
        reference::EngineOptions options;
        options.blockLength = scene.blockLength;
        options.sampleRate = scene.sampleRate;
        options.earlyFlexRefPreset = scene.preset;
        options.qvReverb = qvReverb;
        options.auralisation = scene.auralisation;
        options.presetRow = reference::presetRowOf(scene.preset);
        options.tail = reference::tailOf(qvReverb, scene.sampleRate, testTailSample);
        reference::SourceInputs inputs;
        reference::MixLevels mix;
        reference::Engine plain(process, inputs, mix, options);
        ASSERT_TRUE(plain.built());
        ASSERT_EQ(plain.partitions(), rig.state().sizes.fdlCount);
        ASSERT_EQ(plain.firSize(), rig.state().sizes.FIR_size);

        std::mt19937 random(static_cast<unsigned>(scene.preset));
        std::uniform_real_distribution<float> noise(-0.05f, 0.05f);
        std::vector<double> expected;
        double peak = 0.0;
        double largest = 0.0;
        for (int block = 0; block < scene.blocks; ++block) {
            for (float& sample : rig.input) {
                sample = noise(random);
            }
            rig.azimuth = inputs.azimuth =
                static_cast<std::int16_t>((block * 23 + scene.preset * 7) % 360 - 180);
            rig.elevation = inputs.elevation = static_cast<std::int16_t>(block * 17 % 120 - 60);
            rig.distance = inputs.distance = 0.6f + 0.37f * static_cast<float>(block % 9);
            const float size = block < 4 ? 1.0f : 1.0f - 0.1f * static_cast<float>(block % 7);
            rig.engine->controls().roomSizeFactor = plain.controls.roomSizeFactor = size;
            rig.run();
            plain.process(std::span<const float>(rig.input), expected);
            for (std::size_t i = 0; i < expected.size(); ++i) {
                ASSERT_TRUE(std::isfinite(rig.output[i]));
                peak = std::max(peak, std::abs(expected[i]));
                largest =
                    std::max(largest, std::abs(static_cast<double>(rig.output[i]) - expected[i]));
            }
            for (std::size_t k = 0; k < plain.records.size(); ++k) {
                const auto& got = rig.state().reflections.records[k];
                EXPECT_EQ(got.delaySamples, plain.records[k].delaySamples) << k;
                EXPECT_EQ(got.indexPhi, plain.records[k].indexPhi) << k;
                EXPECT_EQ(got.indexTheta, plain.records[k].indexTheta) << k;
            }
        }
        EXPECT_LE(largest, tolerance * std::max(1.0, peak));
        EXPECT_GT(peak, 0.05) << "silence was compared with silence";
        std::printf("[ DEVIATION] room %d at %d/%d: %.1e, peak %.2f\n", scene.preset,
                    scene.sampleRate, scene.blockLength, largest, peak);
    }

private:
    LogCapture quiet_;  // loads write pages of log
};

class EveryRoom : public RoomComparison, public ::testing::WithParamInterface<int> {};
INSTANTIATE_TEST_SUITE_P(Rooms, EveryRoom, ::testing::Range(1, 61));

TEST_P(EveryRoom, MovingSource) { play({.preset = GetParam()}); }

TEST_P(EveryRoom, MovingSourceAmongMovingWalls) {
    play({.preset = GetParam(), .reverb = false, .auralisation = true});
}

struct OtherFormat {
    int sampleRate;
    int blockLength;
};

class EveryFormat : public RoomComparison, public ::testing::WithParamInterface<OtherFormat> {};
INSTANTIATE_TEST_SUITE_P(Rooms,
                         EveryFormat,
                         ::testing::Values(OtherFormat{24000, 256},
                                           OtherFormat{24000, 512},
                                           OtherFormat{24000, 4096},
                                           OtherFormat{44100, 256},
                                           OtherFormat{44100, 512},
                                           OtherFormat{48000, 256},
                                           OtherFormat{48000, 512}),
                         [](const auto& each) {
                             return std::to_string(each.param.sampleRate) + "By" +
                                    std::to_string(each.param.blockLength);
                         });

TEST_P(EveryFormat, EightRooms) {
    for (const int preset : {11, 15, 20, 23, 33, 41, 52, 53}) {
        for (const bool auralisation : {false, true}) {
            play({preset, GetParam().sampleRate, GetParam().blockLength, true, auralisation, 16});
        }
    }
}

TEST_F(RoomComparison, WholeTailRunsOut) {
    play({.preset = 20, .blockLength = 256, .blocks = 40});
    play({.preset = 41, .blockLength = 1024, .auralisation = true, .blocks = 30});
}

}  // namespace
}  // namespace tessaly::test
