// The two changes of floating precision, spelled out where the sound depends on them.
#pragma once

namespace tessaly {

/// Widens a single-precision value; the arithmetic that follows is in double precision.
constexpr double wide(float value) noexcept { return static_cast<double>(value); }

/// Rounds a double once to single precision, at the place where it is stored.
constexpr float single(double value) noexcept { return static_cast<float>(value); }

}  // namespace tessaly
