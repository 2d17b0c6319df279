// Looks through samples for silence.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>

namespace tessaly {

/// All samples are zero, of either sign. Stops soon after the first that is not. Block time.
inline bool allZero(const float* samples, std::size_t count) noexcept {
    constexpr std::size_t group = 64;
    constexpr std::uint32_t withoutSign = 0x7fffffffu;
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
