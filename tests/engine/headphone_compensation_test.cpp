// Headphone filter selection and loading.
#include "engine/headphone_compensation.h"

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <vector>

#include "base/ess_error.h"
#include "engine/shared_state.h"
#include "support/engine_rig.h"
#include "support/log_capture.h"
#include "support/test_data.h"

namespace tessaly::test {
namespace {

using HeadphoneFilter = EngineFixture;

std::vector<float> taps(int count, float scale) {
    std::vector<float> samples(static_cast<std::size_t>(count));
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = scale * (1.0f + static_cast<float>(i));
    }
    return samples;
}

struct Row {
    int selection;
    const char* line;  // null: the line's wording is free
    const char* file;
};

// clang-format off
constexpr std::array<Row, 10> rows = {{
    {1, "iPhone-Standart-Headphones selected...",    "/IPALLI_16"},
    {2, "iPhone-InEar-Headphones selected...",       "/IINALLIH"},
    {3, "Beyerdynamic DT770 Headphones selected...", "/770ALIF3_CUB_Mono.wav"},
    {4, "Sennheiser HD25 Headphones selected...",    "/25AINBS_16bit"},
    {5, "Sennheiser HD600 Headphones selected...",   "/FFIH03GL"},
    {6, nullptr,                                     "/ITA-Kunstkopf_HRIR_Mess01_D180_5x5_256_A000_B090"},
    {7, "Bose qc15",                                 "/I15I12_32.wav"},
    {8, "Bose qc20",                                 "/20H114_32.wav"},
    {9, "Bose qc20_ID",                              "/I20H111_32.wav"},
    {10, "Bose qc20_ID",                             "/20H1103_32.wav"},
}};
// clang-format on

TEST_F(HeadphoneFilter, EverySelectionReadsItsFile) {
    for (const Row& row : rows) {
        SCOPED_TRACE(row.selection);
        const TempDirectory directory;
        const auto samples = taps(256, 0.001f * static_cast<float>(row.selection));
        writeWav(directory.file(row.file), 1, 44100, 32, samples);
        qvHpTFcompSelect = static_cast<std::int16_t>(row.selection);
        LogCapture log;
        loadHpTF(4096, 1024, directory.path());
        EXPECT_EQ(essError, essErrorNone);
        EXPECT_STREQ(headphoneFileName(row.selection), row.file);
        ASSERT_EQ(hpTFtimeLength, 2048);
        for (std::size_t i = 0; i < 2048; ++i) {
            ASSERT_EQ(hpTFfilter[i], i < 256 ? samples[i] : 0.0f) << i;
        }
        const auto lines = log.outputLines();
        ASSERT_GE(lines.size(), 4u);
        EXPECT_EQ(lines[0], "Load HpTF-Filter!");
        EXPECT_EQ(lines[1], "qvHpTFcompSelect = " + std::to_string(row.selection));
        if (row.line != nullptr) {
            EXPECT_EQ(lines[2], row.line);
        }
    }
}

TEST_F(HeadphoneFilter, SelectionsOutsideTheTableLeaveAZeroFilter) {
    const struct {
        int selection;
        const char* line;
    } cases[] = {{0, "qvHpTF activ, but no Filter selected!!!"},
                 {11, "qvHpTF activ, but no Filter selected!!! qvHpTFcompSelect too high!"}};
    for (const auto& c : cases) {
        qvHpTFcompSelect = static_cast<std::int16_t>(c.selection);
        LogCapture log;
        loadHpTF(2048, 1024, "/nowhere");
        EXPECT_EQ(log.outputLines().back(), c.line);
        EXPECT_EQ(headphoneFileName(c.selection), nullptr);
        EXPECT_EQ(essError, essErrorNone);
        for (int i = 0; i < 2048; ++i) {
            ASSERT_EQ(hpTFfilter[i], 0.0f);
        }
    }
}

TEST_F(HeadphoneFilter, AMissingFileIsAnErrorAndAZeroFilter) {
    qvHpTFcompSelect = 3;
    loadHpTF(2048, 1024, "/nowhere");
    EXPECT_EQ(essError, essErrorWavUnreadable);
    for (int i = 0; i < 2048; ++i) {
        ASSERT_EQ(hpTFfilter[i], 0.0f);
    }
}

TEST_F(HeadphoneFilter, AnUnfitFileIsAnErrorAndAZeroFilter) {
    const struct {
        int channels;
        int frames;
        int bits;
        int error;
    } cases[] = {{2, 256, 32, -107}, {1, 255, 32, -108}, {1, 256, 8, -109}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.error);
        const TempDirectory directory;
        std::vector<char> bytes =
            wavBytes(c.channels, 44100, 32, taps(c.channels * c.frames, 0.1f));
        bytes[34] = static_cast<char>(c.bits);
        writeFile(directory.file("/770ALIF3_CUB_Mono.wav"), bytes);
        essError = essErrorNone;
        qvHpTFcompSelect = 3;
        loadHpTF(2048, 1024, directory.path());
        EXPECT_EQ(essError, c.error);
        for (int i = 0; i < 2048; ++i) {
            ASSERT_EQ(hpTFfilter[i], 0.0f) << i;
        }
    }
}

