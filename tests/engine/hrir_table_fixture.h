// A direction table of the test's own, and helpers that compare composed responses.
#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <random>
#include <vector>

#include "resources/hrir_tables.h"

namespace tessaly::test {

/// Starts and ends with empty process-wide tables. Each entry is an allocation of exactly the
/// frames that the tables promise, so that a sanitizer sees every read beyond them.
class HrirTableTest : public ::testing::Test {
protected:
    HrirTableTest() { resetHrirTables(); }
    ~HrirTableTest() override { resetHrirTables(); }

    /// Puts noise below 0.5 into the cell of a direction. @return the stored pairs
    float* store(int indexPhi, int indexTheta) {
        HrirSlot entry = storeLoose();
        *filterTableCell(indexPhi, indexTheta) = entry;
        return *entry;
    }

    /// An entry that no cell of the table leads to.
    HrirSlot storeLoose() {
        constexpr std::size_t pairFloats = std::size_t{2} * hrirMaxLength;
        std::uniform_real_distribution<float> noise(-0.5f, 0.5f);
        auto& pairs = entries_.emplace_back(std::make_unique<float[]>(pairFloats));
        for (std::size_t i = 0; i < pairFloats; ++i) {
            pairs[i] = noise(random_);
        }
        return slots_.emplace_back(std::make_unique<float*>(pairs.get())).get();
    }

    std::mt19937 random_{17};

private:
    std::vector<std::unique_ptr<float[]>> entries_;
    std::vector<std::unique_ptr<float*>> slots_;
};

/// Both ears of a response, each on an allocation of its exact length.
struct Ears {
    explicit Ears(int frames, float value = 0.0f)
        : size(frames),
          left(std::make_unique<float[]>(static_cast<std::size_t>(frames))),
          right(std::make_unique<float[]>(static_cast<std::size_t>(frames))) {
        for (int i = 0; i < size; ++i) {
            at(0, i) = at(1, i) = value;
        }
    }
    /// @param ear  0 left, 1 right
    float& at(int ear, int i) { return (ear == 0 ? left : right)[static_cast<std::size_t>(i)]; }

    int size;
    std::unique_ptr<float[]> left;
    std::unique_ptr<float[]> right;
};

/// Frame i of a stored pair as an ear hears it: the left ear takes the second value.
inline float frameOf(const float* pairs, int ear, int i) {
    return pairs[2 * i + (ear == 0 ? 1 : 0)];
}

}  // namespace tessaly::test
