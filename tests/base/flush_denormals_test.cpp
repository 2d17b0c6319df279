// Tests of the scope that turns denormal numbers to zero.
#include "base/flush_denormals.h"

#include <gtest/gtest.h>

#include <limits>

namespace tessaly {
namespace {

/// Half of the smallest normal number, worked out at run time.
float halvedSmallest() {
    volatile float smallest = std::numeric_limits<float>::min();
    volatile float half = 0.5f;
    return smallest * half;
}

/// A denormal operand, doubled.
float doubledDenormal() {
    volatile float denormal = std::numeric_limits<float>::denorm_min() * 1024.0f;
    volatile float two = 2.0f;
    return denormal * two;
}

#if defined(__SSE__) || defined(__aarch64__)
TEST(FlushDenormalsScope, TurnsDenormalResultsAndOperandsToZero) {
    const FlushDenormalsScope scope;
    EXPECT_EQ(halvedSmallest(), 0.0f);
    EXPECT_EQ(doubledDenormal(), 0.0f);
}
#endif

TEST(FlushDenormalsScope, GivesTheCallersModeBack) {
    const float before = halvedSmallest();
    ASSERT_GT(before, 0.0f);
    { const FlushDenormalsScope scope; }
    EXPECT_EQ(halvedSmallest(), before);
    EXPECT_GT(doubledDenormal(), 0.0f);
}

#if defined(__SSE__)
TEST(FlushDenormalsScope, KeepsAModeThatWasOnBefore) {
    const unsigned int callersMode = _mm_getcsr();
    _mm_setcsr(callersMode | 0x8040u);
    { const FlushDenormalsScope scope; }
    const unsigned int modeAfter = _mm_getcsr();
    _mm_setcsr(callersMode);
    EXPECT_EQ(modeAfter & 0x8040u, 0x8040u);
}

TEST(FlushDenormalsScope, LeavesTheRoundingModeAlone) {
    const unsigned int before = _mm_getcsr();
    const FlushDenormalsScope scope;
    EXPECT_EQ(_mm_getcsr() & 0x6000u, before & 0x6000u);
}
#endif

TEST(FlushDenormalsScope, CanBeNested) {
    const float before = halvedSmallest();
    {
        const FlushDenormalsScope outer;
        { const FlushDenormalsScope inner; }
#if defined(__SSE__) || defined(__aarch64__)
        EXPECT_EQ(halvedSmallest(), 0.0f);
#endif
    }
    EXPECT_EQ(halvedSmallest(), before);
}

}  // namespace
}  // namespace tessaly
