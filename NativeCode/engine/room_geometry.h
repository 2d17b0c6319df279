// Keeps the reflection records true while the source moves.
#pragma once

#include <cstdint>

#include "base/audio_thread.h"
#include "engine/distance_law.h"
#include "engine/engine_settings.h"
#include "engine/live_controls.h"
#include "engine/reflections.h"
#include "engine/source_direction.h"

namespace tessaly {

/// Moves every record with the source: presets add the source's direction to fixed offsets;
/// auralisation computes the six walls of a shoebox. Block time.
void updateReflections(Reflections& reflections,
                       const SourceDirection& direction,
                       const DistanceLaw& law,
                       const LiveControls& controls,
                       const EffectiveSettings& switches,
                       std::int16_t earlyFlexRefPreset,
                       float samplesPerMetre) noexcept TESSALY_NONBLOCKING;

}  // namespace tessaly
