// Sums of products of input spectra and partition spectra, over any choice of partitions.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "convolution/complex_bin.h"

namespace tessaly {

struct Kernels;

/// The two ears' sums of one block.
struct EarSpectra {
    ComplexBin* left = nullptr;
    ComplexBin* right = nullptr;

    bool complete() const noexcept { return left != nullptr && right != nullptr; }
};

/// Collects pairs of an input spectrum and a partition's two spectra, then sums their products:
/// block spectra of B bins, or, once told, spectra of B+1 bins in natural order.
class PartitionSums {
public:
    PartitionSums() = default;
    ~PartitionSums();
    PartitionSums(const PartitionSums&) = delete;
    PartitionSums& operator=(const PartitionSums&) = delete;

    /// For up to `pairs` pairs; every spectrum has room for B+1 bins. Load time: allocates. Without
    /// memory `ready` is false and `essError` tells.
    /// @param alsoNaturalOrder  `useNaturalOrder` may be called
    void prepare(const Kernels& kernels,
                 std::int32_t blockLength,
                 std::size_t pairs,
                 bool alsoNaturalOrder);
    bool ready() const noexcept {
        return part_.complete() && (!naturalOrder_ || product_ != nullptr);
    }
    /// From now on.
    void useNaturalOrder() noexcept { naturalOrder_ = true; }

    void begin() noexcept { count_ = 0; }
    /// No pair has been added.
    bool empty() const noexcept { return count_ == 0; }
    /// Pairs beyond the prepared number are dropped. Block time.
    void add(const ComplexBin* input, const ComplexBin* left, const ComplexBin* right) noexcept {
        if (count_ < inputs_.size()) {
            inputs_[count_] = input;
            left_[count_] = left;
            right_[count_] = right;
            ++count_;
        }
    }

    /// sum = products of the pairs. Without a pair nothing is written. Block time.
    /// @return whether there was one
    bool store(const EarSpectra& sum) noexcept;
    /// sum = base + products; without a pair a copy of the base. Block time.
    void store(const EarSpectra& base, const EarSpectra& sum) noexcept;
    /// sum += products. Block time.
    void addTo(const EarSpectra& sum) noexcept;
    /// sum += gain * products. Block time.
    void addTo(const EarSpectra& sum, float gain) noexcept;

    /// sum += gain * term. Block time.
    void addScaled(const EarSpectra& term, float gain, const EarSpectra& sum) const noexcept;

private:
    std::size_t bins() const noexcept { return blockLength_ + (naturalOrder_ ? 1 : 0); }
    void run(const EarSpectra& base, const EarSpectra& sum) noexcept;
    void runInOrder(const ComplexBin* const* responses,
                    const ComplexBin* base,
                    ComplexBin* sum) noexcept;

    const Kernels* kernels_ = nullptr;
    std::int32_t lanes_ = 1;  ///< of the block spectra
    std::size_t blockLength_ = 0;
    std::size_t count_ = 0;
    bool naturalOrder_ = false;
    std::vector<const ComplexBin*> inputs_;
    std::vector<const ComplexBin*> left_;
    std::vector<const ComplexBin*> right_;
    EarSpectra part_;                ///< products that take a gain on their way into a sum
    ComplexBin* product_ = nullptr;  ///< one product, in natural order
};

}  // namespace tessaly
