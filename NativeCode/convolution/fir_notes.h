// What goes with the samples of an impulse response: what was written, and a gain of its end.
#pragma once

#include <algorithm>
#include <array>
#include <climits>
#include <cstddef>
#include <cstdint>

namespace tessaly {

/// Samples [begin, end) of an impulse response. Empty where end is not above begin.
struct FirStretch {
    int begin = 0;
    int end = 0;

    bool empty() const noexcept { return begin >= end; }
    void clear() noexcept { begin = end = 0; }
    /// Grows to hold [from, to) too.
    void include(int from, int to) noexcept {
        if (from >= to) {
            return;
        }
        begin = empty() ? from : std::min(begin, from);
        end = empty() ? to : std::max(end, to);
    }
};

/// Stretches of an impulse response, apart from each other, in no order.
class FirStretches {
public:
    static constexpr std::size_t capacity = 64;

    bool empty() const noexcept { return count_ == 0; }
    void clear() noexcept { count_ = 0; }
    const FirStretch* begin() const noexcept { return stretches_.data(); }
    const FirStretch* end() const noexcept { return stretches_.data() + count_; }
    /// Holds [from, to) too from now on. What touches becomes one; beyond the capacity the last
    /// one grows over what lies between.
    void include(int from, int to) noexcept {
        if (from >= to) {
            return;
        }
        FirStretch added{from, to};
        for (std::size_t k = 0; k < count_;) {
            const FirStretch& other = stretches_[k];
            if (other.begin <= added.end && added.begin <= other.end) {
                added.include(other.begin, other.end);
                stretches_[k] = stretches_[--count_];
                k = 0;
            } else {
                ++k;
            }
        }
        if (count_ == capacity) {
            const FirStretch last = stretches_[--count_];
            added.include(last.begin, last.end);
            include(added.begin, added.end);
            return;
        }
        stretches_[count_++] = added;
    }
    /// From the first sample to the last one.
    FirStretch hull() const noexcept {
        FirStretch all;
        for (const FirStretch& stretch : *this) {
            all.include(stretch.begin, stretch.end);
        }
        return all;
    }

private:
    std::array<FirStretch, capacity> stretches_{};
    std::size_t count_ = 0;
};

/// The end of a response that stands in the buffers without its gain: its level may change without
/// a sample being written. Starts at a whole partition.
struct ScaledEnd {
    int begin = 0;      ///< samples from here on count `gain` times
    float gain = 1.0f;  ///< linear
};

/// What a convolver is told about a response beside its samples.
struct FirNotes {
    static FirStretches everything() noexcept {
        FirStretches all;
        all.include(0, INT_MAX);
        return all;
    }
    /// Parts [k, k + 1) / 64 of samples [begin, begin + length) that may hold something else than
    /// zeros, at bit k. `length` is at least 1.
    std::uint64_t soundingParts(std::int64_t begin, std::int64_t length) const noexcept {
        std::uint64_t parts = 0;
        for (const FirStretch& stretch : sounding) {
            const std::int64_t first = std::max<std::int64_t>(stretch.begin - begin, 0);
            const std::int64_t last = std::min<std::int64_t>(stretch.end - begin, length) - 1;
            if (first <= last) {
                const auto from = static_cast<int>(first * 64 / length);
                const auto to = static_cast<int>(((last + 1) * 64 - 1) / length);
                parts |= (~std::uint64_t{0} << from) & (~std::uint64_t{0} >> (63 - to));
            }
        }
        return parts;
    }

    FirStretches written;  ///< since the convolver last took them
    /// Outside of these the response is zeros.
    FirStretches sounding = everything();
    ScaledEnd scaledEnd;  ///< as of now
};

}  // namespace tessaly
