// A crossfade block: the same input through the old response and the new one.
#include <algorithm>
#include <utility>

#include "convolution/conv_class.h"
#include "convolution/simd/kernels.h"

namespace tessaly {

/// The plain order of a crossfade block, for all cases that the shared sum does not cover.
void convClass::borrowAndProcess(convClass& second) noexcept {
    second.scaled_ = scaled_;  // it renders with these spectra as they stand
    second.process();
    std::copy(second.FDL.begin(), second.FDL.end(), FDL.begin());
    process();
    std::copy(FDLown.begin(), FDLown.end(), FDL.begin());
}

/// Both have all their memory and read the same spectra; once found so, that stays.
bool convClass::sharesWith(const convClass& second) noexcept {
    if ((hpTFactive && FDLtoBUFConv == 1) || second.newestSlot() != newestSlot()) {
        return false;
    }
    if (partner_ == &second) {
        return true;
    }
    const bool shares = directFilterFeed == 0 && isSecondInstance == 0 &&
                        second.isSecondInstance != 0 && second.FDLtoBUFConv == FDLtoBUFConv &&
                        second.binCount == binCount && fftHandle != nullptr &&
                        ifftHandle != nullptr && second.fftHandle != nullptr &&
                        second.ifftHandle != nullptr && second.accumulators().complete() &&
                        canSum(second.ownRing(), false) && second.filterPartsL == filterPartsL &&
                        second.filterPartsR == filterPartsR;
    partner_ = shares ? &second : nullptr;
    return shares;
}

void convClass::processCrossfade(convClass& second, std::int32_t heardOfOld) noexcept {
    chooseMemory();
    followCompensation();
    if (naturalOrder_ && !second.naturalOrder_) {
        second.useNaturalOrder();  // it has slept while compensation came and went
    }
    oldContinued_ = false;
    if (!sharesWith(second)) {
        continuation_.forget();
        settle();
        borrowAndProcess(second);
        return;
    }
    second.watchSelection();
    second.resultSilent_ = false;  // its results are written here, past its own knowledge
    const bool silent = second.takeInput(blockNumber());
    const bool promised = std::exchange(windowFollows_, false);
    const bool follows = followRing(second) && promised;
    if (second.input != nullptr) {
        continuation_.takeWindow(second.input, follows);
    }
    watchSelection();
    const bool update = filterChangeAll || forceUpdateAll;
    if (update && hpTFactive) {
        fullLengthBranch();
    }
    changedCount_ = 0;
    changedTaps_ = 0;
    const ScaledPartitions before = scaled_;
    if (update) {
        std::copy_n(changed_.begin(), changedBefore_.size(), changedBefore_.begin());
        findChangedPartitions();
        scaled_ = scaledNow();
    }
    advanceFarTail(silent, changedCount_ == 0);
    const RingView ring = second.ownRing();
    const std::int32_t heard = std::clamp(heardOfOld, 0, blockLength);
    if (changedCount_ > 0 && ring.state->silent()) {
        transformChanged();
        changedCount_ = 0;
    }
    const bool same = ring.state->silent() || (changedCount_ == 0 && before == scaled_);
    if (!same && continuesOld(ring, before, heard)) {
        continueOld(second, before, heard);
        chooseOwed();
        transformChanged();
        render(ring, ownRing(), true);
        return;
    }
    continuation_.drop();
    settle();
    const bool byTaps = changedTaps_ > 0 && before == scaled_ && scaled_.begin > 0;
    if (changedCount_ > 0 && byTaps) {
        findStartChange();
        transformChanged();
        changedCount_ = 0;
    }
    if (ring.state->silent() || (changedCount_ == 0 && before == scaled_)) {
        render(ring, ownRing(), true);
        std::copy_n(outputL + blockLength, heard, second.outputL + blockLength);
        std::copy_n(outputR + blockLength, heard, second.outputR + blockLength);
        if (byTaps && !ring.state->silent()) {
            renderOldByTaps(second, heard);
        }
        return;
    }
    renderBoth(second, before, heard);
}

/// A crossfade block's window has come to the second instance's ring.
/// @return whether it is the one behind the last that `continuation_` has taken
bool convClass::followRing(const convClass& second) noexcept {
    const std::size_t slot = newestSlot();
    const std::uint64_t writes = second.ring_.writes();
    const std::size_t next = followedSlot_ + 1;
    const bool follows = followed_ == &second && writes == followedWrites_ + 1 &&
                         slot == (next < static_cast<std::size_t>(FDLtoBUFConv) ? next : 0);
    followed_ = &second;
    followedWrites_ = writes;
    followedSlot_ = slot;
    return follows;
}

/// From the last result's ring and place a next one may go on.
bool convClass::mayContinue() const noexcept {
    return continuation_.kept() > 0 && !naturalOrder_ && !(hpTFactive && FDLtoBUFConv == 1) &&
           followed_->ring_.writes() == followedWrites_;
}

void convClass::beforeWriting(bool crossfade) noexcept {
    // A promise that still stands is one of a block that was not made.
    if (std::exchange(windowFollows_, crossfade) || !crossfade) {
        continuation_.forget();
    }
    if (!mayContinue()) {
        settle();
    }
}

/// What has changed in the last block and in this one will change in the next.
void convClass::chooseOwed() noexcept {
    const std::size_t end = inShared_ ? std::min(owed_.size(), layoutOf(scaled_).scaledBegin) : 0;
    for (std::size_t i = 0; i < owed_.size(); ++i) {
        const bool owed = i < end && changed_[i] != 0 && changedBefore_[i] != 0;
        const bool before = std::exchange(owed_[i], owed ? 1 : 0) != 0;
        owedCount_ += (owed ? 1 : 0) - (before ? 1 : 0);
        if (before && !owed) {
            takePartition(i, filterPartsL[i], filterPartsR[i]);
        }
    }
}

/// The last result was made from this ring with the old response.
bool convClass::continuesOld(const RingView& ring,
                             const ScaledPartitions& before,
                             std::int32_t heard) noexcept {
    if (!continuation_.goesOn() || naturalOrder_ || heard > Continuation::samples) {
        return false;
    }
    farHeard_ = findFarCorrections(ring, ownRing(), before, scaled_);
    return true;
}

/// The near part of the old response goes on; its far part comes from the far tail, or else from
/// the spectra as they stand.
void convClass::continueOld(convClass& second,
                            const ScaledPartitions& before,
                            std::int32_t heard) noexcept {
    const RingView ring = second.ownRing();
    const std::size_t near = continuation_.kept();
    const std::size_t end = farHeard_ ? near : filterPartsL.size();
    const std::size_t scaledBegin = std::clamp(before.begin, near, end);
    const float gain = layoutOf(before).gain;
    const EarSpectra sum = second.accumulators();
    collect(ring, near, scaledBegin, Pick::all);
    bool some = sums_.store(sum);
    collect(ring, scaledBegin, end, Pick::all);
    addFarHeld();
    if (!sums_.empty() || (farHeard_ && !farExpected_.empty())) {
        if (!some) {
            clearSums(sum);
        }
        sums_.addTo(sum, gain);
        subtractFarExpected(sum, gain);
        some = true;
    }
    float* const left = second.outputL + blockLength;
    float* const right = second.outputR + blockLength;
    if (some) {
        second.transformBack(heard);
    } else {
        std::fill_n(left, heard, 0.0f);
        std::fill_n(right, heard, 0.0f);
    }
    if (farHeard_) {
        far_->addTo(left, right, gain, heard);
    }
    continuation_.addTo(left, right, before.begin, gain, heard);
    oldContinued_ = true;
}

/// A result stands that partitions below `partitions` made, beside the far tail.
void convClass::keepResult(bool made, std::size_t partitions) noexcept {
    const bool alone = !farHeard_ || (farHeld_.empty() && farExpected_.empty());
    if (made && alone && !naturalOrder_) {
        continuation_.keep(partitions);
    } else {
        continuation_.drop();
    }
}

/// What a change of few taps of the start takes away, in the time domain: the old response's
/// samples from the new one's. The first partition always meets the window of this very block.
void convClass::renderOldByTaps(convClass& second, std::int32_t heard) noexcept {
    kernels_->addTaps(static_cast<std::size_t>(heard), static_cast<std::size_t>(changedTaps_),
                      startChange_.data(), startChange_.data() + directTaps, input + blockLength,
                      second.outputL + blockLength, second.outputR + blockLength);
}

/// Old and new response share what no update touched, and the end of them without its gain.
void convClass::renderBoth(convClass& second,
                           const ScaledPartitions& before,
                           std::int32_t heard) noexcept {
    const RingView ring = second.ownRing();
    resultSilent_ = false;
    farHeard_ = findFarCorrections(ring, ownRing(), before, scaled_);
    const Layout old = layoutOf(before);
    const Layout now = layoutOf(scaled_);
    const std::size_t lastBegin = std::max(old.scaledBegin, now.scaledBegin);

    collect(ring, 0, lastBegin, Pick::untouched);
    if (!sums_.store(accumulators())) {
        clearSums(accumulators());
    }
    collect(ring, lastBegin, old.end, Pick::untouched);
    addFarHeld();
    bool hasEnd = sums_.store(end_);
    if (farHeard_ && !farExpected_.empty()) {
        if (!hasEnd) {
            clearSums(end_);
        }
        subtractFarExpected(end_, 1.0f);
        hasEnd = true;
    }
    if (hasEnd && old.gain == now.gain) {
        sums_.addScaled(end_, now.gain, accumulators());
        hasEnd = false;
    }
    const auto addOwn = [&](const Layout& layout, const EarSpectra& sum) {
        collect(ring, 0, layout.scaledBegin, Pick::touched);
        sums_.store(accumulators(), sum);
        collect(ring, layout.scaledBegin, layout.end, Pick::touched);
        sums_.addTo(sum, layout.gain);
        if (hasEnd) {
            sums_.addScaled(end_, layout.gain, sum);
        }
    };

    addOwn(old, second.accumulators());
    second.transformBack(heard);
    transformChanged();
    addOwn(now, accumulators());
    const bool made = transformBack(blockLength, continuation_.prepared());
    keepResult(made, now.end);
    if (farHeard_) {
        far_->addTo(second.outputL + blockLength, second.outputR + blockLength, old.gain, heard);
        far_->addTo(outputL + blockLength, outputR + blockLength, now.gain, blockLength);
    }
}

}  // namespace tessaly
