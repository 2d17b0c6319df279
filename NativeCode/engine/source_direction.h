// Where the source is on the 5-degree grid, and whether it moved.
#pragma once

#include <cstdint>

#include "base/audio_thread.h"
#include "engine/engine_settings.h"

namespace tessaly {

/// Angles are whole degrees in the engine's sign: azimuth positive to the listener's left.
class SourceDirection {
public:
    /// Tests azimuth, then elevation: a new value counts unless both it and the present one lie
    /// beyond the limit. Block time.
    bool changed(const EffectiveSettings& switches) const noexcept TESSALY_NONBLOCKING;

    /// Clamps and steps the new direction into `phi` and `theta`, sets the grid indices and
    /// `filterChangeAll`. Block time.
    void update(const EffectiveSettings& switches, bool& filterChange) noexcept TESSALY_NONBLOCKING;

    /// Follows the source across the grid in 1-degree steps; says when a new pair of grid filters
    /// is needed. Block time.
    void bookkeepSteps(const EffectiveSettings& switches,
                       bool& filterChange) noexcept TESSALY_NONBLOCKING;

    std::int16_t phi = 0;
    std::int16_t theta = 0;
    std::int16_t phiNew = 0;
    std::int16_t thetaNew = 0;
    std::int16_t phiOld = 0;
    std::int16_t thetaOld = 0;
    std::int16_t indexPhi = 0;
    std::int16_t indexTheta = 0;
    std::int16_t indexPhiOld = 0;
    std::int16_t indexThetaOld = 0;
    std::int16_t phiSteps = 0;          ///< grid steps across the azimuth range
    std::int16_t thetaSteps = 0;        ///< grid steps across the elevation range
    std::int16_t thetaCentreIndex = 0;  ///< 18 without elevation
    std::int16_t angleStep = 5;         ///< degrees; 1 when directions are interpolated

    float phiStep = 0.0f;  ///< change in the current update, possibly limited
    float thetaStep = 0.0f;
    float phiMoved = 0.0f;  ///< since the last grid point
    float thetaMoved = 0.0f;
    float phiStepMoved = 0.0f;  ///< step of the latest update, for the interpolation
    float thetaStepMoved = 0.0f;

    bool filterUpdatePending = false;  ///< new grid filters are due
    bool holdInterpPair = false;       ///< keep the pair of buffers for this block
    float interpAngleOffset = 0.0f;    ///< degrees from the old grid point to the new
};

}  // namespace tessaly
