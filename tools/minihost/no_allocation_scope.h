// Counts what the calling thread allocates and frees, in this program and in every library it
// loaded.
#pragma once

#include <cstdint>

namespace tessaly {

/// While one is alive, every allocation and release of the calling thread is counted, whichever
/// library makes it and whichever C++ runtime it carries: the program's own malloc family stands
/// before the C library's. Under the address sanitizer its hooks count instead. Other threads are
/// not counted. Scopes may be nested; each sees what happened since it began.
class NoAllocationScope {
public:
    NoAllocationScope() noexcept;
    ~NoAllocationScope();
    NoAllocationScope(const NoAllocationScope&) = delete;
    NoAllocationScope& operator=(const NoAllocationScope&) = delete;

    /// Allocations of this thread since the scope began; a successful realloc counts as one.
    std::uint64_t allocations() const noexcept;

    /// Releases of this thread since the scope began; freeing a null pointer is none.
    std::uint64_t releases() const noexcept;

private:
    std::uint64_t allocationsBefore;
    std::uint64_t releasesBefore;
};

}  // namespace tessaly
