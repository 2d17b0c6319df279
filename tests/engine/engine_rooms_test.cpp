// Whole engines with rooms: response lengths, reflections and tails in the response, room changes.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "engine/fir_size.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/room_tables.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr std::array<int, 3> sampleRates = {24000, 44100, 48000};

class EngineRooms : public EngineFixture {
protected:
    /// HRIRs of a rate, and its tail file with these tails; all others are silent.
    void writeData(int rate, const std::vector<int>& tails = {}) {
        writePackedHrirSet(directory.path(), rate);
        writePackedTails(directory.path(), rate, tails);
    }
    std::unique_ptr<EngineRig> rigFor(int rate, int block, int reflections, int reverb) const {
        auto rig = std::make_unique<EngineRig>(directory.path(), rate, block);
        rig->settings.earlyFlexRefPreset = static_cast<std::int16_t>(reflections);
        rig->settings.qvReverb = static_cast<std::int16_t>(reverb);
        return rig;
    }
    std::unique_ptr<EngineRig> built(int rate, int block, int reflections, int reverb) const {
        auto rig = rigFor(rate, block, reflections, reverb);
        rig->build();
        return rig;
    }

    TempDirectory directory;
    LogCapture log;
};

/// Sizes that all components of an engine have to agree on.
void expectSizes(EngineRig& rig, int firSize, int partitions) {
    const EngineState& state = rig.state();
    EXPECT_EQ(state.sizes.FIR_size, firSize);
    EXPECT_EQ(state.sizes.fdlCount, partitions);
    EXPECT_EQ(state.sizes.firBufferSize, firSize + rig.blocklenght());
    EXPECT_EQ(state.composer.filterLeftBuffer.size(),
              static_cast<std::size_t>(firSize + rig.blocklenght()));
    EXPECT_EQ(state.composer.filterRightBuffer.size(), state.composer.filterLeftBuffer.size());
    EXPECT_EQ(state.firstOLS->FDLtoBUFConv, partitions);
    EXPECT_EQ(state.firstOLS->firBufferSize, firSize + rig.blocklenght());
}

/// Whether any sample of a stretch of the left response sounds.
bool sounds(EngineRig& rig, int begin, int end) {
    const float* const left = rig.state().composer.filterLeft;
    return std::any_of(left + begin, left + end, [](float sample) { return sample != 0.0f; });
}

// ---- Lengths ----

TEST_F(EngineRooms, TailsAreRoundedUpToWholeBlocks) {
    const std::vector<TailLine> tails = readTailLines();
    for (std::size_t r = 0; r < sampleRates.size(); ++r) {
        resetProcess();
        writeData(sampleRates[r]);
        const auto keeper = built(sampleRates[r], 256, 0, 0);  // keeps the HRIRs loaded
        for (const int room : {15, 16, 20, 22, 25, 41, 52, 60}) {
            for (const int block : {64, 256, 1024, 4096}) {
                SCOPED_TRACE(std::to_string(room) + " at " + std::to_string(sampleRates[r]) + "/" +
                             std::to_string(block));
                const auto rig = built(sampleRates[r], block, room, room);
                ASSERT_EQ(essError, essErrorNone);
                const int frames = tails[static_cast<std::size_t>(room - 1)].frames[r];
                const int partitions = (frames + block - 1) / block;
                expectSizes(*rig, partitions * block, partitions);
                EXPECT_EQ(rig->state().tail.reverbLength, frames);
            }
        }
    }
}

TEST_F(EngineRooms, ReflectionsAloneTakeTheRoomsLength) {
    writeData(48000);
    const auto keeper = built(48000, 256, 0, 0);
    for (int room = 1; room <= 60; ++room) {
        SCOPED_TRACE(room);
        for (const int block : {256, 4096}) {
            const auto rig = built(48000, block, room, 0);
            const int size = std::max(earlyFlexFirSizeOf(room), block);
            expectSizes(*rig, size, size / block);
        }
    }
}

