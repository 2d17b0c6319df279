// The library's convolver as an engine holds it, and what all convolvers of the benchmarks are fed.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/bench_noise.h"
#include "convolution/conv_class.h"

namespace tessaly::bench {

/// Lengths of responses in frames: an HRIR, reflections, and tails of 0.5, 1.7 and 4.6 s.
inline constexpr std::int32_t tapCounts[] = {128, 1024, 4096, 23147, 81533, 220245};
inline constexpr std::int32_t blockLengths[] = {256, 1024};

/// The response of one ear, 0 or 1: `taps` samples of noise.
inline std::vector<float> noiseResponse(std::int32_t taps, unsigned ear) {
    std::vector<float> response(static_cast<std::size_t>(taps));
    fillNoise(response.data(), response.size(), 2 + ear);
    return response;
}

/// Blocks of noise that a benchmark goes round in.
class InputBlocks {
public:
    explicit InputBlocks(std::int32_t blockLength)
        : length_(static_cast<std::size_t>(blockLength)), samples_(count * length_) {
        fillNoise(samples_.data(), samples_.size());
    }
    const float* next() {
        at_ = (at_ + 1) % count;
        return samples_.data() + at_ * length_;
    }

private:
    static constexpr std::size_t count = 4;
    std::size_t length_;
    std::size_t at_ = 0;
    std::vector<float> samples_;
};

/// One mono source to two ears: both instances with the buffers that an engine lends to them.
class Convolver {
public:
    /// The kernels are those chosen, or forced, now.
    Convolver(std::int32_t blockLength, std::int32_t taps);

    /// One block under an unchanged response.
    void still(const float* block);

    /// One block in which every partition of the response changes, old and new heard.
    void moving(const float* block);

    /// The last block's result, `blockLength` samples times 2 * `blockLength`.
    const float* output(std::size_t ear) const { return output_[ear] + blockLength_; }

private:
    std::unique_ptr<convClass> make(std::uint8_t second, float*& left, float*& right);
    void takeInput(const float* block);

    std::int32_t blockLength_;
    std::int16_t partitions_;
    std::int32_t firLength_;
    AlignedArray<float> window_;
    std::array<AlignedArray<float>, 4> outputs_;
    std::array<AlignedArray<float>, 2> firs_;
    float* input_ = nullptr;
    float* output_[4] = {};
    float* fir_[2] = {};
    bool filterChangeAll_ = true;
    bool secondOLSactive_ = false;
    bool off_ = false;
    float unread_ = 0.0f;
    float* hpTFtime_ = nullptr;
    std::int16_t hpTFselect_ = 0;
    std::uint32_t blockCounter_ = 0;
    std::unique_ptr<convClass> first_;
    std::unique_ptr<convClass> second_;
};

}  // namespace tessaly::bench
