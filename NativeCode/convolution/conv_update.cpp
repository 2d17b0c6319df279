// What an update takes from the responses: the partitions that changed.
#include <algorithm>
#include <cstring>

#include "base/log.h"
#include "base/silence.h"
#include "convolution/conv_class.h"

namespace tessaly {

void convClass::updateFilter() noexcept {
    if (directFilterFeed == 0 && FDLtoBUFConv != 1 && hpTFactive) {
        fullLengthBranch();
    }
    takeResponses();
}

void convClass::takeResponses() noexcept {
    followCompensation();
    continuation_.forget();
    if (directFilterFeed != 0) {
        feedDirectly(firL, timePartsL, filterPartsL);
        feedDirectly(firR, timePartsR, filterPartsR);
    } else {
        findChangedPartitions();
        transformChanged();
        settle();
    }
    if (hpTFactive && FDLtoBUFConv == 1) {
        multiplyHeadphone(filterPartsL[0], hpTFspectrumL, binCount);
        multiplyHeadphone(filterPartsR[0], hpTFspectrumR, binCount);
    }
}

/// Whatever the FIR buffer holds in its first 2B samples, without padding. The other partitions
/// keep the zeros they were made with, and so do their spectra.
void convClass::feedDirectly(float* fir,
                             std::vector<float*>& timeParts,
                             const std::vector<ComplexBin*>& filterParts) noexcept {
    if (firBufferSize < fftLength) {
        return;
    }
    timeParts[0] = fir;
    dftiStatus = FFT(fir, filterParts[0], fftHandle);
}

/// A partition whose samples are bit for bit those last transformed keeps its spectrum: a source
/// that stands still asks for an update in every block.
void convClass::findChangedPartitions() noexcept {
    std::fill(changed_.begin(), changed_.end(), std::uint8_t{0});
    changedCount_ = 0;
    changedTaps_ = 0;
    if (notes_ == nullptr) {
        findChangedPartitions(0, changed_.size());
        return;
    }
    const auto length = static_cast<std::size_t>(blockLength);
    for (const FirStretch& written : notes_->written) {
        findChangedPartitions(
            static_cast<std::size_t>(std::max(written.begin, 0)) / length,
            (static_cast<std::size_t>(std::max(written.end, 0)) + length - 1) / length);
    }
    if (!notes_->written.empty()) {
        noteStartChange(notes_->written.hull().end);
        notes_->written.clear();
    }
}

void convClass::findChangedPartitions(std::size_t first, std::size_t end) noexcept {
    const auto length = static_cast<std::size_t>(blockLength);
    const ScaledPartitions next = scaledNow();
    const auto available = static_cast<std::size_t>(std::max(firBufferSize, 0));
    const auto differs = [length](const float* kept, const float* fir, std::size_t start) {
        return fir != nullptr &&
               (kept == nullptr || std::memcmp(kept, fir + start, length * sizeof(float)) != 0);
    };
    for (std::size_t i = first; i < std::min(end, changed_.size()); ++i) {
        const std::size_t start = i * length;
        if (start + length > available) {
            break;
        }
        if (changed_[i] != 0) {
            continue;
        }
        // One that joins or leaves the scaled end counts differently even with equal samples.
        if (differs(timePartsL[i], firL, start) || differs(timePartsR[i], firR, start) ||
            fftHandle == nullptr || (i < scaled_.begin) != (i < next.begin)) {
            changed_[i] = 1;
            ++changedCount_;
            if (far_ != nullptr && i >= far_->firstPartition()) {
                far_->responseChanged();
            }
        }
    }
}

/// @param taps  all that changed lies before
void convClass::noteStartChange(std::int32_t taps) noexcept {
    if (startTaps_.empty() || firL == nullptr || firR == nullptr ||
        taps > std::min(directTaps, blockLength) || taps > firBufferSize) {
        return;
    }
    changedTaps_ = taps;
}

/// What the start was more than what it is, where only that changed.
void convClass::findStartChange() noexcept {
    float* const kept = startTaps_.data();
    float* const change = startChange_.data();
    const auto factor = static_cast<float>(fftLength);  // of the unscaled transforms
    for (std::int32_t k = 0; k < changedTaps_; ++k) {
        change[k] = factor * (kept[k] - firL[k]);
        change[directTaps + k] = factor * (kept[directTaps + k] - firR[k]);
    }
}

void convClass::transformChanged() noexcept {
    scaled_ = scaledNow();
    for (std::size_t i = 0; i < changed_.size(); ++i) {
        const bool owed = i < owed_.size() && owed_[i] != 0;
        if (changed_[i] != 0 && !owed) {
            takePartition(i, filterPartsL[i], filterPartsR[i]);
        }
    }
}

/// A partition of the responses as it stands now, and its spectra.
void convClass::takePartition(std::size_t partition, ComplexBin* left, ComplexBin* right) noexcept {
    const auto length = static_cast<std::size_t>(blockLength);
    const std::size_t start = partition * length;
    const std::uint64_t sounding =
        notes_ != nullptr ? notes_->soundingParts(static_cast<std::int64_t>(start), blockLength)
                          : ~std::uint64_t{0};
    const auto take = [&](const float* fir, float* kept, ComplexBin* spectrum) noexcept {
        if (fir == nullptr) {
            return false;
        }
        if (kept != nullptr) {
            std::memcpy(kept, fir + start, length * sizeof(float));
        }
        dftiStatus = transformPartition(fir + start, spectrum, sounding);
        return sounding == 0 || (~sounding == 0 && allZero(fir + start, length));
    };
    const bool leftSilent = take(firL, timePartsL[partition], left);
    const bool rightSilent = take(firR, timePartsR[partition], right);
    if (firL != nullptr && firR != nullptr) {
        // Its first samples, and no others, are those of the first parts.
        const std::int64_t parts = std::int64_t{64} * Continuation::samples;
        const bool begins =
            (sounding & (~std::uint64_t{0} >>
                         (64 - std::clamp<std::int64_t>(parts / blockLength, 1, 64)))) != 0;
        continuation_.takeTaps(partition, begins ? firL + start : nullptr,
                               begins ? firR + start : nullptr);
        // While its spectrum is owed nobody looks for what changed.
        const bool owed = !owed_.empty() && owed_[0] != 0;
        if (partition == 0 && !startTaps_.empty() && !owed) {
            const std::int32_t taps = std::min({directTaps, blockLength, firBufferSize});
            std::copy_n(firL, taps, startTaps_.data());
            std::copy_n(firR, taps, startTaps_.data() + directTaps);
        }
    }
    silent_[partition] = leftSilent && rightSilent && dftiStatus == transformOk ? 1 : 0;
}

/// Makes the spectra of all partitions that had none.
void convClass::settle() noexcept {
    for (std::size_t i = 0; i < owed_.size() && owedCount_ > 0; ++i) {
        if (owed_[i] != 0) {
            owed_[i] = 0;
            --owedCount_;
            takePartition(i, filterPartsL[i], filterPartsR[i]);
        }
    }
}

/// The far tail is built from what the spectra were made of: a copy where there is one of all
/// samples, the response itself where its writer tells of each change.
/// @param taken  the copies are those of the present responses
void convClass::advanceFarTail(bool silent, bool taken) noexcept {
    if (far_ == nullptr) {
        return;
    }
    const bool copied = !timePartsL.empty() && timePartsL.back() != nullptr;
    if (copied && !taken) {
        far_->advance(input, silent, standsBeforeFar(scaled_), nullptr, nullptr);
        return;
    }
    const float* const left = copied ? timeMemoryL_.data() : firL;
    const float* const right = copied ? timeMemoryR_.data() : firR;
    const auto near = static_cast<std::int32_t>(far_->firstPartition()) * blockLength;
    if (!copied && notes_ != nullptr && notes_->written.hull().end > near) {
        // Written, but not taken yet.
        far_->responseChanged();
        far_->advance(input, silent, false, nullptr, nullptr);
        return;
    }
    far_->advance(input, silent, standsBeforeFar(scaled_), left, right);
}

/// Compensation of the whole response at once. Its handles are never created, so every transform
/// is refused and reported, and the responses stay as they are.
void convClass::fullLengthBranch() noexcept {
    const std::int32_t bins = firLengthHalf + 1;
    clearSpectrum(hpTFspectrumL, bins - 1);
    clearSpectrum(hpTFspectrumR, bins - 1);
    logTrace("Full HPTF-CONV");
    dftiStatus = FFT(firL, hpTFspectrumL, fftHandleFull);
    dftiStatus = FFT(firR, hpTFspectrumR, fftHandleFull);
    multiplyHeadphone(hpTFspectrumL, hpTFspectrumL, bins);
    multiplyHeadphone(hpTFspectrumR, hpTFspectrumR, bins);
    dftiStatus = IFFT(hpTFspectrumL, firL, ifftHandleFull);
    dftiStatus = IFFT(hpTFspectrumR, firR, ifftHandleFull);
}

/// Where the headphone spectrum ends early, or there is none, the product is zero.
void convClass::multiplyHeadphone(const ComplexBin* filter,
                                  ComplexBin* product,
                                  std::int32_t bins) noexcept {
    if (filter == nullptr || product == nullptr) {
        return;
    }
    const std::int32_t present = std::min(bins, HpTF_FreqBins);
    vcMul(present, filter, tessaly::HpTF_Freq, product);
    if (present < bins) {
        clearSpectrum(product + present, bins - present - 1);
    }
}

convClass::ScaledPartitions convClass::scaledNow() const noexcept {
    const std::size_t all = filterPartsL.size();
    if (notes_ == nullptr || blockLength <= 0) {
        return {all, 1.0f};
    }
    const ScaledEnd& end = notes_->scaledEnd;
    const auto begin = static_cast<std::size_t>(std::max(end.begin, 0) / blockLength);
    return {std::min(begin, all), end.gain};
}

}  // namespace tessaly
