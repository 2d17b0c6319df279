// Composition of the response, and the decision when it runs.
#include "engine/fir_composer.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>

#include "base/log.h"
#include "base/precision.h"
#include "engine/ear_mix.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr double fixedGain1st = 0.1;
constexpr double fixedGain2nd = 0.11;
constexpr int wallRecords = 6;  // the first records are walls, which a room may lack
constexpr int shortestResponseWithTail = 4096;  // frames
constexpr int syntheticTail = 1;                // the value of `qvReverb`
constexpr int tailFadeFrames = 15;
constexpr float widestHeldStep = 5.0f;      // degrees; a wider move composes the old pair anew
constexpr int filteredStartFrames = 16384;  // behind a longer early part the tail is filtered anew

/// Equal means equal, also of what is no number.
bool sameBits(float a, float b) noexcept {
    return std::bit_cast<std::uint32_t>(a) == std::bit_cast<std::uint32_t>(b);
}

/// Frames of a stored pair that may be read.
int readableFrames(int frames) noexcept { return std::clamp(frames, 0, hrirMaxLength); }

ResponsePiece directPiece(const CompositionInputs& inputs) noexcept {
    ResponsePiece piece;
    piece.kind = ResponsePiece::Kind::Direct;
    piece.frames = readableFrames(inputs.switches.hrirLength);
    piece.gain = inputs.law.directGain;
    if (inputs.switches.qvTrackDirection) {
        piece.hrir = hrirAt(inputs.direction.indexPhi, inputs.direction.indexTheta);
        piece.secondGain = inputs.mix.directGain;
    } else {
        // The mix's direct gain is not applied on this path.
        piece.hrir = hrirOf(inputs.staticFilter);
    }
    return piece;
}

ResponsePiece fixedPiece(
    HrirSlot slot, int delay, int length, double gain, float earlyGain) noexcept {
    ResponsePiece piece;
    piece.kind = ResponsePiece::Kind::Fixed;
    piece.hrir = hrirOf(slot);
    piece.position = delay;
    piece.frames = readableFrames(length);
    piece.gain = earlyGain;
    piece.fixedGain = gain;
    return piece;
}

/// A record that does not fit has no HRIR.
ResponsePiece recordPiece(const ReflectionRecord& record,
                          int number,
                          const CompositionInputs& inputs,
                          float earlyGain) noexcept {
    const int hrirLength = inputs.switches.hrirLength;
    const int end = record.delaySamples + hrirLength;
    const bool filtered = record.filterClass >= 0;
    ResponsePiece piece;
    if (filtered && (end >= inputs.sizes.FIR_size || end < 0)) {
        logTrace("ERROR: FIR-size ", inputs.sizes.FIR_size, " too small for ",
                 record.delaySamples + 2 * hrirLength, " this reflection no ", number,
                 "!!!! (not processed) or delay < 0");
        return piece;
    }
    if (end >= inputs.sizes.FIR_size) {
        return piece;
    }
    piece.hrir = hrirAt(record.indexPhi, record.indexTheta);
    piece.position = record.delaySamples;
    piece.frames = readableFrames(hrirLength);
    piece.gain = record.gain * record.distanceGain * earlyGain;
    if (filtered) {
        const bool firstClass = record.filterClass == 0;
        piece.kind = ResponsePiece::Kind::Filtered;
        piece.filterClass = firstClass ? 0 : 1;
        piece.cutOff =
            firstClass ? inputs.controls.reflectionLP_Fc : inputs.controls.reflectionLP2_Fc;
    }
    return piece;
}

bool hasTail(const CompositionInputs& inputs) noexcept {
    return inputs.switches.qvReverb > 0 && inputs.sizes.FIR_size >= shortestResponseWithTail;
}

bool hasMeasuredTail(const CompositionInputs& inputs) noexcept {
    return hasTail(inputs) && inputs.switches.qvReverb != syntheticTail;
}

float tailGain(const CompositionInputs& inputs, float reverbMixGain) noexcept {
    return hasMeasuredTail(inputs)
               ? inputs.tail.reverbPresetGain * reverbMixGain * inputs.law.reverbDistanceGain
               : reverbMixGain;
}

