// Builds an engine for a handler, swaps it in and deletes the one before.
#include <algorithm>
#include <limits>
#include <new>

#include "base/ess_error.h"
#include "base/log.h"
#include "base/numeric_conversion.h"
#include "handler/instance_handler.h"
#include "handler/process_state.h"
#include "handler/room_table.h"

namespace tessaly {

namespace {

constexpr int slotCount = 2;
constexpr int lastHeadphoneSelection = 6;
/// Frames of a response before the room decides.
constexpr int defaultFirSize = 4096;

}  // namespace

void InstanceHandler::loadEngine(int hostSampleRate, int hostBuffersize) {
    isLoaded = false;
    logOutput("Tessaly_h: Loading instance = ", handlerNumber, " samplerate = ", hostSampleRate,
              " buffersize = ", hostBuffersize, " preset = ", roomPreset);

    latchSettings(hostSampleRate, hostBuffersize);
    fillEngineSettings();
    mixParameters.directGain = 1.0f;
    mixParameters.earlyGain = 1.0f;
    mixParameters.reverbGain = 1.0f;
    std::int16_t qualityValue = qualityIn;
    if (qualityIn == 1) {
        engineSettings.qvInterpolateFilters = 1;
        qualityValue = 0;
    }
    selectRoom();
    if (hpTFSelectIn >= 0 && hpTFSelectIn <= lastHeadphoneSelection) {
        engineSettings.qvHpTFcompSelect = hpTFSelectIn;
    }
    gainDb = 0.0f;

    if (activeInstance >= slotCount) {
        logOutput("Tessaly_h: ERROR to many instances of essCore called! Max number is ", slotCount,
                  " but called ", activeInstance, " now!!!");
    }
    nextInstance = activeInstance == 0 ? 1 : 0;
    otherInstance = activeInstance == 0 ? 0 : 1;

    // While both engines live the new one shares the HRIR set and leaves headphone and ambience
    // to the old one.
    const auto next = static_cast<std::size_t>(nextInstance);
    try {
        instance[next] = std::make_unique<SpatialEngine>(
            "essCore_InstanceForUnity", bundleBasePath, wrapToInt16(blocklenght), &azimuthCell,
            &elevationCell, &distanceCell, &gainCell, qualityValue, &engineSettings, &mixParameters,
            nextInstance);
    } catch (const std::bad_alloc&) {
        // No exception leaves the library.
        essError = essErrorSpectrumMemory;
        logError("Tessaly_h: ERROR code ", essError);
        return;
    }
    activeInstance = nextInstance;

    if (essError >= 0) {
        essError = essErrorNone;
    } else {
        logError("Tessaly_h: ERROR code ", essError);
    }

    auto& previous = instance[static_cast<std::size_t>(otherInstance)];
    if (previous != nullptr) {
        isLoaded = false;
        previous.reset();
    }
    isLoaded = true;

    // The room's cut-offs replace what the host asked for before the load.
    const LiveControls& controls = instance[next]->controls();
    roomWallCopy = controls.roomDistances;
    reflectionLP = controls.reflectionLP_Fc;
    reverbLP = controls.reverbLP_Fc;
    allocateBlocks();

    internalMute = false;
    if (essError == essErrorNone) {
        logTrace("Tessaly_h: Load Engine succesfull with buffersize ", blocklenght);
    } else {
        logError("Tessaly_h: Load Engine with error: ", essError);
    }
}

void InstanceHandler::latchSettings(int hostSampleRate, int hostBuffersize) {
    roomPresetIn = static_cast<std::int16_t>(
        std::min<std::int32_t>(roomPreset, std::numeric_limits<std::int16_t>::max()));
    internalMute = true;
    sampleRate = hostSampleRate;
    blocklenght = hostBuffersize;
    fadingIn = fading;
    auralisationIn = auralisation;
    dopplerIn = doppler;
    reverbActiveIn = reverbActive;
    bypass3DAudioIn = bypass3DAudio;
    qualityIn = 0;
    hpTFSelectIn = 0;
    limitThetaIn = 90;

    azimuthIn = truncateToInt16(azimuth);
    elevationIn = truncateToInt16(elevation);
    distanceIn = distance;  // unscaled: "Distance" acts from the first block on
}

void InstanceHandler::fillEngineSettings() {
    engineSettings.qvInterpolateSpectra = 0;
    engineSettings.qvInterpolateFilters = 0;
    engineSettings.qvEarlyReflections = 0;
    engineSettings.qvFlexReflections = 1;
    engineSettings.qvSmoothSteps = 0;
    engineSettings.fading = fadingIn ? 1 : 0;
    engineSettings.qvTrackDirection = 1;
    engineSettings.qvUse256HRIR = 0;
    engineSettings.qvUpdateInterval = 1;
    engineSettings.atmoSelect = 0;
    engineSettings.limitPhi = 180;
    engineSettings.limitTheta = limitThetaIn;
    engineSettings.alwaysUpdateFilter = alwaysUpdateFilter ? 1 : 0;
    engineSettings.sampleRate = sampleRate;
    engineSettings.debugDump = 0;
    engineSettings.settingsReserved = 1;
    engineSettings.defaultFirSize = defaultFirSize;
    engineSettings.doppler = dopplerIn ? 1 : 0;
    engineSettings.dopplerScale = 1.0f;
    engineSettings.auralisation = auralisationIn ? 1 : 0;
    engineSettings.bypass3DAudio = bypass3DAudioIn;
    engineSettings.settingsFloatA = settingsFloatA;
    engineSettings.settingsFloatB = settingsFloatB;
}

void InstanceHandler::selectRoom() {
    const std::int16_t preset = roomPresetFor(roomPresetIn);
    engineSettings.earlyFlexRefPreset = preset;
    engineSettings.qvReverb = preset;
    if (preset <= 0) {
        logTrace("Tessaly_h: ERROR roomPresetIn ", roomPresetIn, " is too high!!!");
    }
    // Without its tail a source keeps its early reflections.
    if (preset == presetWithoutTail || !reverbActiveIn) {
        engineSettings.qvReverb = 0;
    }
}

void InstanceHandler::allocateBlocks() {
    // What does not fit the engine's 16-bit block length has failed or was built for another
    // length: such a handler gets no blocks and stays silent.
    const bool fits = blocklenght > 0 && blocklenght <= std::numeric_limits<std::int16_t>::max();
    blockCapacity = fits ? static_cast<std::uint32_t>(blocklenght) : 0;
    try {
        const std::size_t floats = 2 * static_cast<std::size_t>(blockCapacity);
        inputStorage = AlignedArray<float>(floats);
        outputStorage = AlignedArray<float>(floats);
    } catch (const std::bad_alloc&) {
        inputStorage = {};
        outputStorage = {};
        blockCapacity = 0;
        essError = essErrorSpectrumMemory;
    }
    inputBlock = inputStorage.data();
    outputBlock = outputStorage.data();
    inputBlockSilent_ = true;
    overlongReported = false;
}

}  // namespace tessaly
