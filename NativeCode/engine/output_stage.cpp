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

/// @param rising   weights of the new output
/// @param falling  weights of the old one
void fade(const float* rising, const float* falling, const float* old, float* output, int count) {
    for (int i = 0; i < count; ++i) {
        output[i] = falling[i] * old[i] + rising[i] * output[i];
    }
}

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
    const int B = blocklenght_;
    fade(rising, falling, secondOutLeft + B, firstOutLeft + B, count);
    fade(rising, falling, secondOutRight + B, firstOutRight + B, count);
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
        kernels_->interleave(static_cast<std::size_t>(blocklenght_), left, right, scale, output);
        return;
    }
    for (int i = 0; i < blocklenght_; ++i) {
        output[2 * i] = single(wide(left[i]) * wide(scale) + wide(bed[2 * i]) * atmoGain);
        output[2 * i + 1] = single(wide(right[i]) * wide(scale) + wide(bed[2 * i + 1]) * atmoGain);
    }
}

}  // namespace tessaly
