// The engine's own responses, of which only that is made again which may differ, against the
// composition from nothing.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <memory>
#include <random>
#include <vector>

#include "engine/fir_composer_fixture.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

/// Room with records of all three kinds, with or without a tail and its low-pass.
class ComposerChanges : public FirComposerTest {
protected:
    void setUp(int tailFrames, bool lowPass) {
        setSizes(8192, 512);
        direction.filterUpdatePending = true;
        tail.reverbLength = tailFrames;
        tail.reverbIR = AlignedArray<float>(static_cast<std::size_t>(2 * tailFrames));
        for (float& sample : tail.reverbIR) {
            sample = uniform(-1.0f, 1.0f);
        }
        tail.reverbPresetGain = 0.05f;
        tail.hasReverbLowPass = lowPass;
        tail.reverbLowPass = Biquad(Biquad::lowPass, 0.0, 0.1);
        switches.qvReverb = static_cast<std::int16_t>(tailFrames > 0 ? 20 : 0);
        reflections.reflectionFilter.fill(Biquad(Biquad::lowPass, 0.0, 0.1));
        store(40, 20);
        store(41, 20);
        for (int number = 0; number < 12; ++number) {
            addRecord(200 + 150 * number, number % 3 - 1);
        }
        composer.prepare(sizes.firBufferSize);
        composer.prepareKeptParts(switches.hrirLength, tail);
        plain = std::make_unique<FirComposer>();
        plain->prepare(sizes.firBufferSize);
    }
    float uniform(float low, float high) {
        return std::uniform_real_distribution<float>(low, high)(random);
    }
    int whole(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); }

    /// Changes one of the ingredients, or none.
    void changeSomething() {
        ReflectionRecord& record = reflections.records[static_cast<std::size_t>(whole(0, 11))];
        switch (whole(0, 12)) {
            case 0:
                law.directGain = uniform(0.0f, 1.0f);
                break;
            case 1:
                direction.indexPhi = static_cast<std::int16_t>(whole(40, 41));
                break;
            case 2:
                record.delaySamples = static_cast<std::int16_t>(whole(-200, 3000));
                break;
            case 3:
                record.delaySamples = static_cast<std::int16_t>(whole(3000, 8300));
                break;
            case 4:
                record.distanceGain = uniform(0.0f, 1.0f);
                break;
            case 5:
                record.wallDistance = uniform(-1.0f, 1.0f);
                break;
            case 6:
                mix.earlyGain = uniform(0.0f, 1.0f);
                break;
            case 7:
                mix.reverbGain = whole(0, 3) == 0 ? 0.0f : uniform(0.0f, 1.0f);
                break;
            case 8:
                law.reverbDistanceGain = uniform(0.0f, 1.0f);
                break;
            case 9:
                controls.reverbLP_Fc = whole(0, 1) == 0 ? 20000.0f : uniform(500.0f, 20000.0f);
                break;
            case 10:
                controls.roomSizeFactor = whole(0, 1) == 0 ? 1.0f : uniform(0.0f, 1.0f);
                break;
            case 11:
                controls.reflectionLP_Fc = uniform(500.0f, 20000.0f);
                break;
            default:
                break;
        }
    }

    /// Composes both ways and compares every sample as it counts.
    void composeBoth() {
        CompositionInputs in = inputs();
        composer.refreshFilter(in, interpolation);
        plain->composeFIR(plain->filterLeft, plain->filterRight, in);
        plain->fadeFilterTail(sizes.FIR_size);
        const ScaledEnd& end = composer.notes.scaledEnd;
        for (int i = 0; i < sizes.firBufferSize; ++i) {
            const float gain = i >= end.begin ? end.gain : 1.0f;
            compare(plain->filterLeft[i], composer.filterLeft[i] * gain);
            compare(plain->filterRight[i], composer.filterRight[i] * gain);
        }
        EXPECT_EQ(composer.earlyGain, plain->earlyGain);
        EXPECT_EQ(composer.reverbMixGain, plain->reverbMixGain);
        expectNoted(standingLeft, composer.filterLeft);
        expectNoted(standingRight, composer.filterRight);
    }
    /// All that differs from the response before, or counts differently, has to be in the notes.
    void expectNoted(std::vector<float>& standing, const float* now) {
        const FirNotes& notes = composer.notes;
        standing.resize(static_cast<std::size_t>(sizes.firBufferSize));
        std::vector<char> noted(standing.size());
        for (const FirStretch& stretch : notes.written) {
            std::fill(noted.begin() + stretch.begin, noted.begin() + stretch.end, char{1});
        }
        const int nearest = std::min(standingEnd, notes.scaledEnd.begin);
        const int farthest = std::max(standingEnd, notes.scaledEnd.begin);
        for (int i = 0; i < sizes.firBufferSize; ++i) {
            const auto at = static_cast<std::size_t>(i);
            const bool moved = i >= nearest && i < farthest;
            if (noted[at] == 0 && (standing[at] != now[i] || moved)) {
                FAIL() << "frame " << i << " is not in the notes";
            }
        }
        std::vector<char> sounding(standing.size());
        for (const FirStretch& stretch : notes.sounding) {
            std::fill(sounding.begin() + std::clamp(stretch.begin, 0, sizes.firBufferSize),
                      sounding.begin() + std::clamp(stretch.end, 0, sizes.firBufferSize), char{1});
        }
        for (int i = 0; i < sizes.firBufferSize; ++i) {
            if (sounding[static_cast<std::size_t>(i)] == 0 && now[i] != 0.0f) {
                FAIL() << "frame " << i << " sounds, and is not in the notes";
            }
        }
        standing.assign(now, now + sizes.firBufferSize);
        if (now == composer.filterRight) {
            standingEnd = notes.scaledEnd.begin;
        }
    }
    void compare(float expected, float got) {
        worst = std::max(worst, std::abs(static_cast<double>(expected) - static_cast<double>(got)));
        largest = std::max(largest, std::abs(static_cast<double>(expected)));
    }
    /// What a convolver does with the notes.
    FirStretch take() {
        const FirStretch written = composer.notes.written.hull();
        composer.notes.written.clear();
        return written;
    }

    std::mt19937 random{5};
    std::unique_ptr<FirComposer> plain;
    std::vector<float> standingLeft;
    std::vector<float> standingRight;
    int standingEnd = 0;
    double worst = 0.0;
    double largest = 0.0;
};

