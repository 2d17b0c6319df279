// Measured tails: the ini file, what is refused, where they are cut and how loud they become.
#include "data/tail_import.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <functional>

#include "base/precision.h"
#include "data/data_error.h"
#include "data/measurement.h"
#include "data/tail_builder.h"
#include "data/tail_design.h"
#include "support/test_data.h"
#include "tools/data/scratch_directory.h"
#include "tools/data/tail_test_set.h"

namespace tessaly::data {
namespace {

using testing::HasSubstr;

std::string messageOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const DataError& error) {
        return error.what();
    }
    return "";
}

std::string iniRefusal(const std::string& text) {
    return messageOf([&text] { parseTailsIni(text, "tails.ini"); });
}

TEST(TailsIni, SectionsBecomeRules) {
    const TailImportRules rules = parseTailsIni(
        "# measured in spring\n\n[preset_16]\nfile = my hall.wav\r\nstart_ms=0\n gain_db = -3.5 \n"
        "level = keep\nlicence = CC BY 4.0\nsource = me\n[ preset_60 ]\n; all defaults\n",
        "tails.ini");
    ASSERT_EQ(rules.size(), 2u);
    const TailImportRule& hall = rules.at(16);
    EXPECT_EQ(hall.file, "my hall.wav");
    EXPECT_EQ(hall.startMs, 0.0);
    EXPECT_EQ(hall.gainDb, -3.5);
    EXPECT_FALSE(hall.matchLevel);
    EXPECT_EQ(hall.licence, "CC BY 4.0");
    EXPECT_EQ(hall.source, "me");
    EXPECT_FALSE(rules.at(60).startMs.has_value());
    EXPECT_TRUE(rules.at(60).matchLevel);
}

TEST(TailsIni, MistakesAreNamedWithTheirLine) {
    EXPECT_THAT(iniRefusal("[preset_14]\n"), HasSubstr("tails.ini line 1: preset 14 has no tail"));
    EXPECT_THAT(iniRefusal("[preset_61]\n"), HasSubstr("preset 61 has no tail, expected 15 to 60"));
    EXPECT_THAT(iniRefusal("[hall]\n"), HasSubstr("found \"[hall]\", expected a section like"));
    EXPECT_THAT(iniRefusal("[preset_15\n"), HasSubstr("expected a section like [preset_15]"));
    EXPECT_THAT(iniRefusal("file = a.wav\n"),
                HasSubstr("expected a section like [preset_15] first"));
    EXPECT_THAT(iniRefusal("[preset_15]\n\nlevel = loud\n"),
                HasSubstr("tails.ini line 3: level is \"loud\", expected match or keep"));
    EXPECT_THAT(iniRefusal("[preset_15]\nstart_ms = soon\n"), HasSubstr("found \"soon\""));
    EXPECT_THAT(iniRefusal("[preset_15]\nstart_ms = -1\n"), HasSubstr("expected a number from 0"));
    EXPECT_THAT(iniRefusal("[preset_15]\ngain_db = nan\n"), HasSubstr("found \"nan\""));
    EXPECT_THAT(iniRefusal("[preset_15]\ncolour = red\n"), HasSubstr("\"colour\" is unknown"));
    EXPECT_THAT(iniRefusal("[preset_15]\nlevel\n"), HasSubstr("expected key = value"));
    EXPECT_THAT(iniRefusal("[preset_15]\n[preset_15]\n"), HasSubstr("preset 15 has two sections"));
}

class TailImport : public testing::Test {
protected:
    std::string file(const std::string& name) const { return (scratch.path() / name).string(); }

    /// Silence, a click at `onset` and alternating samples from there on that fall by half every
    /// 2000 frames.
    void writeTail(const std::string& name, int rate, std::size_t frames, std::size_t onset) const {
        std::vector<float> pairs(2 * frames);
        for (std::size_t i = onset; i < frames; ++i) {
            const double value =
                0.2 * std::exp2(-static_cast<double>(i - onset) / 2000.0) * (i % 2 == 0 ? 1 : -1);
            pairs[2 * i] = pairs[2 * i + 1] = static_cast<float>(value);
        }
        pairs[2 * onset] = pairs[2 * onset + 1] = 1.0f;
        test::writeWav(file(name), 2, rate, 32, pairs);
    }
    void writeIni(const std::string& text) const {
        std::ofstream(scratch.path() / "tails.ini") << text;
    }
    std::string refusal() {
        return messageOf([this] { importTails(scratch.path()); });
    }

