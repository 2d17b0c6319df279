// Composition of the response, and the decision when it runs.
#include "engine/fir_composer.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "base/log.h"
#include "base/precision.h"
#include "engine/ear_mix.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr int hrirLeftIndex = 1;   // the left ear takes the second value of a stored pair
constexpr int hrirRightIndex = 0;  // the right ear the first

constexpr double fixedGain1st = 0.1;
constexpr double fixedGain2nd = 0.11;
constexpr int wallRecords = 6;  // the first records are walls, which a room may lack
constexpr EndFade reflectionFade{15, 0.06666667f};
constexpr int shortestResponseWithTail = 4096;  // frames
constexpr int tailFadeFrames = 15;
constexpr float widestHeldStep = 5.0f;  // degrees; a wider move composes the old pair anew

EarPairs pairsOf(const float* hrir, int frames) noexcept {
    return {hrir + hrirLeftIndex, hrir + hrirRightIndex, frames};
}

/// Frames of a stored pair that may be read.
int readableFrames(int frames) noexcept { return std::clamp(frames, 0, hrirMaxLength); }

/// Direct sound: written, not added. Both gains are applied one after the other.
void writeDirect(const EarBuffers& ears,
                 const EarPairs& pairs,
                 float lawGain,
                 float mixGain) noexcept {
    const FrameRange range = framesInside(0, pairs.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        ears.left[i] = pairs.leftAt(i) * lawGain * mixGain;
        ears.right[i] = pairs.rightAt(i) * lawGain * mixGain;
    }
}

void composeDirect(const EarBuffers& ears, const CompositionInputs& inputs) noexcept {
    const int frames = readableFrames(inputs.switches.hrirLength);
    if (inputs.switches.qvTrackDirection) {
        const float* const hrir = hrirAt(inputs.direction.indexPhi, inputs.direction.indexTheta);
        if (hrir != nullptr) {
            writeDirect(ears, pairsOf(hrir, frames), inputs.law.directGain, inputs.mix.directGain);
        }
    } else if (const float* const hrir = hrirOf(inputs.staticFilter); hrir != nullptr) {
        // The mix's direct gain is not applied on this path.
        writeDirect(ears, pairsOf(hrir, frames), inputs.law.directGain, 1.0f);
    }
}

/// One of the fixed pair: products and sum in double, rounded once at the store.
void addFixed(const EarBuffers& ears,
              HrirSlot slot,
              int delay,
              int length,
              double gain,
              float earlyGain) noexcept {
    const float* const hrir = hrirOf(slot);
    if (hrir == nullptr) {
        return;
    }
    const EarPairs pairs = pairsOf(hrir, readableFrames(length));
    const FrameRange range = framesInside(delay, pairs.frames, ears.size);
    for (int i = range.begin; i < range.end; ++i) {
        float& left = ears.left[delay + i];
        float& right = ears.right[delay + i];
        left = single(wide(left) + wide(pairs.leftAt(i)) * gain * wide(earlyGain));
        right = single(wide(right) + wide(pairs.rightAt(i)) * gain * wide(earlyGain));
    }
}

void addRecord(const EarBuffers& ears,
               const ReflectionRecord& record,
               int number,
               CompositionInputs& inputs,
               float earlyGain) noexcept {
    const int hrirLength = inputs.switches.hrirLength;
    const int end = record.delaySamples + hrirLength;
    const bool filtered = record.filterClass >= 0;
    if (filtered && (end >= inputs.sizes.FIR_size || end < 0)) {
        logTrace("ERROR: FIR-size ", inputs.sizes.FIR_size, " too small for ",
                 record.delaySamples + 2 * hrirLength, " this reflection no ", number,
                 "!!!! (not processed) or delay < 0");
        return;
    }
    const float* const hrir = hrirAt(record.indexPhi, record.indexTheta);
    if (end >= inputs.sizes.FIR_size || hrir == nullptr) {
        return;
    }
    const EarPairs pairs = pairsOf(hrir, readableFrames(hrirLength));
    const float gain = record.gain * record.distanceGain * earlyGain;
    if (!filtered) {
        addPairs(ears, record.delaySamples, pairs, gain);
        return;
    }
    const bool firstClass = record.filterClass == 0;
    Biquad& biquad = inputs.reflections.reflectionFilter[firstClass ? 0 : 1];
    const float cutOff =
        firstClass ? inputs.controls.reflectionLP_Fc : inputs.controls.reflectionLP2_Fc;
    biquad.follow(Biquad::normalise(cutOff, inputs.sampleRate));
    addFilteredPairs(ears, record.delaySamples, pairs, gain, biquad, reflectionFade);
}

