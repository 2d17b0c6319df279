// Headphone filters: equaliser settings, curves, taps, and a user's own.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <functional>

#include "data/data_error.h"
#include "data/headphone_builder.h"
#include "data/headphone_table.h"
#include "support/test_data.h"
#include "tools/data/scratch_directory.h"

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

std::vector<double> inDouble(const std::vector<float>& taps) { return {taps.begin(), taps.end()}; }

TEST(EqFilter, PeaksAndShelvesHaveTheirGainWhereTheyShould) {
    const std::vector<EqFilter> peak = {{EqType::peaking, 1000.0, 6.0, 2.0}};
    EXPECT_NEAR(eqLevel(peak, 1000.0), 6.0, 1e-9);
    EXPECT_NEAR(eqLevel(peak, 20.0), 0.0, 0.01);
    EXPECT_NEAR(eqLevel(peak, 20000.0), 0.0, 0.05);
    const std::vector<EqFilter> low = {{EqType::lowShelf, 200.0, -4.0, 0.7}};
    EXPECT_NEAR(eqLevel(low, 1.0), -4.0, 1e-3);
    EXPECT_NEAR(eqLevel(low, 200.0), -2.0, 0.01);
    EXPECT_NEAR(eqLevel(low, 20000.0), 0.0, 1e-3);
    const std::vector<EqFilter> high = {{EqType::highShelf, 5000.0, 4.0, 0.7}};
    EXPECT_NEAR(eqLevel(high, 1.0), 0.0, 1e-3);
    EXPECT_NEAR(eqLevel(high, 5000.0), 2.0, 0.01);
    EXPECT_NEAR(eqLevel(high, 24000.0), 4.0, 1e-3);
    EXPECT_NEAR(eqLevel({peak[0], peak[0]}, 1000.0), 12.0, 1e-9);
}

TEST(EqText, LinesBecomeFilters) {
    const std::vector<EqFilter> filters = parseEqText(
        "Preamp: -6.1 dB\n# mine\n\nFilter 1: ON PK Fc 105 Hz Gain 1.0 dB Q 0.70\r\n"
        "Filter 2: OFF PK Fc 1 Hz Gain 1.0 dB Q 0.70\nFilter 3: ON LSC Fc 90.5 Hz Gain -2 dB Q 1\n"
        "Filter 4: ON HSC Fc 9000 Hz Gain 3.5 dB Q 0.7\n",
        "eq.txt");
    ASSERT_EQ(filters.size(), 3u);
    EXPECT_EQ(filters[0].type, EqType::peaking);
    EXPECT_EQ(filters[0].hertz, 105.0);
    EXPECT_EQ(filters[1].type, EqType::lowShelf);
    EXPECT_EQ(filters[1].gainDb, -2.0);
    EXPECT_EQ(filters[2].type, EqType::highShelf);
    EXPECT_EQ(filters[2].q, 0.7);
}

TEST(EqText, MistakesAreNamedWithTheirLine) {
    const auto refusal = [](const std::string& text) {
        return messageOf([&text] { parseEqText(text, "eq.txt"); });
    };
    EXPECT_THAT(refusal(""), HasSubstr("eq.txt has no filter that is ON"));
    EXPECT_THAT(refusal("Filter 1: OFF PK Fc 105 Hz Gain 1.0 dB Q 0.70\n"),
                HasSubstr("no filter that is ON"));
    EXPECT_THAT(refusal("\nsome words\n"), HasSubstr("eq.txt line 2: found \"some words\""));
    EXPECT_THAT(refusal("Filter 1: ON PK Fc 105 Hz Gain 1.0 dB\n"), HasSubstr("line 1: found"));
    EXPECT_THAT(refusal("Filter 1: ON PK Fc 105 Hz Gain 1.0 dB Q 0.7 x\n"), HasSubstr("line 1"));
    EXPECT_THAT(refusal("Filter 1: ON NOTCH Fc 105 Hz Gain 1.0 dB Q 0.70\n"),
                HasSubstr("filter type \"NOTCH\" is unknown"));
    EXPECT_THAT(refusal("Filter 1: ON PK Fc 25000 Hz Gain 1.0 dB Q 0.70\n"),
                HasSubstr("frequency is 25000 Hz"));
    EXPECT_THAT(refusal("Filter 1: ON PK Fc 100 Hz Gain 99 dB Q 0.70\n"), HasSubstr("gain is 99"));
    EXPECT_THAT(refusal("Filter 1: ON PK Fc 100 Hz Gain 1 dB Q 0\n"), HasSubstr("Q is 0"));
}

