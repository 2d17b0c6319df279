// Work on the even slots of interleaved stereo, where the engine's mono signals stand.
#pragma once

#include <cstddef>
#include <cstring>

#include "base/audio_thread.h"

#if (defined(__SSE2__) || defined(__ARM_NEON)) && defined(__has_builtin)
#if __has_builtin(__builtin_shufflevector)
#define TESSALY_HAS_SHUFFLES 1
#endif
#endif

namespace tessaly {

// Four frames a step where compiler and processor have vectors, then one by one, with the same
// results bit for bit. The odd slots of `out` stay as they are. `in` and `out` do not overlap.
// Block time.

namespace detail {

#if defined(TESSALY_HAS_SHUFFLES)
using FourFloats = float __attribute__((vector_size(16)));

inline FourFloats load(const float* p) noexcept {
    FourFloats values;
    std::memcpy(&values, p, sizeof values);
    return values;
}
inline void store(float* p, FourFloats values) noexcept { std::memcpy(p, &values, sizeof values); }
inline FourFloats evenOf(FourFloats a, FourFloats b) noexcept {
    return __builtin_shufflevector(a, b, 0, 2, 4, 6);
}
inline FourFloats oddOf(FourFloats a, FourFloats b) noexcept {
    return __builtin_shufflevector(a, b, 1, 3, 5, 7);
}
inline void storeEven(float* out, FourFloats even, FourFloats odd) noexcept {
    store(out, __builtin_shufflevector(even, odd, 0, 4, 1, 5));
    store(out + 4, __builtin_shufflevector(even, odd, 2, 6, 3, 7));
}
#endif

}  // namespace detail

/// out[2i] = in[2i] * left + in[2i + 1] * right
inline void blendToEven(const float* in,
                        std::size_t frames,
                        float left,
                        float right,
                        float* out) noexcept TESSALY_NONBLOCKING {
    std::size_t i = 0;
#if defined(TESSALY_HAS_SHUFFLES)
    for (; i + 4 <= frames; i += 4) {
        const detail::FourFloats a = detail::load(in + 2 * i);
        const detail::FourFloats b = detail::load(in + 2 * i + 4);
        const detail::FourFloats odd =
            detail::oddOf(detail::load(out + 2 * i), detail::load(out + 2 * i + 4));
        detail::storeEven(out + 2 * i, detail::evenOf(a, b) * left + detail::oddOf(a, b) * right,
                          odd);
    }
#endif
    for (; i < frames; ++i) {
        out[2 * i] = in[2 * i] * left + in[2 * i + 1] * right;
    }
}

/// out[2i] = in[i]
inline void spreadToEven(const float* in,
                         std::size_t frames,
                         float* out) noexcept TESSALY_NONBLOCKING {
    std::size_t i = 0;
#if defined(TESSALY_HAS_SHUFFLES)
    for (; i + 4 <= frames; i += 4) {
        const detail::FourFloats odd =
            detail::oddOf(detail::load(out + 2 * i), detail::load(out + 2 * i + 4));
        detail::storeEven(out + 2 * i, detail::load(in + i), odd);
    }
#endif
    for (; i < frames; ++i) {
        out[2 * i] = in[i];
    }
}

/// out[2i] += (in[2i] + in[2i + 1]) * gain
inline void addSumsToEven(const float* in,
                          std::size_t frames,
                          float gain,
                          float* out) noexcept TESSALY_NONBLOCKING {
    std::size_t i = 0;
#if defined(TESSALY_HAS_SHUFFLES)
    for (; i + 4 <= frames; i += 4) {
        const detail::FourFloats a = detail::load(in + 2 * i);
        const detail::FourFloats b = detail::load(in + 2 * i + 4);
        const detail::FourFloats c = detail::load(out + 2 * i);
        const detail::FourFloats d = detail::load(out + 2 * i + 4);
        const detail::FourFloats sum = detail::evenOf(a, b) + detail::oddOf(a, b);
        detail::storeEven(out + 2 * i, detail::evenOf(c, d) + sum * gain, detail::oddOf(c, d));
    }
#endif
    for (; i < frames; ++i) {
        out[2 * i] += (in[2 * i] + in[2 * i + 1]) * gain;
    }
}

/// out[2i] += in[i] * gain
inline void addToEven(const float* in,
                      std::size_t frames,
                      float gain,
                      float* out) noexcept TESSALY_NONBLOCKING {
    std::size_t i = 0;
#if defined(TESSALY_HAS_SHUFFLES)
    for (; i + 4 <= frames; i += 4) {
        const detail::FourFloats c = detail::load(out + 2 * i);
        const detail::FourFloats d = detail::load(out + 2 * i + 4);
        const detail::FourFloats product = detail::load(in + i) * gain;
        detail::storeEven(out + 2 * i, detail::evenOf(c, d) + product, detail::oddOf(c, d));
    }
#endif
    for (; i < frames; ++i) {
        out[2 * i] += in[i] * gain;
    }
}

}  // namespace tessaly
