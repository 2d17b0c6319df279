// Work on the even slots of interleaved stereo, where the engine's mono signals stand.
#pragma once

#include <cstddef>

#include "base/audio_thread.h"

#if defined(__SSE2__) || defined(_M_X64)
#include <emmintrin.h>
#define TESSALY_HAS_SSE2 1
#endif

namespace tessaly {

// Four frames a step where the processor has the registers, then one by one, with the same results
// bit for bit. The odd slots of `out` stay as they are. `in` and `out` do not overlap. Block time.

namespace detail {

#if defined(TESSALY_HAS_SSE2)
inline __m128 evenOf(__m128 a, __m128 b) noexcept {
    return _mm_shuffle_ps(a, b, _MM_SHUFFLE(2, 0, 2, 0));
}
inline __m128 oddOf(__m128 a, __m128 b) noexcept {
    return _mm_shuffle_ps(a, b, _MM_SHUFFLE(3, 1, 3, 1));
}
inline void storeEven(float* out, __m128 even, __m128 odd) noexcept {
    _mm_storeu_ps(out, _mm_unpacklo_ps(even, odd));
    _mm_storeu_ps(out + 4, _mm_unpackhi_ps(even, odd));
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
#if defined(TESSALY_HAS_SSE2)
    const __m128 leftGain = _mm_set1_ps(left);
    const __m128 rightGain = _mm_set1_ps(right);
    for (; i + 4 <= frames; i += 4) {
        const __m128 a = _mm_loadu_ps(in + 2 * i);
        const __m128 b = _mm_loadu_ps(in + 2 * i + 4);
        const __m128 odd = detail::oddOf(_mm_loadu_ps(out + 2 * i), _mm_loadu_ps(out + 2 * i + 4));
        detail::storeEven(out + 2 * i,
                          _mm_add_ps(_mm_mul_ps(detail::evenOf(a, b), leftGain),
                                     _mm_mul_ps(detail::oddOf(a, b), rightGain)),
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
#if defined(TESSALY_HAS_SSE2)
    for (; i + 4 <= frames; i += 4) {
        const __m128 odd = detail::oddOf(_mm_loadu_ps(out + 2 * i), _mm_loadu_ps(out + 2 * i + 4));
        detail::storeEven(out + 2 * i, _mm_loadu_ps(in + i), odd);
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
#if defined(TESSALY_HAS_SSE2)
    const __m128 factor = _mm_set1_ps(gain);
    for (; i + 4 <= frames; i += 4) {
        const __m128 a = _mm_loadu_ps(in + 2 * i);
        const __m128 b = _mm_loadu_ps(in + 2 * i + 4);
        const __m128 c = _mm_loadu_ps(out + 2 * i);
        const __m128 d = _mm_loadu_ps(out + 2 * i + 4);
        const __m128 sum = _mm_add_ps(detail::evenOf(a, b), detail::oddOf(a, b));
        detail::storeEven(out + 2 * i, _mm_add_ps(detail::evenOf(c, d), _mm_mul_ps(sum, factor)),
                          detail::oddOf(c, d));
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
#if defined(TESSALY_HAS_SSE2)
    const __m128 factor = _mm_set1_ps(gain);
    for (; i + 4 <= frames; i += 4) {
        const __m128 c = _mm_loadu_ps(out + 2 * i);
        const __m128 d = _mm_loadu_ps(out + 2 * i + 4);
        const __m128 product = _mm_mul_ps(_mm_loadu_ps(in + i), factor);
        detail::storeEven(out + 2 * i, _mm_add_ps(detail::evenOf(c, d), product),
                          detail::oddOf(c, d));
    }
#endif
    for (; i < frames; ++i) {
        out[2 * i] += in[i] * gain;
    }
}

}  // namespace tessaly
