// Axes of charts: ranges, round steps, labels of ticks.
#pragma once

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <string>

namespace tessaly {

struct AxisRange {
    double low = 0.0;
    double high = 1.0;

    double place(double value, double from, double to) const {
        return from + (to - from) * (value - low) / (high - low);
    }
};

/// Ticks at multiples of 1, 2 or 5 times a power of ten.
/// @param wanted  about how many steps; 1 or more
/// @returns the step, above 0 for high above low
inline double niceStep(double low, double high, int wanted) noexcept {
    const double rough = (high - low) / wanted;
    const double decade = std::pow(10.0, std::floor(std::log10(rough)));
    for (const double factor : {1.0, 2.0, 5.0}) {
        if (factor * decade >= rough * 0.999) {
            return factor * decade;
        }
    }
    return 10.0 * decade;
}

/// Label of a tick: as many decimals as the step needs.
inline std::string tickLabel(double value, double step) {
    const int decimals = std::max(0, static_cast<int>(-std::floor(std::log10(step) + 1e-9)));
    const double shown = std::abs(value) < 1e-9 * step ? 0.0 : value;
    return fmt::format("{:.{}f}", shown, decimals);
}

/// Calls back with each multiple of the step in the range, rising.
template <typename Draw>
void forEachTick(const AxisRange& range, double step, const Draw& draw) {
    const double first = std::ceil(range.low / step - 1e-9);
    const double last = std::floor(range.high / step + 1e-9);
    const int count = static_cast<int>(last - first) + 1;
    for (int i = 0; i < count; ++i) {
        draw((first + i) * step);
    }
}

}  // namespace tessaly
