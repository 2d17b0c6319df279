// The order of a block, and no arithmetic of its own.
#include <algorithm>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "engine/engine_state.h"
#include "engine/headphone_compensation.h"
#include "engine/room_geometry.h"
#include "engine/shared_state.h"
#include "engine/spatial_engine.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

constexpr float forcedInterpAngleOffset = 2.5f;  // degrees, half a grid step
constexpr std::uint32_t silencePatience = 16;    // blocks before silence is relied on

static_assert(OutputStage::crossfadeLength <= Continuation::samples,
              "of the old response no more is heard than a result goes on to be");

void moveReflections(EngineState& state) noexcept {
    if (state.switches.qvFlexReflections && state.switches.qvTrackDirection) {
        updateReflections(state.reflections, state.direction, state.law, state.controls,
                          state.switches, state.earlyFlexRefPreset, state.samplesPerMetre);
    }
}

/// Engines that do not update always watch the mix values instead.
void watchMixParameters(EngineState& state) noexcept {
    if (state.switches.alwaysUpdateFilter != 0) {
        return;
    }
    if (mixParametersDiffer(*state.mixParameters, state.mixParametersOld)) {
        state.switches.mixParametersChanged = 1;
    }
    state.mixParametersOld = *state.mixParameters;
}

void readDistance(EngineState& state) noexcept {
    DistanceLaw& law = state.law;
    law.distanceNew = **state.distanceIn;
    if (law.distanceNew != law.distance) {
        law.distanceUpdate(state.switches, state.mixParameters->unityDistance != 0, filterChangeAll,
                           forceUpdateAll);
    }
}

void updateDirection(EngineState& state) noexcept {
    SourceDirection& direction = state.direction;
    direction.update(state.switches, filterChangeAll);
    moveReflections(state);
    if (!state.switches.interpolateAngles) {
        return;
    }
    if (state.switches.alwaysUpdateFilter != 0) {
        direction.filterUpdatePending = true;
    }
    direction.bookkeepSteps(state.switches, filterChangeAll);
    if (direction.filterUpdatePending) {
        direction.indexPhiOld = direction.indexPhi;
        direction.indexThetaOld = direction.indexTheta;
    }
}

void directionStage(EngineState& state) noexcept {
    SourceDirection& direction = state.direction;
    direction.phiNew = wrapToInt16(-int{**state.phiIn});  // the host's azimuth grows to the right
    direction.thetaNew = **state.thetaIn;
    if (direction.changed(state.switches) || state.switches.alwaysUpdateFilter == 1 ||
        state.switches.mixParametersChanged == 1) {
        updateDirection(state);
    } else if (forceUpdateAll) {
        if (state.switches.interpolateAngles) {
            direction.interpAngleOffset = forcedInterpAngleOffset;
            direction.filterUpdatePending = true;
        }
        if (state.switches.qvFlexReflections && state.switches.qvTrackDirection) {
            filterChangeAll = true;
            moveReflections(state);
        }
    }
}

bool isCrossfadeBlock(const EngineState& state) noexcept {
    return state.switches.fading && filterChangeAll && blockCounter != 0;
}

/// Neither this block's window nor the ring it is convolved with holds a sound, and has not for a
/// while: waking from a response that was put off costs more than a usual block. With headphone
/// compensation nothing is put off, and what was is written before a selection changes: from then
/// on it counts which responses came before the change.
bool watchSilence(EngineState& state) noexcept {
    const convClass& heard = isCrossfadeBlock(state) ? *state.secondOLS : *state.firstOLS;
    const bool silent =
        state.frontEnd.seesSilence(state.inBlock, state.inputChannel, state.controls.bassBoost,
                                   state.switches.doppler) &&
        heard.pastSilent() && essError == essErrorNone && !hpTFactive &&
        state.firstOLS->hpTFselectSeen == qvHpTFcompSelect;
    state.silentBlocks = silent ? std::min(state.silentBlocks + 1, silencePatience + 1) : 0;
    return state.silentBlocks > silencePatience;
}

CompositionInputs compositionInputs(EngineState& state) noexcept {
    return {state.switches,    state.sizes,
            state.sampleRate,  state.direction,
            state.law,         *state.mixParameters,
            state.controls,    state.database->staticFilter,
            filterChangeAll,   forceUpdateAll,
            blockCounter,      state.frontEnd,
            state.reflections, state.tail};
}

