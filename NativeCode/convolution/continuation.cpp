// What a block's result goes on to be.
#include "convolution/continuation.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "base/silence.h"
#include "convolution/simd/kernels.h"

namespace tessaly {

void Continuation::prepare(const Kernels& kernels,
                           std::int32_t blockLength,
                           std::size_t partitions) {
    kernels_ = &kernels;
    blockLength_ = static_cast<std::size_t>(blockLength);
    if (partitions > mostPartitions ||
        createBlockTransform(transform_, 2 * samples) != transformOk) {
        return;
    }
    lanes_ = kernels.transformLanes(samples);
    taps_ = AlignedArray<ComplexBin>(ears * partitions * samples);
    silent_.assign(partitions, 1);
    quiet_.assign(partitions, 1);
    inputs_ = AlignedArray<ComplexBin>(partitions * samples);
    starts_ = AlignedArray<float>((ears + 1) * samples);
    partitions_ = partitions;
}

void Continuation::takeTaps(std::size_t partition, const float* left, const float* right) noexcept {
    if (partition >= partitions_) {
        return;
    }
    const bool silent =
        left == nullptr || right == nullptr || (allZero(left, samples) && allZero(right, samples));
    silent_[partition] = silent ? 1 : 0;
    if (!silent) {
        computePartition(transform_, left, tapsOf(partition, 0));
        computePartition(transform_, right, tapsOf(partition, 1));
    }
}

void Continuation::link(bool follows) noexcept {
    linked_ = follows && !broken_ ? std::min(linked_ + 1, partitions_) : 0;
    broken_ = false;
    newest_ = newest_ + 1 < partitions_ ? newest_ + 1 : 0;
}

void Continuation::takeWindow(const float* window, bool follows) noexcept {
    if (!prepared()) {
        return;
    }
    link(follows);
    alignas(AlignedArray<float>::alignment) std::array<float, 2 * samples> both{};
    const float* const newer = window + blockLength_;
    float* const older = olderStart();
    for (std::size_t i = 0; i < samples; ++i) {
        both[samples + i] = newer[i] + older[i];
    }
    std::copy_n(window, samples, older);
    // As in the sums of whole partitions, zeros are left out, whatever the taps are.
    quiet_[newest_] = allZero(both.data() + samples, samples) ? 1 : 0;
    if (quiet_[newest_] == 0) {
        computeWindow(transform_, both.data(), inputs_.data() + newest_ * samples);
    }
}

void Continuation::takeSilence(bool follows) noexcept {
    if (!prepared()) {
        return;
    }
    link(follows);
    quiet_[newest_] = 1;
}

void Continuation::forget() noexcept {
    linked_ = 0;
    broken_ = true;
    kept_ = 0;
}

void Continuation::keep(std::size_t partitions) noexcept {
    const bool finite =
        partitions <= partitions_ &&
        std::all_of(wrappedOf(0), wrappedOf(ears), [](float x) { return std::isfinite(x); });
    kept_ = finite ? partitions : 0;
}

/// The short convolutions of some partitions. @return whether there is anything
bool Continuation::sum(std::size_t begin, std::size_t end, bool add, ComplexBin* sums) noexcept {
    std::array<const ComplexBin*, mostPartitions> inputs;
    std::array<const ComplexBin*, mostPartitions> left;
    std::array<const ComplexBin*, mostPartitions> right;
    std::size_t count = 0;
    for (std::size_t k = begin; k < end; ++k) {
        const std::size_t slot = (newest_ + partitions_ - k) % partitions_;
        if (silent_[k] == 0 && quiet_[slot] == 0) {
            inputs[count] = inputs_.data() + slot * samples;
            left[count] = tapsOf(k, 0);
            right[count] = tapsOf(k, 1);
            ++count;
        }
    }
    kernels_->sumOfProducts(lanes_, samples, count, inputs.data(), left.data(), right.data(),
                            add ? sums : nullptr, add ? sums + samples : nullptr, sums,
                            sums + samples);
    return count > 0 || add;
}

void Continuation::addTo(
    float* left, float* right, std::size_t scaledBegin, float gain, std::int32_t count) noexcept {
    const auto wanted = static_cast<std::size_t>(std::clamp(count, 0, samples));
    const std::size_t begin = std::min(scaledBegin, kept_);
    alignas(AlignedArray<float>::alignment) std::array<ComplexBin, ears * samples> sums;
    alignas(AlignedArray<float>::alignment) std::array<float, samples> result;
    bool some = sum(begin, kept_, false, sums.data());
    if (some && gain != 1.0f) {
        for (ComplexBin& bin : sums) {
            bin.re *= gain;
            bin.im *= gain;
        }
    }
    some = sum(0, begin, some, sums.data());
    const float factor =
        static_cast<float>(blockLength_) / static_cast<float>(samples);  // of both transforms
    std::size_t ear = 0;
    for (float* const output : {left, right}) {
        const float* const wrapped = wrappedOf(ear);
        if (some) {
            computeBlock(transform_, sums.data() + ear * samples, result.data(), samples);
            for (std::size_t i = 0; i < wanted; ++i) {
                output[i] += factor * result[i];
            }
        }
        for (std::size_t i = 0; i < wanted; ++i) {
            output[i] -= wrapped[i];
        }
        ++ear;
    }
}

}  // namespace tessaly