TEST(HeadphoneTable, FlatBassDropsTheFirstLowShelfOnly) {
    for (const HeadphoneRow& row : headphoneTable()) {
        const std::size_t all = headphoneFilters(row, false).size();
        const bool hasShelf = row.number != frontalRow && row.number != 10;
        EXPECT_EQ(all, row.number == frontalRow ? 0u : 10u) << row.number;
        EXPECT_EQ(headphoneFilters(row, true).size(), hasShelf ? all - 1 : all) << row.number;
    }
}

TEST(HeadphoneCurve, IsCentredLimitedAndHeld) {
    const HeadphoneCurve curve = headphoneCurve(
        [](double hertz) {
            if (hertz < 100.0) {
                return 50.0;
            }
            return hertz > 8000.0 ? -50.0 - hertz / 1000.0 : 5.0;
        },
        48000);
    EXPECT_NEAR(curve.at(1000.0), 9.54, 1e-9);
    EXPECT_NEAR(curve.at(50.0), 19.54, 1e-9);
    EXPECT_NEAR(curve.at(12000.0), 9.54 - 12.0, 1e-9);
    const HeadphoneCurve rising =
        headphoneCurve([](double hertz) { return hertz / 4000.0; }, 48000);
    EXPECT_NEAR(rising.at(20000.0), rising.at(16000.0), 1e-3) << "between two bins";
}

TEST(HeadphoneFilter, KeepsItsCurveAndStartsAtOnce) {
    for (const int rate : {24000, 44100, 48000}) {
        const HeadphoneOptions options{rate, false};
        const HeadphoneCurve curve = builtInCurve(5, options, {});
        const std::vector<float> taps = headphoneFilter(curve, headphoneTaps, headphoneFade);
        ASSERT_EQ(taps.size(), 256u);
        const auto level = responseLevel(inDouble(taps), rate);
        for (const double hertz : {250.0, 500.0, 1000.0, 2000.0, 4000.0, 8000.0}) {
            EXPECT_NEAR(level(hertz), curve.at(hertz), 1.0) << rate << " " << hertz;
        }
        EXPECT_GT(std::abs(taps[0]), 0.5f) << "minimum phase";
        EXPECT_LT(std::abs(taps[255]), 1e-3f) << "faded";
    }
}

TEST(HeadphoneFilter, TheFormForShortResponsesLiesInTheSecondHalf) {
    const HeadphoneCurve curve = builtInCurve(smallFilterRow, {}, {});
    const std::vector<float> small = smallHeadphoneFilter(curve);
    const std::vector<float> whole = headphoneFilter(curve, headphoneTaps, headphoneFade);
    ASSERT_EQ(small.size(), 256u);
    for (std::size_t i = 0; i < 128; ++i) {
        EXPECT_EQ(small[i], 0.0f);
    }
    for (std::size_t i = 0; i < 96; ++i) {
        EXPECT_EQ(small[128 + i], whole[i]);
    }
}

TEST(HeadphoneOptions, ReadBack) {
    for (const HeadphoneOptions options : {HeadphoneOptions{}, HeadphoneOptions{24000, true}}) {
        EXPECT_EQ(headphoneOptionsFromText(toText(options)), options);
        EXPECT_EQ(headphoneOptionsFromText(toText(options) + " imported response"), options);
    }
    EXPECT_THROW(headphoneOptionsFromText("rate=48000"), DataError);
    EXPECT_THROW(headphoneOptionsFromText("rate=8000 flat-bass=on"), DataError);
}