void addTails(const EarBuffers& ears, CompositionInputs& inputs, float reverbMixGain) noexcept {
    if (inputs.sizes.FIR_size < shortestResponseWithTail) {
        return;
    }
    ReverbTail& tail = inputs.tail;
    if (inputs.switches.qvReverb == 1) {
        tail.addSyntheticTail(ears.left, ears.right, ears.size, inputs.switches.hrirLength,
                              inputs.switches.limitTheta, reverbMixGain);
        return;
    }
    tail.addTail(ears.left, ears.right, ears.size, inputs.controls.reverbLP_Fc, inputs.sampleRate,
                 tail.reverbPresetGain * reverbMixGain * inputs.law.reverbDistanceGain);
    tail.cutToRoomSize(ears.left, ears.right, ears.size, inputs.controls.roomSizeFactor);
}

}  // namespace

void FirComposer::prepare(int firBufferSize) {
    filterLeftBuffer = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
    filterRightBuffer = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
    filterLeft = filterLeftBuffer.data();
    filterRight = filterRightBuffer.data();
}

void FirComposer::composeFIR(float* left, float* right, CompositionInputs& inputs) noexcept {
    const EarBuffers ears{left, right, inputs.sizes.firBufferSize};
    const std::size_t bytes = static_cast<std::size_t>(ears.size) * sizeof(float);
    std::memset(left, 0, bytes);
    std::memset(right, 0, bytes);

    composeDirect(ears, inputs);
    if (inputs.forceUpdate) {
        inputs.frontEnd.followDistance(inputs.law.distance);
    }

    const EffectiveSettings& switches = inputs.switches;
    Reflections& reflections = inputs.reflections;
    if (switches.qvEarlyReflections || switches.qvFlexReflections) {
        earlyGain =
            inputs.mix.earlyGain * inputs.law.earlyDistanceGain * reflections.earlyPresetGain;
    }
    if (switches.qvEarlyReflections) {
        addFixed(ears, reflections.earlyRefFilter_1st, reflections.earlyRefDelay_1st,
                 reflections.earlyRefLength_1st, fixedGain1st, earlyGain);
        addFixed(ears, reflections.earlyRefFilter_2nd, reflections.earlyRefDelay_2nd,
                 reflections.earlyRefLength_2nd, fixedGain2nd, earlyGain);
    }
    if (switches.qvFlexReflections) {
        const int count = std::min<int>(reflections.flexReflectionCount, Reflections::capacity);
        for (int number = 0; number < count; ++number) {
            const ReflectionRecord& record = reflections.records[static_cast<std::size_t>(number)];
            const bool missingWall = number < wallRecords && record.wallDistance < 0.0f;
            if (!missingWall) {
                addRecord(ears, record, number, inputs, earlyGain);
            }
        }
    }
    if (switches.qvReverb > 0) {
        reverbMixGain = inputs.mix.reverbGain;
        addTails(ears, inputs, reverbMixGain);
    }
}

void FirComposer::fadeFilterTail(int FIR_size) noexcept {
    const int size = static_cast<int>(filterLeftBuffer.size());
    for (int j = 0; j < tailFadeFrames; ++j) {
        const int i = FIR_size - tailFadeFrames + j;
        if (i >= 0 && i < size) {
            const float weight = 1.0f / static_cast<float>(4 * (j + 1));
            filterLeft[i] *= weight;
            filterRight[i] *= weight;
        }
    }
}

void FirComposer::refreshFilter(CompositionInputs& inputs,
                                FirInterpolation& interpolation) noexcept {
    if (filterLeft == nullptr || filterRight == nullptr) {
        return;
    }
    const SourceDirection& direction = inputs.direction;
    const bool interpolating = inputs.switches.qvInterpolateFilters;
    if (inputs.forceUpdate || (inputs.filterChange && direction.filterUpdatePending)) {
        if (!interpolating || !direction.filterUpdatePending) {
            composeFIR(filterLeft, filterRight, inputs);
            fadeFilterTail(inputs.sizes.FIR_size);
        } else {
            const auto composePair = [&](std::int16_t pair) noexcept {
                const std::size_t k = pair != 0 ? 1 : 0;
                composeFIR(interpolation.interpFilterLeft[k].data(),
                           interpolation.interpFilterRight[k].data(), inputs);
            };
            if (inputs.blockCounter == 0 || std::fabs(direction.phiStepMoved) > widestHeldStep ||
                std::fabs(direction.thetaStepMoved) > widestHeldStep) {
                composePair(interpolation.interpFilterOld);
            }
            if (!direction.holdInterpPair) {
                // Both start at 0; from the first turn on they differ.
                interpolation.interpFilterOld = interpolation.interpFilterNew;
                interpolation.interpFilterNew =
                    static_cast<std::int16_t>(1 - interpolation.interpFilterNew);
            }
            composePair(interpolation.interpFilterNew);
        }
    }
    if (inputs.filterChange && interpolating) {
        interpolation.interpolateFIR(filterLeft, filterRight, inputs.sizes.firBufferSize,
                                     inputs.switches.hrirLength, direction.filterUpdatePending,
                                     direction.interpAngleOffset);
    }
}

}  // namespace tessaly