/// @param gain  of a measured tail as it counts, of the synthetic one the mix's share
void addTails(const EarBuffers& ears,
              CompositionInputs& inputs,
              float cutOff,
              float roomSizeFactor,
              float gain) noexcept {
    if (!hasTail(inputs)) {
        return;
    }
    ReverbTail& tail = inputs.tail;
    if (inputs.switches.qvReverb == syntheticTail) {
        tail.addSyntheticTail(ears.left, ears.right, ears.size, inputs.switches.hrirLength,
                              inputs.switches.limitTheta, gain);
        return;
    }
    tail.addTail(ears.left, ears.right, ears.size, cutOff, inputs.sampleRate, gain);
    tail.cutToRoomSize(ears.left, ears.right, ears.size, roomSizeFactor);
}

void clearFrames(const EarBuffers& ears, int frames) noexcept {
    const std::size_t bytes = static_cast<std::size_t>(frames) * sizeof(float);
    std::memset(ears.left, 0, bytes);
    std::memset(ears.right, 0, bytes);
}

}  // namespace

void FirComposer::prepare(int firBufferSize) {
    filterLeftBuffer = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
    filterRightBuffer = AlignedArray<float>(static_cast<std::size_t>(firBufferSize));
    filterLeft = filterLeftBuffer.data();
    filterRight = filterRightBuffer.data();
    forget();
}

void FirComposer::prepareKeptParts(int hrirLength, ReverbTail& tail) {
    writer_.prepare(hrirLength);
    tail.prepareStart(filteredStartFrames);
}

void FirComposer::forget() noexcept {
    const int size = static_cast<int>(filterLeftBuffer.size());
    startKnown_ = false;
    endKnown_ = false;
    postponed_ = false;
    notes.written.include(0, size);
    notes.sounding = FirNotes::everything();
    notes.scaledEnd = {size, 1.0f};
}

void FirComposer::listIngredients(const CompositionInputs& inputs) noexcept {
    const auto add = [this](const ResponsePiece& piece) noexcept {
        if (piece.hrir != nullptr) {
            wanted_.pieces.add(piece);
        }
    };
    wanted_.pieces.clear();
    listedStream_ = hrirStreamNumber;
    add(directPiece(inputs));
    const EffectiveSettings& switches = inputs.switches;
    const Reflections& reflections = inputs.reflections;
    if (switches.qvEarlyReflections || switches.qvFlexReflections) {
        earlyGain =
            inputs.mix.earlyGain * inputs.law.earlyDistanceGain * reflections.earlyPresetGain;
    }
    if (switches.qvEarlyReflections) {
        add(fixedPiece(reflections.earlyRefFilter_1st, reflections.earlyRefDelay_1st,
                       reflections.earlyRefLength_1st, fixedGain1st, earlyGain));
        add(fixedPiece(reflections.earlyRefFilter_2nd, reflections.earlyRefDelay_2nd,
                       reflections.earlyRefLength_2nd, fixedGain2nd, earlyGain));
    }
    if (switches.qvFlexReflections) {
        const int count = std::min<int>(reflections.flexReflectionCount, Reflections::capacity);
        for (int number = 0; number < count; ++number) {
            const ReflectionRecord& record = reflections.records[static_cast<std::size_t>(number)];
            const bool missingWall = number < wallRecords && record.wallDistance < 0.0f;
            if (!missingWall) {
                add(recordPiece(record, number, inputs, earlyGain));
            }
        }
    }
    if (switches.qvReverb > 0) {
        reverbMixGain = inputs.mix.reverbGain;
    }
    wanted_.tailGain = tailGain(inputs, reverbMixGain);
    wanted_.tailCutOff = inputs.controls.reverbLP_Fc;
    wanted_.roomSizeFactor = inputs.controls.roomSizeFactor;
}

void FirComposer::composeFIR(float* left, float* right, CompositionInputs& inputs) noexcept {
    const EarBuffers ears{left, right, inputs.sizes.firBufferSize};
    clearFrames(ears, ears.size);
    listIngredients(inputs);
    plainWriter_.write(ears, wanted_.pieces, inputs.sampleRate,
                       inputs.reflections.reflectionFilter);
    if (inputs.forceUpdate) {
        inputs.frontEnd.followDistance(inputs.law.distance);
    }
    addTails(ears, inputs, wanted_.tailCutOff, wanted_.roomSizeFactor, wanted_.tailGain);
}

