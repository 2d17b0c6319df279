// The plain form of multiply-accumulate: separate scalar passes over one partition at a time.
#pragma once

#include <cstddef>

#include "convolution/complex_bin.h"

namespace tessaly::bench {

/// One ear over the ring: clears `sum`, then a product into `scratch` and an addition for each
/// partition. `bins` bins each; the arrays do not overlap.
void plainRingSum(std::size_t bins,
                  std::size_t partitions,
                  std::size_t newest,
                  const ComplexBin* const* ring,
                  const ComplexBin* const* parts,
                  ComplexBin* scratch,
                  ComplexBin* sum);

}  // namespace tessaly::bench
