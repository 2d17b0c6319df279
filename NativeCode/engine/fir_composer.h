// Sums direct sound, reflections and tail into one response per ear.
#pragma once

#include "base/aligned_array.h"
#include "base/audio_thread.h"
#include "engine/distance_law.h"
#include "engine/engine_settings.h"
#include "engine/fir_interpolation.h"
#include "engine/fir_size.h"
#include "engine/input_front_end.h"
#include "engine/live_controls.h"
#include "engine/reflections.h"
#include "engine/reverb_tail.h"
#include "engine/source_direction.h"

namespace tessaly {

/// What a composition reads of the engine, and the filters it redesigns on the way.
struct CompositionInputs {
    const EffectiveSettings& switches;
    const FirSizes& sizes;
    int sampleRate;  ///< Hz
    const SourceDirection& direction;
    const DistanceLaw& law;
    const MixParameters& mix;
    const LiveControls& controls;
    HrirSlot staticFilter;  ///< used when directions are not tracked; null: silence
    bool filterChange;      ///< process-wide flags of this block
    bool forceUpdate;
    unsigned int blockCounter;
    InputFrontEnd& frontEnd;  ///< its two distance filters are redesigned
    Reflections& reflections;
    ReverbTail& tail;
};

class FirComposer {
public:
    /// Load time: allocates both responses.
    void prepare(int firBufferSize);

    /// Rebuilds both ears. Block time. `left` and `right` hold `sizes.firBufferSize` floats and are
    /// overwritten; whatever would lie before or behind them is dropped.
    void composeFIR(float* left,
                    float* right,
                    CompositionInputs& inputs) noexcept TESSALY_NONBLOCKING;
    /// Divides the last 15 samples of the response by 4, 8, ... 60. Block time.
    void fadeFilterTail(int FIR_size) noexcept TESSALY_NONBLOCKING;
    /// Decides what is composed and blended in this block. Block time.
    void refreshFilter(CompositionInputs& inputs,
                       FirInterpolation& interpolation) noexcept TESSALY_NONBLOCKING;

    AlignedArray<float> filterLeftBuffer;
    AlignedArray<float> filterRightBuffer;
    float* filterLeft = nullptr;   ///< `firBufferSize` floats
    float* filterRight = nullptr;  ///< `firBufferSize` floats
    float earlyGain = 0.0f;        ///< of the last composition
    float reverbMixGain = 0.0f;    ///< of the last composition
};

}  // namespace tessaly