class FilterImport : public testing::Test {
protected:
    std::string file(const std::string& name) const { return (scratch.path() / name).string(); }
    ImportedFilter import(const std::string& name, bool minimumPhase = false, int rate = 48000) {
        ImportedFilters filters;
        importFilter("3=" + file(name), rate, minimumPhase, filters);
        return filters.at(3);
    }
    std::string refusal(const std::string& argument) {
        return messageOf([&argument] {
            ImportedFilters filters;
            importFilter(argument, 48000, false, filters);
        });
    }
    ScratchDirectory scratch;
};

TEST_F(FilterImport, ATextBecomesItsCurve) {
    std::ofstream(file("eq.txt")) << "Filter 1: ON PK Fc 2000 Hz Gain 6.0 dB Q 2\n";
    const ImportedFilter filter = import("eq.txt");
    EXPECT_EQ(filter.kind, "parametric");
    const auto level = responseLevel(inDouble(filter.taps), 48000);
    EXPECT_NEAR(level(2000.0) - level(400.0), 6.0, 0.3);
    EXPECT_NEAR(middleLevel(level), 9.54, 0.1);
}

TEST_F(FilterImport, AResponseKeepsItsShapeAtAnyRate) {
    // A delayed impulse at 96000 Hz: flat, and its delay stays.
    std::vector<float> samples(400);
    samples[40] = 0.3f;
    test::writeWav(file("response.wav"), 1, 96000, 32, samples);
    for (const int rate : {24000, 44100, 48000}) {
        const ImportedFilter filter = import("response.wav", false, rate);
        const auto level = responseLevel(inDouble(filter.taps), rate);
        EXPECT_NEAR(level(1000.0), 9.54, 0.2) << rate;
        EXPECT_NEAR(level(5000.0), 9.54, 0.2) << rate;
    }
    const ImportedFilter delayed = import("response.wav");
    EXPECT_NEAR(static_cast<double>(delayed.taps[20]), 3.0, 0.2)
        << "less what lies above the new band";
    const ImportedFilter minimum = import("response.wav", true);
    EXPECT_GT(std::abs(minimum.taps[0]), 1.0f);
}

TEST_F(FilterImport, BadFilesAndRowsAreRefused) {
    EXPECT_THAT(refusal("eq.txt"), HasSubstr("expected ROW=FILE"));
    EXPECT_THAT(refusal("x=eq.txt"), HasSubstr("expected ROW=FILE"));
    EXPECT_THAT(refusal("3="), HasSubstr("expected ROW=FILE"));
    EXPECT_THAT(refusal("0=eq.txt"), HasSubstr("row 0 is unknown, expected 1 to 10"));
    EXPECT_THAT(refusal("11=eq.txt"), HasSubstr("row 11 is unknown"));
    EXPECT_THAT(refusal("3=" + file("none.txt")), HasSubstr("none.txt is missing or empty"));
    std::ofstream(file("empty.txt")).close();
    EXPECT_THAT(refusal("3=" + file("empty.txt")), HasSubstr("empty.txt is missing or empty"));
    test::writeWav(file("stereo.wav"), 2, 48000, 32, std::vector<float>(64, 0.1f));
    EXPECT_THAT(refusal("3=" + file("stereo.wav")), HasSubstr("has 2 channels, expected 1"));
    test::writeWav(file("slow.wav"), 1, 22050, 32, std::vector<float>(64, 0.1f));
    EXPECT_THAT(refusal("3=" + file("slow.wav")), HasSubstr("a rate of 22050 Hz"));
    std::vector<float> late(2000);
    late[1500] = 1.0f;
    test::writeWav(file("late.wav"), 1, 48000, 32, late);
    EXPECT_THAT(refusal("3=" + file("late.wav")), HasSubstr("of its energy in the first 256 taps"));
    EXPECT_EQ(import("late.wav", true).taps.size(), 256u);
    ImportedFilters filters;
    importFilter("3=" + file("late.wav"), 48000, true, filters);
    EXPECT_THAT(messageOf([&] { importFilter("3=" + file("late.wav"), 48000, true, filters); }),
                HasSubstr("row 3 is given twice"));
}

}  // namespace
}  // namespace tessaly::data
