// Headphone compensation in whole engines: start-up, live selection, level, odd orders of things.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

constexpr int rate = 48000;

class EngineHeadphone : public EngineFixture {
protected:
    EngineHeadphone() { writePackedHrirSet(directory.path(), rate); }

    /// A filter file of one tap.
    void writeFilter(const std::string& name, int tap, float level) {
        std::vector<float> samples(256, 0.0f);
        samples[static_cast<std::size_t>(tap)] = level;
        writeWav(directory.file(name), 1, 44100, 32, samples);
    }
    std::unique_ptr<EngineRig> built(int block, int selection, int room = 0) {
        auto rig = std::make_unique<EngineRig>(directory.path(), rate, block);
        rig->settings.qvHpTFcompSelect = static_cast<std::int16_t>(selection);
        rig->settings.earlyFlexRefPreset = static_cast<std::int16_t>(room);
        rig->azimuth = 40;
        rig->build();
        return rig;
    }
    /// The left ear over some blocks of noise, the source turning a little in each.
    static std::vector<float> play(EngineRig& rig, int blocks) {
        std::mt19937 random(5);
        std::uniform_real_distribution<float> noise(-0.5f, 0.5f);
        std::vector<float> left;
        for (int block = 0; block < blocks; ++block) {
            for (float& sample : rig.input) {
                sample = noise(random);
            }
            rig.azimuth = static_cast<std::int16_t>(40 + 5 * block);
            rig.run();
            for (std::size_t i = 0; i < rig.output.size(); i += 2) {
                left.push_back(rig.output[i]);
            }
        }
        return left;
    }
    std::vector<float> plain(int block, int blocks, int room = 0) {
        resetProcess();
        const auto rig = built(block, 0, room);
        std::vector<float> left = play(*rig, blocks);
        EXPECT_GT(*std::max_element(left.begin(), left.end()), 0.05f);
        return left;
    }
    static void expectScaled(const std::vector<float>& got,
                             const std::vector<float>& plain,
                             float scale,
                             std::size_t begin,
                             std::size_t end) {
        for (std::size_t i = begin; i < end; ++i) {
            ASSERT_NEAR(got[i], plain[i] * scale, 1e-6f) << i;
        }
    }

    TempDirectory directory;
    LogCapture log;
};

TEST_F(EngineHeadphone, FilterFromTheStartActsAtAThirdOfTheLevel) {
    const std::vector<float> dry = plain(1024, 6);
    resetProcess();
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.5f);
    const auto rig = built(1024, 3);
    EXPECT_TRUE(hpTFactive);
    ASSERT_EQ(essError, essErrorNone);
    EXPECT_EQ(rig->state().secondOLS->hpTFspectrumL, rig->state().firstOLS->hpTFspectrumL);
    expectScaled(play(*rig, 6), dry, 0.5f, 0, dry.size());
}

TEST_F(EngineHeadphone, FilterDelaysByItsTap) {
    const std::vector<float> dry = plain(1024, 4);
    resetProcess();
    writeFilter("/IPALLI_16", 5, 1.0f);
    const auto rig = built(1024, 1);
    const std::vector<float> got = play(*rig, 4);
    // Before the first turn of the source; later blocks fade between two responses.
    for (std::size_t i = 5; i < 1024; ++i) {
        ASSERT_NEAR(got[i], dry[i - 5] / 3.0f, 1e-6f) << i;
    }
}

TEST_F(EngineHeadphone, ShortBlocksStartWithoutAndAreSwitchedOnByTheFirstBlock) {
    const std::vector<float> dry = plain(512, 4);
    resetProcess();
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto rig = built(512, 3);
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 0);
    EXPECT_EQ(hpTFfilter, nullptr);
    const std::vector<float> got = play(*rig, 4);
    EXPECT_TRUE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 3);
    expectScaled(got, dry, 1.0f / 3.0f, 0, 512);
    // The second convolver's own spectra are zero, so each later block fades in from silence.
    for (std::size_t block = 1; block < 4; ++block) {
        EXPECT_EQ(got[512 * block], 0.0f);
        expectScaled(got, dry, 1.0f / 3.0f, 512 * block + 64, 512 * (block + 1));
    }
}

TEST_F(EngineHeadphone, SelectionZeroSwitchesOffAtOnceAndKeepsTheFilter) {
    const std::vector<float> dry = plain(1024, 1);
    resetProcess();
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto rig = built(1024, 3);
    const float* const filter = hpTFfilter;
    rig->settings.qvHpTFcompSelect = 0;
    expectScaled(play(*rig, 1), dry, 1.0f, 0, dry.size());
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(hpTFfilter, filter);
    EXPECT_EQ(filter[0], 1.0f);
}

TEST_F(EngineHeadphone, UnknownSelectionIsSilentAndSaysWhy) {
    const auto rig = built(1024, 0);
    play(*rig, 1);
    rig->settings.qvHpTFcompSelect = 11;
    const std::vector<float> got = play(*rig, 1);
    EXPECT_TRUE(hpTFactive);
    EXPECT_EQ(essError, essErrorNone);
    EXPECT_TRUE(std::all_of(got.begin() + 64, got.end(), [](float s) { return s == 0.0f; }));
    EXPECT_EQ(log.count(LogStream::output,
                        "qvHpTF activ, but no Filter selected!!! qvHpTFcompSelect too high!"),
              1u);
}

TEST_F(EngineHeadphone, MissingFileSilencesTheProcess) {
    const auto rig = built(1024, 3);
    EXPECT_EQ(essError, essErrorWavUnreadable);
    const std::vector<float> got = play(*rig, 2);
    EXPECT_TRUE(std::all_of(got.begin(), got.end(), [](float s) { return s == 0.0f; }));
}

