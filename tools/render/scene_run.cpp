// Creation of a scene's effects, and the order of one block.
#include "render/scene_run.h"

#include <fmt/format.h>

#include <algorithm>
#include <mutex>
#include <stdexcept>

#include "render/effect_names.h"
#include "render/library_failure.h"

namespace tessaly {

namespace {

// Loading writes to the log. Copies of the library that share the program's C++ runtime share its
// output streams, so only one of them loads at a time.
std::mutex loadGuard;

bool hasOwnEngine(const SceneSource& source) { return source.engine.has_value(); }

}  // namespace

SceneRun::SceneRun(const PluginLibrary& library,
                   const std::filesystem::path& dataDirectory,
                   const Scene& scene,
                   double duration)
    : library_(library), scene_(scene), duration_(duration) {
    if (std::any_of(scene.sources.begin(), scene.sources.end(), hasOwnEngine)) {
        session.emplace(dataDirectory, scene);
    }
    const std::lock_guard lock(loadGuard);
    if (!library.setStreamingAssetsPath(dataDirectory.string())) {
        throw std::runtime_error("the library refuses the data directory " +
                                 dataDirectory.string());
    }
    if (scene.wallDistances) {
        library.setRoomDistances(*scene.wallDistances);
    }
    // A return's buffer must exist before anything is sent to it.
    for (const SceneReturn& one : scene.returns) {
        returns.push_back(returnVoice(one));
    }
    for (const SceneSource& source : scene.sources) {
        sources.push_back(sourceVoice(source));
    }
}

SceneRun::~SceneRun() {
    const std::lock_guard lock(loadGuard);
    sources.clear();
    returns.clear();
}

Voice SceneRun::voiceOf(const UnityAudioEffectDefinition& effect,
                        int room,
                        const std::vector<ParameterTrack>& parameters) const {
    const auto rate = static_cast<std::uint32_t>(scene_.sampleRate);
    const auto frames = static_cast<std::uint32_t>(scene_.blockLength);
    Voice voice{std::make_unique<EffectInstance>(effect, rate, frames),
                ParameterSetter(effect, parameters), std::nullopt,
                std::vector<float>(2 * std::size_t{frames}),
                std::vector<float>(2 * std::size_t{frames})};
    // All defaults first, as a host does; the room is what makes the library load.
    voice.instance->setDefaults();
    voice.instance->setParameter(roomParameter, static_cast<float>(room));
    return voice;
}

Voice SceneRun::sourceVoice(const SceneSource& source) const {
    const UnityAudioEffectDefinition& effect =
        source.engine ? OwnEngineSession::spatializer() : library_.effect(spatializerName);
    Voice voice = voiceOf(effect, source.room, source.parameters);
    if (source.engine) {
        if (!source.sends.empty()) {
            throw std::runtime_error(
                fmt::format("source \"{}\" has an engine of its own and cannot send: the returns "
                            "belong to the library",
                            source.name));
        }
        voice.engine.emplace(*source.engine);
    }
    if (!source.sends.empty()) {
        voice.instance->setParameter(sendCountParameter, static_cast<float>(source.sends.size()));
    }
    for (const SceneSend& send : source.sends) {
        voice.instance->setParameter(sendTargetParameter, static_cast<float>(send.reverbId));
        voice.instance->setParameter(sendLevelParameter, static_cast<float>(send.level));
    }
    return voice;
}

Voice SceneRun::returnVoice(const SceneReturn& one) const {
    Voice voice = voiceOf(library_.effect(reverbName), one.room, one.parameters);
    voice.instance->setParameter(reverbIdParameter, static_cast<float>(one.reverbId));
    return voice;
}

bool SceneRun::setParameters(double seconds) {
    bool loads = !begun;
    for (std::vector<Voice>* voices : {&sources, &returns}) {
        for (Voice& voice : *voices) {
            if (loading) {
                voice.parameters.repeatAll();
            }
            loads = voice.parameters.set(*voice.instance, seconds) || loads;
        }
    }
    begun = true;
    return loads;
}

void SceneRun::process(Voice& voice) {
    if (voice.engine) {
        voice.engine->follow(*voice.instance);
    }
    voice.instance->processBlock(voice.in.data(), voice.out.data(),
                                 static_cast<std::uint32_t>(scene_.blockLength));
    if (!loading) {
        allocationCount += voice.instance->blockAllocations();
        releaseCount += voice.instance->blockReleases();
    }
}

void SceneRun::runAll(double seconds) {
    const Pose listener = listenerAt(scene_.listener, seconds);
    for (std::size_t i = 0; i < sources.size(); ++i) {
        Pose place;
        place.position = positionAt(scene_.sources[i].path, seconds, duration_);
        sources[i].instance->place(listener, place);
        process(sources[i]);
    }
    for (Voice& voice : returns) {
        process(voice);
    }
}

void SceneRun::block(double seconds) {
    loading = setParameters(seconds);
    if (!loading) {
        runAll(seconds);
        return;
    }
    const std::lock_guard lock(loadGuard);
    runAll(seconds);
    check();
}

void SceneRun::check() const {
    checkErrorState(library_.getErrorState());
    if (session) {
        OwnEngineSession::check();
    }
}

}  // namespace tessaly
