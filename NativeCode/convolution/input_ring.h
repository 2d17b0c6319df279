// What a ring of input spectra holds, slot by slot.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace tessaly {

/// Beside a ring of N spectra: which of them are all zeros, and which block each one is of. Zeros
/// need no product; blocks are counted by who convolves, from 1.
class InputRing {
public:
    static constexpr std::uint64_t noBlock = 0;  ///< of a slot that is of no block that is known

    /// All slots silent and of no block. Load time: allocates.
    void prepare(std::size_t slots) {
        silent_.assign(slots, 1);
        blocks_.assign(slots, noBlock);
        sounding_ = 0;
        ++writes_;
    }
    /// Likewise, without allocating. Block time.
    void clear() noexcept {
        std::fill(silent_.begin(), silent_.end(), std::uint8_t{1});
        std::fill(blocks_.begin(), blocks_.end(), noBlock);
        sounding_ = 0;
        ++writes_;
    }
    /// Block time.
    void set(std::size_t slot, bool silent, std::uint64_t block) noexcept {
        sounding_ += static_cast<std::size_t>(silent_[slot]) - (silent ? 1u : 0u);
        silent_[slot] = silent ? 1 : 0;
        blocks_[slot] = block;
        ++writes_;
    }
    bool silent(std::size_t slot) const noexcept { return silent_[slot] != 0; }
    std::uint64_t block(std::size_t slot) const noexcept { return blocks_[slot]; }
    /// No slot holds a sound.
    bool silent() const noexcept { return sounding_ == 0; }
    /// How often something was written, whatever it was.
    std::uint64_t writes() const noexcept { return writes_; }

private:
    std::vector<std::uint8_t> silent_;
    std::vector<std::uint64_t> blocks_;
    std::size_t sounding_ = 0;
    std::uint64_t writes_ = 0;
};

}  // namespace tessaly
