// Memory on a 64-byte boundary.
#include "base/aligned_memory.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>

namespace tessaly {

namespace {

/// Room to move the start up to the boundary, with the address to release in front of it. The
/// aligned allocations of the standard library give no zeroed memory.
constexpr std::size_t slack = memoryAlignment + sizeof(void*);

bool fits(std::size_t bytes) noexcept {
    return bytes <= std::numeric_limits<std::size_t>::max() - slack;
}

void* align(void* allocated) noexcept {
    if (allocated == nullptr) {
        return nullptr;
    }
    auto* const bytes = static_cast<unsigned char*>(allocated);
    const auto first = reinterpret_cast<std::uintptr_t>(bytes) + sizeof(void*);
    const std::size_t up = (memoryAlignment - first % memoryAlignment) % memoryAlignment;
    unsigned char* const memory = bytes + sizeof(void*) + up;
    std::memcpy(memory - sizeof(void*), &allocated, sizeof(void*));
    return memory;
}

}  // namespace

void* allocateZeroed(std::size_t bytes) noexcept {
    return fits(bytes) ? align(std::calloc(bytes + slack, 1)) : nullptr;
}

void* allocateForOverwrite(std::size_t bytes) noexcept {
    return fits(bytes) ? align(std::malloc(bytes + slack)) : nullptr;
}

void releaseAligned(void* memory) noexcept {
    if (memory != nullptr) {
        void* allocated = nullptr;
        std::memcpy(&allocated, static_cast<unsigned char*>(memory) - sizeof(void*), sizeof(void*));
        std::free(allocated);
    }
}

}  // namespace tessaly
