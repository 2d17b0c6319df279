// From the host's matrices to the direction of a source as the listener hears it.
#pragma once

#include <array>

#include "base/audio_thread.h"

namespace tessaly {

/// Degrees.
struct SourceAngles {
    float azimuth;    ///< (-180, 180]: 0 toward +z, positive toward +x
    float elevation;  ///< just under 90 straight overhead
};

/// Single precision throughout; the source's own orientation does not count. Block time.
/// @param listenermatrix  16 floats, column-major, world to listener
/// @param sourcematrix    16 floats, column-major; 12 to 14 are the position
SourceAngles sourceAngles(const float* listenermatrix,
                          const float* sourcematrix) noexcept TESSALY_NONBLOCKING;

/// The angles of one source, worked out only when one of the values they come from has moved.
class KeptSourceAngles {
public:
    /// As `sourceAngles`, bit for bit. Block time.
    const SourceAngles& of(const float* listenermatrix,
                           const float* sourcematrix) noexcept TESSALY_NONBLOCKING;

private:
    // Compared by their bits: what is no number neither sticks nor counts as moved.
    std::array<float, 16> listener_{};
    std::array<float, 3> source_{};
    SourceAngles angles_{};
    bool known_ = false;
};

}  // namespace tessaly
