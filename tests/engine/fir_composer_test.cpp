// The composed response against plain loops, its bounds, and the decision when it is composed.
#include "engine/fir_composer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "base/log.h"
#include "engine/fir_composer_fixture.h"
#include "support/log_capture.h"

namespace tessaly::test {
namespace {

constexpr float nan = std::numeric_limits<float>::quiet_NaN();

/// Adds to a response what falls inside it.
void addAt(Ears& ears, int ear, int position, float value) {
    if (position >= 0 && position < ears.size) {
        ears.at(ear, position) += value;
    }
}

void expectEqual(Ears& a, Ears& b) {
    ASSERT_EQ(a.size, b.size);
    for (int i = 0; i < a.size; ++i) {
        ASSERT_EQ(a.at(0, i), b.at(0, i)) << "left at " << i;
        ASSERT_EQ(a.at(1, i), b.at(1, i)) << "right at " << i;
    }
}

bool silent(Ears& ears) {
    for (int i = 0; i < ears.size; ++i) {
        if (ears.at(0, i) != 0.0f || ears.at(1, i) != 0.0f) {
            return false;
        }
    }
    return true;
}

// ---- Direct sound ----

TEST_F(FirComposerTest, DirectSoundIsTheDirectionsHrirWithBothGains) {
    const float* hrir = store(40, 20);
    for (const int hrirLength : {70, 128, 139, 256}) {
        setRate(48000, hrirLength);
        Ears ears = compose();
        for (int i = 0; i < ears.size; ++i) {
            for (int ear : {0, 1}) {
                const float expected = i < hrirLength ? frameOf(hrir, ear, i) * 0.7f * 0.6f : 0.0f;
                EXPECT_EQ(ears.at(ear, i), expected) << i;
            }
        }
    }
}

TEST_F(FirComposerTest, StaticFilterTakesNoMixGain) {
    switches.qvTrackDirection = false;
    store(40, 20);
    staticFilter = storeLoose();
    Ears ears = compose();
    for (int i = 0; i < 128; ++i) {
        EXPECT_EQ(ears.at(0, i), frameOf(*staticFilter, 0, i) * 0.7f);
        EXPECT_EQ(ears.at(1, i), frameOf(*staticFilter, 1, i) * 0.7f);
    }
}

TEST_F(FirComposerTest, MissingFiltersAreSilent) {
    Ears empty = compose();
    EXPECT_TRUE(silent(empty)) << "an empty cell";
    direction.indexPhi = 90;
    direction.indexTheta = -1;
    Ears offGrid = compose();
    EXPECT_TRUE(silent(offGrid));
    switches.qvTrackDirection = false;
    Ears never = compose();
    EXPECT_TRUE(silent(never)) << "a static filter that was never loaded";
    float* nothing = nullptr;
    staticFilter = &nothing;
    Ears hollow = compose();
    EXPECT_TRUE(silent(hollow));
}

TEST_F(FirComposerTest, HrirLongerThanTheBufferKeepsWhatFits) {
    const float* hrir = store(40, 20);
    for (const int block : {2, 16, 32, 64}) {
        for (const int hrirLength : {70, 128, 139, 256}) {
            setRate(48000, hrirLength);
            setSizes(block, block);
            Ears ears = compose();
            for (int i = 0; i < std::min(2 * block, hrirLength); ++i) {
                EXPECT_EQ(ears.at(0, i), frameOf(hrir, 0, i) * 0.7f * 0.6f);
                EXPECT_EQ(ears.at(1, i), frameOf(hrir, 1, i) * 0.7f * 0.6f);
            }
        }
    }
}

// ---- Distance filters ----

TEST_F(FirComposerTest, InputFiltersFollowTheDistanceOnlyWhenForced) {
    store(40, 20);
    law.distance = 15.0f;
    compose();
    EXPECT_EQ(frontEnd.highCut_Fc, 20000.0f);
    forceUpdate = true;
    compose();
    EXPECT_EQ(frontEnd.highCut_Fc, 9000.0f);
    EXPECT_EQ(frontEnd.lowCut_Fc, 95.0f);
    EXPECT_EQ(frontEnd.highCutFilter.normalisedFrequency, Biquad::normalise(9000.0f, 44100));
}

// ---- Fixed pair ----

TEST_F(FirComposerTest, FixedPairIsAddedInDoublePrecision) {
    const float* direct = store(40, 20);
    switches.qvEarlyReflections = true;
    reflections.earlyPresetGain = 1.3f;
    reflections.earlyRefFilter_1st = storeLoose();
    reflections.earlyRefFilter_2nd = storeLoose();
    // Both over the direct sound and over each other, so that the order of rounding shows.
    reflections.earlyRefDelay_1st = 20;
    reflections.earlyRefDelay_2nd = 20;
    reflections.earlyRefLength_1st = 128;
    reflections.earlyRefLength_2nd = 100;
    Ears ears = compose();
    const float earlyGain = 0.5f * 0.9f * 1.3f;
    EXPECT_EQ(composer.earlyGain, earlyGain);
    for (int ear : {0, 1}) {
        for (int i = 0; i < ears.size; ++i) {
            float expected = i < 128 ? frameOf(direct, ear, i) * 0.7f * 0.6f : 0.0f;
            const int k = i - 20;
            const double g = static_cast<double>(earlyGain);
            if (k >= 0 && k < 128) {
                const double x =
                    static_cast<double>(frameOf(*reflections.earlyRefFilter_1st, ear, k));
                expected = static_cast<float>(static_cast<double>(expected) + x * 0.1 * g);
            }
            if (k >= 0 && k < 100) {
                const double x =
                    static_cast<double>(frameOf(*reflections.earlyRefFilter_2nd, ear, k));
                expected = static_cast<float>(static_cast<double>(expected) + x * 0.11 * g);
            }
            EXPECT_EQ(ears.at(ear, i), expected) << ear << " " << i;
        }
    }
}

TEST_F(FirComposerTest, FixedPairIsDroppedWhereItLeavesTheBuffer) {
    switches.qvEarlyReflections = true;
    reflections.earlyRefFilter_1st = storeLoose();
    reflections.earlyRefFilter_2nd = storeLoose();
    reflections.earlyRefDelay_1st = -96;
    reflections.earlyRefDelay_2nd = 40;
    reflections.earlyRefLength_1st = 128;
    reflections.earlyRefLength_2nd = 32767;
    setSizes(32, 32);
    Ears ears = compose();
    EXPECT_NE(ears.at(0, 31), 0.0f);
    EXPECT_EQ(ears.at(0, 32), 0.0f) << "the first ends here";
    EXPECT_NE(ears.at(1, 63), 0.0f);

    reflections.earlyRefLength_2nd = 128;
    for (const std::int16_t delay : std::array<std::int16_t, 3>{-32768, -128, 32767}) {
        reflections.earlyRefDelay_1st = delay;
        reflections.earlyRefDelay_2nd = delay;
        Ears nothing = compose();
        EXPECT_TRUE(silent(nothing)) << delay;
    }
    reflections.earlyRefDelay_1st = 0;
    reflections.earlyRefLength_1st = -26000;
    Ears negative = compose();
    EXPECT_TRUE(silent(negative)) << "a wrapped length copies nothing";
    reflections.earlyRefLength_1st = 128;
    reflections.earlyRefFilter_1st = nullptr;
    Ears missing = compose();
    EXPECT_TRUE(silent(missing));
}

TEST_F(FirComposerTest, NoMoreIsReadThanTheTablesPromise) {
    setSizes(1024, 256);
    switches.hrirLength = 1000;
    store(40, 20);
    switches.qvEarlyReflections = true;
    reflections.earlyRefFilter_1st = storeLoose();
    reflections.earlyRefFilter_2nd = storeLoose();
    reflections.earlyRefDelay_1st = 300;
    reflections.earlyRefDelay_2nd = 600;
    reflections.earlyRefLength_1st = 1000;
    reflections.earlyRefLength_2nd = 32767;
    Ears ears = compose();
    EXPECT_NE(ears.at(0, 255), 0.0f);
    EXPECT_EQ(ears.at(0, 256), 0.0f);
    EXPECT_NE(ears.at(1, 300 + 255), 0.0f);
    EXPECT_EQ(ears.at(1, 300 + 256), 0.0f);
    EXPECT_NE(ears.at(0, 600 + 255), 0.0f);
    EXPECT_EQ(ears.at(0, 600 + 256), 0.0f);
}

// ---- Preset reflections ----

/// One record as it is defined, over a response.
void plainRecord(Ears& ears,
                 const ReflectionRecord& record,
                 int hrirLength,
                 float earlyGain,
                 float cutOff,
                 int sampleRate) {
    const float* hrir = hrirAt(record.indexPhi, record.indexTheta);
    const float g = record.gain * record.distanceGain * earlyGain;
    const Biquad design(Biquad::lowPass, 0.0,
                        static_cast<double>(cutOff / static_cast<float>(sampleRate)));
    for (int ear : {0, 1}) {
        double z1 = 0.0;
        double z2 = 0.0;
        for (int i = 0; i < hrirLength; ++i) {
            float value = frameOf(hrir, ear, i) * g;
            if (record.filterClass >= 0) {
                const double x = static_cast<double>(value);
                const double y = x * design.b0 + z1;
                z1 = x * design.b1 + z2 - design.a1 * y;
                z2 = x * design.b2 - design.a2 * y;
                value = static_cast<float>(y);
                if (i > hrirLength - 16) {
                    value *= 1.0f - static_cast<float>(i - hrirLength + 16) * 0.06666667f;
                }
            }
            addAt(ears, ear, record.delaySamples + i, value);
        }
    }
}

TEST_F(FirComposerTest, RecordsAreAddedInOrderWithTheirFilters) {
    store(40, 20);
    struct Rate {
        int sampleRate;
        int hrirLength;
    };
    for (const Rate& rate :
         {Rate{24000, 70}, Rate{44100, 128}, Rate{48000, 139}, Rate{48000, 256}}) {
        setRate(rate.sampleRate, rate.hrirLength);
        reflections.flexReflectionCount = 0;
        switches.qvFlexReflections = false;
        Ears expected = compose();
        controls.reflectionLP_Fc = 4000.0f;
        controls.reflectionLP2_Fc = 20000.0f;
        const std::array<int, 9> classes = {0, -1, 1, 0, -1, 0, 1, 1, 0};
        for (std::size_t k = 0; k < classes.size(); ++k) {
            addRecord(60 + 37 * static_cast<int>(k), classes[k]);
        }
        reflections.reflectionFilter[0].z1 = 4.0;
        reflections.earlyPresetGain = 2.0f;
        Ears ears = compose();
        const float earlyGain = 0.5f * 0.9f * 2.0f;
        for (std::size_t k = 0; k < classes.size(); ++k) {
            plainRecord(expected, reflections.records[k], rate.hrirLength, earlyGain,
                        classes[k] == 0 ? 4000.0f : 20000.0f, rate.sampleRate);
        }
        expectEqual(ears, expected);
        for (const Biquad& filter : reflections.reflectionFilter) {
            EXPECT_EQ(filter.z1, 0.0) << "at rest afterwards";
            EXPECT_EQ(filter.z2, 0.0);
        }
    }
}

TEST_F(FirComposerTest, FilteredReflectionFadesToNothingAtItsLastFrame) {
    addRecord(100, 0);
    Ears ears = compose();
    EXPECT_NE(ears.at(0, 100 + 126), 0.0f);
    EXPECT_EQ(ears.at(0, 100 + 127), 0.0f);
    EXPECT_EQ(ears.at(1, 100 + 127), 0.0f);
}

TEST_F(FirComposerTest, NoRecordsLeaveTheDirectSoundAlone) {
    store(40, 20);
    Ears expected = compose();
    switches.qvFlexReflections = true;
    Ears ears = compose();
    expectEqual(ears, expected);
}

TEST_F(FirComposerTest, MissingWallsAreSkippedInTheFirstSixRecordsOnly) {
    for (int k = 0; k < 7; ++k) {
        addRecord(100 * k, -1).wallDistance = -1.0f;
    }
    Ears ears = compose();
    for (int i = 0; i < 600; ++i) {
        EXPECT_EQ(ears.at(0, i), 0.0f);
    }
    EXPECT_NE(ears.at(0, 600), 0.0f) << "the seventh is no wall";
    reflections.records[2].wallDistance = 0.0f;
    reflections.records[3].wallDistance = nan;
    Ears withWalls = compose();
    EXPECT_NE(withWalls.at(0, 200), 0.0f);
    EXPECT_NE(withWalls.at(0, 300), 0.0f);
}

TEST_F(FirComposerTest, RecordThatReachesTheEndIsRejected) {
    for (const int filterClass : {-1, 0, 1}) {
        reflections.flexReflectionCount = 0;
        addRecord(1024 - 128, filterClass);
        Ears rejected = compose();
        EXPECT_TRUE(silent(rejected)) << "the test is strictly less, class " << filterClass;
        reflections.records[0].delaySamples = 1024 - 128 - 1;
        Ears kept = compose();
        EXPECT_FALSE(silent(kept)) << filterClass;
    }
}

TEST_F(FirComposerTest, OnlyFilteredRecordsTraceTheirRejection) {
    addRecord(1024 - 128, -1);
    addRecord(1000, 1);
    addRecord(-200, 0);
    const LogCapture log;
    compose();
    const std::string first =
        "ERROR: FIR-size 1024 too small for 1256 this reflection no 1!!!! (not processed) or delay "
        "< 0";
    const std::string second =
        "ERROR: FIR-size 1024 too small for 56 this reflection no 2!!!! (not processed) or delay "
        "< 0";
    const std::vector<std::string> traced = {first, second};
    EXPECT_EQ(log.outputLines(), traceEnabled ? traced : std::vector<std::string>{});
}

TEST_F(FirComposerTest, WrappedDelaysDropWhatLiesBeforeTheResponse) {
    for (const int filterClass : {-1, 0}) {
        for (const int delay : {-1, -60, -126, -128, -129, -20000, -32768}) {
            reflections.flexReflectionCount = 0;
            ReflectionRecord& record = addRecord(delay, filterClass);
            controls.reflectionLP_Fc = 3000.0f;
            Ears ears = compose();
            Ears expected(sizes.firBufferSize);
            plainRecord(expected, record, 128, composer.earlyGain, 3000.0f, 44100);
            expectEqual(ears, expected);
            EXPECT_EQ(silent(ears), delay <= -128) << delay;
        }
    }
}

TEST_F(FirComposerTest, RecordsOfEmptyCellsAndOffTheGridAddNothing) {
    addRecord(10, 0).indexPhi = 70;
    addRecord(10, -1).indexTheta = 37;
    addRecord(10, 1).indexPhi = -1;
    Ears ears = compose();
    EXPECT_TRUE(silent(ears));
}

TEST_F(FirComposerTest, CountBeyondTheCapacityReadsNoFurther) {
    for (int k = 0; k < Reflections::capacity; ++k) {
        addRecord(10 * k, -1);
    }
    Ears expected = compose();
    reflections.flexReflectionCount = 100;
    Ears ears = compose();
    expectEqual(ears, expected);
    reflections.flexReflectionCount = -3;
    Ears none = compose();
    EXPECT_TRUE(silent(none));
}

TEST_F(FirComposerTest, ReflectionFiltersAreRedesignedOnlyForANewCutOff) {
    addRecord(10, 0);
    controls.reflectionLP_Fc = 5000.0f;
    compose();
    Biquad& filter = reflections.reflectionFilter[0];
    EXPECT_EQ(filter.normalisedFrequency, Biquad::normalise(5000.0f, 44100));
    filter.b0 = 0.0;
    compose();
    EXPECT_EQ(filter.b0, 0.0) << "kept while the cut-off stands";
    controls.reflectionLP_Fc = 5001.0f;
    compose();
    EXPECT_NE(filter.b0, 0.0);
    EXPECT_EQ(reflections.reflectionFilter[1].normalisedFrequency, 0.0) << "no record of class 1";

    setRate(24000, 70);
    controls.reflectionLP_Fc = 20000.0f;
    Ears first = compose();
    EXPECT_EQ(filter.normalisedFrequency, 0.458);
    Ears second = compose();
    expectEqual(first, second);
}

// ---- Tails ----

class TailTest : public FirComposerTest {
protected:
    TailTest() {
        switches.qvReverb = 20;
        tail.reverbPresetGain = 0.5f;
        tail.reverbLength = 4000;
        tail.reverbIR = AlignedArray<float>(8000);
        std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
        for (float& sample : tail.reverbIR) {
            sample = noise(random_);
        }
        setSizes(4096, 256);
    }
};

TEST_F(TailTest, MeasuredTailTakesThreeGains) {
    Ears ears = compose();
    const float g = 0.5f * 0.4f * 0.8f;
    EXPECT_EQ(composer.reverbMixGain, 0.4f);
    for (int i = 0; i < ears.size; ++i) {
        const auto k = 2 * static_cast<std::size_t>(i);
        EXPECT_EQ(ears.at(0, i), i < 4000 ? tail.reverbIR[k] * g : 0.0f);
        EXPECT_EQ(ears.at(1, i), i < 4000 ? tail.reverbIR[k + 1] * g : 0.0f);
    }
}

TEST_F(TailTest, ShortResponseTakesNoTailButTheGain) {
    setSizes(4095, 256);
    for (const std::int16_t preset : std::array<std::int16_t, 2>{1, 20}) {
        switches.qvReverb = preset;
        composer.reverbMixGain = 9.0f;
        Ears ears = compose();
        EXPECT_TRUE(silent(ears));
        EXPECT_EQ(composer.reverbMixGain, 0.4f);
    }
    switches.qvReverb = 0;
    setSizes(4096, 256);
    composer.reverbMixGain = 9.0f;
    Ears none = compose();
    EXPECT_TRUE(silent(none));
    EXPECT_EQ(composer.reverbMixGain, 9.0f) << "without a reverb not even that";
}

TEST_F(TailTest, SmallRoomCutsDirectSoundAndReflectionsToo) {
    tail.reverbLength = 600;
    controls.roomSizeFactor = 0.0f;
    Ears uncutTail = compose();
    store(40, 20);
    addRecord(400, -1);
    Ears ears = compose();
    for (int i = 300; i < 600; ++i) {
        EXPECT_EQ(ears.at(0, i), 0.0f) << "the reflection at 400 lies behind the room's end";
    }
    // start = 6, stop = 300: the direct sound is faded from frame 6 on.
    controls.roomSizeFactor = 1.0f;
    Ears whole = compose();
    for (int i = 6; i < 128; ++i) {
        const float weight = 1.0f - static_cast<float>(i - 5) / 294.0f;
        EXPECT_EQ(ears.at(0, i), whole.at(0, i) * weight);
    }
    EXPECT_EQ(ears.at(0, 5), whole.at(0, 5));
    EXPECT_NE(uncutTail.at(0, 100), 0.0f);
}

TEST_F(TailTest, LowPassIsUsedOnlyByRoomsThatHaveOne) {
    controls.reverbLP_Fc = 2000.0f;
    Ears plain = compose();
    tail.hasReverbLowPass = true;
    Ears filtered = compose();
    EXPECT_EQ(tail.reverbLowPass.normalisedFrequency, Biquad::normalise(2000.0f, 44100));
    double plainPower = 0.0;
    double filteredPower = 0.0;
    for (int i = 0; i < 4000; ++i) {
        plainPower += std::pow(static_cast<double>(plain.at(0, i)), 2.0);
        filteredPower += std::pow(static_cast<double>(filtered.at(0, i)), 2.0);
    }
    EXPECT_LT(filteredPower, 0.25 * plainPower) << "noise up to 2 of 22 kHz remains";
}

TEST_F(TailTest, SyntheticTailEndsWithTheBuffer) {
    switches.qvReverb = 1;
    for (int p = 0; p < gridPhiCount; ++p) {
        for (int t = 0; t < gridThetaCount; ++t) {
            store(p, t);
        }
    }
    Ears ears = compose();
    EXPECT_NE(ears.at(0, 2048), 0.0f);
    EXPECT_NE(ears.at(1, ears.size - 100), 0.0f) << "frames behind FIR_size belong to the buffer";
    EXPECT_NE(tail.reverbPresetGain, 0.5f) << "the last tap's gain stays";
}

// ---- End fade ----

TEST(FadeFilterTail, DividesTheLastFifteenSamples) {
    FirComposer composer;
    composer.prepare(320);
    std::fill(composer.filterLeftBuffer.begin(), composer.filterLeftBuffer.end(), 0.75f);
    std::fill(composer.filterRightBuffer.begin(), composer.filterRightBuffer.end(), 0.3f);
    composer.fadeFilterTail(256);
    for (int i = 0; i < 320; ++i) {
        const int j = i - (256 - 15);
        const bool faded = j >= 0 && j < 15;
        const float weight = faded ? 1.0f / (4.0f * static_cast<float>(j + 1)) : 1.0f;
        EXPECT_EQ(composer.filterLeft[i], 0.75f * weight) << i;
        EXPECT_EQ(composer.filterRight[i], 0.3f * weight) << i;
    }
}

TEST(FadeFilterTail, ShortResponsesKeepWhatLiesInsideThem) {
    for (const int size : {2, 4, 8, 14}) {
        FirComposer composer;
        composer.prepare(2 * size);
        std::fill(composer.filterLeftBuffer.begin(), composer.filterLeftBuffer.end(), 1.0f);
        std::fill(composer.filterRightBuffer.begin(), composer.filterRightBuffer.end(), 1.0f);
        composer.fadeFilterTail(size);
        for (int i = 0; i < size; ++i) {
            const int j = i - (size - 15);
            EXPECT_EQ(composer.filterLeft[i], 1.0f / (4.0f * static_cast<float>(j + 1)));
        }
        EXPECT_EQ(composer.filterRight[size], 1.0f);
        composer.fadeFilterTail(2 * size + 5);
        composer.fadeFilterTail(1000000);
        composer.fadeFilterTail(0);
    }
}

// ---- What runs when ----

class RefreshTest : public FirComposerTest {
protected:
    RefreshTest() {
        setSizes(512, 256);
        composer.prepare(sizes.firBufferSize);
        interpolation.prepare(sizes.firBufferSize);
        hrir_ = store(40, 20);
        filterChange = false;
        direction.filterUpdatePending = false;
    }