TEST_F(EngineRooms, LengthRaisedForTheReflectionsLeavesThePartitions) {
    writeData(24000, {20});
    const auto keeper = built(24000, 256, 0, 0);
    // The synthetic tail keeps 4096 frames, presets without a tail one block, room 20 has 2048.
    const struct {
        int reverb;
        int before;
    } cases[] = {{1, 4096}, {2, 256}, {14, 256}, {20, 2048}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.reverb);
        const auto rig = built(24000, 256, 25, c.reverb);
        ASSERT_EQ(essError, essErrorNone);
        expectSizes(*rig, 16384, c.before / 256);
        rig->input.assign(rig->input.size(), 0.25f);
        for (int block = 0; block < 4; ++block) {
            rig->azimuth = static_cast<std::int16_t>(20 * block);
            rig->run();
            EXPECT_TRUE(std::all_of(rig->output.begin(), rig->output.end(),
                                    [](float sample) { return std::isfinite(sample); }));
        }
        EXPECT_TRUE(sounds(*rig, 4096, 16384)) << "reflections behind the partitions are composed";
    }
}

TEST_F(EngineRooms, SyntheticTailLoadsNothing) {
    writePackedHrirSet(directory.path(), 48000);
    auto rig = built(48000, 512, 0, 1);
    EXPECT_EQ(essError, essErrorNone) << "no tail file is needed";
    expectSizes(*rig, 4096, 8);
    EXPECT_EQ(rig->state().tail.reverbLength, 0);
    EXPECT_EQ(log.count(LogStream::output, "___loadIReverb"), 0u);
    rig->run();
    EXPECT_TRUE(sounds(*rig, 2048, 2048 + 139));
    EXPECT_FALSE(sounds(*rig, 139, 2048));

    rig = built(48000, 512, 0, 2);
    expectSizes(*rig, 512, 1);
    EXPECT_EQ(rig->state().tail.reverbLength, 1);
    rig->run();
    EXPECT_FALSE(sounds(*rig, 139, 512));
}

