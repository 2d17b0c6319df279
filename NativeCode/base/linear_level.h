// A level whose linear factor is worked out only when the level changes.
#pragma once

#include <bit>
#include <cstdint>

#include "base/audio_thread.h"
#include "base/units.h"

namespace tessaly {

class LinearLevel {
public:
    /// As `decibelsToLinear`, bit for bit. The level is compared by its bits, so that one that is
    /// no number neither sticks nor is worked out anew each time. Block time.
    float of(float levelDb) noexcept TESSALY_NONBLOCKING {
        const auto bits = std::bit_cast<std::uint32_t>(levelDb);
        if (bits != levelBits_) {
            levelBits_ = bits;
            linear_ = decibelsToLinear(levelDb);
        }
        return linear_;
    }

private:
    std::uint32_t levelBits_ = 0;  // 0 dB
    float linear_ = 1.0f;
};

}  // namespace tessaly
