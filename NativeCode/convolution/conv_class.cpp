// A convolver's memory, from construction to release, and the headphone compensation's spectra.
#include "convolution/conv_class.h"

#include <algorithm>
#include <bit>
#include <new>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/process_lifetime.h"
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

/// Spectra that are made and used up within a block: what a thread's convolvers share stays in the
/// nearest cache. For the process's life, since a convolver keeps the memory that it found, also if
/// another one needs more, and a thread may come back under the same number. Loads write it and
/// meet no other, as with the HRIR tables.
struct ThreadSpectra {
    std::thread::id thread;
    AlignedArray<ComplexBin> memory;
};

std::vector<ThreadSpectra>& threadSpectra() noexcept {
    static ProcessLifetime<std::vector<ThreadSpectra>> all;
    return *all;
}

/// At least so many bins for the thread that asks. @throws std::bad_alloc
ComplexBin* findThreadSpectra(std::int32_t bins) {
    const auto wanted = static_cast<std::size_t>(bins);
    const std::thread::id thread = std::this_thread::get_id();
    for (ThreadSpectra& one : threadSpectra()) {
        if (one.thread == thread && one.memory.size() >= wanted) {
            return one.memory.data();
        }
    }
    threadSpectra().push_back({thread, AlignedArray<ComplexBin>(wanted)});
    return threadSpectra().back().memory.data();
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
    threadSpectra().clear();
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
    changed_.resize(count);
    silent_.resize(count);
    ring_.prepare(count);
    const bool alsoNaturalOrder = count == 1 || directFilterFeed != 0;
    sums_.prepare(*kernels_, blockLength, count, alsoNaturalOrder);
    if (alsoNaturalOrder) {
        padded_ = AlignedArray<float>(2 * static_cast<std::size_t>(std::max(blockLength, 0)));
    }
    // From here on nothing throws: these have no owner that would release them.
    carveSpectra(FDL, ringMemory_, stride_);
    if (isSecondInstance == 0) {
        std::copy(FDL.begin(), FDL.end(), FDLown.begin());
        carveSpectra(filterPartsL, partsMemoryL_, stride_);
        carveSpectra(filterPartsR, partsMemoryR_, stride_);
    }
    for (ComplexBin** const spectrum : {&accumL, &accumR, &end_.left, &end_.right}) {
        allocSpectrum(*spectrum, binCount);
    }
    scaled_.begin = count;
    ++convInstanceCount;

    dftiStatus = createFFT(fftHandle, fftLength);
    dftiStatus = createFFT(ifftHandle, fftLength);
    if (fftHandle == nullptr) {
        essError = essErrorTransformPlan;
    }
    if (directFilterFeed != 0) {
        useNaturalOrder();
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
        startTaps_ = AlignedArray<float>(2 * directTaps);
        startChange_ = AlignedArray<float>(2 * directTaps);
    }
}

void convClass::splitFarTail(std::int32_t ratio) {
    if (isSecondInstance != 0 || directFilterFeed != 0) {
        return;
    }
    try {
        auto far = std::make_unique<FarTail>();
        const auto count = static_cast<std::size_t>(FDLtoBUFConv);
        if (far->prepare(*kernels_, blockLength, count, ratio)) {
            // Where more than that is to be made up for, the uniform sum is no dearer.
            const std::size_t corrections = (count - far->firstPartition()) / 4 + 1;
            farHeld_.reserve(corrections);
            farExpected_.reserve(corrections);
            far_ = std::move(far);
        }
    } catch (const std::bad_alloc&) {
        logTrace("no memory for larger partitions, all of the response stays in short ones");
    }
}

void convClass::continueResults() {
    const std::size_t partitions = far_ != nullptr ? far_->firstPartition() : filterPartsL.size();
    if (isSecondInstance != 0 || directFilterFeed != 0 || blockLength < Continuation::samples ||
        partitions > Continuation::mostPartitions || !accumulators().complete()) {
        return;
    }
    try {
        owed_.assign(partitions, 0);
        changedBefore_.assign(partitions, 0);
        shared_ = findThreadSpectra(2 * sharedPairs * stride_);
        sharedBy_ = std::this_thread::get_id();
        continuation_.prepare(*kernels_, blockLength, partitions);
    } catch (const std::bad_alloc&) {
        logTrace("no memory for results that go on, each old response is convolved");
    }
}

void convClass::useNaturalOrder() noexcept {
    naturalOrder_ = true;
    sums_.useNaturalOrder();
}

/// The product of a response and a compensation filter is longer than a block, and what it wraps is
/// heard: from the first block with compensation of one partition on, spectra are those of whole
/// windows. The ring's only slot is written again in every block.
void convClass::followCompensation() noexcept {
    if (naturalOrder_ || !hpTFactive || FDLtoBUFConv != 1) {
        return;
    }
    if (isSecondInstance == 0) {
        reorderResponse();
    }
    useNaturalOrder();
}

/// The responses may have been written since they were taken, so their samples come from the
/// spectra: delayed by a block they stand in the half that a block spectrum gives back.
void convClass::reorderResponse() noexcept {
    settle();
    const bool complete = end_.complete() && accumL != nullptr && filterPartsL[0] != nullptr &&
                          filterPartsR[0] != nullptr && sums_.ready() && !padded_.empty();
    if (!complete || silent_[0] != 0) {
        return;
    }
    float* const samples = padded_.data();
    padded_.clear();
    samples[blockLength] = 1.0f;
    dftiStatus = windowFFT(samples, accumL, fftHandle);
    if (dftiStatus != transformOk) {
        return;
    }
    sums_.begin();
    sums_.add(accumL, filterPartsL[0], filterPartsR[0]);
    sums_.store(end_);
    padded_.clear();
    const float scale = 1.0f / static_cast<float>(fftLength);
    const auto reorder = [&](const ComplexBin* delayed, ComplexBin* spectrum) noexcept {
        dftiStatus = blockIFFT(delayed, samples, blockLength, ifftHandle);
        for (std::int32_t i = 0; i < blockLength; ++i) {
            samples[i] *= scale;
        }
        dftiStatus = FFT(samples, spectrum, fftHandle);
    };
    reorder(end_.left, filterPartsL[0]);
    reorder(end_.right, filterPartsR[0]);
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
    continuation_.forget();
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

}  // namespace tessaly
