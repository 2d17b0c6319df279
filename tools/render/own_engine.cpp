// The renderer's own copy of the engines: its process-wide state, and engines with other settings.
#include "render/own_engine.h"

#include <memory>

#include "base/ess_error.h"
#include "base/numeric_conversion.h"
#include "convolution/conv_class.h"
#include "engine/shared_state.h"
#include "engine/spatial_engine.h"
#include "handler/process_state.h"
#include "host/effect_registry.h"
#include "host/spatializer_effect.h"
#include "minihost/plugin_library.h"
#include "render/effect_names.h"
#include "render/library_failure.h"
#include "resources/hrir_tables.h"

namespace tessaly {

namespace {

std::mutex ownEngines;

void startAnew() {
    essError = essErrorNone;
    resetSharedEngineState();
    resetConvolutionState();
    resetHrirTables();
}

void forgetHost() {
    assetPathSet = false;
    roomDistances.fill(1.0f);
    roomDistancesSet = false;
}

}  // namespace

OwnEngineSession::OwnEngineSession(const std::filesystem::path& dataDirectory, const Scene& scene)
    : turn(ownEngines) {
    startAnew();
    forgetHost();
    bundleBasePath = dataDirectory.string();
    assetPathSet = true;
    if (scene.wallDistances) {
        roomDistances = *scene.wallDistances;
        roomDistancesSet = true;
    }
}

OwnEngineSession::~OwnEngineSession() {
    startAnew();
    forgetHost();
}

const UnityAudioEffectDefinition& OwnEngineSession::spatializer() {
    UnityAudioEffectDefinition** table = nullptr;
    const int count = getAudioEffectDefinitions(&table);
    return effectNamed({table, static_cast<std::size_t>(count)}, spatializerName);
}

void OwnEngineSession::check() { checkErrorState(essError); }

OwnEngine::OwnEngine(const DirectEngine& wanted)
    : settings(wanted.settings),
      qualityValue(wanted.qualityValue),
      wallsFollow(wanted.settings.auralisation != 0) {}

void OwnEngine::follow(EffectInstance& instance) {
    InstanceHandler& handler =
        *static_cast<SpatializerEffect*>(instance.state().effectdata)->handler;
    handler.auralisation = handler.auralisation || wallsFollow;
    handler.alwaysUpdateFilter = settings.alwaysUpdateFilter == 1;
    if (!handler.checkForChanges(static_cast<int>(instance.state().samplerate),
                                 static_cast<int>(instance.state().dspbuffersize))) {
        return;
    }
    const EngineSettings& given = handler.engineSettings;
    settings.sampleRate = given.sampleRate;
    settings.earlyFlexRefPreset = given.earlyFlexRefPreset;
    settings.qvReverb = given.qvReverb;
    settings.auralisation = given.auralisation;
    auto& slot = handler.instance[static_cast<std::size_t>(handler.activeInstance)];
    slot.reset();
    // The first engine of the process leads the others, and its convolver is told by its number:
    // ours must find all as the effect's did.
    if (engineCount == 0) {
        startAnew();
    }
    slot = std::make_unique<SpatialEngine>(
        "essCore_InstanceForUnity", bundleBasePath, wrapToInt16(handler.blocklenght),
        &handler.azimuthCell, &handler.elevationCell, &handler.distanceCell, &handler.gainCell,
        qualityValue, &settings, &handler.mixParameters, handler.activeInstance);
    const LiveControls& controls = slot->controls();
    handler.roomWallCopy = controls.roomDistances;
    handler.reflectionLP = controls.reflectionLP_Fc;
    handler.reverbLP = controls.reverbLP_Fc;
}

}  // namespace tessaly
