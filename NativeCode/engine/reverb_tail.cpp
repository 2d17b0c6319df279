// The measured and the synthetic tail, and the cut to the room's size.
#include "engine/reverb_tail.h"

#include <algorithm>
#include <cstdint>

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "engine/ear_mix.h"
#include "engine/reverb_presets.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr float unfilteredCutOff = 20000.0f;  // Hz; from here on the tail is not filtered
constexpr EndFade tailFade{60, 0.016666668f};

// The synthetic tail: HRIRs from directions that wander round the head, ever weaker.
constexpr int syntheticTaps = 26;
constexpr int syntheticStart = 2048;                    // frames
constexpr int syntheticSpacing = 5452 / syntheticTaps;  // frames
constexpr float syntheticDecay = 0.03846154f;           // a tap, about 1 / 26
constexpr float syntheticGain = 0.05f;
constexpr int syntheticPhiStep = 55;    // degrees
constexpr int syntheticThetaStep = 35;  // degrees
constexpr int levelAngle = 90;          // degrees from the south pole

}  // namespace

void ReverbTail::loadIReverb(std::int16_t preset, std::int16_t& qvReverb, WavSource source) {
    logOutput("\n___loadIReverb ", preset, " now...");
    loadingReverb = true;
    const ReverbPreset* const row = findReverbPreset(preset);
    if (preset == 0) {
        logOutput("reverb activ, but no Filter selected!!!");
        reverbLength = 0;
    } else if (row == nullptr) {
        logOutput("reverb selector to high with ", preset);
        qvReverb = 0;
    } else if (row->length48000 == 0) {
        reverbPresetGain = row->reverbPresetGain;
        reverbLength = 1;
        reverbIR = AlignedArray<float>(2);
    } else {
        reverbPresetGain = row->reverbPresetGain;
        reverbLength = reverbFramesAt(source.sampleRate, row->length48000);
        const auto floats = static_cast<std::size_t>(reverbLength) * 2;
        // The reader fills what the packed file does not hold; a file of its own may be refused.
        reverbIR = source.usePackedDatabase ? AlignedArray<float>(floats, forOverwrite)
                                            : AlignedArray<float>(floats);
        source.loadingReverb = true;
        source.zeroMissing = true;
        source.qvReverb = preset;
        source.reverbLength = reverbLength;
        readWav(source, row->name, reverbIR.data(), reverbLength, 2);
    }
    logOutput("reverbLength = ", reverbLength);
    loadingReverb = false;
}

void ReverbTail::addTail(float* left,
                         float* right,
                         int bufferSize,
                         float reverbLP_Fc,
                         int sampleRate,
                         float gain) noexcept {
    const int stored = static_cast<int>(reverbIR.size() / 2);
    const float* const tail = reverbIR.data();
    const EarPairs pairs{tail, tail + 1, reverbLength};
    const EarBuffers ears{left, right, std::min(bufferSize, stored)};
    if (stored == 0) {
        return;
    }
    // The unfiltered tail has no fade at its end.
    if (!filtered(reverbLP_Fc)) {
        addPairs(ears, 0, pairs, gain);
        return;
    }
    reverbLowPass.follow(Biquad::normalise(reverbLP_Fc, sampleRate));
    addFilteredPairs(ears, 0, pairs, gain, reverbLowPass, tailFade);
}

bool ReverbTail::filtered(float reverbLP_Fc) const noexcept {
    return hasReverbLowPass && !(reverbLP_Fc >= unfilteredCutOff);
}

void ReverbTail::prepareStart(int frames) {
    const auto count = static_cast<std::size_t>(
        hasReverbLowPass ? std::clamp(frames, 0, std::max(reverbLength, 0)) : 0);
    filteredLeft_ = AlignedArray<float>(count);
    filteredRight_ = AlignedArray<float>(count);
}

int ReverbTail::startFrames(float reverbLP_Fc) const noexcept {
    return filtered(reverbLP_Fc) ? static_cast<int>(filteredLeft_.size()) : reverbLength;
}

void ReverbTail::refreshStart(float reverbLP_Fc, int sampleRate) noexcept {
    const int frames = static_cast<int>(filteredLeft_.size());
    if (frames == 0 || !filtered(reverbLP_Fc)) {
        return;
    }
    filteredLeft_.clear();
    filteredRight_.clear();
    addTail(filteredLeft_.data(), filteredRight_.data(), frames, reverbLP_Fc, sampleRate, 1.0f);
}

void ReverbTail::addStart(
    float* left, float* right, int begin, int end, float reverbLP_Fc, float gain) const noexcept {
    if (!filtered(reverbLP_Fc)) {
        const int stored = std::min(static_cast<int>(reverbIR.size() / 2), reverbLength);
        const int last = std::min(end, stored);
        if (begin < last) {
            kernels_->addPairs(static_cast<std::size_t>(last - begin),
                               reverbIR.data() + std::ptrdiff_t{2} * begin, gain, left, right);
        }
        return;
    }
    const int last = std::min(end, static_cast<int>(filteredLeft_.size()));
    const float* const tailLeft = filteredLeft_.data() + begin;
    const float* const tailRight = filteredRight_.data() + begin;
    for (int i = 0; i < last - begin; ++i) {
        left[i] += tailLeft[i] * gain;
        right[i] += tailRight[i] * gain;
    }
}

void ReverbTail::addSyntheticTail(float* left,
                                  float* right,
                                  int bufferSize,
                                  int hrirLength,
                                  int limitTheta,
                                  float reverbMixGain) noexcept {
    const EarBuffers ears{left, right, bufferSize};
    const int frames = std::min(hrirLength, hrirMaxLength);
    for (int k = 0; k < syntheticTaps; ++k) {
        reverbPresetGain =
            (1.0f - static_cast<float>(k) * syntheticDecay) * syntheticGain * reverbMixGain;
        const int indexPhi = syntheticPhiStep * k % 360 / gridStepDegrees;
        int angle = syntheticThetaStep * k % 180;
        if (angle >= levelAngle + limitTheta) {
            angle = levelAngle + limitTheta;
        } else if (angle <= levelAngle - limitTheta) {
            angle = levelAngle - limitTheta;
        }
        const float* const hrir = hrirAt(indexPhi, angle / gridStepDegrees);
        if (hrir != nullptr) {
            addPairs(ears, syntheticStart + k * syntheticSpacing, {hrir + 1, hrir, frames},
                     reverbPresetGain);
        }
    }
}

void ReverbTail::cutToRoomSize(float* left,
                               float* right,
                               int bufferSize,
                               float roomSizeFactor) const noexcept {
    if (!(roomSizeFactor < 1.0f)) {
        return;
    }
    const double length = static_cast<double>(reverbLength);
    const double factor = wide(roomSizeFactor);
    const std::int64_t start = truncateToInt32(length * 0.99 * factor + length * 0.01);
    const std::int64_t stop = truncateToInt32((factor + 1.0) * (length * 0.5));
    const auto inside = [bufferSize](std::int64_t index) {
        return static_cast<int>(std::clamp<std::int64_t>(index, 0, std::max(bufferSize, 0)));
    };
    const float span = static_cast<float>(stop - start);
    for (int i = inside(start); i < inside(stop); ++i) {
        const float weight = 1.0f - static_cast<float>(i - start + 1) / span;
        left[i] *= weight;
        right[i] *= weight;
    }
    for (int i = inside(stop); i < inside(reverbLength); ++i) {
        left[i] = 0.0f;
        right[i] = 0.0f;
    }
}

}  // namespace tessaly
