// Blends two responses after aligning their onsets, so that the interaural delay glides.
#pragma once

#include <array>
#include <cstdint>

#include "base/aligned_array.h"
#include "base/audio_thread.h"

namespace tessaly {

/// Index of the largest signed value among the first 100; ties go to the earliest. Block time.
/// @param count  floats behind `buffer`; fewer than 100 are scanned if it is shorter
std::int16_t findPeakIndex(const float* buffer, int count) noexcept;

class FirInterpolation {
public:
    /// Load time: allocates the four buffers.
    void prepare(int firBufferSize);

    /// Writes the first stretch of `filterLeft` and `filterRight` from the two buffer pairs; what
    /// lies behind stays. Reads outside a buffer count as 0, writes outside are dropped.
    /// Block time.
    /// @param filterUpdatePending  find the peaks anew
    /// @param interpAngleOffset    degrees from the old grid point
    void interpolateFIR(float* filterLeft,
                        float* filterRight,
                        int firBufferSize,
                        int hrirLength,
                        bool filterUpdatePending,
                        float interpAngleOffset) noexcept TESSALY_NONBLOCKING;

    std::array<AlignedArray<float>, 2> interpFilterLeft;
    std::array<AlignedArray<float>, 2> interpFilterRight;
    std::int16_t interpFilterNew = 0;  ///< 0 or 1: the current buffer
    std::int16_t interpFilterOld = 0;  ///< 0 or 1: the one before
    std::array<std::int16_t, 2> peakLeft{};
    std::array<std::int16_t, 2> peakRight{};
    std::int16_t peakShiftLeft = 0;
    std::int16_t peakShiftRight = 0;
    std::int16_t alignShiftLeft = 0;
    std::int16_t alignShiftRight = 0;
    std::int16_t peakShiftMaxLeft = 0;
    std::int16_t peakShiftMaxRight = 0;
    float interpFraction = 0.0f;
    float interpWeightNew = 0.0f;
    float interpWeightOld = 1.0f;
};

}  // namespace tessaly
