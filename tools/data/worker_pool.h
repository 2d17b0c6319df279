// Spreads independent pieces of work over the processor's cores.
#pragma once

#include <cstddef>
#include <functional>

namespace tessaly::data {

/// Calls `work(i)` once for each i below `count`, on up to one thread a core. Pieces must not share
/// what they write; each one's result then does not depend on the number of threads. Returns when
/// all are done.
/// @throws the exception of the lowest failing piece; pieces behind it may not have run
void forEachParallel(std::size_t count, const std::function<void(std::size_t)>& work);

}  // namespace tessaly::data
