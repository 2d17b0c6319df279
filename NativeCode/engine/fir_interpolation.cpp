// Onset alignment and blend of two responses.
#include "engine/fir_interpolation.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/numeric_conversion.h"

namespace tessaly {

namespace {

constexpr int peakSearchLength = 100;   // frames
constexpr float perGridStep = 0.2f;     // 1/degree, 1 / 5
constexpr float shiftRounding = 0.55f;  // not 0.5: shifts lean away from zero

std::int16_t alignShiftOf(std::int16_t peakShift, float fraction) noexcept {
    const float shift = static_cast<float>(peakShift) * fraction;
    return truncateToInt16(shift < 0.0f ? shift - shiftRounding : shift + shiftRounding);
}

/// One ear of the blend.
struct EarBlend {
    const float* fresh;  ///< response of the current buffer, read from `peakShift` on
    const float* former;
    int size;  ///< floats behind each of the two and behind the target
    int peakShift;
    int alignShift;
    float weightNew;
    float weightOld;

    void run(float* target, int count) const noexcept {
        const int first = std::max(0, -alignShift);
        const int last = std::min(count, size - alignShift);
        // All three indices are inside between these two.
        const int innerFirst = std::clamp(-peakShift, first, std::max(first, last));
        const int innerLast =
            std::clamp(std::min(size, size - peakShift), innerFirst, std::max(innerFirst, last));
        for (int i = first; i < innerFirst; ++i) {
            target[alignShift + i] = edge(i);
        }
        for (int i = innerFirst; i < innerLast; ++i) {
            target[alignShift + i] = fresh[peakShift + i] * weightNew + former[i] * weightOld;
        }
        for (int i = innerLast; i < last; ++i) {
            target[alignShift + i] = edge(i);
        }
    }

    /// The same sum where one of the reads may lie outside its buffer and counts as 0.
    float edge(int i) const noexcept {
        const int from = peakShift + i;
        const float a = from >= 0 && from < size ? fresh[from] : 0.0f;
        const float b = i < size ? former[i] : 0.0f;
        return a * weightNew + b * weightOld;
    }
};

}  // namespace

std::int16_t findPeakIndex(const float* buffer, int count) noexcept {
    int best = 0;
    const int end = std::min(count, peakSearchLength);
    // Signed values on purpose: a negative main peak is not seen.
    for (int i = 1; i < end; ++i) {
        if (buffer[i] > buffer[best]) {
            best = i;
        }
    }
    return static_cast<std::int16_t>(best);
}

void FirInterpolation::prepare(int firBufferSize) {
    for (std::size_t k = 0; k < interpFilterLeft.size(); ++k) {
        interpFilterLeft[k] = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
        interpFilterRight[k] = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
    }
    interpFilterNew = 0;
    interpFilterOld = 0;
    interpWeightNew = 0.0f;
    interpWeightOld = 1.0f;
    peakShiftMaxLeft = 0;
    peakShiftMaxRight = 0;
}

void FirInterpolation::interpolateFIR(float* filterLeft,
                                      float* filterRight,
                                      int firBufferSize,
                                      int hrirLength,
                                      bool filterUpdatePending,
                                      float interpAngleOffset) noexcept {
    const int size = std::min(firBufferSize, static_cast<int>(interpFilterLeft[0].size()));
    const std::size_t fresh = interpFilterNew != 0 ? 1 : 0;
    const std::size_t former = interpFilterOld != 0 ? 1 : 0;

    if (filterUpdatePending) {
        for (std::size_t k = 0; k < peakLeft.size(); ++k) {
            peakLeft[k] = findPeakIndex(interpFilterLeft[k].data(), size);
            peakRight[k] = findPeakIndex(interpFilterRight[k].data(), size);
        }
        peakShiftLeft = wrapToInt16(peakLeft[fresh] - peakLeft[former]);
        peakShiftRight = wrapToInt16(peakRight[fresh] - peakRight[former]);
        peakShiftMaxLeft = std::max(peakShiftMaxLeft, peakShiftLeft);
        peakShiftMaxRight = std::max(peakShiftMaxRight, peakShiftRight);
    }

    interpFraction = std::fabs(interpAngleOffset * perGridStep);
    interpWeightNew = interpFraction;
    interpWeightOld = 1.0f - interpFraction;
    alignShiftLeft = alignShiftOf(peakShiftLeft, interpFraction);
    alignShiftRight = alignShiftOf(peakShiftRight, interpFraction);

    // The left ear's shift sets the length for both ears.
    const int count = std::abs(int{peakShiftLeft}) + hrirLength;
    EarBlend{interpFilterLeft[fresh].data(),
             interpFilterLeft[former].data(),
             size,
             peakShiftLeft,
             alignShiftLeft,
             interpWeightNew,
             interpWeightOld}
        .run(filterLeft, count);
    EarBlend{interpFilterRight[fresh].data(),
             interpFilterRight[former].data(),
             size,
             peakShiftRight,
             alignShiftRight,
             interpWeightNew,
             interpWeightOld}
        .run(filterRight, count);
}

}  // namespace tessaly
