// Loading a tail, the measured and the synthetic one in a response, the cut to the room's size.
#include "engine/reverb_tail.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "engine/hrir_table_fixture.h"
#include "engine/reverb_presets.h"
#include "support/log_capture.h"
#include "support/room_tables.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr std::array<int, 3> sampleRates = {24000, 44100, 48000};
constexpr float nan = std::numeric_limits<float>::quiet_NaN();
constexpr float infinity = std::numeric_limits<float>::infinity();

ReverbTail tailOf(int frames, unsigned seed = 21) {
    ReverbTail tail;
    tail.reverbLength = frames;
    tail.reverbIR = AlignedArray<float>(2 * static_cast<std::size_t>(frames));
    std::mt19937 random(seed);
    std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
    for (float& sample : tail.reverbIR) {
        sample = noise(random);
    }
    return tail;
}

float tailFrame(const ReverbTail& tail, int ear, int i) {
    return tail.reverbIR[2 * static_cast<std::size_t>(i) + static_cast<std::size_t>(ear)];
}

TEST(ReverbTailAdd, UnfilteredAddsEvenValuesLeftAndOddValuesRight) {
    for (const bool hasFilter : {false, true}) {
        ReverbTail tail = tailOf(500);
        tail.hasReverbLowPass = hasFilter;
        Ears ears(600, 0.25f);
        // 20000 Hz exactly takes this path, which has no fade at the end.
        tail.addTail(ears.left.get(), ears.right.get(), 600, hasFilter ? 20000.0f : 100.0f, 48000,
                     0.3f);
        for (int ear : {0, 1}) {
            for (int i = 0; i < 600; ++i) {
                const float expected = i < 500 ? 0.25f + tailFrame(tail, ear, i) * 0.3f : 0.25f;
                EXPECT_EQ(ears.at(ear, i), expected) << ear << " " << i;
            }
        }
    }
}

/// The low-passed tail of one ear by the recursion and the fade as they are defined.
std::vector<float> filteredTail(
    const ReverbTail& tail, int ear, float cutOff, int sampleRate, float gain) {
    const Biquad design(Biquad::lowPass, 0.0,
                        static_cast<double>(cutOff / static_cast<float>(sampleRate)));
    std::vector<float> out;
    double z1 = 0.0;
    double z2 = 0.0;
    for (int i = 0; i < tail.reverbLength; ++i) {
        const double x = static_cast<double>(tailFrame(tail, ear, i) * gain);
        const double y = x * design.b0 + z1;
        z1 = x * design.b1 + z2 - design.a1 * y;
        z2 = x * design.b2 - design.a2 * y;
        float sample = static_cast<float>(y);
        if (i >= tail.reverbLength - 60) {
            sample *= 1.0f - static_cast<float>(i - tail.reverbLength + 61) * 0.016666668f;
        }
        out.push_back(sample);
    }
    return out;
}

TEST(ReverbTailAdd, LowPassRunsOverEachEarFromRestAndFadesTheLastSixty) {
    for (const int sampleRate : sampleRates) {
        for (const float cutOff : {500.0f, 5000.0f, 19999.0f}) {
            for (const int frames : {61, 400, 60, 59, 1}) {
                ReverbTail tail = tailOf(frames);
                tail.hasReverbLowPass = true;
                tail.reverbLowPass.z1 = 5.0;
                Ears ears(400, 0.125f);
                tail.addTail(ears.left.get(), ears.right.get(), 400, cutOff, sampleRate, 0.7f);
                for (int ear : {0, 1}) {
                    const auto expected = filteredTail(tail, ear, cutOff, sampleRate, 0.7f);
                    for (int i = 0; i < 400; ++i) {
                        const float added = i < frames ? expected[static_cast<std::size_t>(i)] : 0;
                        ASSERT_EQ(ears.at(ear, i), 0.125f + added)
                            << frames << " frames at " << i << ", ear " << ear;
                    }
                    EXPECT_EQ(ears.at(ear, frames - 1), 0.125f) << "faded out at its last frame";
                }
                EXPECT_EQ(tail.reverbLowPass.z1, 0.0) << "at rest afterwards";
                EXPECT_EQ(tail.reverbLowPass.z2, 0.0);
            }
        }
    }
}

