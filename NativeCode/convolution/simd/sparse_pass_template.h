// The first pass of a block transform over a partition that is mostly zeros, written once over a
// lane type. The passes themselves and what rings and rows are: negacyclic_template.h.
#pragma once

#include "convolution/simd/complex_lanes.h"

namespace tessaly {
namespace {

/// Which of the K rows sound, from the 64 parts of all samples. Butterflies of a pass take rows
/// that lie as far apart as K / R, and so do their bits by 64 / R.
template <Index Radix>
class SoundingRows {
public:
    static constexpr int apart = 64 / static_cast<int>(Radix);

    SoundingRows(std::uint64_t parts, Index rows) : parts_(parts) {
        for (; rows < 64; rows *= 2) {
            // A row is several parts: what any of them holds, at the bit of the first.
            parts_ |= parts_ >> partsInRow_;
            partsInRow_ *= 2;
        }
        for (; rows > 64; rows /= 2) {
            ++rowsInPart_;
        }
    }
    /// At bit `apart` t: row p + t K / R.
    std::uint64_t of(Index p) const {
        constexpr std::uint64_t all =
            ~std::uint64_t{0} / ((std::uint64_t{1} << (apart - 1)) * 2 - 1);
        return (parts_ >> ((p * partsInRow_) >> rowsInPart_)) & all;
    }

private:
    std::uint64_t parts_;
    Index partsInRow_ = 1;
    int rowsInPart_ = 0;  ///< log2
};

/// The first pass over a partition of which little is not zero: the sums of a few rows, each times
/// the power of a ring's root, are less than a butterfly, and the other rows are not read.
template <class Lanes, Index Radix>
TESSALY_KERNEL_INLINE void splitSounding(const BlockTables& tables,
                                         const float* samples,
                                         std::uint64_t parts,
                                         float* rows) {
    const Index step = tables.columns / Radix;
    const SoundingRows<Radix> sounding(parts, tables.columns);
    for (Index p = 0; p < step; ++p) {
        Complex<Lanes> sum[Radix];
        const auto nothing = Lanes::broadcast(0.0f);
        TESSALY_KERNEL_UNROLL
        for (Index s = 0; s < Radix; ++s) {
            sum[s] = {nothing, nothing};
        }
        std::uint64_t bits = sounding.of(p);
        for (Index t = 0; bits != 0; ++t, bits >>= SoundingRows<Radix>::apart) {
            if ((bits & 1) == 0) {
                continue;
            }
            const auto value = Lanes::load(samples + Lanes::count * (p + t * step));
            const float* const powers = tables.first + 2 * Radix * t;
            TESSALY_KERNEL_UNROLL
            for (Index s = 0; s < Radix; ++s) {
                sum[s].re = Lanes::multiplyAdd(value, Lanes::broadcast(powers[2 * s]), sum[s].re);
                sum[s].im =
                    Lanes::multiplyAdd(value, Lanes::broadcast(powers[2 * s + 1]), sum[s].im);
            }
        }
        TESSALY_KERNEL_UNROLL
        for (Index s = 0; s < Radix; ++s) {
            storeGroup(rows, p + s * step, sum[s]);
        }
    }
}

/// Not worth it from half of the parts on. Counted by hand: a function of the library's headers
/// could be emitted here with wide instructions, and be the copy that old machines get.
TESSALY_KERNEL_INLINE bool isSparse(std::uint64_t parts) {
    constexpr int most = 24;
    int count = 0;
    for (; parts != 0 && count <= most; ++count) {
        parts &= parts - 1;
    }
    return count <= most;
}

}  // namespace
}  // namespace tessaly
