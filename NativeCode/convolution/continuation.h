// What a block's result goes on to be in the first samples of the next one.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

struct Kernels;

/// A crossfade hears a few samples of the response that the last block was made with. They need no
/// convolution of their own: the block transform of the last result holds them already, in the half
/// that overlap-save throws away.
///
/// There, sample j is the product's own start less what it goes on to be 2B samples later
/// (u^2B = -1): p[j] - p[2B + j]. The start is a sum of j + 1 taps over samples that are known, and
/// so is what the newest block adds to the rest. Both are sums over the same taps, the first ones
/// of each partition:
///
///     old[j] = sum over partitions and i <= j of h[i] (x2[j - i] + x0[j - i])  -  wrapped[j]
///
/// with the block x2 that the partition meets now and the one, x0, that was two before it. These
/// short convolutions are a block convolution again, of `samples` in place of B.
class Continuation {
public:
    /// Samples that can be told.
    static constexpr std::int32_t samples = 64;
    static constexpr std::size_t ears = 2;

    /// Load time: allocates. Without memory for a transform nothing is prepared.
    /// @param blockLength  B, at least `samples`
    /// @param partitions   the first ones of a response that results are made of, at least 1
    /// @throws std::bad_alloc
    void prepare(const Kernels& kernels, std::int32_t blockLength, std::size_t partitions);
    bool prepared() const noexcept { return partitions_ > 0; }

    /// The first samples of a partition as it counts from now on. Those behind the prepared ones
    /// are not looked at. Block time.
    void takeTaps(std::size_t partition, const float* left, const float* right) noexcept;
    /// The window of 2B samples that a block is made from, once a block. Block time.
    void takeWindow(const float* window) noexcept;
    /// As `takeWindow` of zeros, after two windows of zeros. Block time.
    void takeSilence() noexcept;
    /// The next window does not follow the last one. Block time.
    void forget() noexcept;

    /// What of the result of the block at hand is to be made as well, for `keep`.
    WrappedSamples wrapped(std::size_t ear) noexcept {
        return {wrapped_[ear].data(), prepared() ? samples : 0};
    }
    /// The wrapped samples stand, of a result that the first `partitions` made with the taps that
    /// were taken. Samples that are no numbers do not. Block time.
    void keep(std::size_t partitions) noexcept;
    /// The last result does not go on. Block time.
    void drop() noexcept { kept_ = 0; }
    /// Partitions of the result that stands; 0: none does.
    std::size_t kept() const noexcept { return kept_; }
    /// One does, and all windows that count came one after the other. Behind `takeWindow`.
    bool goesOn() const noexcept { return kept_ > 0 && linked_ >= kept_; }
    /// Adds what the last result goes on to be, with the factor 2B of the transforms. Before other
    /// taps are taken. Block time.
    /// @param scaledBegin  partitions from here on count `gain` times
    /// @param count        samples of each ear, up to `samples`
    void addTo(float* left,
               float* right,
               std::size_t scaledBegin,
               float gain,
               std::int32_t count) noexcept;

private:
    ComplexBin* tapsOf(std::size_t partition, std::size_t ear) noexcept {
        return taps_.data() + (ears * partition + ear) * samples;
    }
    bool sum(std::size_t begin, std::size_t end, bool add) noexcept;

    const Kernels* kernels_ = nullptr;
    std::size_t blockLength_ = 0;
    std::size_t partitions_ = 0;
    TransformHandle transform_;           ///< of 2 `samples`
    std::int32_t lanes_ = 1;              ///< of its spectra
    AlignedArray<ComplexBin> taps_;       ///< per partition and ear
    std::vector<std::uint8_t> silent_;    ///< per partition: both ears' taps are zeros
    AlignedArray<ComplexBin> starts_;     ///< x2 + x0 of each block, in a ring of `partitions_`
    std::size_t newest_ = 0;              ///< place in that ring
    AlignedArray<float> start_;           ///< `samples` zeros, and x2 + x0 of the newest block
    AlignedArray<float> block_;           ///< the newest B samples
    std::array<float, samples> older_{};  ///< start of the B samples before them
    std::size_t linked_ = 0;              ///< newest windows that each began as the last ended
    bool broken_ = true;                  ///< the next one does not
    std::array<AlignedArray<float>, ears> wrapped_;
    std::size_t kept_ = 0;
    // Of `addTo`:
    AlignedArray<ComplexBin> sums_;  ///< both ears
    AlignedArray<float> result_;
    std::vector<const ComplexBin*> inputs_;
    std::array<std::vector<const ComplexBin*>, ears> responses_;
};

}  // namespace tessaly