TEST(ReverbTailAdd, LowPassIsRedesignedOnlyForANewCutOff) {
    ReverbTail tail = tailOf(100);
    tail.hasReverbLowPass = true;
    Ears ears(100);
    tail.addTail(ears.left.get(), ears.right.get(), 100, 4000.0f, 48000, 1.0f);
    EXPECT_EQ(tail.reverbLowPass.normalisedFrequency, Biquad::normalise(4000.0f, 48000));
    tail.reverbLowPass.b0 = 0.0;
    tail.addTail(ears.left.get(), ears.right.get(), 100, 4000.0f, 48000, 1.0f);
    EXPECT_EQ(tail.reverbLowPass.b0, 0.0);
    tail.addTail(ears.left.get(), ears.right.get(), 100, 4001.0f, 48000, 1.0f);
    EXPECT_NE(tail.reverbLowPass.b0, 0.0);
}

TEST(ReverbTailAdd, TailLongerThanTheBufferIsDropped) {
    for (const float cutOff : {20000.0f, 3000.0f}) {
        ReverbTail tail = tailOf(500);
        tail.hasReverbLowPass = true;
        Ears whole(500);
        Ears part(470);
        tail.addTail(whole.left.get(), whole.right.get(), 500, cutOff, 44100, 1.0f);
        tail.addTail(part.left.get(), part.right.get(), 470, cutOff, 44100, 1.0f);
        for (int i = 0; i < 470; ++i) {
            EXPECT_EQ(part.at(0, i), whole.at(0, i)) << "the fade belongs to the tail's end";
            EXPECT_EQ(part.at(1, i), whole.at(1, i));
        }
    }
}

TEST(ReverbTailAdd, LengthBeyondTheStoredSamplesReadsNoFurther) {
    for (const float cutOff : {20000.0f, 3000.0f}) {
        ReverbTail tail = tailOf(64);
        tail.hasReverbLowPass = true;
        tail.reverbLength = 400;
        Ears ears(400);
        tail.addTail(ears.left.get(), ears.right.get(), 400, cutOff, 44100, 1.0f);
        EXPECT_EQ(ears.at(0, 64), 0.0f);
        tail.reverbIR = {};
        tail.addTail(ears.left.get(), ears.right.get(), 400, cutOff, 44100, 1.0f);
        tail.reverbLength = -5;
        tail.addTail(ears.left.get(), ears.right.get(), 400, cutOff, 44100, 1.0f);
        EXPECT_EQ(ears.at(1, 399), 0.0f);
    }
}

TEST(ReverbTailAdd, OddCutOffsAreDefined) {
    for (const float cutOff : {nan, infinity, -infinity, -5.0f, 0.0f}) {
        ReverbTail tail = tailOf(200);
        tail.hasReverbLowPass = true;
        Ears ears(200);
        tail.addTail(ears.left.get(), ears.right.get(), 200, cutOff, 48000, 1.0f);
        EXPECT_TRUE(std::isfinite(ears.at(0, 100))) << cutOff;
    }
}

using SyntheticTail = HrirTableTest;

TEST_F(SyntheticTail, SetsTwentySixTapsOfFallingGain) {
    for (int p = 0; p < gridPhiCount; ++p) {
        for (int t = 0; t < gridThetaCount; ++t) {
            store(p, t);
        }
    }
    for (const int limitTheta : {90, 45, 0}) {
        for (const int hrirLength : {70, 128, 139, 256}) {
            const int size = 2048 + 25 * 209 + hrirLength;
            Ears ears(size, 0.5f);
            ReverbTail tail;
            tail.addSyntheticTail(ears.left.get(), ears.right.get(), size, hrirLength, limitTheta,
                                  0.8f);
            Ears expected(size, 0.5f);
            for (int k = 0; k < 26; ++k) {
                const float gain = (1.0f - static_cast<float>(k) * 0.03846154f) * 0.05f * 0.8f;
                const int angle = std::clamp(35 * k % 180, 90 - limitTheta, 90 + limitTheta);
                const float* hrir = hrirAt(55 * k % 360 / 5, angle / 5);
                for (int i = 0; i < hrirLength; ++i) {
                    for (int ear : {0, 1}) {
                        expected.at(ear, 2048 + 209 * k + i) += frameOf(hrir, ear, i) * gain;
                    }
                }
            }
            for (int i = 0; i < size; ++i) {
                ASSERT_EQ(ears.at(0, i), expected.at(0, i)) << i;
                ASSERT_EQ(ears.at(1, i), expected.at(1, i)) << i;
            }
            EXPECT_NEAR(static_cast<double>(tail.reverbPresetGain), 0.05 * 0.8 / 26.0, 1e-7)
                << "the last tap's gain stays in the field";
        }
    }
}