TEST_F(HeadphoneFilter, SelectionsBelowOneSwitchOff) {
    const TempDirectory directory;
    writeWav(directory.file("/770ALIF3_CUB_Mono.wav"), 1, 44100, 32, taps(256, 0.001f));
    engineCount = 1;
    for (const std::int16_t off : {std::int16_t{0}, std::int16_t{-1}, std::int16_t{-32768}}) {
        watchHeadphoneSelection(3, 4096, 1024, directory.path());
        ASSERT_TRUE(hpTFactive);
        const float* const loaded = hpTFfilter;
        watchHeadphoneSelection(off, 4096, 1024, directory.path());
        EXPECT_FALSE(hpTFactive);
        EXPECT_EQ(qvHpTFcompSelect, off);
        EXPECT_EQ(hpTFfilter, loaded) << "nothing is loaded for it";
    }
}

TEST_F(HeadphoneFilter, AShortResponseTakesTheEndOfTheSmallFilter) {
    for (const int block : {2, 64, 128}) {
        const TempDirectory directory;
        const auto samples = taps(256, 0.001f);
        writeWav(directory.file("/IP23M3_512_FadeOut"), 1, 44100, 32, samples);
        qvHpTFcompSelect = 3;
        LogCapture log;
        loadHpTF(block, block, directory.path());
        EXPECT_EQ(log.outputLines().front(), "Buffersize < HpTP_FIR-Filter-Length!!!");
        for (std::size_t i = 0; i < 256; ++i) {
            const std::size_t from = 256 - static_cast<std::size_t>(block) + i;
            ASSERT_EQ(hpTFfilter[i], from < 256 ? samples[from] : 0.0f) << block << " " << i;
        }
    }
}

TEST_F(HeadphoneFilter, TheWatchActsOnAChangeOnly) {
    const TempDirectory directory;
    writeWav(directory.file("/770ALIF3_CUB_Mono.wav"), 1, 44100, 32, taps(256, 0.001f));
    engineCount = 1;
    watchHeadphoneSelection(0, 4096, 512, directory.path());
    EXPECT_EQ(hpTFfilter, nullptr);
    EXPECT_FALSE(hpTFactive);

    watchHeadphoneSelection(3, 4096, 512, directory.path());
    EXPECT_TRUE(hpTFactive) << "a live change asks no block length";
    EXPECT_EQ(qvHpTFcompSelect, 3);
    const float* const loaded = hpTFfilter;
    ASSERT_NE(loaded, nullptr);
    EXPECT_EQ(loaded[0], 0.001f);

    watchHeadphoneSelection(3, 4096, 512, directory.path());
    EXPECT_EQ(hpTFfilter, loaded);

    watchHeadphoneSelection(0, 4096, 512, directory.path());
    EXPECT_FALSE(hpTFactive);
    EXPECT_EQ(hpTFfilter, loaded) << "the filter stays";

    watchHeadphoneSelection(3, 4096, 512, directory.path());
    EXPECT_NE(hpTFfilter, loaded) << "loaded anew; the old one is still readable";
    EXPECT_EQ(loaded[0], 0.001f);
}

TEST_F(HeadphoneFilter, WithNoEngineCountedTheSelectionIsTakenAsNew) {
    engineCount = 0;
    qvHpTFcompSelect = 11;
    watchHeadphoneSelection(11, 4096, 1024, "/nowhere");
    EXPECT_TRUE(hpTFactive);
    ASSERT_NE(hpTFfilter, nullptr);
}

}  // namespace
}  // namespace tessaly::test
