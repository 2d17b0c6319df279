// Partitioned convolution of the reference: rings of input windows and partitions of a response.
#pragma once

#include <complex>
#include <cstddef>
#include <span>
#include <vector>

namespace tessaly::reference {

/// How the sums are worked out. `transformed` gives the same result faster, to about 1e-14.
enum class Arithmetic { direct, transformed };

/// Discrete Fourier transform in place, unscaled both ways; the length is a power of two.
void fourier(std::vector<std::complex<double>>& values, bool backward);

/// Two real sequences side by side, e.g. both ears: left in the real part, right in the imaginary.
using Pairs = std::vector<std::complex<double>>;

/// The last N input windows of 2 * blockLength samples. A slot that was never written is silent.
class WindowRing {
public:
    WindowRing(int blockLength, int slotCount);

    void write(int slot, std::span<const double> window);
    const std::vector<double>& window(int slot) const { return windows_[slot]; }
    const Pairs& spectrum(int slot) const { return spectra_[slot]; }
    /// Nothing but zeros: adds nothing to any sum.
    bool silent(int slot) const { return silent_[slot]; }
    int slotCount() const { return static_cast<int>(windows_.size()); }

private:
    std::vector<std::vector<double>> windows_;
    std::vector<Pairs> spectra_;
    std::vector<bool> silent_;
};

/// A pair of responses cut into N partitions, each a sequence of 2 * blockLength taps. A partition
/// that is given the taps it has keeps its spectrum: of a long tail little changes.
class PartitionedResponse {
public:
    PartitionedResponse(int blockLength, int partitionCount);

    /// Cuts the first N * blockLength taps into partitions of blockLength taps and as many zeros.
    void cut(const std::vector<double>& left, const std::vector<double>& right);
    /// Partition 0 takes the first 2 * blockLength taps as they stand and acts circularly; the
    /// other partitions keep what they hold.
    void feedDirectly(const std::vector<double>& left, const std::vector<double>& right);

    const Pairs& taps(int partition) const { return taps_[partition]; }
    const Pairs& spectrum(int partition) const { return spectra_[partition]; }
    int blockLength() const { return blockLength_; }

private:
    void take(int partition,
              const std::vector<double>& left,
              const std::vector<double>& right,
              int first,
              int count);

    int blockLength_;
    std::vector<Pairs> taps_;
    std::vector<Pairs> spectra_;
};

/// One block of output: partition p acts on the window that was written p slots before
/// `newestSlot`; of each circular convolution of 2 * blockLength samples the upper half counts.
/// @return blockLength samples of both ears
Pairs convolveBlock(const WindowRing& ring,
                    int newestSlot,
                    const PartitionedResponse& response,
                    Arithmetic arithmetic);

}  // namespace tessaly::reference