TEST_F(SyntheticTail, EndsWithAShortResponse) {
    for (int p = 0; p < gridPhiCount; ++p) {
        store(p, 18);
    }
    ReverbTail tail;
    for (const int size : {1, 64, 2048, 2049, 2100, 4096 + 32, 7273 + 5}) {
        Ears ears(size, 0.5f);
        tail.addSyntheticTail(ears.left.get(), ears.right.get(), size, 256, 0, 1.0f);
        EXPECT_EQ(ears.at(0, size - 1) == 0.5f, size <= 2048) << size;
    }
}

TEST_F(SyntheticTail, EmptyCellsAddNothing) {
    Ears ears(8192, 0.5f);
    ReverbTail tail;
    tail.addSyntheticTail(ears.left.get(), ears.right.get(), 8192, 128, 90, 1.0f);
    EXPECT_TRUE(std::all_of(ears.left.get(), ears.left.get() + 8192,
                            [](float sample) { return sample == 0.5f; }));
}

/// Both ears set to 1, cut, and returned as the weight of each frame.
std::vector<double> weights(int length, int size, float factor) {
    ReverbTail tail;
    tail.reverbLength = length;
    Ears ears(size, 1.0f);
    tail.cutToRoomSize(ears.left.get(), ears.right.get(), size, factor);
    std::vector<double> out;
    for (int i = 0; i < size; ++i) {
        EXPECT_EQ(ears.at(0, i), ears.at(1, i));
        out.push_back(static_cast<double>(ears.at(0, i)));
    }
    return out;
}

TEST(ReverbTailCut, WholeRoomAndMoreLeaveTheTailAlone) {
    for (const float factor : {1.0f, 1.5f, infinity, nan}) {
        for (const double weight : weights(1000, 1200, factor)) {
            EXPECT_EQ(weight, 1.0);
        }
    }
}

TEST(ReverbTailCut, FadesFromStartToStopAndSilencesTheRest) {
    for (const int length : {10, 1000, 21266, 50001}) {
        for (const float factor : {0.0f, 0.1f, 0.37f, 0.5f, 0.9f, 0.999f}) {
            const double f = static_cast<double>(factor);
            const int start = static_cast<int>(length * 0.99 * f + length * 0.01);
            const int stop = static_cast<int>((f + 1.0) * (length * 0.5));
            const int size = length + 20;
            const std::vector<double> cut = weights(length, size, factor);
            for (int i = 0; i < size; ++i) {
                double expected = 1.0;
                if (i >= stop && i < length) {
                    expected = 0.0;
                } else if (i >= start && i < stop) {
                    expected = 1.0 - static_cast<double>(i - start + 1) / (stop - start);
                }
                ASSERT_NEAR(cut[static_cast<std::size_t>(i)], expected, 1.2e-7)
                    << length << " * " << factor << " at " << i;
            }
        }
    }
}

TEST(ReverbTailCut, SmallestRoomKeepsTheFirstHalfFading) {
    const std::vector<double> cut = weights(1000, 1000, 0.0f);
    EXPECT_EQ(cut[9], 1.0);
    EXPECT_LT(cut[10], 1.0);
    EXPECT_NEAR(cut[254], 0.5, 1e-6);
    EXPECT_EQ(cut[499], 0.0);
    EXPECT_EQ(cut[999], 0.0);
}

TEST(ReverbTailCut, OddFactorsAndLengthsStayInsideTheBuffer) {
    for (const float factor : {-0.02f, -0.5f, -1.0f, -2.0f, -1e9f, -1e30f, -infinity}) {
        for (const int length : {0, 1, 59, 1000, 100000, -7}) {
            for (const int size : {1, 64, 1000}) {
                const std::vector<double> cut = weights(length, size, factor);
                if (factor <= -1.0f && length >= size) {
                    EXPECT_EQ(cut.front(), 0.0) << factor << " " << length;
                    EXPECT_EQ(cut.back(), 0.0);
                }
            }
        }
    }
    EXPECT_EQ(weights(0, 64, 0.0f)[0], 1.0);
    EXPECT_EQ(weights(100000, 64, 0.5f)[63], 1.0) << "the cut lies behind the buffer";
}

// ---- Loading ----

class ReverbTailLoad : public ::testing::Test {
protected:
    ReverbTailLoad() { essError = essErrorNone; }
    ~ReverbTailLoad() override { essError = essErrorNone; }