    ScratchDirectory scratch;
};

TEST_F(TailImport, BadFilesAreRefusedByName) {
    EXPECT_THAT(refusal(), HasSubstr("no measured tail in"));
    EXPECT_THAT(messageOf([this] { importTails(scratch.path() / "none"); }),
                HasSubstr("none is no directory"));

    test::writeWav(file("preset_20.wav"), 1, 48000, 32, std::vector<float>(100, 0.5f));
    EXPECT_THAT(refusal(), HasSubstr("preset_20.wav has 1 channel, expected 2, left ear first"));
    test::writeWav(file("preset_20.wav"), 2, 22050, 32, std::vector<float>(100, 0.5f));
    EXPECT_THAT(refusal(), HasSubstr("a rate of 22050 Hz, expected 24000 Hz or more"));
    test::writeWav(file("preset_20.wav"), 2, 48000, 32, std::vector<float>(100, 0.0f));
    EXPECT_THAT(refusal(), HasSubstr("preset_20.wav is silent"));
    std::vector<float> samples(100, 0.5f);
    samples[7] = std::nanf("");
    test::writeWav(file("preset_20.wav"), 2, 48000, 32, samples);
    EXPECT_THAT(refusal(), HasSubstr("samples that are no numbers"));
    std::ofstream(scratch.path() / "preset_20.wav").close();
    EXPECT_THAT(refusal(), HasSubstr("preset_20.wav is empty"));
    test::writeWav(file("preset_20.wav"), 2, 48000, 32, std::vector<float>{});
    EXPECT_THAT(refusal(), HasSubstr("preset_20.wav"));
    std::ofstream(scratch.path() / "preset_20.wav") << "no sound at all, but some text";
    EXPECT_THAT(refusal(), HasSubstr("cannot be read as a sound file"));
}

TEST_F(TailImport, NumbersOutsideTheTableAreRefused) {
    writeTail("preset_61.wav", 48000, 1000, 10);
    EXPECT_THAT(refusal(), HasSubstr("preset 61 has no tail, expected 15 to 60"));
}

TEST_F(TailImport, SectionsWithoutAFileAreRefused) {
    writeTail("preset_20.wav", 48000, 4000, 10);
    writeIni("[preset_21]\ngain_db = 1\n");
    EXPECT_THAT(refusal(), HasSubstr("preset_21.wav does not exist"));
    writeIni("[preset_21]\nfile = other.wav\n");
    EXPECT_THAT(refusal(), HasSubstr("other.wav does not exist"));
}

TEST_F(TailImport, NothingBehindTheCutIsRefused) {
    writeTail("preset_16.wav", 48000, 1000, 10);  // the cut is 63 ms behind the direct sound
    EXPECT_THAT(refusal(), HasSubstr("has nothing left behind its direct sound"));
}

TEST_F(TailImport, TheDirectSoundBecomesTimeZeroAndIsDroppedWithWhatFollowsIt) {
    writeTail("preset_53.wav", 48000, 20000, 700);
    const MeasuredTail tail = importTails(scratch.path()).at(53);
    EXPECT_EQ(tail.sampleRate, 48000);
    EXPECT_EQ(tail.pairs.size(), 2u * (20000u - 700u));
    const auto start = static_cast<std::size_t>(std::lround(tailDesign(53).startSeconds * 48000.0));
    for (std::size_t i = 0; i < 2 * start; ++i) {
        ASSERT_EQ(tail.pairs[i], 0.0) << i;
    }
    EXPECT_GT(std::abs(tail.pairs[2 * start]), 0.0);
    EXPECT_LT(std::abs(tail.pairs[2 * start]), 1e-3) << "faded in over 2 ms";
    const double full = 0.2 * std::exp2(-static_cast<double>(start + 96) / 2000.0);
    EXPECT_NEAR(std::abs(tail.pairs[2 * (start + 96)]), full, 2e-4);
}

