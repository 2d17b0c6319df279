// Distance of spectra that share one block of memory.
#pragma once

#include <cstdint>

namespace tessaly {

/// Bins from one spectrum to the next: whole cache lines and no multiple of 4 KB, so that
/// neighbours do not share cache sets.
constexpr std::int32_t spectrumStride(std::int32_t bins) noexcept {
    constexpr std::int32_t binsPerLine = 8;
    constexpr std::int32_t binsPerPage = 512;
    std::int32_t stride = (bins + binsPerLine - 1) / binsPerLine * binsPerLine;
    if (stride % binsPerPage == 0) {
        stride += binsPerLine;
    }
    return stride;
}

}  // namespace tessaly