    WavSource sourceAt(int rate) const {
        WavSource source;
        source.bundleBasePath = directory.path();
        source.IRfilePath = directory.file(rate == 44100   ? "/TSLdata510.dat"
                                           : rate == 48000 ? "/TSLdata511.dat"
                                                           : "/TSLdata512.dat");
        source.sampleRate = rate;
        return source;
    }
    void load(int preset, int rate = 48000) {
        qvReverb = static_cast<std::int16_t>(preset);
        log.clear();
        tail = ReverbTail{};
        tail.loadIReverb(qvReverb, qvReverb, sourceAt(rate));
    }
    static std::string intro(int preset) {
        return "___loadIReverb " + std::to_string(preset) + " now...";
    }

    TempDirectory directory;
    LogCapture log;
    ReverbTail tail;
    std::int16_t qvReverb = 0;
};

TEST_F(ReverbTailLoad, EveryTailHasItsLengthAndGainAtEveryRate) {
    for (const int rate : sampleRates) {
        writePackedTails(directory.path(), rate, {});
        for (const TailLine& line : readTailLines()) {
            if (line.length48000 == 0) {
                continue;
            }
            load(line.preset, rate);
            const int frames = line.frames[rate == 24000 ? 0u : rate == 44100 ? 1u : 2u];
            EXPECT_EQ(tail.reverbLength, frames) << line.preset;
            EXPECT_EQ(tail.reverbIR.size(), 2 * static_cast<std::size_t>(frames));
            EXPECT_EQ(tail.reverbPresetGain, line.gain) << line.preset;
            EXPECT_EQ(qvReverb, line.preset);
            EXPECT_FALSE(tail.loadingReverb);
            EXPECT_EQ(log.outputLines(),
                      (std::vector<std::string>{"", intro(line.preset),
                                                "reverbLength = " + std::to_string(frames)}));
        }
        EXPECT_EQ(essError, essErrorNone);
    }
}

TEST_F(ReverbTailLoad, SamplesOfThePackedFileStandAsTheyAre) {
    for (const int rate : sampleRates) {
        // The second in the file is the one before it in the list: the index decides.
        writePackedTails(directory.path(), rate, {52, 20, 41});
        for (const int preset : {20, 41, 52}) {
            load(preset, rate);
            ASSERT_EQ(essError, essErrorNone);
            for (int i = 0; i < tail.reverbLength; ++i) {
                for (int ear : {0, 1}) {
                    ASSERT_EQ(tailFrame(tail, ear, i), testTailSample(preset, i, ear))
                        << preset << " at " << rate << ": " << i << " ear " << ear;
                }
            }
        }
    }
}

TEST_F(ReverbTailLoad, PresetsBelowFifteenAreOnePairOfZeros) {
    for (const TailLine& line : readTailLines()) {
        if (line.length48000 != 0) {
            continue;
        }
        load(line.preset);
        EXPECT_EQ(tail.reverbLength, 1) << line.preset;
        EXPECT_EQ(tail.reverbPresetGain, line.gain) << line.preset;
        ASSERT_EQ(tail.reverbIR.size(), 2u);
        EXPECT_EQ(tail.reverbIR[0], 0.0f);
        EXPECT_EQ(tail.reverbIR[1], 0.0f);
        EXPECT_EQ(qvReverb, line.preset);
        EXPECT_EQ(log.outputLines(),
                  (std::vector<std::string>{"", intro(line.preset), "reverbLength = 1"}));
    }
    EXPECT_EQ(essError, essErrorNone) << "no file is opened";
}

TEST_F(ReverbTailLoad, ZeroSaysThatNothingIsSelected) {
    tail.reverbLength = 7;
    tail.reverbPresetGain = 0.25f;
    tail.loadIReverb(0, qvReverb, sourceAt(48000));
    EXPECT_EQ(tail.reverbLength, 0);
    EXPECT_EQ(tail.reverbPresetGain, 0.25f) << "not set";
    EXPECT_TRUE(tail.reverbIR.empty());
    EXPECT_EQ(log.outputLines(),
              (std::vector<std::string>{"", intro(0), "reverb activ, but no Filter selected!!!",
                                        "reverbLength = 0"}));
}