    /// Runs one refresh. @return whether the direct composition reached `filterLeft`
    bool refresh() {
        std::fill(composer.filterLeftBuffer.begin(), composer.filterLeftBuffer.end(), 9.0f);
        std::fill(composer.filterRightBuffer.begin(), composer.filterRightBuffer.end(), 9.0f);
        composer.forget();
        CompositionInputs in = inputs();
        composer.refreshFilter(in, interpolation);
        return composer.filterLeft[sizes.firBufferSize - 1] == 0.0f;
    }

    /// Whether a pair of the interpolation holds this composition.
    bool composed(int pair) const {
        const float expected = frameOf(hrir_, 0, 0) * law.directGain * mix.directGain;
        return interpolation.interpFilterLeft[static_cast<std::size_t>(pair)][0] == expected;
    }

    void clearPairs() {
        for (std::size_t k = 0; k < 2; ++k) {
            interpolation.interpFilterLeft[k].clear();
            interpolation.interpFilterRight[k].clear();
        }
    }

private:
    const float* hrir_ = nullptr;
};

TEST_F(RefreshTest, ComposesWhenForcedOrWhenChangeAndUpdateMeet) {
    for (const bool change : {false, true}) {
        for (const bool pending : {false, true}) {
            for (const bool forced : {false, true}) {
                filterChange = change;
                direction.filterUpdatePending = pending;
                forceUpdate = forced;
                EXPECT_EQ(refresh(), forced || (change && pending)) << change << pending << forced;
            }
        }
    }
}

TEST_F(RefreshTest, DirectCompositionFadesTheEnd) {
    switches.qvFlexReflections = true;
    addRecord(512 - 129, -1);
    forceUpdate = true;
    Ears expected = compose();
    refresh();
    EXPECT_EQ(composer.filterLeft[511], expected.at(0, 511)) << "0: rejected past FIR_size";
    for (int i = 512 - 15; i < 511; ++i) {
        const float weight = 1.0f / (4.0f * static_cast<float>(i - (512 - 15) + 1));
        ASSERT_NE(expected.at(0, i), 0.0f);
        EXPECT_EQ(composer.filterLeft[i], expected.at(0, i) * weight);
        EXPECT_EQ(composer.filterRight[i], expected.at(1, i) * weight);
    }
}

TEST_F(RefreshTest, InterpolationComposesIntoThePairAndTurns) {
    switches.qvInterpolateFilters = true;
    filterChange = true;
    direction.filterUpdatePending = true;
    direction.interpAngleOffset = 5.0f;
    blockCounter = 7;
    EXPECT_FALSE(refresh()) << "only the first stretch of the response is written";
    EXPECT_EQ(interpolation.interpFilterOld, 0);
    EXPECT_EQ(interpolation.interpFilterNew, 1);
    EXPECT_TRUE(composed(1));
    EXPECT_FALSE(composed(0)) << "no wide step: the old pair stands";
    EXPECT_EQ(composer.filterLeft[110], interpolation.interpFilterLeft[1][110]);
    EXPECT_EQ(composer.filterRight[110], interpolation.interpFilterRight[1][110]);

    clearPairs();
    refresh();
    EXPECT_EQ(interpolation.interpFilterOld, 1);
    EXPECT_EQ(interpolation.interpFilterNew, 0);
    EXPECT_TRUE(composed(0));
}

TEST_F(RefreshTest, FirstBlockAndWideStepsComposeTheOldPairToo) {
    switches.qvInterpolateFilters = true;
    filterChange = true;
    direction.filterUpdatePending = true;
    struct Case {
        unsigned int blockCounter;
        float phiStep;
        float thetaStep;
        bool both;
    };
    for (const Case& c :
         {Case{0, 0.0f, 0.0f, true}, Case{3, 5.0f, 5.0f, false}, Case{3, 6.0f, 0.0f, true},
          Case{3, -6.0f, 0.0f, true}, Case{3, 0.0f, 5.5f, true}, Case{3, 0.0f, -5.5f, true}}) {
        interpolation.prepare(sizes.firBufferSize);
        interpolation.interpFilterNew = 1;
        blockCounter = c.blockCounter;
        direction.phiStepMoved = c.phiStep;
        direction.thetaStepMoved = c.thetaStep;
        refresh();
        // The old pair was 0; after the turn the old one is 1 and the new one 0.
        EXPECT_TRUE(composed(0));
        EXPECT_EQ(interpolation.interpFilterOld, 1);
        EXPECT_FALSE(composed(1)) << "the pair that was new is left as it stood";
        interpolation.prepare(sizes.firBufferSize);
        interpolation.interpFilterNew = 1;
        direction.holdInterpPair = true;
        refresh();
        EXPECT_EQ(composed(0), c.both) << c.phiStep << " " << c.thetaStep;
        EXPECT_TRUE(composed(1));
        direction.holdInterpPair = false;
    }
}

TEST_F(RefreshTest, HeldPairDoesNotTurn) {
    switches.qvInterpolateFilters = true;
    filterChange = true;
    direction.filterUpdatePending = true;
    direction.holdInterpPair = true;
    interpolation.interpFilterNew = 1;
    refresh();
    EXPECT_EQ(interpolation.interpFilterNew, 1);
    EXPECT_EQ(interpolation.interpFilterOld, 0);
    EXPECT_TRUE(composed(1));
}

TEST_F(RefreshTest, ChangeWithoutUpdateOnlyBlends) {
    switches.qvInterpolateFilters = true;
    filterChange = true;
    direction.interpAngleOffset = 2.0f;
    interpolation.interpFilterNew = 1;
    interpolation.interpFilterLeft[0][0] = 1.0f;
    interpolation.interpFilterLeft[1][0] = 2.0f;
    refresh();
    EXPECT_EQ(composer.filterLeft[0], 2.0f * (2.0f * 0.2f) + 1.0f * (1.0f - 2.0f * 0.2f));
    EXPECT_EQ(interpolation.interpFilterNew, 1);

    filterChange = false;
    refresh();
    EXPECT_EQ(composer.filterLeft[0], 9.0f) << "nothing without a change";
}

TEST_F(RefreshTest, ForcedWithoutUpdateComposesDirectlyThenBlends) {
    switches.qvInterpolateFilters = true;
    forceUpdate = true;
    EXPECT_TRUE(refresh());
    EXPECT_NE(composer.filterLeft[0], 0.0f);
    filterChange = true;
    EXPECT_TRUE(refresh());
    EXPECT_EQ(composer.filterLeft[0], 0.0f) << "the empty pairs are blended over the start";
}

TEST_F(RefreshTest, WithoutBuffersNothingHappens) {
    FirComposer bare;
    forceUpdate = true;
    CompositionInputs in = inputs();
    bare.refreshFilter(in, interpolation);
    EXPECT_EQ(bare.filterLeft, nullptr);
}

TEST_F(RefreshTest, BuffersHaveTheirExactLength) {
    EXPECT_EQ(composer.filterLeftBuffer.size(), 768u);
    EXPECT_EQ(composer.filterRightBuffer.size(), 768u);
    EXPECT_EQ(composer.filterLeft, composer.filterLeftBuffer.data());
}

}  // namespace
}  // namespace tessaly::test