TEST_F(ComposerChanges, EqualTheCompositionFromNothingThroughEveryChange) {
    const struct {
        int tailFrames;
        bool lowPass;
    } rooms[] = {{0, false}, {7000, false}, {7000, true}, {8600, true}, {900, false}};
    const LogCapture quiet;
    for (const auto& room : rooms) {
        SCOPED_TRACE(room.tailFrames);
        reflections = {};
        controls = {};
        setUp(room.tailFrames, room.lowPass);
        for (int n = 0; n < 300; ++n) {
            SCOPED_TRACE(n);
            changeSomething();
            composeBoth();
            take();
            ASSERT_LT(worst, 2e-7);
        }
        EXPECT_GT(largest, 0.1);
    }
}

TEST_F(ComposerChanges, TheFadeAtTheEndIsAppliedOnceToEachReflectionThatReachesIt) {
    const LogCapture quiet;
    setUp(0, false);
    // Two that end within the last frames, over each other; only one of them changes.
    for (const int number : {0, 1}) {
        ReflectionRecord& record = reflections.records[static_cast<std::size_t>(number)];
        record.delaySamples =
            static_cast<std::int16_t>(sizes.FIR_size - switches.hrirLength - 2 - 5 * number);
        record.gain = 1.0f;
    }
    for (int n = 0; n < 4; ++n) {
        reflections.records[0].distanceGain = 0.5f + 0.1f * static_cast<float>(n);
        composeBoth();
        take();
        ASSERT_LT(worst, 2e-7) << n;
    }
    EXPECT_NE(composer.filterLeft[sizes.FIR_size - 5], 0.0f) << "else nothing is faded";
}

TEST_F(ComposerChanges, TheSyntheticTailIsMadeAgainEachTime) {
    const LogCapture quiet;
    setUp(0, false);
    switches.qvReverb = 1;
    for (int n = 0; n < 60; ++n) {
        changeSomething();
        composeBoth();
        take();
        ASSERT_LT(worst, 1e-7);
    }
}

TEST_F(ComposerChanges, TheSyntheticTailFollowsCellsThatAreMappedAnew) {
    const LogCapture quiet;
    setUp(0, false);
    switches.qvReverb = 1;
    composeBoth();
    *filterTableCell(0, 0) = storeLoose();  // the first tap's direction
    composeBoth();
    EXPECT_LT(worst, 1e-7);
}

