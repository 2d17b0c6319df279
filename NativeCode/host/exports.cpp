// The functions that the host and game scripts find by name.
#include <fstream>
#include <string>

#include "base/ess_error.h"
#include "base/log.h"
#include "handler/process_state.h"
#include "host/effect_registry.h"

#if defined(_WIN32)
#define TESSALY_EXPORT extern "C" __declspec(dllexport)
#else
#define TESSALY_EXPORT extern "C" __attribute__((visibility("default")))
#endif

namespace tessaly {

namespace {

/// Its presence tells a data directory.
constexpr const char* databaseProbe = "/TSLdata120.dat";

/// Last candidate path of each family.
std::string spatPathCopy;
std::string reverbPathCopy;

/// Takes the family's path over if the data files are there; else leaves all as it was.
/// @param prefix     "Tessaly_s: " or "Tessaly_sr: "
/// @param firstPath  the path of the family's first call, the only one that counts
bool storeAssetPath(const char* prefix, const std::string& firstPath, std::string& pathCopy) {
    pathCopy = firstPath;
    const std::string candidate = pathCopy + databaseProbe;
    const bool exists = std::ifstream(candidate).good();
    if (!exists) {
        // Both families say this with the spatializer's prefix.
        logTrace("Tessaly_s: ", "file ", candidate, " does not exists!");
        return false;
    }
    logTrace(prefix, "file ", candidate, " exists!");
    assetPathSet = true;
    bundleBasePath = pathCopy;
    return true;
}

std::string textOf(const char* path) { return path != nullptr ? path : ""; }

/// The low byte, whatever width the caller passes a bool with.
int store3DBypass(int bypass) {
    bypass3DAudio = static_cast<std::uint8_t>(bypass & 0xFF);
    return bypass3DAudio;
}

int storeRoomDistances(float above, float below, float front, float back, float pos, float neg) {
    roomDistances = {above, below, front, back, pos, neg};
    roomDistancesSet = true;
    return 1;
}

}  // namespace

}  // namespace tessaly

// Scripts link by either name on any platform; the "IOS" and "Reverb" forms do the same work.

/// @param definitions  receives the table of definitions. @return number of effects
TESSALY_EXPORT int UnityGetAudioEffectDefinitions(
    tessaly::UnityAudioEffectDefinition*** definitions) {
    return tessaly::getAudioEffectDefinitions(definitions);
}

/// Sets the directory of the data files, no trailing slash. The first path of the process counts,
/// for each family: a later scene cannot move the data. @return the data files were found there
TESSALY_EXPORT bool SetStreamingAssetsPath(const char* path) {
    tessaly::logTrace("Tessaly_s: SetStreamingAssetsPath ", tessaly::textOf(path));
    static const std::string firstPath = tessaly::textOf(path);
    return tessaly::storeAssetPath("Tessaly_s: ", firstPath, tessaly::spatPathCopy);
}

TESSALY_EXPORT bool SetStreamingAssetsPathIOS(const char* path) {
    return SetStreamingAssetsPath(path);
}

TESSALY_EXPORT bool SetStreamingAssetsPathReverb(const char* path) {
    tessaly::logTrace("Tessaly_sr: SetStreamingAssetsPath ", tessaly::textOf(path));
    static const std::string firstPath = tessaly::textOf(path);
    return tessaly::storeAssetPath("Tessaly_sr: ", firstPath, tessaly::reverbPathCopy);
}

TESSALY_EXPORT bool SetStreamingAssetsPathReverbIOS(const char* path) {
    return SetStreamingAssetsPathReverb(path);
}

/// Block size of the spatializers in frames, for a host that does not tell its own.
TESSALY_EXPORT int SetBuffersize(int size) {
    tessaly::logTrace("Tessaly_s: buffersizeSpat = ", tessaly::buffersizeSpat,
                      " buffersizeExternal = ", size);
    tessaly::buffersizeSpat = size;
    return size;
}

TESSALY_EXPORT int SetBuffersizeIOS(int size) { return SetBuffersize(size); }

/// Block size of the reverbs. The trace line says Spat here too.
TESSALY_EXPORT int SetBuffersizeReverb(int size) {
    tessaly::logTrace("Tessaly_sr: buffersizeSpat = ", tessaly::buffersizeReverb,
                      " buffersizeExternal = ", size);
    tessaly::buffersizeReverb = size;
    return size;
}

TESSALY_EXPORT int SetBuffersizeReverbIOS(int size) { return SetBuffersizeReverb(size); }

/// Panning in place of HRIRs for all effects; each reloads at its next block. The argument is one
/// byte to the caller. @return that byte
TESSALY_EXPORT int Set3DBypass(int bypass) { return tessaly::store3DBypass(bypass); }

TESSALY_EXPORT int Set3DBypassIOS(int bypass) { return tessaly::store3DBypass(bypass); }

TESSALY_EXPORT int Set3DBypassReverb(int bypass) {
    tessaly::logTrace("Tessaly_sr: set Tessalybypass3DAudio to ", bypass & 0xFF);
    return tessaly::store3DBypass(bypass);
}

TESSALY_EXPORT int Set3DBypassReverbIOS(int bypass) { return Set3DBypassReverb(bypass); }

/// Wall distances in metres, -1 for no wall; heard by sources with "Auralization". @return 1
TESSALY_EXPORT int SetRoomDistances(
    float above, float below, float front, float back, float positive, float negative) {
    return tessaly::storeRoomDistances(above, below, front, back, positive, negative);
}

TESSALY_EXPORT int SetRoomDistancesIOS(
    float above, float below, float front, float back, float positive, float negative) {
    return tessaly::storeRoomDistances(above, below, front, back, positive, negative);
}

/// 1 if all is well, negative after a failure.
TESSALY_EXPORT int GetErrorState() { return tessaly::essError; }

TESSALY_EXPORT int GetErrorStateIOS() { return tessaly::essError; }

TESSALY_EXPORT int GetErrorStateReverb() { return tessaly::essError; }

TESSALY_EXPORT int GetErrorStateReverbIOS() { return tessaly::essError; }

/// Lets a script see that the library answers. @return 1
TESSALY_EXPORT int TestMethode([[maybe_unused]] int value) {
    tessaly::logTrace("testInt ", value);
    return 1;
}
