// What a convolver is told about a response.
#include "convolution/fir_notes.h"

#include <gtest/gtest.h>

namespace tessaly::test {
namespace {

TEST(FirNotes, AtFirstAnythingMaySound) {
    const FirNotes notes;
    EXPECT_EQ(notes.soundingParts(0, 1024), ~std::uint64_t{0});
    EXPECT_EQ(notes.soundingParts(1 << 20, 16), ~std::uint64_t{0});
    EXPECT_TRUE(notes.written.empty());
}

TEST(FirNotes, TellPartsOfAPartitionInWhichAStretchLies) {
    FirNotes notes;
    notes.sounding.clear();
    EXPECT_EQ(notes.soundingParts(0, 1024), 0u);
    notes.sounding.include(1024, 1025);
    EXPECT_EQ(notes.soundingParts(0, 1024), 0u);
    EXPECT_EQ(notes.soundingParts(1024, 1024), 1u);
    notes.sounding.include(1024 + 15, 1024 + 17);  // the last of part 0, the first of part 1
    EXPECT_EQ(notes.soundingParts(1024, 1024), 3u);
    notes.sounding.include(2047, 2100);
    EXPECT_EQ(notes.soundingParts(1024, 1024), 3u | std::uint64_t{1} << 63);
    EXPECT_EQ(notes.soundingParts(2048, 1024), 0xfu) << "52 samples of 16";
    notes.sounding.include(-50, 5000);
    EXPECT_EQ(notes.soundingParts(0, 1024), ~std::uint64_t{0});
    EXPECT_EQ(notes.soundingParts(4096, 1024), (std::uint64_t{1} << 57) - 1) << "904 of 16";
    EXPECT_EQ(notes.soundingParts(5000, 1024), 0u);
}

TEST(FirNotes, PartsOfShortPartitionsAreLessThanASample) {
    FirNotes notes;
    notes.sounding.clear();
    notes.sounding.include(17, 18);
    EXPECT_EQ(notes.soundingParts(16, 16), std::uint64_t{0xf} << 4);
    EXPECT_EQ(notes.soundingParts(0, 16), 0u);
    EXPECT_EQ(notes.soundingParts(17, 1), ~std::uint64_t{0});
}

TEST(FirStretches, BecomeOneWhereTheyTouch) {
    FirStretches stretches;
    stretches.include(10, 20);
    stretches.include(30, 40);
    stretches.include(5, 5);
    EXPECT_EQ(stretches.end() - stretches.begin(), 2);
    stretches.include(20, 30);
    ASSERT_EQ(stretches.end() - stretches.begin(), 1);
    EXPECT_EQ(stretches.hull().begin, 10);
    EXPECT_EQ(stretches.hull().end, 40);
}

TEST(FirStretches, BeyondTheirNumberHoldMoreThanTheyWereTold) {
    FirStretches stretches;
    const int many = 3 * static_cast<int>(FirStretches::capacity);
    for (int k = 0; k < many; ++k) {
        stretches.include(10 * k, 10 * k + 1);
    }
    EXPECT_LE(stretches.end() - stretches.begin(),
              static_cast<std::ptrdiff_t>(FirStretches::capacity));
    for (int k = 0; k < many; ++k) {
        bool held = false;
        for (const FirStretch& stretch : stretches) {
            held = held || (stretch.begin <= 10 * k && 10 * k < stretch.end);
        }
        EXPECT_TRUE(held) << k;
    }
}

}  // namespace
}  // namespace tessaly::test
