// Reading memory as fast as this processor can, in a version for each vector width.
#include "convolution/read_limit.h"

namespace tessaly::bench {

namespace {

using Reader = float (*)(std::size_t, const float*, const float*, const float*);

// Unaligned, and allowed to look at floats.
typedef float Float4 __attribute__((vector_size(16), aligned(4), may_alias));

// A macro, since a function template that is inlined would be compiled for the plain processor
// before it becomes part of a wide function. Two independent sums a stream hide the addition's
// latency; it adds at a higher rate than it loads.
#define TESSALY_READER(name, Vector)                                                  \
    float name(std::size_t count, const float* a, const float* b, const float* c) {   \
        constexpr std::size_t lanes = sizeof(Vector) / sizeof(float);                 \
        Vector sum[6] = {};                                                           \
        std::size_t i = 0;                                                            \
        for (; i + 2 * lanes <= count; i += 2 * lanes) {                              \
            sum[0] += *reinterpret_cast<const Vector*>(a + i);                        \
            sum[1] += *reinterpret_cast<const Vector*>(b + i);                        \
            sum[2] += *reinterpret_cast<const Vector*>(c + i);                        \
            sum[3] += *reinterpret_cast<const Vector*>(a + i + lanes);                \
            sum[4] += *reinterpret_cast<const Vector*>(b + i + lanes);                \
            sum[5] += *reinterpret_cast<const Vector*>(c + i + lanes);                \
        }                                                                             \
        const Vector all = (sum[0] + sum[1]) + (sum[2] + sum[3]) + (sum[4] + sum[5]); \
        float total = 0.0f;                                                           \
        for (std::size_t k = 0; k < lanes; ++k) {                                     \
            total += all[k];                                                          \
        }                                                                             \
        for (; i < count; ++i) {                                                      \
            total += a[i] + b[i] + c[i];                                              \
        }                                                                             \
        return total;                                                                 \
    }

TESSALY_READER(read4, Float4)

#if defined(__x86_64__) || defined(__i386__)

typedef float Float8 __attribute__((vector_size(32), aligned(4), may_alias));
typedef float Float16 __attribute__((vector_size(64), aligned(4), may_alias));

__attribute__((target("avx2"))) TESSALY_READER(read8, Float8) __attribute__((target("avx512f")))
TESSALY_READER(read16, Float16)

    Reader widestReader() {
    if (__builtin_cpu_supports("avx512f")) {
        return read16;
    }
    return __builtin_cpu_supports("avx2") ? read8 : read4;
}

#else

Reader widestReader() { return read4; }

#endif

#undef TESSALY_READER

}  // namespace

float readStreams(std::size_t count, const float* a, const float* b, const float* c) {
    static const Reader reader = widestReader();
    return reader(count, a, b, c);
}

}  // namespace tessaly::bench
