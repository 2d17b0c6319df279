// Copies between interleaved buffers whose channel counts need not agree.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstring>

#include "base/audio_thread.h"

namespace tessaly {

/// Floats in a buffer of `frames` frames; a negative channel count holds none.
constexpr std::size_t floatsIn(std::size_t frames, int channels) noexcept {
    return channels > 0 ? frames * static_cast<std::size_t>(channels) : 0;
}

/// Copies `wanted` floats as they lie, whatever the channels mean; where the input ends earlier
/// the rest becomes zero. Block time.
/// @param in         `available` floats; null: counts as none
/// @param out        `wanted` floats; null: nothing happens; may be the input
inline void copyOrZero(const float* in,
                       std::size_t available,
                       float* out,
                       std::size_t wanted) noexcept TESSALY_NONBLOCKING {
    if (out == nullptr) {
        return;
    }
    const std::size_t copied = in == nullptr ? 0 : std::min(available, wanted);
    if (copied > 0) {
        std::memmove(out, in, copied * sizeof(float));
    }
    std::fill(out + copied, out + wanted, 0.0f);
}

}  // namespace tessaly
