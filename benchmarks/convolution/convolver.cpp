// The library's convolver as an engine holds it.
#include "convolution/convolver.h"

#include <algorithm>

namespace tessaly::bench {

namespace {

/// Samples of an old response that are heard after a change.
constexpr std::int32_t crossfade = 64;

}  // namespace

Convolver::Convolver(std::int32_t blockLength, std::int32_t taps)
    : blockLength_(blockLength),
      partitions_(static_cast<std::int16_t>((taps + blockLength - 1) / blockLength)),
      firLength_(blockLength * partitions_),
      window_(2 * static_cast<std::size_t>(blockLength)) {
    for (std::size_t k = 0; k < outputs_.size(); ++k) {
        outputs_[k] = AlignedArray<float>(window_.size());
        output_[k] = outputs_[k].data();
    }
    input_ = window_.data();
    for (std::size_t ear = 0; ear < firs_.size(); ++ear) {
        firs_[ear] = AlignedArray<float>(static_cast<std::size_t>(firLength_ + blockLength));
        const std::vector<float> response = noiseResponse(taps, static_cast<unsigned>(ear));
        std::copy(response.begin(), response.end(), firs_[ear].begin());
        fir_[ear] = firs_[ear].data();
    }
    first_ = make(0, output_[0], output_[1]);
    if (partitions_ >= FarTail::fewestPartitions) {
        first_->splitFarTail(FarTail::ratioFor(partitions_, 0));
    }
    second_ = make(1, output_[2], output_[3]);
    second_->filterPartsL = first_->filterPartsL;
    second_->filterPartsR = first_->filterPartsR;
    const std::vector<float> silence(static_cast<std::size_t>(blockLength));
    still(silence.data());
    filterChangeAll_ = false;
}

void Convolver::still(const float* block) {
    takeInput(block);
    first_->process();
}

void Convolver::moving(const float* block) {
    for (AlignedArray<float>& fir : firs_) {
        for (std::int32_t i = 0; i < firLength_; i += blockLength_) {
            fir[static_cast<std::size_t>(i)] += 0.001f;
        }
    }
    filterChangeAll_ = true;
    secondOLSactive_ = true;
    takeInput(block);
    first_->processCrossfade(*second_, crossfade);
    filterChangeAll_ = false;
    secondOLSactive_ = false;
}

std::unique_ptr<convClass> Convolver::make(std::uint8_t second, float*& left, float*& right) {
    return std::make_unique<convClass>("bench", blockLength_, input_, left, right, fir_[0], fir_[1],
                                       filterChangeAll_, off_, off_, std::uint8_t{0}, off_, unread_,
                                       unread_, second, off_, secondOLSactive_, off_, hpTFtime_,
                                       hpTFselect_, unread_, off_, blockCounter_, firLength_,
                                       firLength_ + blockLength_, partitions_);
}

void Convolver::takeInput(const float* block) {
    std::copy_n(input_ + blockLength_, blockLength_, input_);
    std::copy_n(block, blockLength_, input_ + blockLength_);
    first_->FDLpos = static_cast<std::int16_t>((first_->FDLpos + 1) % partitions_);
    second_->FDLpos = first_->FDLpos;
    ++blockCounter_;
}

}  // namespace tessaly::bench
