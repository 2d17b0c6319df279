// Mixes a block out: crossfade after a change of response, normalisation, ambience.
#include "engine/output_stage.h"

#include <algorithm>

#include "base/precision.h"
#include "base/units.h"

namespace tessaly {

namespace {

constexpr float rampStep = 0.015873017f;    // 1 / 63, in single precision
constexpr float compensatedDivisor = 3.0f;  // room for a headphone filter's gain
constexpr double atmoGain = 1.45;

}  // namespace

void OutputStage::prepare(int blocklenght, bool fading) {
    blocklenght_ = blocklenght;
    const auto length = static_cast<std::size_t>(2 * blocklenght);
    firstOutLeftBuffer = AlignedArray<float>(length);
    firstOutRightBuffer = AlignedArray<float>(length);
    firstOutLeft = firstOutLeftBuffer.data();
    firstOutRight = firstOutRightBuffer.data();
    if (fading) {
        secondOutLeftBuffer = AlignedArray<float>(length);
        secondOutRightBuffer = AlignedArray<float>(length);
        secondOutLeft = secondOutLeftBuffer.data();
        secondOutRight = secondOutRightBuffer.data();
        crossfadeRamp = AlignedArray<float>(2 * crossfadeLength);
        for (std::size_t k = 0; k < crossfadeLength; ++k) {
            const float value = static_cast<float>(k) * rampStep;
            crossfadeRamp[k] = value;
            crossfadeRamp[2 * crossfadeLength - 1 - k] = value;
        }
    }
}

void OutputStage::clear() noexcept {
    firstOutLeftBuffer.clear();
    firstOutRightBuffer.clear();
    secondOutLeftBuffer.clear();
    secondOutRightBuffer.clear();
}

void OutputStage::setBlockGain(float gainDb, int fftLength, bool compensated) noexcept {
    blockGainLinear = decibelsToLinear(gainDb);
    outputNormalisation = static_cast<float>(fftLength) / blockGainLinear;
    if (compensated) {
        outputNormalisation *= compensatedDivisor;
    }
}

void OutputStage::crossfade() noexcept {
    const float* rising = crossfadeRamp.data();
    const float* falling = rising + crossfadeLength;
    const int count = std::min<int>(crossfadeLength, blocklenght_);
    float* newLeft = firstOutLeft + blocklenght_;
    float* newRight = firstOutRight + blocklenght_;
    const float* oldLeft = secondOutLeft + blocklenght_;
    const float* oldRight = secondOutRight + blocklenght_;
    for (int i = 0; i < count; ++i) {
        newLeft[i] = falling[i] * oldLeft[i] + rising[i] * newLeft[i];
        newRight[i] = falling[i] * oldRight[i] + rising[i] * newRight[i];
    }
}

void OutputStage::write(float* output,
                        const Ambience& ambience,
                        int atmoSelect,
                        unsigned int block) const noexcept {
    const float scale = 1.0f / outputNormalisation;
    const float* left = firstOutLeft + blocklenght_;
    const float* right = firstOutRight + blocklenght_;
    const float* bed = atmoSelect != 0 ? ambience.block(block) : nullptr;
    if (bed == nullptr) {
        for (int i = 0; i < blocklenght_; ++i) {
            output[2 * i] = left[i] * scale;
            output[2 * i + 1] = right[i] * scale;
        }
        return;
    }
    for (int i = 0; i < blocklenght_; ++i) {
        output[2 * i] = single(wide(left[i]) * wide(scale) + wide(bed[2 * i]) * atmoGain);
        output[2 * i + 1] = single(wide(right[i]) * wide(scale) + wide(bed[2 * i + 1]) * atmoGain);
    }
}

}  // namespace tessaly