TEST_F(ReverbTailLoad, PresetsBeyondTheTableTurnTheTailOff) {
    for (const int preset : {61, -1, 32767, -32768}) {
        load(preset);
        EXPECT_EQ(qvReverb, 0);
        EXPECT_EQ(tail.reverbLength, 0);
        EXPECT_TRUE(tail.reverbIR.empty());
        EXPECT_EQ(log.outputLines(),
                  (std::vector<std::string>{
                      "", intro(preset), "reverb selector to high with " + std::to_string(preset),
                      "reverbLength = 0"}));
    }
    EXPECT_EQ(essError, essErrorNone);
}

TEST_F(ReverbTailLoad, MissingFileIsAnErrorAndASilentTail) {
    load(15, 44100);
    EXPECT_EQ(essError, essErrorTailUnreadable);
    EXPECT_EQ(tail.reverbLength, 21266);
    EXPECT_EQ(tail.reverbPresetGain, 0.05306f);
    EXPECT_TRUE(std::all_of(tail.reverbIR.begin(), tail.reverbIR.end(),
                            [](float sample) { return sample == 0.0f; }));
    const std::string line =
        "Tessaly_e ERROR: Wav " + directory.file("/TSLdata510.dat") + " not readable!!!!";
    EXPECT_EQ(log.errorLines(), std::vector<std::string>{line});
    EXPECT_EQ(log.count(LogStream::output, line), 1u);
    EXPECT_FALSE(tail.loadingReverb);
}

TEST_F(ReverbTailLoad, ShortFileLeavesTheRestSilent) {
    constexpr int stored = 100;
    std::vector<char> bytes(242, '\0');
    for (int i = 0; i < stored; ++i) {
        for (const float sample : {0.5f, -0.25f}) {
            const auto* const raw = reinterpret_cast<const char*>(&sample);
            bytes.insert(bytes.end(), raw, raw + sizeof sample);
        }
    }
    bytes.insert(bytes.end(), {'\x7f', '\x7f'});  // half a sample more
    writeFile(directory.file("/TSLdata511.dat"), bytes);
    load(20);
    EXPECT_EQ(essError, essErrorNone);
    ASSERT_EQ(tail.reverbLength, 4096);
    EXPECT_EQ(tailFrame(tail, 0, stored - 1), 0.5f);
    EXPECT_EQ(tailFrame(tail, 1, stored - 1), -0.25f);
    for (int i = stored + 1; i < 4096; ++i) {
        ASSERT_EQ(tailFrame(tail, 0, i), 0.0f) << i;
        ASSERT_EQ(tailFrame(tail, 1, i), 0.0f) << i;
    }
}

TEST_F(ReverbTailLoad, WrongIndexReadsNothing) {
    std::vector<char> bytes(242 + 4096 * 8, '\x3c');
    for (const std::int32_t start : {2147483647, -2147483647, 5000, -40}) {
        const auto* const raw = reinterpret_cast<const char*>(&start);
        std::copy(raw, raw + sizeof start, bytes.begin() + 2 + 4 * (20 - 1));
        writeFile(directory.file("/TSLdata511.dat"), bytes);
        load(20);
        EXPECT_EQ(essError, essErrorNone);
        EXPECT_TRUE(std::all_of(tail.reverbIR.begin(), tail.reverbIR.end(), [](float sample) {
            return sample == 0.0f;
        })) << start;
    }
    for (const std::size_t size : {0u, 2u, 79u}) {
        writeFile(directory.file("/TSLdata511.dat"), std::vector<char>(size, '\0'));
        load(20);
        EXPECT_EQ(tail.reverbIR[0], 0.0f);
    }
}

TEST_F(ReverbTailLoad, OneFileATailIsReadByItsNameAndRate) {
    for (const int rate : sampleRates) {
        WavSource source = sourceAt(rate);
        source.usePackedDatabase = false;
        const std::string name =
            directory.file("/Bin_Small Livingroom_V02_" + std::to_string(rate) + ".wav");
        const auto frames = static_cast<std::size_t>(reverbFramesAt(rate, 22268));
        std::vector<float> pairs(2 * frames);
        for (std::size_t i = 0; i < pairs.size(); ++i) {
            pairs[i] = testTailSample(23, static_cast<int>(i / 2), static_cast<int>(i % 2));
        }
        writeWavForReader(name, 2, rate, pairs);
        tail = ReverbTail{};
        tail.loadIReverb(23, qvReverb, source);
        EXPECT_EQ(essError, essErrorNone);
        ASSERT_EQ(tail.reverbIR.size(), pairs.size());
        EXPECT_TRUE(std::equal(pairs.begin(), pairs.end(), tail.reverbIR.begin()));
    }
}

}  // namespace
}  // namespace tessaly::test