/// @param piecesEnd  pieces end before, in this response and in the one that stands there
/// @param changed    frames that may differ from what stands there
void FirComposer::writeWhole(const EarBuffers& ears,
                             CompositionInputs& inputs,
                             int piecesEnd,
                             const FirStretches& changed) noexcept {
    // Without a tail there are zeros behind the pieces.
    clearFrames(ears, hasTail(inputs) ? ears.size : piecesEnd);
    writer_.write(ears, wanted_.pieces, inputs.sampleRate, inputs.reflections.reflectionFilter);
    addTails(ears, inputs, wanted_.tailCutOff, wanted_.roomSizeFactor, wanted_.tailGain);
    fadeFilterTail(inputs.sizes.FIR_size);
    for (const FirStretch& stretch : changed) {
        notes.written.include(std::clamp(stretch.begin, 0, ears.size),
                              std::clamp(stretch.end, 0, ears.size));
    }
    notes.scaledEnd = {ears.size, 1.0f};
}

/// The tail without its gain, over all of the response.
void FirComposer::writeEnd(const EarBuffers& ears, CompositionInputs& inputs) noexcept {
    clearFrames(ears, ears.size);
    inputs.tail.refreshStart(wanted_.tailCutOff, inputs.sampleRate);
    addTails(ears, inputs, wanted_.tailCutOff, wanted_.roomSizeFactor, 1.0f);
    fadeFilterTail(inputs.sizes.FIR_size);
    notes.written.include(0, ears.size);
}

/// Direct sound, reflections and the start of the tail with its gain, up to `end`.
void FirComposer::writeStart(const EarBuffers& ears, CompositionInputs& inputs, int end) noexcept {
    clearFrames(ears, end);
    writer_.write(ears, wanted_.pieces, inputs.sampleRate, inputs.reflections.reflectionFilter);
    inputs.tail.addStart(ears.left, ears.right, 0, end, wanted_.tailCutOff, wanted_.tailGain);
    inputs.tail.cutToRoomSize(ears.left, ears.right, end, wanted_.roomSizeFactor);
    fadeFilterTail(inputs.sizes.FIR_size, end);
    notes.written.include(0, end);
}

/// Only the frames that pieces have left or come to, of the start in a room of full size, or of a
/// response without a tail.
void FirComposer::writeStretches(const EarBuffers& ears,
                                 CompositionInputs& inputs,
                                 int end,
                                 const FirStretches& changed) noexcept {
    std::array<Biquad, 2>& filters = inputs.reflections.reflectionFilter;
    writer_.refresh(wanted_.pieces, inputs.sampleRate, filters);
    for (const FirStretch& stretch : changed) {
        const int first = std::clamp(stretch.begin, 0, end);
        const int last = std::clamp(stretch.end, 0, end);
        const EarBuffers part{ears.left + first, ears.right + first, last - first};
        clearFrames(part, part.size);
        writer_.writeFrames(part, first, wanted_.pieces, inputs.sampleRate, filters);
        if (hasTail(inputs)) {
            inputs.tail.addStart(part.left, part.right, first, last, wanted_.tailCutOff,
                                 wanted_.tailGain);
        }
        notes.written.include(first, last);
    }
}

/// The engine's own responses: what composeFIR and fadeFilterTail give. While nobody hears them
/// it is noted what they would be, and they are left as they are.
void FirComposer::composeChanges(CompositionInputs& inputs) noexcept {
    listIngredients(inputs);
    if (inputs.forceUpdate) {
        inputs.frontEnd.followDistance(inputs.law.distance);
    }
    const bool synthetic = hasTail(inputs) && !hasMeasuredTail(inputs);
    if (inputs.unheard && !inputs.switches.qvInterpolateFilters && !synthetic) {
        postponed_ = true;
        return;
    }
    postponed_ = false;
    writeChanges(inputs);
}

