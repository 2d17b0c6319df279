// Adds stored stereo pairs into the two ears of a response.
#pragma once

#include <algorithm>
#include <cstddef>

#include "engine/biquad.h"

namespace tessaly {

/// The two ears of a response under composition, `size` floats each.
struct EarBuffers {
    float* left;
    float* right;
    int size;
};

/// Interleaved pairs with the values of one ear on the even, of the other on the odd slots.
struct EarPairs {
    const float* left;   ///< first left value; the next one is two floats further
    const float* right;  ///< first right value
    int frames;

    float leftAt(int frame) const noexcept { return left[std::ptrdiff_t{2} * frame]; }
    float rightAt(int frame) const noexcept { return right[std::ptrdiff_t{2} * frame]; }
};

/// Frames [begin, end) of a copy that land inside a buffer.
struct FrameRange {
    int begin;
    int end;
};

/// What remains of `frames` frames placed at `position`, which may lie before the buffer, of
/// `size` floats, or behind it.
constexpr FrameRange framesInside(int position, int frames, int size) noexcept {
    const int all = std::max(frames, 0);
    const int begin = std::clamp(-position, 0, all);
    return {begin, std::clamp(size - position, begin, all)};
}

/// Adds frame * gain from `position` on, single precision. Block time.
inline void addPairs(const EarBuffers& ears,
                     int position,
                     const EarPairs& pairs,
                     float gain) noexcept {
    const FrameRange range = framesInside(position, pairs.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        ears.left[position + i] += pairs.leftAt(i) * gain;
        ears.right[position + i] += pairs.rightAt(i) * gain;
    }
}

/// The linear fade at the end of a filtered copy: 1 - k * `step` for the k-th of the last
/// `frames` frames, k from 1.
struct EndFade {
    int frames;
    float step;

    /// @param i  one of the last frames of a copy of `length`
    float weightAt(int i, int length) const noexcept {
        return 1.0f - static_cast<float>(i - length + frames + 1) * step;
    }
};

/// Adds frame * gain through `filter` from `position` on, faded at its end. Each ear starts from
/// a filter at rest, and the filter is at rest afterwards; it runs over the frames that fall
/// before the buffer too. The two ears are independent and run side by side. Block time.
inline void addFilteredPairs(const EarBuffers& ears,
                             int position,
                             const EarPairs& pairs,
                             float gain,
                             Biquad& filter,
                             const EndFade& fade) noexcept {
    filter.clear();
    Biquad leftFilter = filter;
    Biquad rightFilter = filter;
    const FrameRange range = framesInside(position, pairs.frames, ears.size);
    for (int i = 0; i < range.begin; ++i) {
        leftFilter.process(pairs.leftAt(i) * gain);
        rightFilter.process(pairs.rightAt(i) * gain);
    }
    const int fadeBegin = std::clamp(pairs.frames - fade.frames, range.begin, range.end);
    for (int i = range.begin; i < fadeBegin; ++i) {
        ears.left[position + i] += leftFilter.process(pairs.leftAt(i) * gain);
        ears.right[position + i] += rightFilter.process(pairs.rightAt(i) * gain);
    }
    for (int i = fadeBegin; i < range.end; ++i) {
        const float weight = fade.weightAt(i, pairs.frames);
        ears.left[position + i] += leftFilter.process(pairs.leftAt(i) * gain) * weight;
        ears.right[position + i] += rightFilter.process(pairs.rightAt(i) * gain) * weight;
    }
}

}  // namespace tessaly
