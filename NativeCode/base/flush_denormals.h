// Flushes denormals to zero for the length of a scope and restores the caller's mode.
#pragma once

#include <cstdint>

#if defined(__SSE__) || defined(_M_X64) || (defined(_M_IX86_FP) && _M_IX86_FP >= 1)
#include <xmmintrin.h>
#define TESSALY_HAS_MXCSR 1
#endif

namespace tessaly {

/// A decaying filter must not make a silent block the slowest one: both effects' Process run
/// inside this scope. Block time.
class FlushDenormalsScope {
public:
#if defined(TESSALY_HAS_MXCSR)
    FlushDenormalsScope() noexcept : saved_(_mm_getcsr()) {
        constexpr unsigned int flushToZeroAndDenormalsAreZero = 0x8040u;
        _mm_setcsr(saved_ | flushToZeroAndDenormalsAreZero);
    }
    ~FlushDenormalsScope() { _mm_setcsr(saved_); }
#elif defined(__aarch64__)
    FlushDenormalsScope() noexcept {
        asm volatile("mrs %0, fpcr" : "=r"(saved_));
        constexpr std::uint64_t flushToZero = std::uint64_t{1} << 24;
        asm volatile("msr fpcr, %0" : : "r"(saved_ | flushToZero));
    }
    ~FlushDenormalsScope() { asm volatile("msr fpcr, %0" : : "r"(saved_)); }
#else
    FlushDenormalsScope() noexcept = default;
    ~FlushDenormalsScope() {}
#endif
    FlushDenormalsScope(const FlushDenormalsScope&) = delete;
    FlushDenormalsScope& operator=(const FlushDenormalsScope&) = delete;

private:
#if defined(TESSALY_HAS_MXCSR)
    unsigned int saved_ = 0;
#elif defined(__aarch64__)
    std::uint64_t saved_ = 0;
#endif
};

}  // namespace tessaly
