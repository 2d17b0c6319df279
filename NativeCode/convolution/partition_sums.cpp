// Sums of products of input spectra and partition spectra.
#include "convolution/partition_sums.h"

#include "convolution/simd/kernels.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

PartitionSums::~PartitionSums() {
    for (ComplexBin** const spectrum : {&part_.left, &part_.right}) {
        if (*spectrum != nullptr) {
            freeSpectrum(*spectrum);
        }
    }
}

void PartitionSums::prepare(const Kernels& kernels, std::int32_t bins, std::size_t pairs) {
    kernels_ = &kernels;
    bins_ = static_cast<std::size_t>(bins);
    inputs_.resize(pairs);
    left_.resize(pairs);
    right_.resize(pairs);
    allocSpectrum(part_.left, bins);
    allocSpectrum(part_.right, bins);
}

void PartitionSums::run(bool onto, const EarSpectra& sum) noexcept {
    kernels_->listSum(bins_, count_, inputs_.data(), left_.data(), right_.data(), onto, sum.left,
                      sum.right);
}

bool PartitionSums::store(const EarSpectra& sum) noexcept {
    run(false, sum);
    return count_ > 0;
}

void PartitionSums::addTo(const EarSpectra& sum) noexcept { run(true, sum); }

void PartitionSums::addTo(const EarSpectra& sum, float gain) noexcept {
    if (store(part_)) {
        addScaled(part_, gain, sum);
    }
}

void PartitionSums::addScaled(const EarSpectra& term,
                              float gain,
                              const EarSpectra& sum) const noexcept {
    for (std::size_t i = 0; i < bins_; ++i) {
        sum.left[i].re += term.left[i].re * gain;
        sum.left[i].im += term.left[i].im * gain;
    }
    for (std::size_t i = 0; i < bins_; ++i) {
        sum.right[i].re += term.right[i].re * gain;
        sum.right[i].im += term.right[i].im * gain;
    }
}

}  // namespace tessaly
