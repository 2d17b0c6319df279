// The constants of each transform length, made once a process and shared by all plans.
#pragma once

#include <cstdint>

#include "convolution/simd/kernels.h"

namespace tessaly {

/// Load time: the first request for a length allocates and computes, and may come from any thread.
/// What it makes stays until the process ends, since plans of any engine read it.
/// @param points  M, a power of two from 2 to 32768
/// @param lanes   1, 4, 8 or 16, with lanes * lanes <= points
/// @return null if there is no memory or no such table
const TransformTables* transformTables(std::int32_t points, std::int32_t lanes) noexcept;
/// Likewise, of the transform of blocks.
const BlockTables* blockTables(std::int32_t points, std::int32_t lanes) noexcept;

}  // namespace tessaly
