// One block of partitioned convolution.
#include <algorithm>
#include <utility>

#include "base/silence.h"
#include "convolution/conv_class.h"
#include "convolution/simd/kernels.h"

namespace tessaly {

float* convClass::process() noexcept {
    chooseMemory();
    followCompensation();
    continuation_.forget();
    settle();
    watchSelection();
    // In a crossfade block the first instance works on the spectrum that the second one made.
    const bool borrowed = secondOLSactive && isSecondInstance == 0;
    const bool silent = !borrowed && takeInput(blockNumber());
    if ((filterChangeAll || forceUpdateAll) && isSecondInstance == 0) {
        updateFilter();
    }
    advanceFarTail(silent);
    const RingView ring = borrowed ? RingView{FDL, nullptr, newestSlot()} : ownRing();
    render(ring, partner_ != nullptr ? partner_->ownRing() : ring);
    return outputL;
}

void convClass::clearSums(const EarSpectra& sums) const noexcept {
    clearSpectrum(sums.left, binCount - 1);
    clearSpectrum(sums.right, binCount - 1);
}

/// Memory that another thread's convolvers share is not for this block.
void convClass::chooseMemory() noexcept {
    inShared_ = shared_ != nullptr && std::this_thread::get_id() == sharedBy_;
}

void convClass::rest(convClass* taker) noexcept {
    convClass& owner = taker != nullptr ? *taker : *this;
    owner.ring_.set(owner.newestSlot(), true, blockNumber());
    if (taker != nullptr) {
        continuation_.takeSilence(followRing(*taker));
    } else {
        continuation_.forget();
    }
    advanceFarTail(true);
}

/// The number of the block that is being made; 0 where nobody counts.
std::uint64_t convClass::blockNumber() const noexcept {
    return far_ != nullptr ? far_->block() + 1 : InputRing::noBlock;
}

/// A window of zeros has a spectrum of zeros. @return whether it is one
bool convClass::takeInput(std::uint64_t block) noexcept {
    const std::size_t slot = newestSlot();
    ComplexBin* const spectrum = FDL[slot];
    const bool known = std::exchange(expectsSilence_, false);
    const bool silent = fftHandle != nullptr && input != nullptr && spectrum != nullptr &&
                        (known || allZero(input, static_cast<std::size_t>(fftLength)));
    if (silent) {
        if (!ring_.silent(slot)) {
            clearSpectrum(spectrum, binCount - 1);
        }
        dftiStatus = transformOk;
    } else {
        dftiStatus = transformWindow(input, spectrum);
    }
    ring_.set(slot, silent, dftiStatus == transformOk ? block : InputRing::noBlock);
    return silent;
}

std::size_t convClass::bins() const noexcept {
    return static_cast<std::size_t>(naturalOrder_ ? binCount : blockLength);
}

std::int32_t convClass::transformWindow(const float* samples, ComplexBin* spectrum) noexcept {
    return naturalOrder_ ? FFT(samples, spectrum, fftHandle)
                         : windowFFT(samples, spectrum, fftHandle);
}

std::int32_t convClass::transformPartition(const float* samples,
                                           ComplexBin* spectrum,
                                           std::uint64_t sounding) noexcept {
    if (!naturalOrder_) {
        return partitionFFT(samples, spectrum, fftHandle, sounding);
    }
    std::copy_n(samples, blockLength, padded_.data());
    return FFT(padded_.data(), spectrum, fftHandle);
}

/// The first `samples` of the block at least, of both ears.
/// @param alsoWrapped  and what they go on to be
/// @return whether it is so, of both ears
bool convClass::transformBack(std::int32_t samples, bool alsoWrapped) noexcept {
    const auto back = [&](const ComplexBin* sum, float* output, std::size_t ear) noexcept {
        if (naturalOrder_ || output == nullptr) {
            return IFFT(sum, output, ifftHandle);
        }
        return blockIFFT(sum, output + blockLength, samples, ifftHandle,
                         alsoWrapped ? continuation_.wrapped(ear) : WrappedSamples{});
    };
    const EarSpectra sum = accumulators();
    const std::int32_t leftStatus = back(sum.left, outputL, 0);
    dftiStatus = back(sum.right, outputR, 1);
    return leftStatus == transformOk && dftiStatus == transformOk && outputL != nullptr &&
           outputR != nullptr;
}

convClass::RingView convClass::ownRing() const noexcept {
    return {FDLown.empty() || isSecondInstance != 0 ? FDL : FDLown, &ring_, newestSlot()};
}

/// The engine writes the index; one outside of the ring is taken modulo N.
std::size_t convClass::newestSlot() const noexcept {
    if (FDLpos >= 0 && FDLpos < FDLtoBUFConv) {
        return static_cast<std::size_t>(FDLpos);
    }
    const int slot = FDLpos % FDLtoBUFConv;
    return static_cast<std::size_t>(slot < 0 ? slot + FDLtoBUFConv : slot);
}

/// A spectrum that memory failed for, or that was never lent, counts as zeros: the ear is silent.
bool convClass::canSum(const RingView& ring, bool compensated) const noexcept {
    const auto present = [](const std::vector<ComplexBin*>& spectra) {
        return std::find(spectra.begin(), spectra.end(), nullptr) == spectra.end();
    };
    const bool response = compensated ? hpTFspectrumL != nullptr && hpTFspectrumR != nullptr
                                      : present(filterPartsL) && present(filterPartsR);
    return accumulators().complete() && end_.complete() && sums_.ready() && response &&
           present(ring.spectra);
}

/// One block from a ring with the spectra as they stand.
/// @param goesOn  the result may go on in the next block
void convClass::render(const RingView& ring, const RingView& other, bool goesOn) noexcept {
    const bool compensated = hpTFactive && FDLtoBUFConv == 1;
    farHeard_ = false;
    if (ring.state != nullptr && ring.state->silent() && ifftHandle != nullptr) {
        renderSilence();
        return;
    }
    resultSilent_ = false;
    const bool complete = canSum(ring, compensated);
    bool summed = false;
    if (complete && compensated) {
        sums_.begin();
        sums_.add(ring.spectra[0], hpTFspectrumL, hpTFspectrumR);
        summed = sums_.store(accumulators());
    } else if (complete) {
        farHeard_ = findFarCorrections(ring, other, scaled_, scaled_);
        const Layout layout = layoutOf(scaled_);
        collect(ring, 0, layout.scaledBegin, Pick::all);
        summed = sums_.store(accumulators());
        if (owedCount_ > 0) {
            summed = addOwed(ring, summed);
        }
    }
    if (!summed) {
        clearSums(accumulators());
    }
    if (complete && !compensated) {
        const Layout layout = layoutOf(scaled_);
        collect(ring, layout.scaledBegin, layout.end, Pick::all);
        addFarHeld();
        sums_.addTo(accumulators(), layout.gain);
        subtractFarExpected(accumulators(), layout.gain);
    }
    const bool kept = goesOn && complete && !compensated;
    const bool made = transformBack(blockLength, kept);
    if (kept) {
        keepResult(made, layoutOf(scaled_).end);
    }
    if (farHeard_) {
        far_->addTo(outputL + blockLength, outputR + blockLength, layoutOf(scaled_).gain,
                    blockLength);
    }
}

/// The results of a silent block are still there in the next one.
void convClass::renderSilence() noexcept {
    dftiStatus = transformOk;
    for (float* const output : {outputL, outputR}) {
        if (output != nullptr && !resultSilent_) {
            std::fill_n(output, fftLength, 0.0f);
        }
    }
    resultSilent_ = true;
}

/// What the uniform sums cover in this block, and from where on with a gain. Without a gain of
/// its end a response whose far tail is heard ends its uniform part there as well.
convClass::Layout convClass::layoutOf(const ScaledPartitions& scaled) const noexcept {
    const std::size_t end = farHeard_ ? far_->firstPartition() : filterPartsL.size();
    return scaled.begin < end
               ? Layout{scaled.begin, end, scaled.gain}
               : Layout{end, end, scaled.begin < filterPartsL.size() ? scaled.gain : 1.0f};
}

/// Partitions whose spectra nobody keeps: each is made and used at once, in the nearest cache.
/// @param summed  there is a sum to add to
/// @return whether there is one now
bool convClass::addOwed(const RingView& ring, bool summed) noexcept {
    const auto partitions = static_cast<std::size_t>(FDLtoBUFConv);
    std::int32_t pairs = 0;
    const auto sum = [&] {
        if (summed) {
            sums_.addTo(accumulators());
        } else {
            summed = sums_.store(accumulators());
        }
        sums_.begin();
        pairs = 0;
    };
    sums_.begin();
    for (std::size_t i = 0; i < owed_.size(); ++i) {
        if (owed_[i] == 0) {
            continue;
        }
        ComplexBin* const left = shared_ + std::ptrdiff_t{2} * (1 + pairs) * stride_;
        ComplexBin* const right = left + stride_;
        takePartition(i, left, right);
        const std::size_t slot = (ring.newest + partitions - i) % partitions;
        if (silent_[i] != 0 || ring.state->silent(slot)) {
            continue;
        }
        sums_.add(ring.spectra[slot], left, right);
        if (++pairs == passingPairs) {
            sum();
        }
    }
    if (pairs > 0) {
        sum();
    }
    return summed;
}

/// Pairs the chosen partitions in [begin, end) with their inputs. What is known to be zero is left
/// out.
void convClass::collect(const RingView& ring,
                        std::size_t begin,
                        std::size_t end,
                        Pick pick) noexcept {
    const auto partitions = static_cast<std::size_t>(FDLtoBUFConv);
    sums_.begin();
    for (std::size_t i = begin; i < end; ++i) {
        const bool touched = changed_[i] != 0;
        const bool owed = i < owed_.size() && owed_[i] != 0;
        if (silent_[i] != 0 || owed ||
            (touched ? pick == Pick::untouched : pick == Pick::touched)) {
            continue;
        }
        // Partition i meets the input of i blocks ago.
        const std::size_t slot = (ring.newest + partitions - i) % partitions;
        if (ring.state == nullptr || !ring.state->silent(slot)) {
            sums_.add(ring.spectra[slot], filterPartsL[i], filterPartsR[i]);
        }
    }
}

/// Whether the far tail can stand for its partitions in this block: its response is that of the
/// spectra, it is behind all samples without the gain of the end, and where a ring holds something
/// else than the input as it came, which crossfade blocks bring about, the difference is known and
/// small.
bool convClass::findFarCorrections(const RingView& ring,
                                   const RingView& other,
                                   const ScaledPartitions& before,
                                   const ScaledPartitions& now) noexcept {
    farHeld_.clear();
    farExpected_.clear();
    if (far_ == nullptr || !far_->ready() || ring.state == nullptr) {
        return false;
    }
    const std::size_t partitions = filterPartsL.size();
    const std::size_t first = far_->firstPartition();
    if (!standsBeforeFar(before) || !standsBeforeFar(now)) {
        return false;
    }
    const std::uint64_t block = far_->block();
    for (std::size_t i = first; i < partitions; ++i) {
        const std::size_t slot = (ring.newest + partitions - i) % partitions;
        const std::uint64_t expected = i < block ? block - i : InputRing::noBlock;
        if (expected != InputRing::noBlock && ring.state->block(slot) == expected) {
            continue;
        }
        if (silent_[i] != 0) {
            continue;
        }
        if (!ring.state->silent(slot)) {
            if (farHeld_.size() == farHeld_.capacity()) {
                return false;
            }
            farHeld_.push_back({i, ring.spectra[slot]});
        }
        if (expected != InputRing::noBlock && !far_->silentBlock(expected)) {
            if (other.state->block(slot) != expected ||
                farExpected_.size() == farExpected_.capacity()) {
                return false;
            }
            farExpected_.push_back({i, other.spectra[slot]});
        }
    }
    return true;
}

/// What has the gain of the end in its samples lies before the far tail, or all of the response
/// has.
bool convClass::standsBeforeFar(const ScaledPartitions& scaled) const noexcept {
    return scaled.begin <= far_->firstPartition() || scaled.begin >= filterPartsL.size();
}

void convClass::addFarHeld() noexcept {
    if (farHeard_) {
        for (const FarCorrection& held : farHeld_) {
            sums_.add(held.spectrum, filterPartsL[held.partition], filterPartsR[held.partition]);
        }
    }
}

void convClass::subtractFarExpected(const EarSpectra& sum, float gain) noexcept {
    if (farHeard_ && !farExpected_.empty()) {
        sums_.begin();
        for (const FarCorrection& expected : farExpected_) {
            sums_.add(expected.spectrum, filterPartsL[expected.partition],
                      filterPartsR[expected.partition]);
        }
        sums_.addTo(sum, -gain);
    }
}

}  // namespace tessaly
