// Tests of the zero-filled aligned array.
#include "base/aligned_array.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <complex>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <new>
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

TEST(AlignedArray, LargeOnesAreZeroToo) {
    constexpr std::size_t size = (std::size_t{1} << 18) + 3;
    for (int round = 0; round < 3; ++round) {
        AlignedArray<float> array(size);
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(array.data()) % 64, 0u);
        EXPECT_EQ(std::count(array.begin(), array.end(), 0.0f), static_cast<std::ptrdiff_t>(size));
        std::fill(array.begin(), array.end(), 3.0f);
    }
}

TEST(AlignedArray, MayComeWithoutValues) {
    for (const std::size_t size : {1u, 17u, 4097u, 1u << 18}) {
        AlignedArray<float> array(size, forOverwrite);
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(array.data()) % 64, 0u) << size;
        EXPECT_EQ(array.size(), size);
        std::fill(array.begin(), array.end(), 3.0f);
        EXPECT_EQ(array[size - 1], 3.0f);
    }
    const AlignedArray<float> none(0, forOverwrite);
    EXPECT_EQ(none.data(), nullptr);
}

TEST(AlignedArray, MissingMemoryThrows) {
    // Refused before the system is asked: with the room for alignment the sum would wrap.
    constexpr std::size_t most = std::numeric_limits<std::size_t>::max();
    for (const std::size_t size : {most - 64, most - 8, most}) {
        EXPECT_THROW(AlignedArray<char>{size}, std::bad_alloc) << size;
        EXPECT_THROW((AlignedArray<char>{size, forOverwrite}), std::bad_alloc) << size;
    }
    EXPECT_EQ(allocateZeroed(most), nullptr);
    EXPECT_EQ(allocateForOverwrite(most), nullptr);
    releaseAligned(nullptr);
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
