// Tells blocks of nothing but zeros, which most of a game's sources play most of the time.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/audio_thread.h"

namespace tessaly {

/// True if every value is a zero without sign. A block of sound is left at its first value that is
/// none, so the question costs next to nothing there. Block time.
/// @param samples  `count` floats; may be null for a count of 0
inline bool isSilent(const float* samples, std::size_t count) noexcept TESSALY_NONBLOCKING {
    if (count == 0) {
        return true;
    }
    std::uint32_t first = 0;
    std::memcpy(&first, samples, sizeof first);
    // All are zero if the first one is and each of the others equals the one before it.
    return first == 0 && std::memcmp(samples, samples + 1, (count - 1) * sizeof(float)) == 0;
}

/// All samples are zero, of either sign. Stops soon after the first that is not. Block time.
inline bool allZero(const float* samples, std::size_t count) noexcept TESSALY_NONBLOCKING {
    constexpr std::size_t group = 64;
    constexpr std::uint32_t withoutSign = 0x7fffffffu;
    if (isSilent(samples, count)) {
        return true;
    }
    std::size_t i = 0;
    for (; i + group <= count; i += group) {
        std::uint32_t bits = 0;
        for (std::size_t k = 0; k < group; ++k) {
            bits |= std::bit_cast<std::uint32_t>(samples[i + k]);
        }
        if ((bits & withoutSign) != 0) {
            return false;
        }
    }
    for (; i < count; ++i) {
        if (samples[i] != 0.0f) {
            return false;
        }
    }
    return true;
}

}  // namespace tessaly