TEST_F(ComposerChanges, ABlendKeepsTheTailsLevelBehindIt) {
    const LogCapture quiet;
    setUp(7000, false);
    interpolation.prepare(sizes.firBufferSize);
    switches.qvInterpolateFilters = true;
    forceUpdate = true;
    direction.filterUpdatePending = false;
    CompositionInputs in = inputs();
    composer.refreshFilter(in, interpolation);
    plain->composeFIR(plain->filterLeft, plain->filterRight, in);
    const ScaledEnd& end = composer.notes.scaledEnd;
    for (int i = 4000; i < 6500; ++i) {
        const float gain = i >= end.begin ? end.gain : 1.0f;
        ASSERT_FLOAT_EQ(composer.filterLeft[i] * gain, plain->filterLeft[i]) << i;
    }
}

TEST_F(ComposerChanges, SayWhichSamplesWereWritten) {
    const LogCapture quiet;
    setUp(7000, false);
    composeBoth();
    EXPECT_EQ(take().end, sizes.firBufferSize) << "the first time all of it";
    const int begin = composer.notes.scaledEnd.begin;
    EXPECT_GE(begin, 200 + 150 * 11 + 128);
    EXPECT_LT(begin, sizes.firBufferSize / 2);

    composeBoth();
    EXPECT_TRUE(take().empty()) << "nothing changed";

    law.directGain *= 0.5f;
    composeBoth();
    EXPECT_LE(take().end, switches.hrirLength) << "the direct sound's frames alone";

    reflections.records[5].distanceGain *= 0.5f;
    composeBoth();
    const FirStretch reflection = take();
    EXPECT_EQ(reflection.begin, reflections.records[5].delaySamples);
    EXPECT_EQ(reflection.end, reflections.records[5].delaySamples + switches.hrirLength);

    law.reverbDistanceGain *= 0.5f;
    composeBoth();
    EXPECT_LE(take().end, begin) << "the end's level is a note, not samples";
    EXPECT_EQ(composer.notes.scaledEnd.gain, 0.05f * 0.4f * 0.4f);

    controls.roomSizeFactor = 0.7f;
    composeBoth();
    EXPECT_EQ(take().end, sizes.firBufferSize);
    EXPECT_LT(worst, 1e-7);
}

TEST_F(ComposerChanges, SayWhatMaySoundOfAResponseWithoutATail) {
    const LogCapture quiet;
    setUp(0, false);
    composeBoth();
    int frames = 0;
    for (const FirStretch& stretch : composer.notes.sounding) {
        frames += stretch.end - stretch.begin;
    }
    EXPECT_GT(frames, 0);
    EXPECT_LE(frames, 13 * switches.hrirLength) << "the direct sound and twelve reflections";
    reflections = {};
    setUp(7000, false);
    composeBoth();
    EXPECT_EQ(composer.notes.soundingParts(0, sizes.firBufferSize), ~std::uint64_t{0});
}

TEST_F(ComposerChanges, ALaterReflectionMovesTheEndAndItStays) {
    const LogCapture quiet;
    setUp(7000, false);
    composeBoth();
    const int begin = composer.notes.scaledEnd.begin;
    reflections.records[3].delaySamples = 4000;
    composeBoth();
    EXPECT_GE(composer.notes.scaledEnd.begin, 4000 + 128);
    EXPECT_EQ(composer.notes.scaledEnd.begin % 512, 0);
    const int moved = composer.notes.scaledEnd.begin;
    EXPECT_GT(moved, begin);
    reflections.records[3].delaySamples = 300;
    composeBoth();
    EXPECT_EQ(composer.notes.scaledEnd.begin, moved);
    EXPECT_LT(worst, 1e-7);
}

TEST_F(ComposerChanges, NewSamplesBehindTheTablesAreSeen) {
    const LogCapture quiet;
    setUp(0, false);
    composeBoth();
    // The direct sound's and a filtered reflection's, in place: every address stays.
    for (float* const hrir : {**filterTableCell(40, 20), **filterTableCell(1, 10)}) {
        for (int i = 0; i < 2 * switches.hrirLength; ++i) {
            hrir[i] = uniform(-0.5f, 0.5f);
        }
    }
    ASSERT_GE(reflections.records[1].filterClass, 0);
    ++hrirTablesVersion;
    composeBoth();
    EXPECT_LT(worst, 1e-7);
}

}  // namespace
}  // namespace tessaly::test
