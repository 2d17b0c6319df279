// One block of partitioned convolution, the filter update and the headphone compensation.
#include "convolution/conv_class.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/process_lifetime.h"
#include "convolution/sample_scan.h"
#include "convolution/simd/kernels.h"
#include "convolution/spectrum_stride.h"

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

/// Points `entries` at consecutive spectra of one block; all null without memory for it.
void carveSpectra(std::vector<ComplexBin*>& entries, ComplexBin*& memory, std::int32_t stride) {
    const std::int64_t bins = static_cast<std::int64_t>(entries.size()) * stride;
    allocSpectrum(memory, bins <= INT32_MAX ? static_cast<std::int32_t>(bins) : 0);
    for (std::size_t i = 0; memory != nullptr && i < entries.size(); ++i) {
        entries[i] = memory + static_cast<std::ptrdiff_t>(i) * stride;
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
      stride_(spectrumStride(blockLengthIn + 1)) {
    ++convInstanceCount;
    FDLpos = static_cast<std::int16_t>(FDLtoBUFConv - 1);
    // One accuracy serves all vector operations, so the mode is the choice of instruction set.
    kernels_ = &selectKernels();

    const auto count = static_cast<std::size_t>(FDLtoBUFConv);
    timePartsL.resize(count);
    timePartsR.resize(count);
    keepTimeParts(isSecondInstance == 0 ? count : 0);
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
    sums_.prepare(*kernels_, binCount, count);
    allocSpectrum(end_.left, binCount);
    allocSpectrum(end_.right, binCount);
    scaled_.begin = count;
    changed_.resize(count);
    silent_.resize(count);
    ring_.prepare(count);

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
    freeSpectrum(end_.left);
    freeSpectrum(end_.right);
}

void convClass::keepTimeParts(std::size_t partitions) {
    const auto length = static_cast<std::size_t>(std::max(blockLength, 0));
    const auto carve = [&](std::vector<float*>& entries, AlignedArray<float>& memory) {
        memory = AlignedArray<float>(partitions * length);
        for (std::size_t i = 0; i < entries.size(); ++i) {
            entries[i] = i < partitions ? memory.data() + i * length : nullptr;
        }
    };
    carve(timePartsL, timeMemoryL_);
    carve(timePartsR, timeMemoryR_);
}

void convClass::watch(FirNotes* notes, std::int32_t compared) {
    notes_ = notes;
    if (notes != nullptr && blockLength > 0 && isSecondInstance == 0) {
        const std::int32_t partitions = (std::max(compared, 0) + blockLength - 1) / blockLength;
        keepTimeParts(std::min(static_cast<std::size_t>(partitions), timePartsL.size()));
    }
}

void convClass::splitFarTail(std::int32_t ratio) {
    auto far = std::make_unique<FarTail>();
    const auto count = static_cast<std::size_t>(FDLtoBUFConv);
    if (isSecondInstance != 0 || directFilterFeed != 0 ||
        !far->prepare(*kernels_, blockLength, count, ratio)) {
        return;
    }
    // Where more than that is to be made up for, the uniform sum is no dearer.
    const std::size_t corrections = (count - far->firstPartition()) / 4 + 1;
    farHeld_.reserve(corrections);
    farExpected_.reserve(corrections);
    far_ = std::move(far);
}

void convClass::clearFDL() noexcept {
    for (ComplexBin* const spectrum : FDL) {
        clearSpectrum(spectrum, binCount - 1);
    }
    // While the ring is borrowed, its owner's knowledge of it is not this instance's.
    if (isSecondInstance != 0 || FDL == FDLown) {
        ring_.clear();
    }
    if (far_ != nullptr) {
        far_->clear();
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
    const bool borrowed = secondOLSactive && isSecondInstance == 0;
    if (!borrowed) {
        takeInput(blockNumber());
    }
    if ((filterChangeAll || forceUpdateAll) && isSecondInstance == 0) {
        updateFilter();
    }
    advanceFarTail();
    const RingView ring = borrowed ? RingView{FDL, nullptr, newestSlot()} : ownRing();
    render(ring, partner_ != nullptr ? partner_->ownRing() : ring);
    return outputL;
}

/// The number of the block that is being made; 0 where nobody counts.
std::uint64_t convClass::blockNumber() const noexcept {
    return far_ != nullptr ? far_->block() + 1 : InputRing::noBlock;
}

/// A window of zeros has a spectrum of zeros.
void convClass::takeInput(std::uint64_t block) noexcept {
    const std::size_t slot = newestSlot();
    ComplexBin* const spectrum = FDL[slot];
    const bool silent = fftHandle != nullptr && input != nullptr && spectrum != nullptr &&
                        allZero(input, static_cast<std::size_t>(fftLength));
    if (silent) {
        if (!ring_.silent(slot)) {
            clearSpectrum(spectrum, binCount - 1);
        }
        dftiStatus = transformOk;
    } else {
        dftiStatus = FFT(input, spectrum, fftHandle);
    }
    ring_.set(slot, silent, dftiStatus == transformOk ? block : InputRing::noBlock);
}

convClass::RingView convClass::ownRing() const noexcept {
    return {FDLown.empty() || isSecondInstance != 0 ? FDL : FDLown, &ring_, newestSlot()};
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
    const auto differs = [length](const float* kept, const float* fir, std::size_t start) {
        return fir != nullptr &&
               (kept == nullptr || std::memcmp(kept, fir + start, length * sizeof(float)) != 0);
    };
    for (std::size_t i = first; i < end; ++i) {
        const std::size_t start = i * length;
        if (start + length > available) {
            break;
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

void convClass::transformChanged() noexcept {
    scaled_ = scaledNow();
    const auto length = static_cast<std::size_t>(blockLength);
    const auto take = [&](const float* fir, float* kept, ComplexBin* spectrum) noexcept {
        if (fir == nullptr) {
            return false;
        }
        if (kept != nullptr) {
            std::memcpy(kept, fir, length * sizeof(float));
        }
        dftiStatus = halfFFT(fir, spectrum, fftHandle);
        return allZero(fir, length);
    };
    for (std::size_t i = 0; i < changed_.size(); ++i) {
        if (changed_[i] != 0) {
            const std::size_t start = i * length;
            const bool leftSilent =
                take(firL != nullptr ? firL + start : nullptr, timePartsL[i], filterPartsL[i]);
            const bool rightSilent =
                take(firR != nullptr ? firR + start : nullptr, timePartsR[i], filterPartsR[i]);
            silent_[i] = leftSilent && rightSilent && dftiStatus == transformOk ? 1 : 0;
        }
    }
}

/// The far tail is built from what the spectra were made of: a copy where there is one of all
/// samples, the response itself where its writer tells of each change.
void convClass::advanceFarTail() noexcept {
    if (far_ == nullptr) {
        return;
    }
    const bool copied = !timePartsL.empty() && timePartsL.back() != nullptr;
    const float* const left = copied ? timeMemoryL_.data() : firL;
    const float* const right = copied ? timeMemoryR_.data() : firR;
    const auto near = static_cast<std::int32_t>(far_->firstPartition()) * blockLength;
    if (!copied && notes_ != nullptr && !notes_->written.empty() && notes_->written.end > near) {
        far_->responseChanged();  // written, but not taken yet
    }
    far_->advance(input, left, right);
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
void convClass::render(const RingView& ring, const RingView& other) noexcept {
    const bool compensated = hpTFactive && FDLtoBUFConv == 1;
    farHeard_ = false;
    const bool complete = canSum(ring, compensated);
    if (complete && ring.state != nullptr && ring.state->silent() && ifftHandle != nullptr) {
        renderSilence();
        return;
    }
    resultSilent_ = false;
    clearSpectrum(accumL, binCount - 1);
    clearSpectrum(accumR, binCount - 1);
    if (complete && compensated) {
        sums_.begin();
        sums_.add(ring.spectra[0], hpTFspectrumL, hpTFspectrumR);
        sums_.store(accumulators());
    } else if (complete) {
        farHeard_ = findFarCorrections(ring, other, scaled_, scaled_);
        const Layout layout = layoutOf(scaled_);
        const auto all = [](std::size_t) { return true; };
        collect(ring, 0, layout.scaledBegin, all);
        sums_.addTo(accumulators());
        collect(ring, layout.scaledBegin, layout.end, all);
        addFarHeld();
        sums_.addTo(accumulators(), layout.gain);
        subtractFarExpected(accumulators(), layout.gain);
    }
    transformBack();
    if (farHeard_) {
        far_->addTo(outputL + blockLength, outputR + blockLength, layoutOf(scaled_).gain,
                    blockLength);
    }
}

void convClass::transformBack() noexcept {
    dftiStatus = IFFT(accumL, outputL, ifftHandle);
    dftiStatus = IFFT(accumR, outputR, ifftHandle);
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

/// Pairs the chosen partitions in [begin, end) with their inputs. What is known to be zero is left
/// out.
template <typename Choice>
void convClass::collect(const RingView& ring,
                        std::size_t begin,
                        std::size_t end,
                        Choice&& chosen) noexcept {
    const auto partitions = static_cast<std::size_t>(FDLtoBUFConv);
    sums_.begin();
    for (std::size_t i = begin; i < end; ++i) {
        if (silent_[i] != 0 || !chosen(i)) {
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
    for (const std::size_t begin : {before.begin, now.begin}) {
        if (begin > first && begin < partitions) {
            return false;
        }
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

convClass::ScaledPartitions convClass::scaledNow() const noexcept {
    const std::size_t all = filterPartsL.size();
    if (notes_ == nullptr || blockLength <= 0) {
        return {all, 1.0f};
    }
    const ScaledEnd& end = notes_->scaledEnd;
    const auto begin = static_cast<std::size_t>(std::max(end.begin, 0) / blockLength);
    return {std::min(begin, all), end.gain};
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
    return directFilterFeed == 0 && isSecondInstance == 0 && second.isSecondInstance != 0 &&
           second.FDLtoBUFConv == FDLtoBUFConv && second.binCount == binCount &&
           second.newestSlot() == newestSlot() && fftHandle != nullptr && ifftHandle != nullptr &&
           second.fftHandle != nullptr && second.ifftHandle != nullptr &&
           second.accumulators().complete() && canSum(second.ownRing(), false) &&
           second.filterPartsL == filterPartsL && second.filterPartsR == filterPartsR;
}

void convClass::processCrossfade(convClass& second, std::int32_t heardOfOld) noexcept {
    if (!sharesWith(second)) {
        borrowAndProcess(second);
        return;
    }
    partner_ = &second;
    second.watchSelection();
    second.takeInput(blockNumber());
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
    advanceFarTail();
    const RingView ring = second.ownRing();
    const std::int32_t heard = std::clamp(heardOfOld, 0, blockLength);
    if (changedCount_ > 0 && ring.state->silent()) {
        transformChanged();
        changedCount_ = 0;
    }
    if (ring.state->silent() || (changedCount_ == 0 && before == scaled_)) {
        render(ring, ownRing());
        std::copy_n(outputL + blockLength, heard, second.outputL + blockLength);
        std::copy_n(outputR + blockLength, heard, second.outputR + blockLength);
        return;
    }
    renderBoth(second, before, heard);
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
    const auto untouched = [this](std::size_t i) { return changed_[i] == 0; };
    const auto touched = [this](std::size_t i) { return changed_[i] != 0; };

    collect(ring, 0, lastBegin, untouched);
    if (!sums_.store(accumulators())) {
        clearSpectrum(accumL, binCount - 1);
        clearSpectrum(accumR, binCount - 1);
    }
    collect(ring, lastBegin, old.end, untouched);
    addFarHeld();
    bool hasEnd = sums_.store(end_);
    if (farHeard_ && !farExpected_.empty()) {
        if (!hasEnd) {
            clearSpectrum(end_.left, binCount - 1);
            clearSpectrum(end_.right, binCount - 1);
        }
        subtractFarExpected(end_, 1.0f);
        hasEnd = true;
    }
    const auto bins = static_cast<std::size_t>(binCount);
    std::copy_n(accumL, bins, second.accumL);
    std::copy_n(accumR, bins, second.accumR);
    const auto addOwn = [&](const Layout& layout, const EarSpectra& sum) {
        collect(ring, 0, layout.scaledBegin, touched);
        sums_.addTo(sum);
        collect(ring, layout.scaledBegin, layout.end, touched);
        sums_.addTo(sum, layout.gain);
        if (hasEnd) {
            sums_.addScaled(end_, layout.gain, sum);
        }
    };

    addOwn(old, second.accumulators());
    second.dftiStatus = middleIFFT(second.accumL, second.outputL, heard, second.ifftHandle);
    second.dftiStatus = middleIFFT(second.accumR, second.outputR, heard, second.ifftHandle);
    transformChanged();
    addOwn(now, accumulators());
    transformBack();
    if (farHeard_) {
        far_->addTo(second.outputL + blockLength, second.outputR + blockLength, old.gain, heard);
        far_->addTo(outputL + blockLength, outputR + blockLength, now.gain, blockLength);
    }
}

}  // namespace tessaly
