// Delay line read at a speed that uses up one block's change of delay.
#include "engine/doppler_line.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <limits>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "base/units.h"

namespace tessaly {

namespace {

constexpr float farthest = 25.0f;  // metres; the delay stands still beyond

/// A NaN distance is as far as the line reaches.
std::int32_t delayOf(double samplesPerMetre, float distance) noexcept {
    return truncateToInt32(samplesPerMetre * wide(distance < farthest ? distance : farthest));
}

std::int32_t saturate(std::int64_t value) noexcept {
    return static_cast<std::int32_t>(std::clamp<std::int64_t>(
        value, std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max()));
}

}  // namespace

void DopplerLine::prepare(int sampleRate, int blocklenght) {
    sampleRate_ = sampleRate;
    blocklenght_ = blocklenght;
    dopplerLineLength =
        truncateToInt32(sampleRate * samplesPerMetrePerHertz * wide(farthest) + blocklenght);
    dopplerLine = AlignedArray<float>(static_cast<std::size_t>(dopplerLineLength));
    dopplerBlock = AlignedArray<float>(static_cast<std::size_t>(blocklenght));
    dopplerRate = 1.0f;
}

void DopplerLine::process(const float* input,
                          float inputGain,
                          float distance,
                          float distanceOld,
                          float* output) noexcept {
    const int B = blocklenght_;
    const int L = dopplerLineLength;
    if (B <= 0 || L < B) {
        return;
    }
    const double samplesPerMetre = sampleRate_ * samplesPerMetrePerHertz;
    dopplerDelayNew = delayOf(samplesPerMetre, distance);
    dopplerDelayOld = delayOf(samplesPerMetre, distanceOld);
    dopplerDelta = saturate(std::int64_t{dopplerDelayOld} - dopplerDelayNew);
    dopplerRate = static_cast<float>(dopplerDelta) / static_cast<float>(B) + 1.0f;

    float* const line = dopplerLine.data();
    std::memmove(line, line + B, static_cast<std::size_t>(L - B) * sizeof(float));
    for (int i = 0; i < B; ++i) {
        line[L - B + i] = input[std::ptrdiff_t{2} * i] * inputGain;
    }

    const float start = static_cast<float>(std::int64_t{L} - B - dopplerDelayOld);
    const float rate = dopplerRate;
    const float lastPosition = start + static_cast<float>(B - 1) * rate;
    // Positions rise or fall steadily, so that both ends inside mean every read inside.
    const float behindTop = static_cast<float>(L - 1);
    int j = 0;
    if (start >= 0.0f && start < behindTop && lastPosition >= 0.0f && lastPosition < behindTop) {
        for (int i = 0; i < B; ++i) {
            const float t = static_cast<float>(i) * rate;
            j = static_cast<int>(start + t);
            // The remainder has the sign of t, and may reach below sample j.
            const float f = std::copysign(t - static_cast<float>(static_cast<int>(t)), t);
            output[i] = f * (line[j + 1] - line[j]) + line[j];
        }
    } else {
        for (int i = 0; i < B; ++i) {
            const float t = static_cast<float>(i) * rate;
            const int wanted = truncateToInt32(start + t);
            j = std::clamp(wanted, 0, L - 1);
            const int next = std::clamp(wanted, -1, L - 2) + 1;
            const float f = std::fmod(t, 1.0f);
            output[i] = f * (line[next] - line[j]) + line[j];
        }
    }
    dopplerReadIndex = j - B + 1;
}

}  // namespace tessaly
