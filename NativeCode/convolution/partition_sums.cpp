// Sums of products of input spectra and partition spectra.
#include "convolution/partition_sums.h"

#include <algorithm>

#include "convolution/simd/kernels.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

PartitionSums::~PartitionSums() {
    for (ComplexBin** const spectrum : {&part_.left, &part_.right, &product_}) {
        if (*spectrum != nullptr) {
            freeSpectrum(*spectrum);
        }
    }
}

void PartitionSums::prepare(const Kernels& kernels,
                            std::int32_t blockLength,
                            std::size_t pairs,
                            bool alsoNaturalOrder) {
    kernels_ = &kernels;
    lanes_ = kernels.transformLanes(blockLength);
    blockLength_ = static_cast<std::size_t>(blockLength);
    inputs_.resize(pairs);
    left_.resize(pairs);
    right_.resize(pairs);
    allocSpectrum(part_.left, blockLength + 1);
    allocSpectrum(part_.right, blockLength + 1);
    if (alsoNaturalOrder) {
        allocSpectrum(product_, blockLength + 1);
    }
}

void PartitionSums::run(const EarSpectra& base, const EarSpectra& sum) noexcept {
    if (naturalOrder_) {
        runInOrder(left_.data(), base.left, sum.left);
        runInOrder(right_.data(), base.right, sum.right);
    } else {
        kernels_->sumOfProducts(lanes_, blockLength_, count_, inputs_.data(), left_.data(),
                                right_.data(), base.left, base.right, sum.left, sum.right);
    }
}

/// One product at a time.
void PartitionSums::runInOrder(const ComplexBin* const* responses,
                               const ComplexBin* base,
                               ComplexBin* sum) noexcept {
    for (std::size_t k = 0; k < count_; ++k) {
        if (base == nullptr) {
            kernels_->multiply(bins(), inputs_[k], responses[k], sum);
        } else {
            kernels_->multiply(bins(), inputs_[k], responses[k], product_);
            kernels_->add(bins(), product_, base, sum);
        }
        base = sum;
    }
}

bool PartitionSums::store(const EarSpectra& sum) noexcept {
    run({}, sum);
    return count_ > 0;
}

void PartitionSums::store(const EarSpectra& base, const EarSpectra& sum) noexcept {
    if (count_ > 0) {
        run(base, sum);
    } else {
        std::copy_n(base.left, bins(), sum.left);
        std::copy_n(base.right, bins(), sum.right);
    }
}

void PartitionSums::addTo(const EarSpectra& sum) noexcept { run(sum, sum); }

void PartitionSums::addTo(const EarSpectra& sum, float gain) noexcept {
    if (store(part_)) {
        addScaled(part_, gain, sum);
    }
}

void PartitionSums::addScaled(const EarSpectra& term,
                              float gain,
                              const EarSpectra& sum) const noexcept {
    kernels_->addScaled(2 * bins(), gain, &term.left->re, &sum.left->re, &sum.left->re);
    kernels_->addScaled(2 * bins(), gain, &term.right->re, &sum.right->re, &sum.right->re);
}

}  // namespace tessaly
