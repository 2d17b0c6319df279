// Tests of the zero-filled aligned array.
#include "base/aligned_array.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <complex>
#include <cstdint>
#include <utility>

namespace tessaly {
namespace {

TEST(AlignedArray, StartsOnACacheLineForEverySize) {
    for (const std::size_t size : {1u, 3u, 16u, 17u, 1000u, 4097u}) {
        const AlignedArray<float> floats(size);
        const AlignedArray<char> bytes(size);
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(floats.data()) % 64, 0u) << size;
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(bytes.data()) % 64, 0u) << size;
    }
}

TEST(AlignedArray, IsFilledWithZeros) {
    // Memory that was used before has to be cleared as well.
    for (int round = 0; round < 4; ++round) {
        AlignedArray<float> array(513);
        EXPECT_EQ(array.size(), 513u);
        EXPECT_TRUE(std::all_of(array.begin(), array.end(), [](float v) { return v == 0.0f; }));
        std::fill(array.begin(), array.end(), 3.0f);
    }
}

TEST(AlignedArray, ClearSetsEveryElementToZero) {
    AlignedArray<std::complex<float>> array(9);
    std::fill(array.begin(), array.end(), std::complex<float>(1.0f, 2.0f));
    array.clear();
    for (const std::complex<float> value : array) {
        EXPECT_EQ(value, std::complex<float>());
    }
}

TEST(AlignedArray, EmptyOnesOwnNothing) {
    AlignedArray<float> unset;
    AlignedArray<float> none(0);
    for (AlignedArray<float>* array : {&unset, &none}) {
        EXPECT_TRUE(array->empty());
        EXPECT_EQ(array->data(), nullptr);
        EXPECT_EQ(array->begin(), array->end());
        array->clear();
    }
}

TEST(AlignedArray, MovingHandsTheMemoryOver) {
    AlignedArray<int> first(5);
    first[4] = 7;
    const int* memory = first.data();

    AlignedArray<int> second(std::move(first));
    EXPECT_EQ(second.data(), memory);
    EXPECT_EQ(second[4], 7);
    EXPECT_TRUE(first.empty());  // NOLINT(bugprone-use-after-move): the empty state is stated

    AlignedArray<int> third(2);
    third = std::move(second);
    EXPECT_EQ(third.data(), memory);
    EXPECT_EQ(third.size(), 5u);
    EXPECT_EQ(second.data(), nullptr);  // NOLINT(bugprone-use-after-move)
}

TEST(AlignedArray, MovingOntoItselfKeepsTheElements) {
    AlignedArray<int> array(3);
    array[1] = 11;
    AlignedArray<int>& same = array;
    array = std::move(same);
    ASSERT_EQ(array.size(), 3u);
    EXPECT_EQ(array[1], 11);
}

}  // namespace
}  // namespace tessaly