TEST_F(TailImport, AGivenStartCountsFromTheDirectSoundAndZeroKeepsAll) {
    writeTail("preset_53.wav", 48000, 20000, 700);
    writeIni("[preset_53]\nstart_ms = 10\n");
    MeasuredTail tail = importTails(scratch.path()).at(53);
    EXPECT_EQ(tail.pairs[2 * 479], 0.0);
    EXPECT_NE(tail.pairs[2 * 480], 0.0);
    writeIni("[preset_53]\nstart_ms = 0\n");
    tail = importTails(scratch.path()).at(53);
    EXPECT_EQ(tail.pairs.size(), 40000u);
    EXPECT_NEAR(tail.pairs[1400], 1.0, 1e-3);
}

TEST_F(TailImport, OtherRatesAndFilesOfAnyNameAreConverted) {
    writeTail("hall.wav", 96000, 80000, 1400);
    writeIni("[preset_53]\nfile = hall.wav\nlicence = CC0\n");
    const MeasuredTail tail = importTails(scratch.path()).at(53);
    EXPECT_EQ(tail.rule.file, "hall.wav");
    EXPECT_EQ(tail.sha256.size(), 64u);
    for (const int rate : {24000, 44100, 48000}) {
        const std::vector<double> pairs = convertMeasuredTail(tail, 53, rate);
        ASSERT_EQ(pairs.size(), 2 * storedTailFrames(tailDesign(53), rate)) << rate;
        EXPECT_EQ(pairs.back(), 0.0) << "cut with a fade";
    }
}

TEST_F(TailImport, AnImpulseKeepsItsGainInTheMiddleAtEveryRate) {
    std::vector<float> pairs(2 * 4000);
    pairs[2 * 1000] = 1.0f;
    pairs[2 * 1000 + 1] = -1.0f;
    test::writeWav(file("preset_20.wav"), 2, 96000, 32, pairs);
    writeIni("[preset_20]\nstart_ms = 0\n");
    const MeasuredTail tail = importTails(scratch.path()).at(20);
    const double expected = (2828.0 - 354.0) / (96000.0 * 96000.0) * 96000.0 * 96000.0;
    for (const int rate : {24000, 44100, 48000}) {
        const double energy = middleEnergy(convertMeasuredTail(tail, 20, rate), rate);
        EXPECT_NEAR(10.0 * std::log10(energy / expected), 0.0, 0.05) << rate;
    }
}

TEST_F(TailImport, ShortTailsArePaddedWithSilence) {
    writeTail("preset_53.wav", 48000, 4000, 0);
    const MeasuredTail tail = importTails(scratch.path()).at(53);
    const std::vector<double> pairs = convertMeasuredTail(tail, 53, 48000);
    for (std::size_t i = 8000; i < pairs.size(); ++i) {
        ASSERT_EQ(pairs[i], 0.0) << i;
    }
}

TEST_F(TailImport, LevelIsMatchedOrKept) {
    const HrirSet set = tailTestSet(48000);
    const TailDesign& design = tailDesign(53);
    const double direct = directEnergy(set);
    // Alternating samples have no energy in the middle: single impulses do.
    std::vector<float> pairs(2 * 6000);
    for (std::size_t i = 0; i < 6000; i += 500) {
        pairs[2 * i] = pairs[2 * i + 1] = 0.5f;
    }
    test::writeWav(file("preset_53.wav"), 2, 48000, 32, pairs);
    const auto build = [&] {
        const MeasuredTails tails = importTails(scratch.path());
        return buildTail(design, set, direct, TailOptions{}, &tails.at(53), {48000});
    };
    const auto ratio = [&](const BuiltTail& tail) {
        std::vector<double> played(tail.stored[0].begin(), tail.stored[0].end());
        for (double& sample : played) {
            sample *= wide(design.presetGain);
        }
        return 10.0 * std::log10(direct / middleEnergy(played, 48000));
    };
    EXPECT_NEAR(ratio(build()), design.directToTail(), 0.01);
    writeIni("[preset_53]\ngain_db = -4\n");
    EXPECT_NEAR(ratio(build()), design.directToTail() + 4.0, 0.01);
    writeIni("[preset_53]\nlevel = keep\nstart_ms = 20\n");
    const BuiltTail kept = build();
    EXPECT_EQ(kept.origin.gainDb, 0.0);
    EXPECT_EQ(kept.origin.file, "preset_53.wav");
    EXPECT_NEAR(static_cast<double>(kept.stored[0][2 * 2500]), 0.5, 0.01);
}

}  // namespace
}  // namespace tessaly::data
