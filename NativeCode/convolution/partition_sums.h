// Sums of products of input spectra and partition spectra, over any choice of partitions.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "convolution/complex_bin.h"

namespace tessaly {

struct Kernels;

/// The two ears' sums of one block, B+1 bins each.
struct EarSpectra {
    ComplexBin* left = nullptr;
    ComplexBin* right = nullptr;

    bool complete() const noexcept { return left != nullptr && right != nullptr; }
};

/// Collects pairs of an input spectrum and a partition's two spectra, then sums their products.
class PartitionSums {
public:
    PartitionSums() = default;
    ~PartitionSums();
    PartitionSums(const PartitionSums&) = delete;
    PartitionSums& operator=(const PartitionSums&) = delete;

    /// For up to `pairs` pairs of `bins` bins. Load time: allocates. Without memory `ready` is
    /// false and `essError` tells.
    void prepare(const Kernels& kernels, std::int32_t bins, std::size_t pairs);
    bool ready() const noexcept { return part_.complete(); }

    void begin() noexcept { count_ = 0; }
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
    /// sum += products. Block time.
    void addTo(const EarSpectra& sum) noexcept;
    /// sum += gain * products. Block time.
    void addTo(const EarSpectra& sum, float gain) noexcept;

    /// sum += gain * term. Block time.
    void addScaled(const EarSpectra& term, float gain, const EarSpectra& sum) const noexcept;

private:
    void run(bool onto, const EarSpectra& sum) noexcept;

    const Kernels* kernels_ = nullptr;
    std::size_t bins_ = 0;
    std::size_t count_ = 0;
    std::vector<const ComplexBin*> inputs_;
    std::vector<const ComplexBin*> left_;
    std::vector<const ComplexBin*> right_;
    EarSpectra part_;  ///< products that take a gain on their way into a sum
};

}  // namespace tessaly
