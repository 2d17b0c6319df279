// The far end of a long response in partitions larger than a block.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "base/aligned_array.h"
#include "convolution/partition_sums.h"
#include "convolution/spectral_primitives.h"

namespace tessaly {

/// Overlap-save with partitions of R blocks (L = R * B samples) for all that lies 2 L samples and
/// more behind the start of a response. What a uniform convolver reads of these partitions in every
/// block, this reads once in R blocks, and it spreads the work: one transform of the input, the
/// products, one backward transform an ear, each in blocks of their own, so that a result is there
/// one whole L before it is heard. (Two-stage partitioning after Gardner, "Efficient Convolution
/// without Input-Output Delay", J. Audio Eng. Soc. 43, 1995.)
///
/// It knows the input as it came, block after block. A ring of input spectra may hold something
/// else for a while; the owner makes up for the difference or does without this.
class FarTail {
public:
    static constexpr std::int32_t smallestRatio = 4;
    /// Its memory pays back from responses of so many blocks on.
    static constexpr std::int32_t fewestPartitions = 48;

    FarTail() = default;
    ~FarTail();
    FarTail(const FarTail&) = delete;
    FarTail& operator=(const FarTail&) = delete;

    /// R for a response of so many partitions, of which the first `early` may not belong to the far
    /// part: near part and far part cost about the same.
    static std::int32_t ratioFor(std::int32_t partitions, std::int32_t early) noexcept;

    /// Load time: allocates 24 bytes for each frame of the far part, and 48 for each of L more.
    /// @param blockLength  B
    /// @param partitions   N, of B samples each; more than 2 * `ratio`
    /// @param ratio        R, a power of two from 4
    /// @return false, and `essError` as it was, without memory for spectra or with other sizes
    /// @throws std::bad_alloc without memory for samples
    bool prepare(const Kernels& kernels,
                 std::int32_t blockLength,
                 std::size_t partitions,
                 std::int32_t ratio);

    /// Of the owner's partitions the first that belongs to this: 2 R.
    std::size_t firstPartition() const noexcept { return 2 * static_cast<std::size_t>(ratio_); }

    /// The input was silence for ever. Block time.
    void clear() noexcept;
    /// Takes a block and does its share of the work. Block time.
    /// @param window  2B samples, the last block's and the new ones
    /// @param silent  the window is known to be zeros
    /// @param wanted  results can be heard; else none is made
    /// @param left, right  the response, `partitions` * B samples each, without the gain of its
    /// end;
    ///                     null while it is not to be read
    void advance(const float* window,
                 bool silent,
                 bool wanted,
                 const float* left,
                 const float* right) noexcept;
    /// Samples of the far part are not those of the block before. Block time.
    void responseChanged() noexcept;

    /// Blocks taken, the number of the newest one.
    std::uint64_t block() const noexcept { return blocks_; }
    /// Whether the window of a block within the length of the response was all zeros.
    bool silentBlock(std::uint64_t block) const noexcept;
    /// There is a result for the newest block.
    bool ready() const noexcept { return resultStands_ && untrusted_ == 0; }
    /// out[i] += gain * result[i] for the first `samples` samples of the newest block, up to B.
    /// Samples have the factor 2B of the owner's transforms. Block time.
    void addTo(float* left, float* right, float gain, std::int32_t samples) const noexcept;

private:
    static constexpr std::size_t ears = 2;

    bool allocate(std::size_t partitions);
    bool continues(const float* window) const noexcept;
    bool zerosThroughout() const noexcept;
    void startRound(bool wanted) noexcept;
    void buildNext(const float* left, const float* right) noexcept;
    void sumShare(std::int32_t phase) noexcept;
    void transformBack(std::size_t ear) noexcept;

    const Kernels* kernels_ = nullptr;
    std::int32_t blockLength_ = 0;
    std::int32_t ratio_ = 0;
    std::size_t length_ = 0;       ///< L
    std::size_t responseEnd_ = 0;  ///< samples of the response
    std::size_t parts_ = 0;        ///< partitions of L samples
    std::size_t stride_ = 0;       ///< bins from one spectrum to the next

    std::uint64_t blocks_ = 0;
    std::uint64_t silentRun_ = 0;  ///< newest blocks whose windows are zeros
    std::int64_t untrusted_ = 0;   ///< blocks until all input that counts came without a gap
    std::vector<std::uint8_t> silentBlocks_;      ///< by block modulo its size
    AlignedArray<float> window_;                  ///< the last two whole L
    AlignedArray<float> filling_;                 ///< the present L
    std::array<ComplexBin*, 1 + ears> memory_{};  ///< input spectra, then the ears' partitions
    std::vector<std::uint8_t> silentInputs_;
    std::vector<std::uint8_t> silentParts_;  ///< per partition and ear
    std::size_t newest_ = 0;                 ///< slot of the newest input spectrum
    std::size_t built_ = 0;                  ///< partition spectra that stand, both ears counted
    AlignedArray<float> padded_;             ///< a partition that ends early
    TransformHandle transform_;

    EarSpectra sum_;
    std::vector<const ComplexBin*> inputs_;
    std::array<std::vector<const ComplexBin*>, ears> responses_;
    std::size_t pairs_ = 0;
    std::array<AlignedArray<float>, ears> result_;  ///< heard now: L samples
    std::array<AlignedArray<float>, ears> next_;    ///< in the making
    bool computing_ = false;
    bool resultStands_ = false;
    bool resultSilent_ = false;
    bool nextSilent_ = false;
};

}  // namespace tessaly
