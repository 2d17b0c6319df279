// One block of partitioned convolution, the filter update and the headphone compensation.
#include "convolution/conv_class.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/process_lifetime.h"
#include "convolution/simd/kernels.h"

namespace tessaly {
namespace {

/// Headphone spectra for the process's life: a second instance and other engines may still be
/// reading a spectrum that its maker has replaced or left behind. The list only keeps them in
/// reach; it is written where they are made, at load and when the selection changes.
struct KeptSpectra {
    std::vector<ComplexBin*> spectra;

    ~KeptSpectra() { release(); }
    void release() noexcept {
        for (ComplexBin*& spectrum : spectra) {
            freeSpectrum(spectrum);
        }
        spectra.clear();
    }
};

KeptSpectra& keptSpectra() noexcept {
    static ProcessLifetime<KeptSpectra> kept;
    return *kept;
}

void allocKeptSpectrum(ComplexBin*& slot, std::int32_t count) noexcept {
    allocSpectrum(slot, count);
    if (slot == nullptr) {
        return;
    }
    try {
        keptSpectra().spectra.push_back(slot);
    } catch (const std::bad_alloc&) {
        freeSpectrum(slot);
        essError = essErrorSpectrumMemory;
    }
}

/// Bins from one spectrum to the next: whole cache lines and no multiple of 4 KB.
std::int32_t strideFor(std::int32_t bins) noexcept {
    constexpr std::int32_t binsPerLine = 8;
    constexpr std::int32_t binsPerPage = 512;
    std::int32_t stride = (bins + binsPerLine - 1) / binsPerLine * binsPerLine;
    if (stride % binsPerPage == 0) {
        stride += binsPerLine;
    }
    return stride;
}

/// Points `entries` at consecutive spectra of one block; all null without memory for it.
void carveSpectra(std::vector<ComplexBin*>& entries, ComplexBin*& memory, std::int32_t stride) {
    const std::int64_t bins = static_cast<std::int64_t>(entries.size()) * stride;
    allocSpectrum(memory, bins <= INT32_MAX ? static_cast<std::int32_t>(bins) : 0);
    for (std::size_t i = 0; memory != nullptr && i < entries.size(); ++i) {
        entries[i] = memory + static_cast<std::ptrdiff_t>(i) * stride;
    }
}

/// y += x * gain, bin by bin.
void addScaled(std::size_t bins, const ComplexBin* x, float gain, ComplexBin* y) noexcept {
    for (std::size_t i = 0; i < bins; ++i) {
        y[i].re += x[i].re * gain;
        y[i].im += x[i].im * gain;
    }
}

void carveTimeParts(std::vector<float*>& entries, AlignedArray<float>& memory, std::size_t length) {
    memory = AlignedArray<float>(entries.size() * length);
    for (std::size_t i = 0; i < entries.size(); ++i) {
        entries[i] = memory.data() + i * length;
    }
}

}  // namespace

constinit std::int32_t convInstanceCount = 0;
constinit ComplexBin* HpTF_Freq = nullptr;
constinit std::int32_t HpTF_FreqBins = 0;
constinit std::int32_t hpTFtimeLength = 0;

void resetConvolutionState() noexcept {
    convInstanceCount = 0;
    HpTF_Freq = nullptr;
    HpTF_FreqBins = 0;
    hpTFtimeLength = 0;
    keptSpectra().release();
}

convClass::convClass(std::string instanceNameIn,
                     std::int32_t blockLengthIn,
                     float*& inputIn,
                     float*& outputLIn,
                     float*& outputRIn,
                     float*& firLIn,
                     float*& firRIn,
                     bool& filterChangeAllIn,
                     bool& forceUpdateAllIn,
                     bool& qualityFlagIn,
                     std::uint8_t directFilterFeedIn,
                     bool& filterUpdatePendingIn,
                     float& interpAngleOffsetIn,
                     float& distanceIn,
                     std::uint8_t isSecondInstanceIn,
                     bool& fadingIn,
                     bool& secondOLSactiveIn,
                     bool& hpTFactiveIn,
                     float*& hpTFtimeIn,
                     std::int16_t& hpTFselectIn,
                     float& blockGainLinearIn,
                     bool& holdInterpPairIn,
                     std::uint32_t& blockCounterIn,
                     std::int32_t FIR_size,
                     std::int32_t firBufferSizeIn,
                     std::int16_t partitions)
    : convNumber(convInstanceCount),
      filterChangeAll(filterChangeAllIn),
      forceUpdateAll(forceUpdateAllIn),
      qualityFlagRef(qualityFlagIn),
      directFilterFeed(directFilterFeedIn),
      filterUpdatePendingRef(filterUpdatePendingIn),
      interpAngleOffsetRef(interpAngleOffsetIn),
      isSecondInstance(isSecondInstanceIn),
      fadingRef(fadingIn),
      secondOLSactive(secondOLSactiveIn),
      distanceRef(distanceIn),
      hpTFactive(hpTFactiveIn),
      hpTFselectSeen(hpTFselectIn),
      hpTFselect(hpTFselectIn),
      instanceName(std::move(instanceNameIn)),
      input(inputIn),
      outputL(outputLIn),
      outputR(outputRIn),
      firL(firLIn),
      firR(firRIn),
      hpTFtimeCopy(hpTFtimeIn),
      hpTFtime(hpTFtimeIn),
      fftLength(2 * blockLengthIn),
      blockLength(blockLengthIn),
      binCount(blockLengthIn + 1),
      firLength(FIR_size),
      firLengthHalf(FIR_size / 2),
      firBufferSize(firBufferSizeIn),
      blockGainLinearRef(blockGainLinearIn),
      holdInterpPairRef(holdInterpPairIn),
      blockCounterRef(blockCounterIn),
      // A partition count that wrapped below 1 leaves one partition.
      FDLtoBUFConv(std::max<std::int16_t>(partitions, 1)),
      partitionsAtCreation(FDLtoBUFConv),
      stride_(strideFor(blockLengthIn + 1)) {
    ++convInstanceCount;
    FDLpos = static_cast<std::int16_t>(FDLtoBUFConv - 1);
    // One accuracy serves all vector operations, so the mode is the choice of instruction set.
    kernels_ = &selectKernels();

    const auto count = static_cast<std::size_t>(FDLtoBUFConv);
    const auto window = static_cast<std::size_t>(std::max(fftLength, 0));
    timePartsL.resize(count);
    timePartsR.resize(count);
    carveTimeParts(timePartsL, timeMemoryL_, window);
    carveTimeParts(timePartsR, timeMemoryR_, window);
    fftOrder = fftLength > 0 ? 31 - std::countl_zero(static_cast<std::uint32_t>(fftLength)) : 0;

    FDL.resize(count);
    FDLown.resize(count);
    filterPartsL.resize(count);
    filterPartsR.resize(count);
    carveSpectra(FDL, ringMemory_, stride_);
    if (isSecondInstance == 0) {
        FDLown = FDL;
        carveSpectra(filterPartsL, partsMemoryL_, stride_);
        carveSpectra(filterPartsR, partsMemoryR_, stride_);
    }
    allocSpectrum(accumL, binCount);
    allocSpectrum(accumR, binCount);
    for (ComplexBin** const spectrum : {&partL_, &partR_, &endL_, &endR_}) {
        allocSpectrum(*spectrum, binCount);
    }
    scaled_.begin = count;
    changed_.resize(count);
    silent_.resize(count);
    chosenRing_.resize(count);
    chosenLeft_.resize(count);
    chosenRight_.resize(count);

    dftiStatus = createFFT(fftHandle, fftLength);
    dftiStatus = createFFT(ifftHandle, fftLength);
    if (fftHandle == nullptr) {
        essError = essErrorTransformPlan;
    }
    if (hpTFactive) {
        HpTF_Freq();
    } else {
        hpTFloaded = 0;
    }
}

// The headphone spectra stay for the process's life, and what was borrowed is not ours.
convClass::~convClass() {
    fftHandle.reset();
    ifftHandle.reset();
    freeSpectrum(ringMemory_);
    if (isSecondInstance == 0) {
        freeSpectrum(partsMemoryL_);
        freeSpectrum(partsMemoryR_);
    }
    freeSpectrum(accumL);
    freeSpectrum(accumR);
    for (ComplexBin** const spectrum : {&partL_, &partR_, &endL_, &endR_}) {
        freeSpectrum(*spectrum);
    }
}

void convClass::clearFDL() noexcept {
    for (ComplexBin* const spectrum : FDL) {
        clearSpectrum(spectrum, binCount - 1);
    }
}

void convClass::HpTF_Freq() noexcept {
    if (convNumber == 0) {
        allocKeptSpectrum(tessaly::HpTF_Freq, headphoneBins());
        HpTF_FreqBins = tessaly::HpTF_Freq != nullptr ? headphoneBins() : 0;
        logTrace("FDLtoBUFConv = ", FDLtoBUFConv);
        if (FDLtoBUFConv == 1) {
            hpTFtimeCopy = hpTFtime;
            transformHeadphoneFilter();
        }
    } else {
        logTrace(
            "Filter for HpTF-Compensation already present in first Instance of convClass. "
            "(static)");
    }
    allocKeptSpectrum(hpTFspectrumL, headphoneBins());
    allocKeptSpectrum(hpTFspectrumR, headphoneBins());
    hpTFloaded = 1;
}

/// The filter may have been loaded for shorter blocks than these: zeros follow it.
void convClass::transformHeadphoneFilter() noexcept {
    if (hpTFtimeCopy == nullptr || tessaly::HpTF_Freq == nullptr) {
        return;
    }
    if (hpTFtimeLength >= fftLength) {
        dftiStatus = FFT(hpTFtimeCopy, tessaly::HpTF_Freq, fftHandle);
        return;
    }
    ComplexBin* padded = nullptr;
    allocSpectrum(padded, blockLength);
    if (padded != nullptr) {
        float* const samples = &padded->re;
        std::copy_n(hpTFtimeCopy, std::max(hpTFtimeLength, 0), samples);
        dftiStatus = FFT(samples, tessaly::HpTF_Freq, fftHandle);
        freeSpectrum(padded);
    }
}

float* convClass::process() noexcept {
    watchSelection();
    // In a crossfade block the first instance works on the spectrum that the second one made.
    if (!secondOLSactive || isSecondInstance != 0) {
        dftiStatus = FFT(input, FDL[newestSlot()], fftHandle);
    }
    if ((filterChangeAll || forceUpdateAll) && isSecondInstance == 0) {
        updateFilter();
    }
    accumulate();
    dftiStatus = IFFT(accumL, outputL, ifftHandle);
    dftiStatus = IFFT(accumR, outputR, ifftHandle);
    return outputL;
}

/// The engine writes the index; one outside of the ring is taken modulo N.
std::size_t convClass::newestSlot() const noexcept {
    const int slot = FDLpos % FDLtoBUFConv;
    return static_cast<std::size_t>(slot < 0 ? slot + FDLtoBUFConv : slot);
}

/// Either branch that writes or reads a product spectrum stays within this many bins.
std::int32_t convClass::headphoneBins() const noexcept {
    return std::max(binCount, firLengthHalf + 1);
}

void convClass::watchSelection() noexcept {
    if (hpTFselect == hpTFselectSeen) {
        return;
    }
    if (hpTFloaded == 0) {
        logTrace("HpTF not loaded yet-> so loading...");
        HpTF_Freq();
    } else if (convNumber == 0) {
        logTrace("HpTF already allocated only transform it, but load it better!");
        HpTF_Freq();
    } else {
        logTrace("HpTF already loaded and allocated so nothing to do!");
    }
    hpTFselectSeen = hpTFselect;
}

void convClass::updateFilter() noexcept {
    if (directFilterFeed != 0) {
        feedDirectly(firL, timePartsL, filterPartsL);
        feedDirectly(firR, timePartsR, filterPartsR);
    } else {
        if (FDLtoBUFConv != 1 && hpTFactive) {
            fullLengthBranch();
        }
        findChangedPartitions();
        transformChanged();
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
    const auto length = static_cast<std::size_t>(blockLength);
    std::size_t first = 0;
    std::size_t end = changed_.size();
    if (notes_ != nullptr) {
        FirStretch& written = notes_->written;
        if (written.empty()) {
            return;
        }
        first = static_cast<std::size_t>(std::max(written.begin, 0)) / length;
        end = std::min(end, (static_cast<std::size_t>(written.end) + length - 1) / length);
        written.clear();
    }
    const ScaledPartitions next = scaledNow();
    const auto available = static_cast<std::size_t>(std::max(firBufferSize, 0));
    const std::size_t bytes = length * sizeof(float);
    for (std::size_t i = first; i < end; ++i) {
        const std::size_t start = i * length;
        if (start + length > available) {
            break;
        }
        const bool known =
            (firL == nullptr || std::memcmp(timePartsL[i], firL + start, bytes) == 0) &&
            (firR == nullptr || std::memcmp(timePartsR[i], firR + start, bytes) == 0);
        // One that joins or leaves the scaled end counts differently even with equal samples.
        if (!known || fftHandle == nullptr || (i < scaled_.begin) != (i < next.begin)) {
            changed_[i] = 1;
            ++changedCount_;
        }
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

void convClass::transformChanged() noexcept {
    scaled_ = scaledNow();
    const auto length = static_cast<std::size_t>(blockLength);
    const auto take = [&](const float* fir, float* samples, ComplexBin* spectrum,
                          std::size_t start) noexcept {
        if (fir == nullptr) {
            return false;
        }
        std::memcpy(samples, fir + start, length * sizeof(float));
        dftiStatus = FFT(samples, spectrum, fftHandle);
        return std::all_of(samples, samples + length, [](float x) { return x == 0.0f; });
    };
    for (std::size_t i = 0; i < changed_.size(); ++i) {
        if (changed_[i] != 0) {
            const bool leftSilent = take(firL, timePartsL[i], filterPartsL[i], i * length);
            const bool rightSilent = take(firR, timePartsR[i], filterPartsR[i], i * length);
            silent_[i] = leftSilent && rightSilent && dftiStatus == transformOk ? 1 : 0;
        }
    }
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

/// A spectrum that memory failed for, or that was never lent, counts as zeros: the ear is silent.
void convClass::accumulate() noexcept {
    const bool compensated = hpTFactive && FDLtoBUFConv == 1;
    const ComplexBin* const* const left = compensated ? &hpTFspectrumL : filterPartsL.data();
    const ComplexBin* const* const right = compensated ? &hpTFspectrumR : filterPartsR.data();
    const auto partitions = static_cast<std::size_t>(FDLtoBUFConv);
    bool complete = accumL != nullptr && accumR != nullptr && hasSumMemory();
    for (std::size_t i = 0; i < partitions; ++i) {
        complete = complete && FDL[i] != nullptr && left[i] != nullptr && right[i] != nullptr;
    }
    if (!complete) {
        clearSpectrum(accumL, binCount - 1);
        clearSpectrum(accumR, binCount - 1);
        return;
    }
    if (compensated) {
        kernels_->ringSum(static_cast<std::size_t>(binCount), partitions, newestSlot(), FDL.data(),
                          left, right, accumL, accumR);
        return;
    }
    accumulateFrom(*this);
}

bool convClass::hasSumMemory() const noexcept {
    return partL_ != nullptr && partR_ != nullptr && endL_ != nullptr && endR_ != nullptr;
}

void convClass::accumulateFrom(const convClass& ring) noexcept {
    clearSpectrum(accumL, binCount - 1);
    clearSpectrum(accumR, binCount - 1);
    addSums(
        ring, [](std::size_t) { return true; }, scaled_, accumL, accumR);
}

/// Sum over chosen partitions of this instance's spectra with the ring of any. Partitions that are
/// known to be zero are left out. @return false, and nothing written, if none is left
template <typename Choice>
bool convClass::sumOver(const convClass& ring,
                        Choice&& chosen,
                        ComplexBin* sumL,
                        ComplexBin* sumR) noexcept {
    const auto partitions = static_cast<std::size_t>(FDLtoBUFConv);
    const std::size_t newest = ring.newestSlot();
    std::size_t count = 0;
    for (std::size_t i = 0; i < partitions; ++i) {
        if (silent_[i] == 0 && chosen(i)) {
            // Partition i meets the input of i blocks ago.
            chosenRing_[count] = ring.FDL[(newest + partitions - i) % partitions];
            chosenLeft_[count] = filterPartsL[i];
            chosenRight_[count] = filterPartsR[i];
            ++count;
        }
    }
    if (count == 0) {
        return false;
    }
    // The kernel pairs slot k of a ring with partition count - k.
    std::reverse(chosenRing_.begin() + 1, chosenRing_.begin() + static_cast<std::ptrdiff_t>(count));
    kernels_->ringSum(static_cast<std::size_t>(binCount), count, 0, chosenRing_.data(),
                      chosenLeft_.data(), chosenRight_.data(), sumL, sumR);
    return true;
}

/// Adds the chosen partitions, those of the scaled end with its gain.
template <typename Choice>
void convClass::addSums(const convClass& ring,
                        Choice&& chosen,
                        const ScaledPartitions& scaled,
                        ComplexBin* sumL,
                        ComplexBin* sumR) noexcept {
    const auto bins = static_cast<std::size_t>(binCount);
    const std::size_t begin = scaled.begin;
    if (sumOver(
            ring, [&](std::size_t i) { return i < begin && chosen(i); }, partL_, partR_)) {
        kernels_->add(bins, sumL, partL_, sumL);
        kernels_->add(bins, sumR, partR_, sumR);
    }
    if (sumOver(
            ring, [&](std::size_t i) { return i >= begin && chosen(i); }, partL_, partR_)) {
        addScaled(bins, partL_, scaled.gain, sumL);
        addScaled(bins, partR_, scaled.gain, sumR);
    }
}

/// The plain order of a crossfade block, for all cases that the shared sum does not cover.
void convClass::borrowAndProcess(convClass& second) noexcept {
    second.scaled_ = scaled_;  // it renders with these spectra as they stand
    second.process();
    std::copy(second.FDL.begin(), second.FDL.end(), FDL.begin());
    process();
    std::copy(FDLown.begin(), FDLown.end(), FDL.begin());
}

bool convClass::sharesWith(const convClass& second) const noexcept {
    if (hpTFactive && FDLtoBUFConv == 1) {
        return false;
    }
    bool shares = directFilterFeed == 0 && isSecondInstance == 0 && second.isSecondInstance != 0 &&
                  second.FDLtoBUFConv == FDLtoBUFConv && second.binCount == binCount &&
                  second.newestSlot() == newestSlot() && fftHandle != nullptr &&
                  second.fftHandle != nullptr && accumL != nullptr && accumR != nullptr &&
                  second.accumL != nullptr && second.accumR != nullptr && hasSumMemory();
    for (std::size_t i = 0; shares && i < FDL.size(); ++i) {
        shares = second.FDL[i] != nullptr && filterPartsL[i] != nullptr &&
                 filterPartsR[i] != nullptr && second.filterPartsL[i] == filterPartsL[i] &&
                 second.filterPartsR[i] == filterPartsR[i];
    }
    return shares;
}

void convClass::processCrossfade(convClass& second, std::int32_t heardOfOld) noexcept {
    if (!sharesWith(second)) {
        borrowAndProcess(second);
        return;
    }
    second.watchSelection();
    second.dftiStatus = FFT(second.input, second.FDL[newestSlot()], second.fftHandle);
    watchSelection();
    const bool update = filterChangeAll || forceUpdateAll;
    if (update && hpTFactive) {
        fullLengthBranch();
    }
    changedCount_ = 0;
    const ScaledPartitions before = scaled_;
    if (update) {
        findChangedPartitions();
        scaled_ = scaledNow();
    }
    const bool sameLevel = before.begin == scaled_.begin && before.gain == scaled_.gain;
    if (changedCount_ == 0 && sameLevel) {
        accumulateFrom(second);
        dftiStatus = IFFT(accumL, outputL, ifftHandle);
        dftiStatus = IFFT(accumR, outputR, ifftHandle);
        const std::int32_t heard = std::clamp(heardOfOld, 0, blockLength);
        std::copy_n(outputL + blockLength, heard, second.outputL + blockLength);
        std::copy_n(outputR + blockLength, heard, second.outputR + blockLength);
        return;
    }

    // What both responses share: untouched partitions, and the end without its gain.
    const std::size_t lastBegin = std::max(before.begin, scaled_.begin);
    const auto touched = [this](std::size_t i) { return changed_[i] != 0; };
    const auto near = [&](std::size_t i) { return changed_[i] == 0 && i < lastBegin; };
    const auto end = [&](std::size_t i) { return changed_[i] == 0 && i >= lastBegin; };
    if (!sumOver(second, near, accumL, accumR)) {
        clearSpectrum(accumL, binCount - 1);
        clearSpectrum(accumR, binCount - 1);
    }
    const bool hasEnd = sumOver(second, end, endL_, endR_);
    const auto addEnd = [&](float gain, ComplexBin* sumL, ComplexBin* sumR) {
        if (hasEnd) {
            addScaled(static_cast<std::size_t>(binCount), endL_, gain, sumL);
            addScaled(static_cast<std::size_t>(binCount), endR_, gain, sumR);
        }
    };

    const auto bins = static_cast<std::size_t>(binCount);
    std::copy_n(accumL, bins, second.accumL);
    std::copy_n(accumR, bins, second.accumR);
    addSums(second, touched, before, second.accumL, second.accumR);
    addEnd(before.gain, second.accumL, second.accumR);
    second.dftiStatus = IFFT(second.accumL, second.outputL, second.ifftHandle);
    second.dftiStatus = IFFT(second.accumR, second.outputR, second.ifftHandle);

    transformChanged();
    addSums(second, touched, scaled_, accumL, accumR);
    addEnd(scaled_.gain, accumL, accumR);
    dftiStatus = IFFT(accumL, outputL, ifftHandle);
    dftiStatus = IFFT(accumR, outputR, ifftHandle);
}

}  // namespace tessaly
