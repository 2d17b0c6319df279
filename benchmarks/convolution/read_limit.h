// Reading memory as fast as this processor can: what bounds a long multiply-accumulate.
#pragma once

#include <cstddef>

namespace tessaly::bench {

/// Reads `count` floats of each of three streams, side by side, with the widest vectors of this
/// processor. @return a value that depends on all of them; the numbers are not otherwise used
float readStreams(std::size_t count, const float* a, const float* b, const float* c);

}  // namespace tessaly::bench
