// Suggestions for misspelt names.
#include "scene/near_names.h"

#include <gtest/gtest.h>

#include <array>
#include <string>

namespace tessaly {
namespace {

constexpr std::array<std::string_view, 4> names = {"gain", "position", "Reverb disable", "at"};

TEST(NearNames, FindsTheLeastDifferentName) {
    EXPECT_EQ(nearestName("gian", names), "gain");
    EXPECT_EQ(nearestName("gani", names), "gain");
    EXPECT_EQ(nearestName("igna", names), "");  // two edits of four letters are too many
    EXPECT_EQ(nearestName("gin", names), "gain");
    EXPECT_EQ(nearestName("postion", names), "position");
    EXPECT_EQ(nearestName("reverb_disabled", names), "Reverb disable");
    EXPECT_EQ(nearestName("POSITION", names), "position");
}

TEST(NearNames, FindsNothingFarAway) {
    EXPECT_EQ(nearestName("", names), "");
    EXPECT_EQ(nearestName("a", names), "");
    EXPECT_EQ(nearestName("occlusion", names), "");
    EXPECT_EQ(nearestName(std::string(41, 'g'), names), "");
    EXPECT_EQ(nearestName("gain", {}), "");
}

TEST(NearNames, AsksOnlyWhereThereIsASuggestion) {
    EXPECT_EQ(didYouMean("gin", names), ", did you mean \"gain\"?");
    EXPECT_EQ(didYouMean("occlusion", names), "");
}

TEST(NearNames, QuotesWhatFitsALine) {
    EXPECT_EQ(inQuotes("a b"), "\"a b\"");
    EXPECT_EQ(inQuotes("a\nb\xc3\xa9"), "\"a?b??\"");
    EXPECT_EQ(inQuotes(std::string(41, 'x')), "\"" + std::string(40, 'x') + "...\"");
    EXPECT_EQ(inQuotes(""), "\"\"");
}

}  // namespace
}  // namespace tessaly
