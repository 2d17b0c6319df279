// From the host's matrices to the direction of a source as the listener hears it.
#pragma once

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

}  // namespace tessaly
