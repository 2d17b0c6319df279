// The sum of one engine's components. Only construction and the block pipeline know them all.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "base/aligned_array.h"
#include "convolution/conv_class.h"
#include "engine/ambience.h"
#include "engine/distance_law.h"
#include "engine/engine_settings.h"
#include "engine/fir_composer.h"
#include "engine/fir_interpolation.h"
#include "engine/fir_size.h"
#include "engine/input_front_end.h"
#include "engine/live_controls.h"
#include "engine/output_stage.h"
#include "engine/reflections.h"
#include "engine/rest_state.h"
#include "engine/reverb_tail.h"
#include "engine/source_direction.h"
#include "resources/hrir_database.h"

namespace tessaly {

struct EngineState {
    std::string instanceName;
    std::string bundleBasePath;       ///< data directory, no trailing slash
    std::int16_t instanceNumber = 0;  ///< engines alive at construction; 0 leads the others
    std::int16_t handlerSlot = 0;
    std::int16_t qualityValue = 0;
    int sampleRate = 0;            ///< Hz
    float sampleRateRatio = 0.0f;  ///< to 44100 Hz
    float samplesPerMetre = 0.0f;
    float panGain = 1.65f;  ///< of the pan pair
    std::int16_t earlyFlexRefPreset = 0;
    /// Construction went through. An engine without it renders silence.
    bool complete = false;

    EngineSettings settings;                 ///< this engine's copy
    EngineSettings* liveSettings = nullptr;  ///< the handler's record, for the live selection
    MixParameters* mixParameters = nullptr;  ///< the handler's record, read every block
    MixParameters mixParametersOld;
    EffectiveSettings switches;
    FirSizes sizes;
    LiveControls controls;

    std::int16_t** phiIn = nullptr;
    std::int16_t** thetaIn = nullptr;
    float** distanceIn = nullptr;
    float** gainDb = nullptr;
    float* inBlock = nullptr;
    float* outBlock = nullptr;
    std::int16_t inputChannel = 0;
    std::uint32_t silentBlocks = 0;  ///< in a row, of input and rings; stops counting soon
    bool expectsSilence = false;     ///< the next block's input is known to be zeros
    RestState rest;

    SourceDirection direction;
    DistanceLaw law;
    InputFrontEnd frontEnd;
    Reflections reflections;
    ReverbTail tail;
    FirComposer composer;
    FirInterpolation interpolation;
    OutputStage output;
    Ambience ambience;
    AlignedArray<float> debugDumpBuffer;
    std::unique_ptr<HrirDatabase> database;
    // Released in this order, the first before the second, by the engine's destructor.
    std::unique_ptr<convClass> firstOLS;
    std::unique_ptr<convClass> secondOLS;

    /// The direction fields as the HRIR loader takes them.
    HrirRequest hrirRequest() noexcept {
        return HrirRequest{direction.phi,      direction.theta,      direction.phiNew,
                           direction.indexPhi, direction.indexTheta, **phiIn,
                           **thetaIn};
    }
};

/// Builds everything in order; returns early, incomplete, on a fatal condition. Load time.
void constructEngine(EngineState& state);

/// Gives the convolver the response that was composed last, if nobody has heard it so far. Block
/// time.
void catchUpWithResponse(EngineState& state) noexcept TESSALY_NONBLOCKING;

/// One block, in order. Block time.
void processEngineBlock(EngineState& state, float*& input, float*& output) TESSALY_NONBLOCKING;

}  // namespace tessaly