void composeResponse(EngineState& state) noexcept {
    state.firstOLS->beforeWriting(isCrossfadeBlock(state) && essError == essErrorNone);
    CompositionInputs inputs = compositionInputs(state);
    inputs.unheard = watchSilence(state);
    if (!inputs.unheard) {
        catchUpWithResponse(state);
    }
    state.composer.refreshFilter(inputs, state.interpolation);
}

void advanceRings(EngineState& state) noexcept {
    convClass& first = *state.firstOLS;
    const int next = first.FDLpos + 1;
    const int count = state.sizes.fdlCount;
    // A division is dear for a block of silence, and needed only behind an index out of the ring.
    first.FDLpos = static_cast<std::int16_t>(next < count    ? next
                                             : next == count ? 0
                                                             : next % count);
    if (state.secondOLS != nullptr) {
        state.secondOLS->FDLpos = first.FDLpos;
    }
}

void convolve(EngineState& state, bool crossfade) {
    if (essError != essErrorNone) {
        logOutput("Tessaly_e ERROR: no comProcessing due to essError: ", essError);
        return;
    }
    if (state.frontEnd.windowSilent()) {
        (crossfade ? *state.secondOLS : *state.firstOLS).expectSilence();
    }
    if (crossfade) {
        state.output.secondOLSactive = true;
        state.firstOLS->processCrossfade(*state.secondOLS, OutputStage::crossfadeLength);
    } else {
        state.firstOLS->process();
    }
}

void printDebugDump(const EngineState& state) {
    const auto blocks = static_cast<std::uint32_t>(std::max(state.ambience.ATMO_BLOCKS, 1));
    const std::size_t start = static_cast<std::size_t>(blockCounter % blocks) *
                              static_cast<std::size_t>(state.sizes.fftLength);
    for (std::size_t i = 0; i < 10; ++i) {
        const std::size_t at = start + i;
        std::cout << i << ">_"
                  << (at < state.debugDumpBuffer.size() ? state.debugDumpBuffer[at] : 0.0f) << '\t';
    }
    std::cout << std::endl;
}

void outputStage(EngineState& state) {
    OutputStage& output = state.output;
    // The second one's result is then silent too.
    const bool silent = state.firstOLS->resultSilent() && essError == essErrorNone;
    if (state.switches.fading && output.secondOLSactive && !silent) {
        output.crossfade();
    }
    if (silent && output.keepsSilence(state.switches.atmoSelect)) {
        std::fill_n(state.outBlock, std::size_t{2} * static_cast<std::size_t>(output.blockLength()),
                    0.0f);
    } else {
        output.write(state.outBlock, state.ambience, state.switches.atmoSelect, blockCounter);
    }
    if (state.settings.debugDump != 0) {
        printDebugDump(state);
    }
    state.direction.holdInterpPair = false;
}

BlockInputs readInputs(const EngineState& state) noexcept {
    return {**state.phiIn,
            **state.thetaIn,
            **state.distanceIn,
            **state.gainDb,
            state.frontEnd.inputLowPassLevel,
            qvHpTFcompSelect,
            state.liveSettings->qvHpTFcompSelect,
            hrirStreamNumber,
            hrirTablesVersion,
            *state.mixParameters,
            state.controls};
}

/// As `readInputs(state) == inputs`, without making the former.
bool readsTheSame(const EngineState& state, const BlockInputs& inputs) noexcept {
    return **state.phiIn == inputs.phi && **state.thetaIn == inputs.theta &&
           **state.distanceIn == inputs.distance && **state.gainDb == inputs.gainDb &&
           state.frontEnd.inputLowPassLevel == inputs.inputLowPassLevel &&
           qvHpTFcompSelect == inputs.headphoneSelection &&
           state.liveSettings->qvHpTFcompSelect == inputs.liveHeadphoneSelection &&
           hrirStreamNumber == inputs.hrirStream && hrirTablesVersion == inputs.hrirTables &&
           *state.mixParameters == inputs.mix && state.controls == inputs.controls;
}

/// A block in full with the same inputs leaves these engines as they were: no delay line moves on,
/// no step is limited or counted towards the next direction, and no block is left out.
bool mayRest(const EngineState& state) noexcept {
    return !state.switches.doppler && !state.switches.interpolateAngles &&
           !state.switches.qvSmoothSteps && state.switches.qvUpdateInterval <= 1 &&
           state.settings.debugDump == 0;
}

/// Flags of the process that ask for something.
bool nothingIsAsked() noexcept {
    return !filterChangeAll && !forceUpdateAll && !hpTFactive && essError == essErrorNone &&
           blockCounter != 0;
}

