// A value that is never destroyed, for what other threads may use until the process ends.
#pragma once

namespace tessaly {

/// Holds a T that is made at start-up and has no end: at exit the host's mixer thread may still be
/// in a block, and must not find tables and buffers released under it.
template <typename T>
class ProcessLifetime {
public:
    constexpr ProcessLifetime() : value_() {}
    constexpr ~ProcessLifetime() {}  // NOLINT(modernize-use-equals-default): leaves the T alone
    ProcessLifetime(const ProcessLifetime&) = delete;
    ProcessLifetime& operator=(const ProcessLifetime&) = delete;

    T& operator*() noexcept { return value_; }
    T* operator->() noexcept { return &value_; }

private:
    union {
        T value_;
    };
};

}  // namespace tessaly
