// What a block's result goes on to be in the first samples of the next one.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

struct Kernels;

/// A crossfade hears a few samples of the response that the last block was made with. The block
/// transform of the last result holds most of them already, in the half that overlap-save throws
/// away: products of polynomials in u with u^2B = -1 (simd/negacyclic_template.h).
///
/// There, sample j is the product's own start less what it goes on to be 2B samples later: p[j] -
/// p[2B + j]. The start is a sum of j + 1 taps over samples that are known, and
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
    static constexpr std::size_t mostPartitions = 128;

    /// Load time: allocates. Without memory for a transform nothing is prepared.
    /// @param blockLength  B, at least `samples`
    /// @param partitions   the first ones of a response that results are made of, 1 to
    ///                     `mostPartitions`
    /// @throws std::bad_alloc
    void prepare(const Kernels& kernels, std::int32_t blockLength, std::size_t partitions);
    bool prepared() const noexcept { return partitions_ > 0; }

    /// The first samples of a partition as it counts from now on; null: they are zeros. Those
    /// behind the prepared ones are not looked at. Block time.
    void takeTaps(std::size_t partition, const float* left, const float* right) noexcept;
    /// The window of 2B samples that a block is made from, once a block. Block time.
    /// @param follows  its first half is the second half of the one taken before
    void takeWindow(const float* window, bool follows) noexcept;
    /// As `takeWindow` of zeros, after two windows of zeros. Block time.
    void takeSilence(bool follows) noexcept;
    /// No result stands, and the next window does not follow. Block time.
    void forget() noexcept;

    /// What of the result of the block at hand is to be made as well, for `keep`.
    WrappedSamples wrapped(std::size_t ear) noexcept {
        return {prepared() ? wrappedOf(ear) : nullptr, samples};
    }
    /// The wrapped samples stand, of a result that the first `partitions` made with the taps that
    /// were taken; a result with samples that are no numbers does not go on. Block time.
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
    float* wrappedOf(std::size_t ear) noexcept { return starts_.data() + ear * samples; }
    /// Start of the older half of the newest window.
    float* olderStart() noexcept { return starts_.data() + ears * samples; }
    void link(bool follows) noexcept;
    bool sum(std::size_t begin, std::size_t end, bool add, ComplexBin* sums) noexcept;

    const Kernels* kernels_ = nullptr;
    std::size_t blockLength_ = 0;
    std::size_t partitions_ = 0;
    TransformHandle transform_;         ///< of 2 `samples`
    std::int32_t lanes_ = 1;            ///< of its spectra
    AlignedArray<ComplexBin> taps_;     ///< per partition and ear
    std::vector<std::uint8_t> silent_;  ///< per partition: both ears' taps are zeros
    std::vector<std::uint8_t> quiet_;   ///< per input: it is zeros
    AlignedArray<ComplexBin> inputs_;   ///< x2 + x0 of each block, in a ring of `partitions_`
    std::size_t newest_ = 0;            ///< place in that ring
    AlignedArray<float> starts_;        ///< `wrappedOf` both ears and `olderStart`
    std::size_t linked_ = 0;            ///< newest windows that each followed the one before
    bool broken_ = true;                ///< the next one does not
    std::size_t kept_ = 0;
};

}  // namespace tessaly
