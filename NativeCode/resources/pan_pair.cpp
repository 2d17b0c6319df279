// The synthetic substitute for an HRIR when 3D rendering is bypassed: one tap per ear.
#include "resources/pan_pair.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

#include "base/precision.h"

namespace tessaly {

namespace {

// A tap never falls below the floor: the far ear keeps a good part of the level.
constexpr float tapRange = 0.6f;
constexpr float tapFloor = 0.4f;

}  // namespace

void writePanPair(float* pair, int hrirLength, std::int16_t phi, float panGain) noexcept {
    if (pair == nullptr || hrirLength <= 0) {
        return;
    }
    // 0 at the right, 1 in front and behind, 2 at the left. The angle is rounded once, the sine is
    // a single-precision one.
    const float angle = single(phi / 360.0 * 2.0 * std::numbers::pi);
    const float s = std::sin(angle) + 1.0f;
    const float tapFirst = (2.0f - s) * panGain * 0.5f * tapRange + tapFloor;
    const float tapSecond = panGain * s * 0.5f * tapRange + tapFloor;

    const double half = hrirLength * 0.5;
    const int posFirst = std::clamp(static_cast<int>(wide(s) * half * 0.5), 0, hrirLength - 1);
    const int posSecond = std::clamp(static_cast<int>(half - posFirst), 0, hrirLength - 1);

    std::fill_n(pair, std::size_t{2} * static_cast<std::size_t>(hrirLength), 0.0f);
    pair[std::ptrdiff_t{2} * posFirst] = tapFirst;
    pair[std::ptrdiff_t{2} * posSecond + 1] = tapSecond;
}

}  // namespace tessaly
