// What a block's result goes on to be.
#include "convolution/continuation.h"

#include <algorithm>
#include <cstring>

#include "base/silence.h"
#include "convolution/simd/kernels.h"

namespace tessaly {

void Continuation::prepare(const Kernels& kernels,
                           std::int32_t blockLength,
                           std::size_t partitions) {
    kernels_ = &kernels;
    blockLength_ = static_cast<std::size_t>(blockLength);
    if (createBlockTransform(transform_, 2 * samples) != transformOk) {
        return;
    }
    lanes_ = kernels.transformLanes(samples);
    taps_ = AlignedArray<ComplexBin>(ears * partitions * samples);
    silent_.assign(partitions, 1);
    starts_ = AlignedArray<ComplexBin>(partitions * samples);
    start_ = AlignedArray<float>(2 * samples);
    block_ = AlignedArray<float>(blockLength_);
    for (AlignedArray<float>& ear : wrapped_) {
        ear = AlignedArray<float>(samples);
    }
    sums_ = AlignedArray<ComplexBin>(ears * samples);
    result_ = AlignedArray<float>(samples);
    inputs_.resize(partitions);
    for (auto& ear : responses_) {
        ear.resize(partitions);
    }
    partitions_ = partitions;
}

void Continuation::takeTaps(std::size_t partition, const float* left, const float* right) noexcept {
    if (partition >= partitions_) {
        return;
    }
    const bool silent = allZero(left, samples) && allZero(right, samples);
    silent_[partition] = silent ? 1 : 0;
    if (!silent) {
        computePartition(transform_, left, tapsOf(partition, 0));
        computePartition(transform_, right, tapsOf(partition, 1));
    }
}

void Continuation::takeWindow(const float* window) noexcept {
    if (!prepared()) {
        return;
    }
    const bool follows =
        !broken_ && std::memcmp(window, block_.data(), blockLength_ * sizeof(float)) == 0;
    broken_ = false;
    linked_ = follows ? std::min(linked_ + 1, partitions_) : 0;
    const float* const newer = window + blockLength_;
    float* const start = start_.data() + samples;
    for (std::size_t i = 0; i < samples; ++i) {
        start[i] = newer[i] + older_[i];
    }
    std::copy_n(window, samples, older_.begin());
    std::copy_n(newer, blockLength_, block_.data());
    newest_ = (newest_ + 1) % partitions_;
    computeWindow(transform_, start_.data(), starts_.data() + newest_ * samples);
}

void Continuation::takeSilence() noexcept {
    if (!prepared()) {
        return;
    }
    linked_ = broken_ ? 0 : std::min(linked_ + 1, partitions_);
    broken_ = false;
    newest_ = (newest_ + 1) % partitions_;
    std::fill_n(starts_.data() + newest_ * samples, samples, ComplexBin{});
}

void Continuation::forget() noexcept {
    linked_ = 0;
    broken_ = true;
    kept_ = 0;
}

void Continuation::keep(std::size_t partitions) noexcept {
    // Zero times what is no number is no number.
    float check = 0.0f;
    for (const AlignedArray<float>& ear : wrapped_) {
        for (const float sample : ear) {
            check += 0.0f * sample;
        }
    }
    kept_ = check == 0.0f && partitions <= partitions_ ? partitions : 0;
}

/// The short convolutions of some partitions. @return whether there is anything
bool Continuation::sum(std::size_t begin, std::size_t end, bool add) noexcept {
    std::size_t count = 0;
    for (std::size_t k = begin; k < end; ++k) {
        if (silent_[k] == 0) {
            const std::size_t slot = (newest_ + partitions_ - k) % partitions_;
            inputs_[count] = starts_.data() + slot * samples;
            responses_[0][count] = tapsOf(k, 0);
            responses_[1][count] = tapsOf(k, 1);
            ++count;
        }
    }
    ComplexBin* const left = sums_.data();
    ComplexBin* const right = left + samples;
    kernels_->sumOfProducts(lanes_, samples, count, inputs_.data(), responses_[0].data(),
                            responses_[1].data(), add ? left : nullptr, add ? right : nullptr, left,
                            right);
    return count > 0 || add;
}

void Continuation::addTo(
    float* left, float* right, std::size_t scaledBegin, float gain, std::int32_t count) noexcept {
    const auto wanted = static_cast<std::size_t>(std::clamp(count, 0, samples));
    const std::size_t begin = std::min(scaledBegin, kept_);
    bool some = sum(begin, kept_, false);
    if (some && gain != 1.0f) {
        float* const both = &sums_[0].re;
        for (std::size_t i = 0; i < 2 * ears * samples; ++i) {
            both[i] *= gain;
        }
    }
    some = sum(0, begin, some);
    const float factor =
        static_cast<float>(blockLength_) / static_cast<float>(samples);  // of both transforms
    std::size_t ear = 0;
    for (float* const output : {left, right}) {
        if (some) {
            computeBlock(transform_, sums_.data() + ear * samples, result_.data(), samples);
            for (std::size_t i = 0; i < wanted; ++i) {
                output[i] += factor * result_[i];
            }
        }
        for (std::size_t i = 0; i < wanted; ++i) {
            output[i] -= wrapped_[ear][i];
        }
        ++ear;
    }
}

}  // namespace tessaly
