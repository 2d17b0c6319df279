// The counting malloc family of NoAllocationScope, and the sanitizer's hooks where those rule.
#include "minihost/no_allocation_scope.h"

#include <cerrno>
#include <cstddef>
#include <cstdlib>

#if defined(__SANITIZE_ADDRESS__)
#define TESSALY_COUNT_BY_HOOKS 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define TESSALY_COUNT_BY_HOOKS 1
#endif
#endif
#ifndef TESSALY_COUNT_BY_HOOKS
#define TESSALY_COUNT_BY_HOOKS 0
#endif

namespace {

// Plain thread locals without construction: they must be usable inside the first malloc of a
// thread.
constinit thread_local int openScopes = 0;
constinit thread_local std::uint64_t allocationCount = 0;
constinit thread_local std::uint64_t releaseCount = 0;

void noteAllocation() noexcept {
    if (openScopes > 0) {
        ++allocationCount;
    }
}

void noteRelease() noexcept {
    if (openScopes > 0) {
        ++releaseCount;
    }
}

}  // namespace

#if TESSALY_COUNT_BY_HOOKS

// NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizer's name
extern "C" int __sanitizer_install_malloc_and_free_hooks(
    void (*mallocHook)(const volatile void*, std::size_t),
    void (*freeHook)(const volatile void*)) noexcept;

namespace {

void onMalloc(const volatile void* memory, std::size_t) {
    if (memory != nullptr) {
        noteAllocation();
    }
}

void onFree(const volatile void* memory) {
    if (memory != nullptr) {
        noteRelease();
    }
}

[[maybe_unused]] const int hooksInstalled =
    __sanitizer_install_malloc_and_free_hooks(onMalloc, onFree);

}  // namespace

#else

// The C library's own entries under the names it keeps for replacements of the malloc family.
// NOLINTBEGIN(bugprone-reserved-identifier)
extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* memory, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);
void __libc_free(void* memory);
}
// NOLINTEND(bugprone-reserved-identifier)

namespace {

void* countedMemalign(std::size_t alignment, std::size_t size) noexcept {
    void* memory = __libc_memalign(alignment, size);
    if (memory != nullptr) {
        noteAllocation();
    }
    return memory;
}

}  // namespace

// Visible, so that loaded libraries bind to them: the program comes first in their search order.
#define TESSALY_VISIBLE __attribute__((visibility("default")))

extern "C" {

TESSALY_VISIBLE void* malloc(std::size_t size) noexcept {
    void* memory = __libc_malloc(size);
    if (memory != nullptr) {
        noteAllocation();
    }
    return memory;
}

TESSALY_VISIBLE void* calloc(std::size_t count, std::size_t size) noexcept {
    void* memory = __libc_calloc(count, size);
    if (memory != nullptr) {
        noteAllocation();
    }
    return memory;
}

TESSALY_VISIBLE void* realloc(void* memory, std::size_t size) noexcept {
    const bool hadMemory = memory != nullptr;
    void* moved = __libc_realloc(memory, size);
    if (moved != nullptr) {
        noteAllocation();
    }
    if (hadMemory && (moved != nullptr || size == 0)) {
        noteRelease();
    }
    return moved;
}

TESSALY_VISIBLE void free(void* memory) noexcept {
    if (memory != nullptr) {
        noteRelease();
    }
    __libc_free(memory);
}

TESSALY_VISIBLE int posix_memalign(void** memory,
                                   std::size_t alignment,
                                   std::size_t size) noexcept {
    const bool powerOfTwo = alignment != 0 && (alignment & (alignment - 1)) == 0;
    if (!powerOfTwo || alignment % sizeof(void*) != 0) {
        return EINVAL;
    }
    void* aligned = countedMemalign(alignment, size);
    if (aligned == nullptr) {
        return ENOMEM;
    }
    *memory = aligned;
    return 0;
}

TESSALY_VISIBLE void* aligned_alloc(std::size_t alignment, std::size_t size) noexcept {
    return countedMemalign(alignment, size);
}

TESSALY_VISIBLE void* memalign(std::size_t alignment, std::size_t size) noexcept {
    return countedMemalign(alignment, size);
}

}  // extern "C"

#endif

namespace tessaly {

NoAllocationScope::NoAllocationScope() noexcept
    : allocationsBefore(allocationCount), releasesBefore(releaseCount) {
    ++openScopes;
}

NoAllocationScope::~NoAllocationScope() { --openScopes; }

std::uint64_t NoAllocationScope::allocations() const noexcept {
    return allocationCount - allocationsBefore;
}

std::uint64_t NoAllocationScope::releases() const noexcept { return releaseCount - releasesBefore; }

}  // namespace tessaly