TEST_F(EngineRooms, UnknownPresetsLeaveADryEngine) {
    writeData(48000);
    auto rig = built(48000, 512, 61, 0);
    expectSizes(*rig, 512, 1);
    EXPECT_EQ(rig->state().earlyFlexRefPreset, 0);
    EXPECT_EQ(log.count(LogStream::output, "ERROR: earlyFlexRefPreset to high with 61"), 1u);
    EXPECT_TRUE(log.errorLines().empty());

    rig = built(48000, 512, 61, 20);
    expectSizes(*rig, 4096, 8);
    EXPECT_EQ(log.errorLines(), std::vector<std::string>{"ERROR: ER-Preset doesn't exist!"});
    EXPECT_EQ(rig->state().reflections.flexReflectionCount, 0);

    rig = built(48000, 512, 0, 61);
    expectSizes(*rig, 512, 1);
    EXPECT_EQ(rig->state().switches.qvReverb, 0);
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(EngineRooms, SwitchWithoutARoomStaysOff) {
    writeData(48000);
    const auto rig = built(48000, 256, 0, 20);
    EXPECT_FALSE(rig->state().switches.qvFlexReflections);
    EXPECT_EQ(rig->state().reflections.flexReflectionCount, 0);
}

// ---- What a handler reads back after the load ----

TEST_F(EngineRooms, CutOffsAndWallsStandAfterTheLoad) {
    writeData(48000);
    const auto keeper = built(48000, 256, 0, 0);
    for (const RoomLine& line : readRoomLines()) {
        const auto rig = built(48000, 1024, line.preset, 0);
        const LiveControls& controls = rig->engine->controls();
        EXPECT_EQ(controls.reflectionLP_Fc, line.cutOffs[0]) << line.preset;
        EXPECT_EQ(controls.reflectionLP2_Fc, line.cutOffs[1]) << line.preset;
        EXPECT_EQ(controls.reverbLP_Fc, line.cutOffs[2]) << line.preset;
        for (std::size_t k = 0; k < 6; ++k) {
            EXPECT_EQ(controls.roomDistances[k], line.walls[k]) << line.preset;
        }
        EXPECT_EQ(rig->state().tail.hasReverbLowPass, line.filtersTail) << line.preset;
    }
}

// ---- Tails ----

TEST_F(EngineRooms, MeasuredTailStandsInTheResponse) {
    constexpr int behindReflections = 1200;  // room 15 ends at 860 * 1.09 + 139
    for (const int rate : sampleRates) {
        resetProcess();
        writeData(rate, {15});
        const auto rig = built(rate, 512, 15, 15);
        ASSERT_EQ(essError, essErrorNone);
        rig->mix.reverbGain = 0.7f;
        rig->distance = 3.0f;
        rig->run();
        const EngineState& state = rig->state();
        const float gain = 0.05306f * 0.7f * state.law.reverbDistanceGain;
        ASSERT_GT(gain, 0.0f);
        const int faded = state.sizes.FIR_size - 15;
        for (int i = behindReflections; i < std::min(state.tail.reverbLength, faded); ++i) {
            ASSERT_EQ(composedSample(state.composer, 0, i), testTailSample(15, i, 0) * gain) << i;
            ASSERT_EQ(composedSample(state.composer, 1, i), testTailSample(15, i, 1) * gain) << i;
        }
        for (int i = state.tail.reverbLength; i < state.sizes.firBufferSize; ++i) {
            ASSERT_EQ(state.composer.filterLeft[i], 0.0f) << i;
        }
        EXPECT_TRUE(sounds(*rig, 0, behindReflections));
    }
}

TEST_F(EngineRooms, ShortestTailsNeedAResponseOf4096Frames) {
    const struct {
        int rate;
        std::vector<int> silent;  // block lengths
        std::vector<int> heard;
    } cases[] = {{24000, {64, 256, 1024, 2048}, {4096}},
                 {44100, {64, 128, 256}, {512, 1024, 2048, 4096}},
                 {48000, {}, {64, 256, 512, 1024, 4096}}};
    for (const auto& c : cases) {
        resetProcess();
        writeData(c.rate, {20, 52});
        const auto keeper = built(c.rate, 256, 0, 0);
        for (const int room : {20, 52}) {
            for (const bool heard : {false, true}) {
                for (const int block : heard ? c.heard : c.silent) {
                    const auto rig = built(c.rate, block, room, room);
                    rig->run();
                    // The last reflection ends at 648 * 1.09 + 139.
                    EXPECT_EQ(sounds(*rig, 900, 2000), heard)
                        << "room " << room << " at " << c.rate << "/" << block;
                }
            }
        }
    }
}

TEST_F(EngineRooms, ShortTailSoundsInAResponseRaisedByItsReflections) {
    writeData(24000, {20});
    const auto rig = built(24000, 256, 24, 20);
    rig->run();
    expectSizes(*rig, 8192, 8);
    EXPECT_TRUE(sounds(*rig, 400, 480)) << "between two reflections";
}

TEST_F(EngineRooms, TailIsHeardThroughTheConvolver) {
    writeData(48000, {41});
    const auto rig = built(48000, 512, 41, 41);
    rig->mix.directGain = 0.0f;
    rig->mix.earlyGain = 0.0f;
    rig->distance = 2.0f;
    rig->settings.alwaysUpdateFilter = 0;
    rig->build();
    std::vector<float> left;
    // A click in the second block: the first one settles the response.
    for (int block = 0; block < 28; ++block) {
        std::fill(rig->input.begin(), rig->input.end(), 0.0f);
        if (block == 2) {
            rig->input[0] = 1.0f;
        }
        rig->run();
        for (std::size_t i = 0; i < rig->output.size(); i += 2) {
            left.push_back(rig->output[i]);
        }
    }
    const EngineState& state = rig->state();
    // The input filters change the click a little; the tail's envelope remains.
    double heard = 0.0;
    double composed = 0.0;
    for (int i = 0; i < 12000; ++i) {
        const double sample = static_cast<double>(left[static_cast<std::size_t>(2 * 512 + i)]);
        const double tap = static_cast<double>(composedSample(state.composer, 0, i));
        heard += sample * sample;
        composed += tap * tap;
    }
    ASSERT_GT(composed, 0.0);
    EXPECT_NEAR(10.0 * std::log10(heard / composed), 0.0, 1.5);
}

TEST_F(EngineRooms, EveryEngineReadsItsTailAnewAndOnce) {
    writeData(48000, {20});
    const auto first = built(48000, 512, 20, 20);
    writeData(48000);  // the same room, silent now
    const auto second = built(48000, 512, 20, 20);
    writeFile(directory.file("/TSLdata511.dat"), std::vector<char>{});
    first->run();
    second->run();
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_EQ(first->state().tail.reverbIR[200], testTailSample(20, 100, 0));
    EXPECT_EQ(second->state().tail.reverbIR[200], 0.0f);
    EXPECT_TRUE(sounds(*first, 900, 2000));
    EXPECT_FALSE(sounds(*second, 900, 2000));
}

TEST_F(EngineRooms, MissingTailFileSilencesTheProcess) {
    writePackedHrirSet(directory.path(), 48000);
    const auto rig = built(48000, 512, 15, 15);
    EXPECT_EQ(essError, essErrorTailUnreadable);
    EXPECT_TRUE(rig->state().complete) << "construction goes on";
    expectSizes(*rig, 23552, 46);
    rig->input.assign(rig->input.size(), 0.5f);
    log.clear();
    rig->run();
    EXPECT_EQ(rig->output, std::vector<float>(rig->output.size(), 0.0f));
    EXPECT_EQ(
        log.count(LogStream::output, "Tessaly_e ERROR: no comProcessing due to essError: -105"),
        1u);
}

// ---- Reflections ----

TEST_F(EngineRooms, DelaysBehindTheResponseAreDropped) {
    // Room 25's back wall lies 15400 samples off at 44100 Hz, 16761 at 48000 Hz: behind 16384.
    for (const int rate : {44100, 48000}) {
        resetProcess();
        writeData(rate);
        const auto rig = built(rate, 1024, 25, 0);
        rig->run();
        const int delay = rig->state().reflections.records[3].delaySamples;
        EXPECT_EQ(delay, rate == 44100 ? 15400 : 16761);
        EXPECT_EQ(sounds(*rig, delay, delay + 128), rate == 44100);
        EXPECT_EQ(log.count(LogStream::error, "ERROR"), 0u);
    }
}

/// The left response of one block, with the gain of a record taken away if asked for.
std::vector<float> responseOf(EngineRig& rig, int mutedRecord = -1) {
    if (mutedRecord >= 0) {
        rig.state().reflections.records[static_cast<std::size_t>(mutedRecord)].gain = 0.0f;
    }
    rig.run();
    const float* const left = rig.state().composer.filterLeft;
    return {left, left + rig.state().sizes.firBufferSize};
}

TEST_F(EngineRooms, MissingWallIsSkipped) {
    writeData(48000);
    const auto keeper = built(48000, 256, 0, 0);
    const auto room = [&](float distance, float frontWall) {
        auto rig = rigFor(48000, 512, 15, 0);
        rig->settings.auralisation = 1;
        rig->distance = distance;
        rig->build();
        rig->engine->controls().roomDistances[2] = frontWall;
        return rig;
    };
    const auto whole = responseOf(*room(1.0f, 3.2f));
    const auto muted = responseOf(*room(1.0f, 3.2f), 2);
    EXPECT_NE(whole, muted);
    EXPECT_EQ(responseOf(*room(1.0f, -1.0f)), muted);
    EXPECT_NE(responseOf(*room(1.0f, 0.0f)), muted) << "a wall at 0 keeps its old path";
    // A source outside: the wall behind it is not heard either.
    EXPECT_EQ(responseOf(*room(3.5f, 3.2f)), responseOf(*room(3.5f, 3.2f), 2));
    EXPECT_NE(responseOf(*room(3.5f, 4.2f)), responseOf(*room(3.5f, 4.2f), 2));
}

TEST_F(EngineRooms, WallsFollowTheSourceOnlyUnderAuralisation) {
    writeData(48000);
    const auto keeper = built(48000, 256, 0, 0);
    for (const bool auralisation : {false, true}) {
        auto rig = rigFor(48000, 512, 15, 0);
        rig->settings.auralisation = auralisation ? 1 : 0;
        rig->build();
        rig->run();
        const ReflectionRecord before = rig->state().reflections.records[2];
        rig->distance = 2.0f;
        rig->azimuth = -50;
        rig->run();
        const ReflectionRecord after = rig->state().reflections.records[2];
        EXPECT_EQ(before.delaySamples == after.delaySamples, !auralisation);
        EXPECT_EQ(before.wallDistance, auralisation ? 3.2f : 0.0f);
        EXPECT_NE(before.distanceGain, after.distanceGain);
        EXPECT_EQ(after.phi == 60, !auralisation) << "the preset's 10 degrees and the source's 50";
    }
}

TEST_F(EngineRooms, FixedDirectionKeepsTheRecordsAsLoaded) {
    writeData(48000);
    auto rig = rigFor(48000, 512, 15, 0);
    rig->settings.qvTrackDirection = 0;
    rig->azimuth = 30;
    rig->build();
    ASSERT_EQ(essError, essErrorNone);
    const ReflectionRecord before = rig->state().reflections.records[4];
    EXPECT_EQ(before.phi, 30 - 70) << "a fixed filter takes the host's azimuth as it stands";
    rig->azimuth = -90;
    rig->distance = 4.0f;
    rig->run();
    EXPECT_EQ(rig->state().reflections.records[4].phi, before.phi);
    EXPECT_EQ(rig->state().reflections.records[4].distanceGain, before.distanceGain);
}

// ---- Changing rooms ----

TEST_F(EngineRooms, ThreeHundredRoomChangesInThreeHundredBlocks) {
    writeData(48000, {15, 20, 41, 53});
    auto rig = rigFor(48000, 512, 0, 0);
    rig->build();
    for (int change = 0; change < 300; ++change) {
        const int room = change % 61;
        // As a handler does it: the new engine is built while the old one is alive.
        auto next = rigFor(48000, 512, room, room == 11 || change % 5 == 0 ? 0 : room);
        next->settings.auralisation = change % 2 == 0 ? 1 : 0;
        next->azimuth = static_cast<std::int16_t>(change * 7 % 180);
        next->build();
        ASSERT_EQ(essError, essErrorNone) << room;
        rig = std::move(next);
        ASSERT_EQ(engineCount, 1);
        for (std::size_t i = 0; i < rig->input.size(); ++i) {
            rig->input[i] = i % 4 == 0 ? 0.5f : -0.5f;
        }
        rig->run();
        // No sample can exceed the input's peak times the sum of a response's magnitudes; half
        // as much again for the overshoot of the input filters.
        double most = 0.0;
        const EngineState& state = rig->state();
        for (int i = 0; i < state.sizes.FIR_size; ++i) {
            most += std::max(std::abs(static_cast<double>(composedSample(state.composer, 0, i))),
                             std::abs(static_cast<double>(composedSample(state.composer, 1, i))));
        }
        double peak = 0.0;
        for (const float sample : rig->output) {
            ASSERT_TRUE(std::isfinite(sample)) << room;
            peak = std::max(peak, std::abs(static_cast<double>(sample)));
        }
        EXPECT_GT(peak, 0.0) << room;
        EXPECT_LT(peak, 0.75 * most) << room;
    }
    rig.reset();
    EXPECT_EQ(engineCount, 0);
}

// ---- The far tail ----

TEST_F(EngineRooms, LongTailsAreHeardInLargerPartitionsBehindTheReflections) {
    // A concert hall, of 290 blocks, whose last reflection comes after 8600 frames.
    constexpr int hall = 16;
    writeData(48000, {hall});
    const auto rig = built(48000, 256, hall, hall);
    ASSERT_GT(rig->state().sizes.fdlCount, FarTail::fewestPartitions);
    std::fill(rig->input.begin(), rig->input.end(), 0.25f);
    int far = 0;
    for (int n = 0; n < 120; ++n) {
        rig->azimuth = static_cast<std::int16_t>(n % 90);
        rig->run();
        far += rig->state().firstOLS->farTailHeard() ? 1 : 0;
    }
    EXPECT_GT(far, 20);
}

TEST_F(EngineRooms, ShortTailsStayInPartitionsOfABlock) {
    constexpr int smallRoom = 20;
    writeData(48000, {smallRoom});
    const auto rig = built(48000, 1024, smallRoom, smallRoom);
    ASSERT_LT(rig->state().sizes.fdlCount, FarTail::fewestPartitions);
    std::fill(rig->input.begin(), rig->input.end(), 0.25f);
    for (int n = 0; n < 40; ++n) {
        rig->run();
        EXPECT_FALSE(rig->state().firstOLS->farTailHeard());
    }
}

}  // namespace
}  // namespace tessaly::test
