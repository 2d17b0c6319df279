// Memory on a 64-byte boundary: one cache line, one widest vector.
#pragma once

#include <cstddef>

namespace tessaly {

inline constexpr std::size_t memoryAlignment = 64;

/// `bytes` of zeros. Pages that come fresh from the system are zero already and are not touched
/// here, so that what is never used costs nothing. Load time: allocates.
/// @return null without memory; give it back with `releaseAligned`
void* allocateZeroed(std::size_t bytes) noexcept;

/// The same without a value, for what is written at once. Load time: allocates.
void* allocateForOverwrite(std::size_t bytes) noexcept;

/// Takes back what one of the two gave; null: nothing happens.
void releaseAligned(void* memory) noexcept;

}  // namespace tessaly