bool FirComposer::catchUp(CompositionInputs& inputs) noexcept {
    if (!postponed_) {
        return false;
    }
    postponed_ = false;
    if (!hrirStreamLives(listedStream_)) {
        // The HRIRs that were listed are gone: as the source stands now.
        listIngredients(inputs);
    }
    writeChanges(inputs);
    return true;
}

/// Only that is made again which may differ from what stands there. A measured tail stands without
/// its gain behind the early part, where a change of its level costs nothing.
void FirComposer::writeChanges(CompositionInputs& inputs) noexcept {
    const EarBuffers ears{filterLeft, filterRight, inputs.sizes.firBufferSize};
    if (lastTables_ != hrirTablesVersion) {
        lastTables_ = hrirTablesVersion;
        writer_.forget();
        startKnown_ = false;
    }
    const PieceList& pieces = wanted_.pieces;
    const bool samePieces = startKnown_ && pieces == standing_.pieces;
    FirStretches everything;
    everything.include(0, ears.size);
    const int extent = pieces.extent();
    const int lastEnd = std::max(extent, standing_.pieces.extent());
    const int piecesEnd = startKnown_ && !endKnown_ ? std::clamp(lastEnd, 0, ears.size) : ears.size;
    const FirStretches differences = pieces.differencesTo(standing_.pieces);
    const bool sameTail = sameBits(wanted_.tailCutOff, standing_.tailCutOff) &&
                          sameBits(wanted_.roomSizeFactor, standing_.roomSizeFactor);
    const bool sameGain = sameBits(wanted_.tailGain, standing_.tailGain);
    standing_ = wanted_;

    const int partition = std::max(inputs.sizes.blocklenght, 1);
    int begin = notes.scaledEnd.begin;
    if (!endKnown_ || begin < extent) {
        // Two partitions are read as they stand by a convolver that is fed directly. Never back:
        // reflections that follow a source come and go.
        begin = std::max(2, (extent + partition - 1) / partition + 1) * partition;
    }
    // What is blended afterwards has to stand as it counts. The synthetic tail looks its directions
    // up anew each time.
    const bool blended = inputs.switches.qvInterpolateFilters;
    const bool measuredTail = hasMeasuredTail(inputs);
    const bool synthetic = hasTail(inputs) && !measuredTail;
    if (hasTail(inputs) || blended) {
        notes.sounding = FirNotes::everything();
    } else {
        pieces.listFrames(notes.sounding);
    }
    if (!measuredTail || blended || begin >= ears.size ||
        begin > inputs.tail.startFrames(wanted_.tailCutOff)) {
        const bool sameEnd = !hasTail(inputs) || (sameTail && sameGain && !synthetic);
        // The fade at its end counts frames from the start.
        const bool plain = startKnown_ && !endKnown_ && !hasTail(inputs) && !blended;
        if (plain && !samePieces &&
            differences.hull().end <= inputs.sizes.FIR_size - tailFadeFrames) {
            writeStretches(ears, inputs, ears.size, differences);
        } else if (endKnown_ || !samePieces || !sameEnd) {
            writeWhole(ears, inputs, piecesEnd,
                       startKnown_ && !endKnown_ && sameEnd ? differences : everything);
        }
        startKnown_ = true;
        endKnown_ = false;
        return;
    }
    const bool sameEnd = endKnown_ && sameTail;
    if (!sameEnd) {
        writeEnd(ears, inputs);
        endKnown_ = true;
    }
    if (!sameEnd || !samePieces || !sameGain || begin != notes.scaledEnd.begin) {
        // The cut to the room's size and the fade at its end count frames from the start.
        const bool plainStart =
            !(wanted_.roomSizeFactor < 1.0f) && begin <= inputs.sizes.FIR_size - tailFadeFrames;
        if (sameEnd && sameGain && startKnown_ && begin == notes.scaledEnd.begin && plainStart) {
            writeStretches(ears, inputs, begin, differences);
        } else {
            writeStart(ears, inputs, begin);
        }
        startKnown_ = true;
        notes.scaledEnd = {begin, wanted_.tailGain};
    }
}

void FirComposer::fadeFilterTail(int FIR_size, int end) noexcept {
    const int size = std::min(end, static_cast<int>(filterLeftBuffer.size()));
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
            composeChanges(inputs);
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
        forget();
    }
}

}  // namespace tessaly
