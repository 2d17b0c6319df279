// Conversions from floating point to integers that are defined for every input.
#pragma once

#include <cstdint>
#include <limits>

namespace tessaly {

/// Truncates toward zero. Values outside the range of int32 saturate; a NaN becomes 0.
/// Host values reach this unchecked, so every input has to be defined.
constexpr std::int32_t truncateToInt32(double value) noexcept {
    constexpr double upper = 2147483647.0;
    constexpr double lower = -2147483648.0;
    if (value != value) {
        return 0;
    }
    if (value >= upper) {
        return std::numeric_limits<std::int32_t>::max();
    }
    if (value <= lower) {
        return std::numeric_limits<std::int32_t>::min();
    }
    return static_cast<std::int32_t>(value);
}

/// As the double form; every float converts to double exactly.
constexpr std::int32_t truncateToInt32(float value) noexcept {
    return truncateToInt32(static_cast<double>(value));
}

/// Keeps the low 16 bits, as a store into a 16-bit field does.
constexpr std::int16_t wrapToInt16(std::int32_t value) noexcept {
    return static_cast<std::int16_t>(static_cast<std::uint16_t>(static_cast<std::uint32_t>(value)));
}

/// Truncates toward zero as truncateToInt32, then keeps the low 16 bits.
constexpr std::int16_t truncateToInt16(double value) noexcept {
    return wrapToInt16(truncateToInt32(value));
}

/// As the double form.
constexpr std::int16_t truncateToInt16(float value) noexcept {
    return truncateToInt16(static_cast<double>(value));
}

}  // namespace tessaly
