// Two-stage partitioning: schedule, input spectra, products and results of the far stage.
#include "convolution/far_tail.h"

#include <algorithm>
#include <bit>
#include <cstdint>
#include <cstring>

#include "base/ess_error.h"
#include "base/silence.h"
#include "convolution/simd/kernels.h"
#include "convolution/spectrum_stride.h"

namespace tessaly {

namespace {

constexpr std::size_t inputMemory = 0;         // of the blocks of memory; the ears' follow
constexpr std::int32_t phasesWithoutSums = 3;  // input transform and one backward transform an ear

/// Gives what the two allocators' failures would leave in `essError` back: without its memory a
/// convolver stays uniform, which is no error.
class KeptError {
public:
    KeptError() noexcept : kept_(essError) {}
    ~KeptError() {
        if (essError == essErrorSpectrumMemory) {
            essError = kept_;
        }
    }
    KeptError(const KeptError&) = delete;
    KeptError& operator=(const KeptError&) = delete;

private:
    std::int32_t kept_;
};

}  // namespace

FarTail::~FarTail() {
    for (ComplexBin** const spectra :
         {&memory_[0], &memory_[1], &memory_[2], &sum_.left, &sum_.right}) {
        if (*spectra != nullptr) {
            freeSpectrum(*spectra);
        }
    }
}

std::int32_t FarTail::ratioFor(std::int32_t partitions, std::int32_t early) noexcept {
    // 2 R partitions are read in every block, and the far ones once in R blocks.
    std::int64_t ratio = smallestRatio;
    while (2 * ratio < early || 8 * ratio * ratio <= partitions) {
        ratio *= 2;
    }
    return static_cast<std::int32_t>(std::min<std::int64_t>(ratio, INT32_MAX));
}

bool FarTail::prepare(const Kernels& kernels,
                      std::int32_t blockLength,
                      std::size_t partitions,
                      std::int32_t ratio) {
    const std::int64_t window = 2 * std::int64_t{blockLength} * ratio;
    const bool fits = blockLength > 0 && ratio >= smallestRatio &&
                      std::has_single_bit(static_cast<std::uint32_t>(ratio)) &&
                      partitions > 2 * static_cast<std::size_t>(ratio) &&
                      window <= transformLengthMax;
    if (!fits) {
        return false;
    }
    kernels_ = &kernels;
    blockLength_ = blockLength;
    ratio_ = ratio;
    length_ = static_cast<std::size_t>(blockLength) * static_cast<std::size_t>(ratio);
    responseEnd_ = partitions * static_cast<std::size_t>(blockLength);
    parts_ = (responseEnd_ - 2 * length_ + length_ - 1) / length_;
    return allocate(partitions);
}

bool FarTail::allocate(std::size_t partitions) {
    const KeptError kept;
    const auto bins = static_cast<std::int32_t>(length_) + 1;
    stride_ = static_cast<std::size_t>(spectrumStride(bins));
    for (ComplexBin*& spectra : memory_) {
        allocSpectrum(spectra, static_cast<std::int32_t>(parts_ * stride_));
    }
    allocSpectrum(sum_.left, bins);
    allocSpectrum(sum_.right, bins);
    createBlockTransform(transform_, static_cast<std::int32_t>(2 * length_));
    window_ = AlignedArray<float>(2 * length_);
    filling_ = AlignedArray<float>(length_);
    padded_ = AlignedArray<float>(length_);
    for (std::size_t ear = 0; ear < ears; ++ear) {
        result_[ear] = AlignedArray<float>(length_);
        next_[ear] = AlignedArray<float>(length_);
        responses_[ear].resize(parts_);
    }
    inputs_.resize(parts_);
    silentParts_.assign(ears * parts_, 0);
    silentInputs_.assign(parts_, 1);
    silentBlocks_.assign(partitions, 1);
    return transform_ != nullptr && sum_.complete() &&
           std::all_of(memory_.begin(), memory_.end(),
                       [](const ComplexBin* spectra) { return spectra != nullptr; });
}

void FarTail::clear() noexcept {
    window_.clear();
    filling_.clear();
    // What a silent input's spectrum holds is not read.
    std::fill(silentInputs_.begin(), silentInputs_.end(), std::uint8_t{1});
    std::fill(silentBlocks_.begin(), silentBlocks_.end(), std::uint8_t{1});
    untrusted_ = 0;
    silentRun_ = 0;
    computing_ = false;
    resultStands_ = false;
}

void FarTail::responseChanged() noexcept {
    built_ = 0;
    computing_ = false;
    resultStands_ = false;
}

bool FarTail::silentBlock(std::uint64_t block) const noexcept {
    return silentBlocks_[block % silentBlocks_.size()] != 0;
}

/// The window's first half is the block that came last.
bool FarTail::continues(const float* window) const noexcept {
    const auto length = static_cast<std::size_t>(blockLength_);
    const std::size_t phase =
        (blocks_ + static_cast<std::size_t>(ratio_) - 1) % static_cast<std::size_t>(ratio_);
    return std::memcmp(filling_.data() + phase * length, window, length * sizeof(float)) == 0;
}

/// All that is kept of the input is zeros, and has been before this block.
bool FarTail::zerosThroughout() const noexcept {
    return silentRun_ > 4 * static_cast<std::uint64_t>(ratio_);
}

void FarTail::advance(
    const float* window, bool silent, bool wanted, const float* left, const float* right) noexcept {
    const auto length = static_cast<std::size_t>(blockLength_);
    const auto ratio = static_cast<std::size_t>(ratio_);
    silentRun_ = silent ? silentRun_ + 1 : 0;
    if (!zerosThroughout() && !continues(window)) {
        untrusted_ = static_cast<std::int64_t>(silentBlocks_.size() + 3 * ratio);
    } else if (untrusted_ > 0) {
        --untrusted_;
    }
    const auto phase = static_cast<std::int32_t>(blocks_ % ratio);
    if (phase == 0) {
        startRound(wanted);
    }
    if (!zerosThroughout()) {
        std::memcpy(filling_.data() + static_cast<std::size_t>(phase) * length, window + length,
                    length * sizeof(float));
    }
    ++blocks_;
    silentBlocks_[blocks_ % silentBlocks_.size()] = silent ? 1 : 0;
    if (built_ < ears * parts_ && left != nullptr && right != nullptr) {
        buildNext(left, right);
    } else if (computing_ && phase > 0) {
        const std::int32_t back = phase - (ratio_ - static_cast<std::int32_t>(ears));
        if (back >= 0) {
            transformBack(static_cast<std::size_t>(back));
        } else {
            sumShare(phase - 1);
        }
    }
}

/// A whole L is complete: what was made is heard from now on, and the next result is begun.
void FarTail::startRound(bool wanted) noexcept {
    std::swap(result_, next_);
    resultStands_ = computing_;
    resultSilent_ = nextSilent_;

    if (!zerosThroughout()) {
        std::memcpy(window_.data(), window_.data() + length_, length_ * sizeof(float));
        std::memcpy(window_.data() + length_, filling_.data(), length_ * sizeof(float));
    }
    newest_ = newest_ + 1 == parts_ ? 0 : newest_ + 1;
    const bool silent = zerosThroughout() || allZero(window_.data(), 2 * length_);
    silentInputs_[newest_] = silent ? 1 : 0;
    if (!silent) {
        windowFFT(window_.data(), memory_[inputMemory] + newest_ * stride_, transform_);
    }

    computing_ = wanted && built_ == ears * parts_;
    pairs_ = 0;
    for (std::size_t i = 0; computing_ && i < parts_; ++i) {
        const std::size_t slot = (newest_ + parts_ - i) % parts_;
        const bool zero = silentParts_[ears * i] != 0 && silentParts_[ears * i + 1] != 0;
        if (silentInputs_[slot] == 0 && !zero) {
            inputs_[pairs_] = memory_[inputMemory] + slot * stride_;
            for (std::size_t ear = 0; ear < ears; ++ear) {
                responses_[ear][pairs_] = memory_[1 + ear] + i * stride_;
            }
            ++pairs_;
        }
    }
    nextSilent_ = pairs_ == 0;
}

/// One partition of one ear a block.
void FarTail::buildNext(const float* left, const float* right) noexcept {
    const std::size_t part = built_ / ears;
    const std::size_t ear = built_ % ears;
    const std::size_t start = (2 + part) * length_;
    const float* samples = (ear == 0 ? left : right) + start;
    if (start + length_ > responseEnd_) {
        const std::size_t rest = responseEnd_ - start;
        std::copy_n(samples, rest, padded_.data());
        std::fill(padded_.begin() + rest, padded_.end(), 0.0f);
        samples = padded_.data();
    }
    silentParts_[built_] = allZero(samples, length_) ? 1 : 0;
    partitionFFT(samples, memory_[1 + ear] + part * stride_, transform_);
    ++built_;
}

/// The products of a range of bins, all partitions.
void FarTail::sumShare(std::int32_t phase) noexcept {
    if (pairs_ == 0) {
        return;
    }
    const auto shares = static_cast<std::size_t>(ratio_ - phasesWithoutSums);
    const auto edge = [&](std::size_t share) {
        constexpr std::size_t rows = 16;  // bins, the most lanes that a spectrum is made with
        return share == shares ? length_ : length_ * share / shares / rows * rows;
    };
    const auto share = static_cast<std::size_t>(phase);
    const std::size_t begin = edge(share);
    const std::size_t end = edge(share + 1);
    const std::size_t step = begin - (share > 0 ? edge(share - 1) : 0);
    for (std::size_t i = 0; i < pairs_; ++i) {
        inputs_[i] += step;
        responses_[0][i] += step;
        responses_[1][i] += step;
    }
    kernels_->sumOfProducts(kernels_->transformLanes(static_cast<std::int32_t>(length_)),
                            end - begin, pairs_, inputs_.data(), responses_[0].data(),
                            responses_[1].data(), nullptr, nullptr, sum_.left + begin,
                            sum_.right + begin);
}

void FarTail::transformBack(std::size_t ear) noexcept {
    if (pairs_ > 0) {
        blockIFFT(ear == 0 ? sum_.left : sum_.right, next_[ear].data(),
                  static_cast<std::int32_t>(length_), transform_);
    }
}

void FarTail::addTo(float* left, float* right, float gain, std::int32_t samples) const noexcept {
    if (resultSilent_) {
        return;
    }
    const auto ratio = static_cast<std::uint64_t>(ratio_);
    const auto length = static_cast<std::size_t>(blockLength_);
    const std::size_t start = static_cast<std::size_t>((blocks_ - 1) % ratio) * length;
    const float scale = gain / static_cast<float>(ratio_);  // 2L to 2B
    const auto count = static_cast<std::size_t>(std::clamp(samples, 0, blockLength_));
    kernels_->addScaled(count, scale, result_[0].data() + start, left, left);
    kernels_->addScaled(count, scale, result_[1].data() + start, right, right);
}

}  // namespace tessaly
