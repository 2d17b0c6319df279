// Transforms kept from one use to the next.
#pragma once

#include "data/fft.h"

namespace tessaly::data {

/// The calling thread's own transform of a length: tables are costly, so they are kept until the
/// thread ends.
RealTransform& threadTransform(std::size_t length);

}  // namespace tessaly::data
