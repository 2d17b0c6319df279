// Tells blocks of nothing but zeros, which most of a game's sources play most of the time.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/audio_thread.h"

namespace tessaly {

namespace detail {

/// The bits of `Count` floats, a multiple of 8, or'ed in pairs.
template <std::size_t Count>
std::uint64_t anyBits(const float* samples) noexcept TESSALY_NONBLOCKING {
#if defined(__GNUC__)
    using Bits = std::uint64_t __attribute__((vector_size(16)));
    const auto at = [samples](std::size_t k) noexcept {
        Bits next;
        std::memcpy(&next, samples + k, sizeof next);
        return next;
    };
    Bits first = at(0);
    Bits second = at(4);
    _Pragma("GCC unroll 8") for (std::size_t k = 8; k < Count; k += 8) {
        first |= at(k);
        second |= at(k + 4);
    }
    first |= second;
    return first[0] | first[1];
#else
    std::uint64_t any = 0;
    for (std::size_t k = 0; k < Count; k += 2) {
        std::uint64_t next = 0;
        std::memcpy(&next, samples + k, sizeof next);
        any |= next;
    }
    return any;
#endif
}

}  // namespace detail

/// All samples are zero, of either sign. Stops soon after the first that is not. Block time.
inline bool allZero(const float* samples, std::size_t count) noexcept TESSALY_NONBLOCKING {
    constexpr std::size_t group = 64;
    constexpr std::uint64_t withoutSigns = 0x7fffffff7fffffffu;
    std::size_t i = 0;
    for (; i + group <= count; i += group) {
        if ((detail::anyBits<group>(samples + i) & withoutSigns) != 0) {
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