TEST_F(EngineHeadphone, RoomsAreNotCompensatedAndReportItOnceAnUpdate) {
    const std::vector<float> dry = plain(1024, 3, 15);
    resetProcess();
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto rig = built(1024, 3, 15);
    ASSERT_EQ(rig->state().sizes.fdlCount, 2);
    log.clear();
    expectScaled(play(*rig, 3), dry, 1.0f / 3.0f, 0, dry.size());
    // Both ears, in each of three updates; the refused way back is a trace line.
    EXPECT_EQ(log.count(LogStream::output, "Tessaly ERROR: FFT not working! status "), 6u);
}

TEST_F(EngineHeadphone, OnlyTheFirstEngineWatchesTheSelection) {
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto first = built(1024, 0);
    const auto second = built(1024, 0);
    second->settings.qvHpTFcompSelect = 3;
    play(*second, 1);
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 0);
    first->settings.qvHpTFcompSelect = 3;
    play(*first, 1);
    EXPECT_TRUE(hpTFactive);
    EXPECT_EQ(qvHpTFcompSelect, 3);
}

TEST_F(EngineHeadphone, OnlyTheFirstEngineLoadsAtTheStart) {
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto first = built(1024, 0);
    const auto second = built(1024, 3);
    EXPECT_TRUE(hpTFactive) << "switched on for the process";
    EXPECT_EQ(hpTFfilter, nullptr) << "but nobody loaded it";
    for (const float sample : play(*second, 2)) {
        ASSERT_EQ(sample, 0.0f);
    }
    play(*first, 1);
    EXPECT_FALSE(hpTFactive) << "the first engine's own selection is 0";
    EXPECT_EQ(qvHpTFcompSelect, 0);
}

TEST_F(EngineHeadphone, TinyBlocksTakeTheEndOfTheSmallFilter) {
    const std::vector<float> dry = plain(128, 1);
    resetProcess();
    writeFilter("/IP23M3_512_FadeOut", 128, 0.9f);  // the first value that 128 frames keep
    const auto rig = built(128, 0);
    rig->settings.qvHpTFcompSelect = 3;
    const std::vector<float> got = play(*rig, 1);
    EXPECT_TRUE(hpTFactive);
    ASSERT_EQ(essError, essErrorNone);
    ASSERT_NE(hpTFfilter, nullptr);
    EXPECT_EQ(hpTFfilter[0], 0.9f);
    expectScaled(got, dry, 0.3f, 0, dry.size());
    EXPECT_EQ(log.count(LogStream::output, "Buffersize < HpTP_FIR-Filter-Length!!!"), 1u);
}

TEST_F(EngineHeadphone, LongerBlocksThanTheSpectrumTakeZerosBehindIt) {
    writeFilter("/770ALIF3_CUB_Mono.wav", 0, 1.0f);
    const auto first = built(1024, 3);
    play(*first, 1);
    const auto second = built(4096, 3);
    for (const float sample : play(*second, 2)) {
        ASSERT_TRUE(std::isfinite(sample));
    }
    const convClass& convolver = *second->state().firstOLS;
    ASSERT_EQ(convolver.FDLtoBUFConv, 1);
    ASSERT_LT(HpTF_FreqBins, convolver.binCount);
    for (const ComplexBin* spectrum : {convolver.hpTFspectrumL, convolver.hpTFspectrumR}) {
        ASSERT_NE(spectrum, nullptr);
        for (std::int32_t k = HpTF_FreqBins; k < convolver.binCount; ++k) {
            ASSERT_EQ(spectrum[k].re, 0.0f) << k;
            ASSERT_EQ(spectrum[k].im, 0.0f) << k;
        }
        EXPECT_NE(spectrum[1].re, 0.0f);
    }
}

TEST_F(EngineHeadphone, AnyOrderOfEnginesSelectionsAndBlockLengths) {
    for (const char* name : {"/IPALLI_16", "/IINALLIH", "/770ALIF3_CUB_Mono.wav",
                             "/IP23M3_512_FadeOut", "/25AINBS_16bit", "/FFIH03GL"}) {
        writeFilter(name, 3, 0.5f);
    }
    std::mt19937 random(11);
    const auto pick = [&](int from, int to) {
        return std::uniform_int_distribution<int>(from, to)(random);
    };
    std::array<std::unique_ptr<EngineRig>, 3> engines;
    for (int step = 0; step < 250; ++step) {
        auto& rig = engines[static_cast<std::size_t>(pick(0, 2))];
        if (rig == nullptr || pick(0, 3) == 0) {
            const bool replace = pick(0, 1) == 0;
            if (replace) {
                rig.reset();
            }
            // Selections up to 5 have files.
            rig = built(32 << pick(0, 7), pick(0, 5), pick(0, 2) == 0 ? 1 : 0);
        }
        if (pick(0, 3) == 0) {
            constexpr std::array<int, 8> selections = {0, 1, 2, 3, 4, 5, 11, -2};
            rig->settings.qvHpTFcompSelect =
                static_cast<std::int16_t>(selections[static_cast<std::size_t>(pick(0, 7))]);
        }
        for (const float sample : play(*rig, pick(1, 3))) {
            ASSERT_TRUE(std::isfinite(sample)) << step;
            ASSERT_LT(std::abs(sample), 10.0f) << step;
        }
        ASSERT_EQ(essError, essErrorNone) << step;
    }
}

}  // namespace
}  // namespace tessaly::test
