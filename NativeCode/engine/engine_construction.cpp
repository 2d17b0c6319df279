// An engine's life at its two ends: construction in order, `Stop`, destruction.
#include <algorithm>
#include <cmath>
#include <new>
#include <utility>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "base/units.h"
#include "engine/engine_state.h"
#include "engine/headphone_compensation.h"
#include "engine/shared_state.h"
#include "engine/spatial_engine.h"

namespace tessaly {

namespace {

constexpr float ratioAt24000 = 0.5442177f;      // 24000 / 44100
constexpr float ratioAt48000 = 1.0884354f;      // 48000 / 44100
constexpr double firstDistanceOffset = 0.4;     // metres: the first block must see a change
constexpr float firstInterpAngleOffset = 5.0f;  // degrees: the first blend takes the new buffer
constexpr std::size_t debugDumpBytes = 8519680;
constexpr const char* stopLine = "___tessCore_Stop";

bool isPowerOfTwo(int value) noexcept { return value >= 2 && (value & (value - 1)) == 0; }

/// Digit of a data file's name by sample rate; 0 at a rate without data.
char rateDigit(int sampleRate) noexcept {
    switch (sampleRate) {
        case 44100:
            return '0';
        case 48000:
            return '1';
        case 24000:
            return '2';
        default:
            return 0;
    }
}

bool takeSampleRate(EngineState& state) {
    state.sampleRate = state.settings.sampleRate;
    switch (state.sampleRate) {
        case 24000:
            state.sampleRateRatio = ratioAt24000;
            return true;
        case 44100:
            state.sampleRateRatio = 1.0f;
            return true;
        case 48000:
            state.sampleRateRatio = ratioAt48000;
            return true;
        default:
            logOutput("samplerate not 44100, 48000 or 24000! so quit!");
            logError("Tessaly: samplerate not 44100, 48000 or 24000!");
            essError = essErrorSampleRate;
            return false;
    }
}

void checkLimits(EngineSettings& settings) {
    if (settings.limitPhi > 180 || settings.limitPhi < 0 || settings.limitTheta > 90 ||
        settings.limitTheta < 0) {
        logOutput("WARNING: Limits for Phi (0-180) or Theta (0-90) exceedet!!!");
        settings.limitPhi = 180;
        settings.limitTheta = 90;
        logOutput("limitPhi set to 180 and limitTheta set to 90!");
    }
}

void nameReverbFile(EngineState& state) {
    state.tail.reverbDataName = std::string("TSLdata51") + rateDigit(state.sampleRate);
    state.tail.IRfilePath = state.bundleBasePath + "/" + state.tail.reverbDataName + ".dat";
    logOutput("IRfilePath = ", state.tail.IRfilePath);
    logOutput("qvReverb = ", state.switches.qvReverb);
}

void loadTail(EngineState& state) {
    WavSource source;
    source.bundleBasePath = state.bundleBasePath;
    source.IRfilePath = state.tail.IRfilePath;
    source.sampleRate = state.sampleRate;
    state.tail.loadIReverb(state.switches.qvReverb, state.switches.qvReverb, source);
}

HrirDatabaseSettings databaseSettings(const EngineState& state) {
    HrirDatabaseSettings settings;
    settings.bundleBasePath = state.bundleBasePath;
    settings.sampleRate = state.sampleRate;
    settings.hrirLength = state.switches.hrirLength;
    settings.qvTrackDirection = state.switches.qvTrackDirection;
    settings.qvUse256HRIR = state.switches.qvUse256HRIR;
    settings.useElevation = state.switches.useElevation;
    settings.bypass3DAudio = state.switches.bypass3DAudio;
    settings.thetaLimited = state.switches.thetaLimited;
    settings.limitPhi = state.switches.limitPhi;
    settings.limitTheta = state.switches.limitTheta;
    settings.phiSteps = state.direction.phiSteps;
    settings.thetaSteps = state.direction.thetaSteps;
    settings.thetaCentreIndex = state.direction.thetaCentreIndex;
    settings.panGain = state.panGain;
    return settings;
}

void setGridSteps(EngineState& state) {
    SourceDirection& direction = state.direction;
    direction.phiSteps = wrapToInt16(2 * state.switches.limitPhi / gridStepDegrees);
    if (state.switches.useElevation) {
        direction.thetaSteps = wrapToInt16(2 * state.switches.limitTheta / gridStepDegrees);
    } else {
        direction.thetaSteps = 0;
        direction.thetaCentreIndex = gridThetaLevel;
    }
}

Reflections::LoadContext reflectionContext(EngineState& state) {
    return Reflections::LoadContext{state.switches,
                                    state.sampleRate,
                                    state.sampleRateRatio,
                                    state.samplesPerMetre,
                                    hpTFactive,
                                    state.earlyFlexRefPreset,
                                    *state.database,
                                    state.hrirRequest(),
                                    state.controls,
                                    state.tail,
                                    state.sizes.FIR_size};
}

void takeStartDirection(EngineState& state) {
    SourceDirection& direction = state.direction;
    if (state.switches.qvTrackDirection) {
        direction.phiOld = **state.phiIn;
        direction.thetaOld = **state.thetaIn;
    } else {
        direction.phiOld = 0;
        direction.thetaOld = 0;
    }
    direction.indexPhiOld = phiToIndex(direction.phiOld);
    direction.indexThetaOld = thetaToIndex(direction.thetaOld);
    state.law.distance = single(wide(**state.distanceIn) + firstDistanceOffset);
    state.law.distanceOld = **state.distanceIn;
}

std::unique_ptr<convClass> makeConvolver(EngineState& state, const char* name, bool second) {
    OutputStage& output = state.output;
    return std::make_unique<convClass>(
        name, state.sizes.blocklenght, state.frontEnd.inputHistory,
        second ? output.secondOutLeft : output.firstOutLeft,
        second ? output.secondOutRight : output.firstOutRight, state.composer.filterLeft,
        state.composer.filterRight, filterChangeAll, forceUpdateAll, state.switches.qvDiagnosticsB,
        static_cast<std::uint8_t>(state.switches.qvInterpolateSpectra),
        state.direction.filterUpdatePending, state.direction.interpAngleOffset, state.law.distance,
        static_cast<std::uint8_t>(second), state.switches.fading, output.secondOLSactive,
        hpTFactive, hpTFfilter, qvHpTFcompSelect, output.blockGainLinear,
        state.direction.holdInterpPair, blockCounter, state.sizes.FIR_size,
        state.sizes.firBufferSize, state.sizes.fdlCount);
}

/// One set of partition spectra, two feeds: the second convolver reads the first one's.
void shareSpectra(EngineState& state) {
    convClass& first = *state.firstOLS;
    convClass& second = *state.secondOLS;
    for (int i = 0; i < state.sizes.fdlCount; ++i) {
        second.filterPartsL[i] = first.filterPartsL[i];
        second.filterPartsR[i] = first.filterPartsR[i];
    }
    if (hpTFactive) {
        second.hpTFspectrumL = first.hpTFspectrumL;
        second.hpTFspectrumR = first.hpTFspectrumR;
    }
}

/// Steps up to the sizes. False stops construction.
bool settleSettings(EngineState& state) {
    if (!isPowerOfTwo(state.sizes.blocklenght)) {
        logOutput("Tessaly_e ERROR: buffersize is not power-of-two!!!");
        essError = essErrorBlockSize;
        return false;
    }
    if (!takeSampleRate(state)) {
        return false;
    }
    checkLimits(state.settings);
    state.switches.auralisation = state.settings.auralisation != 0;
    state.earlyFlexRefPreset = state.settings.earlyFlexRefPreset;
    if (state.earlyFlexRefPreset == 0) {
        state.settings.qvFlexReflections = 0;
        state.switches.qvFlexReflections = false;
    }
    setQualitySettings(state.settings, state.qualityValue, state.switches,
                       state.direction.angleStep, state.instanceNumber, state.sizes.blocklenght,
                       state.ambience.ATMO_BLOCKS);
    state.frontEnd.prepareFilters(state.sampleRate);
    nameReverbFile(state);
    if (state.switches.qvReverb > 1) {
        loadTail(state);
    }
    deriveFirSizes(state.sizes, state.settings.defaultFirSize, state.switches.qvReverb,
                   state.tail.reverbLength, state.earlyFlexRefPreset);
    if (state.settings.atmoSelect > 0) {
        state.ambience.setBlockLength(state.sizes.blocklenght);
    }
    return true;
}

void loadReflections(EngineState& state) {
    if (state.switches.qvFlexReflections) {
        state.reflections.loadFlexReflections(reflectionContext(state));
        // A room may need more than its tail gave. Partitions were counted before and stay.
        state.sizes.firBufferSize = state.sizes.FIR_size + state.sizes.blocklenght;
    }
    state.database->mappingReflections = false;
}

void allocateBuffers(EngineState& state) {
    state.output.prepare(state.sizes.blocklenght, state.switches.fading);
    state.frontEnd.prepareWindow(state.sizes.blocklenght);
    state.composer.prepare(state.sizes.firBufferSize);
    const bool filtersReflections =
        state.switches.qvFlexReflections && state.reflections.presetUsesFilters;
    state.composer.prepareKeptParts(
        filtersReflections ? state.switches.hrirLength : std::int16_t{0}, state.tail);
    if (state.switches.qvInterpolateFilters) {
        state.interpolation.prepare(state.sizes.firBufferSize);
    }
    if (state.switches.interpolateAngles) {
        state.direction.interpAngleOffset = firstInterpAngleOffset;
    }
}

/// Partitions that direct sound and reflections touch where they stand now, and one to spare.
int earlyPartitions(const EngineState& state) {
    const Reflections& reflections = state.reflections;
    int last = 0;
    for (int k = 0; k < std::min<int>(reflections.flexReflectionCount, Reflections::capacity);
         ++k) {
        last = std::max<int>(last, reflections.records[static_cast<std::size_t>(k)].delaySamples);
    }
    last += state.switches.hrirLength;
    if (state.switches.qvEarlyReflections) {
        last = std::max({last, reflections.earlyRefDelay_1st + reflections.earlyRefLength_1st,
                         reflections.earlyRefDelay_2nd + reflections.earlyRefLength_2nd});
    }
    return last / state.sizes.blocklenght + 2;
}

bool buildConvolvers(EngineState& state) {
    state.firstOLS = makeConvolver(state, "firstOLSfeeded-Instanz", false);
    // Blended responses are written whole, and little of them differs from block to block.
    state.firstOLS->watch(&state.composer.notes,
                          state.switches.qvInterpolateFilters ? state.sizes.firBufferSize : 0);
    if (state.sizes.fdlCount >= FarTail::fewestPartitions && !state.switches.qvInterpolateFilters) {
        state.firstOLS->splitFarTail(
            FarTail::ratioFor(state.sizes.fdlCount, earlyPartitions(state)));
    }
    if (state.switches.fading) {
        state.firstOLS->continueResults();
        state.secondOLS = makeConvolver(state, "secondOLSfeeded-Instanz", true);
        shareSpectra(state);
    }
    if (essError == essErrorTransformPlan) {
        logOutput("couldn't load FFT Plan");
        return false;
    }
    return true;
}

}  // namespace

void constructEngine(EngineState& state) {
    if (!settleSettings(state)) {
        return;
    }

    state.database = nullptr;
    state.direction.filterUpdatePending = true;
    state.samplesPerMetre = single(state.sampleRate * samplesPerMetrePerHertz);
    state.output.outputNormalisation = static_cast<float>(state.sizes.fftLength);
    state.direction.interpAngleOffset = 0.0f;
    setGridSteps(state);

    state.database = std::make_unique<HrirDatabase>(databaseSettings(state));
    if (!state.database->load(state.instanceNumber, state.hrirRequest())) {
        return;
    }
    state.database->mappingReflections = true;
    if (state.switches.qvEarlyReflections) {
        state.reflections.loadEarlyReflections(reflectionContext(state));
    }
    if (state.switches.doppler) {
        state.frontEnd.doppler.prepare(state.sampleRate, state.sizes.blocklenght);
    }
    takeStartDirection(state);
    loadReflections(state);
    allocateBuffers(state);
    if (hpTFactive && state.instanceNumber == 0) {
        loadHpTF(state.sizes.FIR_size, state.sizes.blocklenght, state.bundleBasePath);
    }
    if (!buildConvolvers(state)) {
        return;
    }
    state.ambience.load(state.switches.atmoSelect, state.bundleBasePath);
    if (state.settings.debugDump != 0) {
        state.debugDumpBuffer = AlignedArray<float>(debugDumpBytes / sizeof(float));
        logOutput(state.settings.debugDumpName + ".wav");
    }
    // Off what the first block reads, so that its update finds a change.
    state.direction.phi = wrapToInt16(state.direction.angleStep - **state.phiIn);
    state.direction.theta = wrapToInt16(**state.thetaIn + state.direction.angleStep);
    state.complete = true;
}

SpatialEngine::SpatialEngine(std::string instanceName,
                             std::string bundleBasePath,
                             int blocklenght,
                             std::int16_t** phiIn,
                             std::int16_t** thetaIn,
                             float** distanceIn,
                             float** gainDb,
                             std::int16_t qualityValue,
                             EngineSettings* settings,
                             MixParameters* mixParameters,
                             std::int16_t handlerSlot)
    : state_(std::make_unique<EngineState>()) {
    EngineState& state = *state_;
    state.instanceName = std::move(instanceName);
    state.bundleBasePath = std::move(bundleBasePath);
    state.handlerSlot = handlerSlot;
    state.sizes.blocklenght = blocklenght;
    state.qualityValue = qualityValue;
    state.settings = *settings;  // may throw: only then is the engine counted
    state.instanceNumber = wrapToInt16(engineCount);
    ++engineCount;
    blockCounter = 0;
    state.liveSettings = settings;
    state.mixParameters = mixParameters;
    state.phiIn = phiIn;
    state.thetaIn = thetaIn;
    state.distanceIn = distanceIn;
    state.gainDb = gainDb;

    try {
        constructEngine(state);
    } catch (const std::bad_alloc&) {
        // No exception leaves the library. The engine renders silence, and so does the process
        // while the code stands.
        logOutput("!!!Not enough memory!!!");
        essError = essErrorSpectrumMemory;
    }
    if (state.complete) {
        // All buffers are fresh: what `Stop` clears is zero already, and much of it untouched.
        logOutput(stopLine);
    }
}

SpatialEngine::~SpatialEngine() {
    logOutput(state_->instanceNumber, " delete");
    state_->firstOLS.reset();
    state_->secondOLS.reset();
    --engineCount;
}

int SpatialEngine::Stop() {
    logOutput(stopLine);
    EngineState& state = *state_;
    if (state.complete) {
        // The convolver's spectra outlast this, those too that it has not made yet.
        state.firstOLS->beforeWriting(false);
        catchUpWithResponse(state);
    }
    state.frontEnd.inputHistoryBuffer.clear();
    state.composer.filterLeftBuffer.clear();
    state.composer.filterRightBuffer.clear();
    state.composer.forget();
    state.rest.forget();
    state.output.clear();
    if (state.firstOLS != nullptr) {
        state.firstOLS->clearFDL();
    }
    if (state.secondOLS != nullptr) {
        state.secondOLS->clearFDL();
    }
    return 1;
}

}  // namespace tessaly
