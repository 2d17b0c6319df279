// Strict reading of numbers.
#include "render/text_numbers.h"

#include <gtest/gtest.h>

namespace tessaly {
namespace {

TEST(TextNumbers, ReadsWhatIsANumber) {
    EXPECT_EQ(numberFromText("1.5"), 1.5);
    EXPECT_EQ(numberFromText("-6"), -6.0);
    EXPECT_EQ(numberFromText("+3"), 3.0);
    EXPECT_EQ(numberFromText("2e3"), 2000.0);
}

TEST(TextNumbers, RefusesWhatIsNone) {
    for (const char* text :
         {"", " 1", "1 ", "1,5", "1.5x", "nan", "inf", "-inf", "1e999", "0x10"}) {
        EXPECT_EQ(numberFromText(text), std::nullopt) << text;
    }
}

TEST(TextNumbers, ReadsLists) {
    EXPECT_EQ(numbersFromText("-90,0,1.5"), (std::vector<double>{-90.0, 0.0, 1.5}));
    EXPECT_EQ(numbersFromText("7"), (std::vector<double>{7.0}));
    EXPECT_EQ(numbersFromText("1,,2"), std::nullopt);
    EXPECT_EQ(numbersFromText("1,2,"), std::nullopt);
    EXPECT_EQ(numbersFromText(""), std::nullopt);
}

TEST(TextNumbers, FoldsNames) {
    EXPECT_EQ(foldedName("Room Selection"), "roomselection");
    EXPECT_EQ(foldedName("Gold_Hall-2"), "goldhall2");
}

}  // namespace
}  // namespace tessaly
