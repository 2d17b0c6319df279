// The page as text: complete, escaped, alone; and whatever comes, a page.
#include "report/report.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <regex>
#include <sstream>
#include <stdexcept>

#include "tools/report/sample_report.h"

namespace tessaly {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

// One entry with little in it.
Report smallReport() {
    Report report;
    report.title = "t";
    ReportEntry entry;
    entry.title = "one";
    entry.stereo.assign(2 * 2400, 0.0f);
    for (std::size_t i = 0; i < entry.stereo.size(); ++i) {
        entry.stereo[i] = 0.5f * static_cast<float>(std::sin(0.05 * static_cast<double>(i / 2)));
    }
    report.entries = {entry};
    return report;
}

std::size_t countOf(const std::string& text, const std::string& part) {
    std::size_t count = 0;
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1)) {
        ++count;
    }
    return count;
}

const std::string& samplePage() {
    static const std::string page = reportPage(sampleReport());
    return page;
}

// What is left of the page without the sounds and pictures inside it.
std::string withoutData(const std::string& page) {
    std::string rest;
    std::size_t from = 0;
    for (;;) {
        const std::size_t at = page.find("base64,", from);
        rest += page.substr(from, at - from);
        if (at == std::string::npos) {
            return rest;
        }
        from = page.find('"', at);
    }
}

TEST(ReportPage, HasASectionForEachEntry) {
    const std::string& page = samplePage();
    EXPECT_EQ(countOf(page, "<section "), 3u);
    EXPECT_EQ(countOf(page, "<audio "), 3u);
    EXPECT_EQ(countOf(page, "data:audio/flac;base64,"), 3u);
    EXPECT_EQ(countOf(page, "data:image/png;base64,"), 6u);
    EXPECT_EQ(countOf(page, "<h3>Response: "), 2u);
    EXPECT_EQ(countOf(page, "<details>"), 3u);
    for (const char* id : {"sound-1", "sound-2", "sound-3"}) {
        EXPECT_THAT(page, HasSubstr(std::string("href=\"#") + id + "\""));
        EXPECT_THAT(page, HasSubstr(std::string("id=\"") + id + "\""));
    }
}

TEST(ReportPage, RefersToNothingOutside) {
    const std::string page = withoutData(samplePage());
    EXPECT_THAT(page, Not(HasSubstr("://")));
    EXPECT_THAT(page, Not(HasSubstr("@import")));
    EXPECT_THAT(page, HasSubstr("default-src 'none'"));
    const std::regex reference("(?:src|href|action|data|poster)=\"([^\"]{0,12})");
    for (auto it = std::sregex_iterator(page.begin(), page.end(), reference);
         it != std::sregex_iterator(); ++it) {
        const std::string target = (*it)[1];
        EXPECT_TRUE(target.starts_with("#") || target.starts_with("data:")) << target;
    }
}

TEST(ReportPage, NamesAreEscapedEverywhere) {
    Report report;
    report.entries = {hostileEntry()};
    report.title = hostileName;
    report.introduction = hostileName;
    const std::string page = reportPage(report);
    EXPECT_THAT(page, Not(HasSubstr("<script>alert")));
    EXPECT_THAT(page, Not(HasSubstr("alert('x')")));
    EXPECT_THAT(page, Not(HasSubstr("a='&amp;")));
    EXPECT_EQ(countOf(page, "<script>"), 1u);
    // Title twice, introduction, contents, heading, player, description, path and its picture,
    // response, four of a parameter, remark.
    EXPECT_EQ(countOf(page, "&lt;script&gt;alert(&apos;x&apos;)&lt;/script&gt;"), 15u);
}

TEST(ReportPage, SameReportIsTheSamePage) {
    EXPECT_EQ(reportPage(smallReport()), reportPage(smallReport()));
}

TEST(ReportPage, TellsThatALoudSoundIsLowered) {
    Report report = smallReport();
    EXPECT_THAT(reportPage(report), Not(HasSubstr("above full scale")));
    for (float& sample : report.entries[0].stereo) {
        sample *= 4.0f;
    }
    EXPECT_THAT(reportPage(report), HasSubstr("The player&apos;s sound is lowered by 6.0 dB"));
}