/// @param crossfade  the block that was made is one
void noteRest(EngineState& state, bool crossfade) noexcept {
    const bool quiet = state.silentBlocks > silencePatience && state.firstOLS->resultSilent() &&
                       state.frontEnd.windowSilent() && mayRest(state) && nothingIsAsked() &&
                       state.output.keepsSilence(state.switches.atmoSelect);
    if (quiet) {
        state.rest.blockMade(true, readInputs(state), crossfade);
    } else {
        state.rest.forget();
    }
}

/// As a block in full would leave it.
void restForABlock(EngineState& state) noexcept {
    state.rest.blockLeft();
    advanceRings(state);
    state.firstOLS->rest(state.rest.crossfade() ? state.secondOLS.get() : nullptr);
    std::fill_n(state.outBlock, std::size_t{2} * static_cast<std::size_t>(state.sizes.blocklenght),
                0.0f);
    if (state.instanceNumber >= engineCount - 1) {
        ++blockCounter;
    }
}

/// Silence of an engine whose construction stopped.
void renderNothing(const EngineState& state, float* output) {
    if (essError != essErrorNone) {
        logOutput("Tessaly_e ERROR: no comProcessing due to essError: ", essError);
    }
    if (state.sizes.blocklenght > 0 && output != nullptr) {
        std::fill_n(output, std::size_t{2} * static_cast<std::size_t>(state.sizes.blocklenght),
                    0.0f);
    }
}

}  // namespace

void catchUpWithResponse(EngineState& state) noexcept {
    CompositionInputs inputs = compositionInputs(state);
    if (state.composer.catchUp(inputs)) {
        state.firstOLS->takeResponses();
    }
}

void processEngineBlock(EngineState& state, float*& input, float*& output) {
    const bool expectsSilence = std::exchange(state.expectsSilence, false);
    if (input == nullptr) {
        logTrace("ERROR: Buffer-Input problem!!!");
        return;
    }
    if (!state.complete) {
        renderNothing(state, output);
        return;
    }
    if (output == nullptr) {
        return;
    }
    state.inBlock = input;
    state.outBlock = output;
    state.inputChannel = 0;
    if (expectsSilence) {
        if (state.rest.settled() && nothingIsAsked() && readsTheSame(state, state.rest.inputs())) {
            restForABlock(state);
            return;
        }
        state.frontEnd.expectSilence();
    }
    if (state.instanceNumber == 0) {
        watchHeadphoneSelection(state.liveSettings->qvHpTFcompSelect, state.sizes.FIR_size,
                                state.sizes.blocklenght, state.bundleBasePath);
    }
    state.output.setBlockGain(**state.gainDb, state.sizes.fftLength, hpTFactive);
    watchMixParameters(state);

    const auto interval =
        static_cast<std::uint32_t>(std::max<std::int16_t>(state.switches.qvUpdateInterval, 1));
    const bool tick = blockCounter % interval == 0;
    if (tick) {
        readDistance(state);
    }
    if (tick || forceUpdateAll) {
        directionStage(state);
    }
    composeResponse(state);
    state.frontEnd.process(state.inBlock, state.inputChannel, state.controls.bassBoost,
                           state.switches.doppler, state.law.distance, state.law.distanceOld);
    if (state.switches.doppler) {
        state.law.dopplerPitch = 1.0f;  // the delay line has done the shift
    }
    advanceRings(state);
    const bool crossfade = isCrossfadeBlock(state);
    convolve(state, crossfade);
    filterChangeAll = false;
    forceUpdateAll = false;
    outputStage(state);
    noteRest(state, crossfade);

    if (state.instanceNumber >= engineCount - 1) {
        ++blockCounter;
    }
    if (state.switches.interpolateAngles) {
        state.direction.filterUpdatePending = false;
    }
    if (state.switches.fading) {
        state.output.secondOLSactive = false;
    }
    state.law.distanceOld = state.law.distance;
    state.switches.mixParametersChanged = 0;
}

bool SpatialEngine::comProcessing(float*& input, float*& output, std::int16_t /*slot*/) {
    processEngineBlock(*state_, input, output);
    return true;
}

void SpatialEngine::expectSilence() noexcept { state_->expectsSilence = true; }

float SpatialEngine::setInputLowPass(float level) noexcept {
    return state_->frontEnd.setInputLowPass(level);
}

float SpatialEngine::getReverbDistanceGain() const noexcept {
    return state_->law.reverbDistanceGain;
}

LiveControls& SpatialEngine::controls() noexcept { return state_->controls; }

const LiveControls& SpatialEngine::controls() const noexcept { return state_->controls; }

}  // namespace tessaly
