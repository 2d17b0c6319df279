// What goes with the samples of an impulse response: what was written, and a gain of its end.
#pragma once

#include <algorithm>

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

/// The end of a response that stands in the buffers without its gain: its level may change without
/// a sample being written. Starts at a whole partition.
struct ScaledEnd {
    int begin = 0;      ///< samples from here on count `gain` times
    float gain = 1.0f;  ///< linear
};

/// What a convolver is told about a response beside its samples.
struct FirNotes {
    FirStretch written;   ///< since the convolver last took it
    ScaledEnd scaledEnd;  ///< as of now
};

}  // namespace tessaly
