// A handler's life and the watch over its settings.
#include "handler/instance_handler.h"

#include <algorithm>
#include <limits>

#include "base/log.h"
#include "base/numeric_conversion.h"
#include "handler/process_state.h"

namespace tessaly {

InstanceHandler::InstanceHandler(int hostSampleRate, int hostBuffersize) {
    installDebugLog();
    handlerCount = wrapToInt16(handlerCount + 1);
    handlerNumber = handlerCount;
    checkForChanges(hostSampleRate, hostBuffersize);
}

InstanceHandler::~InstanceHandler() {
    handlerCount = wrapToInt16(handlerCount - 1);
    // The engine in use goes last.
    instance[static_cast<std::size_t>(otherInstance)].reset();
    instance[static_cast<std::size_t>(nextInstance)].reset();
}

bool InstanceHandler::checkForChanges(int hostSampleRate, int hostBuffersize) {
    if (!assetPathSet) {
        logTrace("Tessaly_h: tried to checkForChanges but AssetPath not transmitted yet");
        return false;
    }
    if (roomPreset < 0) {
        logTrace("Tessaly_h: tried to checkForChanges but roomPreset is -1");
        return false;
    }
    if (hostSampleRate == 0) {
        logTrace("Tessaly_h: tried to checkForChanges but samplerate is 0!");
        return false;
    }
    if (hostBuffersize == 0) {
        logTrace("Tessaly_h: tried to checkForChanges but buffersize is 0!");
        return false;
    }

    const std::int16_t checksBefore = checkCounter;
    checkCounter = wrapToInt16(checkCounter + 1);
    if (checksBefore <= 0) {
        logTrace("Tessaly_h: CREATE NEW eInstance");
        loadEngine(hostSampleRate, hostBuffersize);
        return true;
    }
    if (settingsDiffer(hostSampleRate, hostBuffersize)) {
        logTrace("Tessaly_h: SETTINGS CHANGED sampleRate new = ", hostSampleRate,
                 " old = ", sampleRate, " buffersize new = ", hostBuffersize,
                 " old = ", blocklenght, " preset new = ", roomPreset, " old = ", roomPresetIn);
        settingsChanged = 1;
    }
    if (settingsChanged > 0) {
        loadEngine(hostSampleRate, hostBuffersize);
        settingsChanged = 0;
        return true;
    }
    checkCounter = 1;
    return false;
}

bool InstanceHandler::settingsDiffer(int hostSampleRate, int hostBuffersize) const noexcept {
    // A room number beyond 16 bits is latched at the bound; compared unbounded it would differ
    // for ever and load in every block.
    const std::int32_t room =
        std::min<std::int32_t>(roomPreset, std::numeric_limits<std::int16_t>::max());
    return hostSampleRate != sampleRate || hostBuffersize != blocklenght || room != roomPresetIn ||
           fadingIn != fading || auralisationIn != auralisation || dopplerIn != doppler ||
           reverbActiveIn != reverbActive || bypass3DAudioIn != bypass3DAudio;
}

}  // namespace tessaly
