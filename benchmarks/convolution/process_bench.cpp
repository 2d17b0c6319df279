// One block of the convolver, with the best kernels and with the plain ones.
// Names: Process/<still or moving>/<tessaly or plain>/<block length>/<partitions>. A still block
// convolves; a moving one also replaces the whole filter and renders the old one for the
// crossfade.
#include <benchmark/benchmark.h>

#include <memory>
#include <string>

#include "base/aligned_array.h"
#include "convolution/bench_noise.h"
#include "convolution/conv_class.h"
#include "convolution/simd/kernels.h"

namespace tessaly::bench {
namespace {

constexpr std::int16_t partitionCounts[] = {1, 8, 46, 216};

/// What an engine lends to its two convolvers.
class Convolvers {
public:
    Convolvers(std::int32_t blockLength, std::int16_t partitions)
        : blockLength_(blockLength),
          partitions_(partitions),
          window_(2 * static_cast<std::size_t>(blockLength)),
          outputs_{AlignedArray<float>(window_.size()), AlignedArray<float>(window_.size()),
                   AlignedArray<float>(window_.size()), AlignedArray<float>(window_.size())},
          firLength_(blockLength * partitions),
          firs_{AlignedArray<float>(static_cast<std::size_t>(firLength_ + blockLength)),
                AlignedArray<float>(static_cast<std::size_t>(firLength_ + blockLength))} {
        fillNoise(window_.data(), window_.size());
        fillNoise(firs_[0].data(), firs_[0].size(), 2);
        fillNoise(firs_[1].data(), firs_[1].size(), 3);
        first_ = make(0, output_[0], output_[1]);
        second_ = make(1, output_[2], output_[3]);
        second_->filterPartsL = first_->filterPartsL;
        second_->filterPartsR = first_->filterPartsR;
        filterChangeAll_ = true;
        advance();
        first_->process();
        filterChangeAll_ = false;
    }

    void still() {
        advance();
        first_->process();
    }
    void moving() {
        // A change in every partition, so that none keeps its spectrum.
        for (AlignedArray<float>& fir : firs_) {
            for (std::int32_t i = 0; i < firLength_; i += blockLength_) {
                fir[static_cast<std::size_t>(i)] += 0.001f;
            }
        }
        filterChangeAll_ = true;
        secondOLSactive_ = true;
        advance();
        second_->process();
        for (std::size_t i = 0; i < first_->FDL.size(); ++i) {
            first_->FDL[i] = second_->FDL[i];
        }
        first_->process();
        first_->FDL = first_->FDLown;
        filterChangeAll_ = false;
        secondOLSactive_ = false;
    }

private:
    std::unique_ptr<convClass> make(std::uint8_t second, float*& left, float*& right) {
        return std::make_unique<convClass>(
            "bench", blockLength_, input_, left, right, fir_[0], fir_[1], filterChangeAll_, off_,
            off_, std::uint8_t{0}, off_, unread_, unread_, second, off_, secondOLSactive_, off_,
            hpTFtime_, hpTFselect_, unread_, off_, blockCounter_, firLength_,
            firLength_ + blockLength_, partitions_);
    }
    void advance() {
        first_->FDLpos = static_cast<std::int16_t>((first_->FDLpos + 1) % partitions_);
        second_->FDLpos = first_->FDLpos;
    }

    std::int32_t blockLength_;
    std::int16_t partitions_;
    AlignedArray<float> window_;
    AlignedArray<float> outputs_[4];
    std::int32_t firLength_;
    AlignedArray<float> firs_[2];
    float* input_ = window_.data();
    float* output_[4] = {outputs_[0].data(), outputs_[1].data(), outputs_[2].data(),
                         outputs_[3].data()};
    float* fir_[2] = {firs_[0].data(), firs_[1].data()};
    bool filterChangeAll_ = false;
    bool secondOLSactive_ = false;
    bool off_ = false;
    float unread_ = 0.0f;
    float* hpTFtime_ = nullptr;
    std::int16_t hpTFselect_ = 0;
    std::uint32_t blockCounter_ = 0;
    std::unique_ptr<convClass> first_;
    std::unique_ptr<convClass> second_;
};

void process(benchmark::State& state,
             const Kernels* kernels,
             bool moving,
             std::int32_t blockLength,
             std::int16_t partitions) {
    forceKernels(kernels);
    Convolvers convolvers(blockLength, partitions);
    forceKernels(nullptr);
    for (auto _ : state) {
        if (moving) {
            convolvers.moving();
        } else {
            convolvers.still();
        }
        benchmark::ClobberMemory();
    }
}

const bool registered = [] {
    for (const bool moving : {false, true}) {
        for (const std::int32_t blockLength : {256, 1024}) {
            for (const std::int16_t partitions : partitionCounts) {
                const std::string head = moving ? "Process/moving/" : "Process/still/";
                const std::string tail =
                    "/" + std::to_string(blockLength) + "/" + std::to_string(partitions);
                benchmark::RegisterBenchmark((head + "tessaly" + tail).c_str(), process,
                                             static_cast<const Kernels*>(nullptr), moving,
                                             blockLength, partitions);
                benchmark::RegisterBenchmark((head + "plain" + tail).c_str(), process,
                                             kernelsScalar, moving, blockLength, partitions);
            }
        }
    }
    return true;
}();

}  // namespace
}  // namespace tessaly::bench