TEST(ReportPage, ShowsTheTimesOfARoomAndDashesWithoutOne) {
    Report report = smallReport();
    ReportResponse room;
    room.label = "room";
    room.left = decayingNoise(0.5, 0.9, 48000, 1);
    room.right = decayingNoise(0.5, 0.9, 48000, 2);
    report.entries[0].responses = {room};
    const std::string withRoom = reportPage(report);
    EXPECT_EQ(countOf(withRoom, "cannot be told"), 0u);
    const std::regex cell("<td>([0-9.]+)</td>");
    std::size_t cells = 0;
    for (auto it = std::sregex_iterator(withRoom.begin(), withRoom.end(), cell);
         it != std::sregex_iterator(); ++it, ++cells) {
        // The chance of noise at 125 Hz; the measurement itself is tested apart.
        EXPECT_NEAR(std::stod((*it)[1]), 0.5, 0.15);
    }
    EXPECT_EQ(cells, 28u);
    std::fill(room.left.begin() + 10, room.left.end(), 0.0f);
    report.entries[0].responses = {room};
    EXPECT_EQ(countOf(reportPage(report), "cannot be told"), 14u);
}

TEST(ReportPage, WhateverComesIsAPage) {
    constexpr float nan = std::numeric_limits<float>::quiet_NaN();
    constexpr double wild = std::numeric_limits<double>::infinity();
    const std::vector<std::vector<float>> sounds = {
        {},
        {0.5f},
        {0.5f, 0.5f},
        std::vector<float>(2 * 4800, 0.0f),
        std::vector<float>(2 * 100, nan),
        std::vector<float>(2 * 100, std::numeric_limits<float>::max()),
        std::vector<float>(2 * 100, std::numeric_limits<float>::denorm_min())};
    for (std::size_t i = 0; i < sounds.size(); ++i) {
        for (const std::size_t step : {0u, 3u}) {
            const std::vector<float>& sound = sounds[i];
            const std::vector<float>& ear = sounds[(i + step) % sounds.size()];
            Report report = smallReport();
            ReportEntry& entry = report.entries[0];
            entry.stereo = sound;
            entry.sampleRate = 24000;
            entry.responses = {{"r", ear, sound}, {"s", ear, ear}};
            entry.sources = {{"a", {}, {}, {}},
                             {"b", {0.0, 1.0}, {{wild, 0.0, 0.0}, {1.0, 0.0, -wild}}, {}},
                             {"c", {0.0, 0.0, wild}, {{1e5, 0.0, 0.0}, {0.0, 0.0, -1e5}}, {wild}},
                             {"d", {0.0, 1.0}, {{1e300, 0.0, 0.0}, {0.0, 0.0, 0.0}}, {}}};
            entry.listener = {"l", {0.0}, {{0.0, 0.0, std::nan("")}}, {}};
            const std::string page = withoutData(reportPage(report));
            EXPECT_TRUE(page.ends_with("</html>\n"));
            // No figure of a drawing or a text is a number gone wrong.
            EXPECT_FALSE(std::regex_search(page, std::regex("[\" ,:(>-](nan|inf)[\" ,.%<s)]")))
                << sound.size() << " " << ear.size();
        }
    }
}

TEST(ReportPage, SamplesThatAreNoNumbersAreTold) {
    Report report = smallReport();
    report.entries[0].stereo[100] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_THAT(reportPage(report), HasSubstr("1 samples were no numbers"));
}

TEST(ReportPage, EmptySoundHasNoPlayer) {
    Report report = smallReport();
    report.entries[0].stereo.clear();
    const std::string page = reportPage(report);
    EXPECT_EQ(countOf(page, "<audio "), 0u);
    EXPECT_THAT(page, HasSubstr("There is no sound"));
}

}  // namespace
}  // namespace tessaly
