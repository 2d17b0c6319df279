// Birth, moves and filling of the mix buffers.
#include "host/reverb_mix_buffers.h"

#include <algorithm>

#include "base/even_slots.h"
#include "base/log.h"
#include "base/process_lifetime.h"

namespace tessaly {

namespace {

ProcessLifetime<std::map<std::int32_t, ReverbMixBuffer>> mixBuffers;

}  // namespace

std::map<std::int32_t, ReverbMixBuffer>& reverbmixbuffermap = *mixBuffers;

ReverbMixBuffer* findMixBuffer(std::int32_t id) noexcept {
    const auto entry = reverbmixbuffermap.find(id);
    return entry != reverbmixbuffermap.end() ? &entry->second : nullptr;
}

void changeReverbId(std::int32_t oldId, std::int32_t newId) {
    if (oldId == 0) {
        if (reverbmixbuffermap.empty()) {
            logTrace("Tessaly_sr: reverbmixbuffermap == 0");
        }
        if (newId != 0) {
            reverbmixbuffermap[newId].fill(0.0f);
        }
        return;
    }
    if (oldId == newId) {
        return;
    }
    if (newId != 0) {
        ReverbMixBuffer& target = reverbmixbuffermap[newId];
        if (const ReverbMixBuffer* source = findMixBuffer(oldId)) {
            target = *source;
        } else {
            // Another reverb with the old ID was released and took the buffer with it.
            target.fill(0.0f);
        }
    }
    reverbmixbuffermap.erase(oldId);
}

void addToMixBuffer(ReverbMixBuffer& mix,
                    const float* in,
                    std::size_t frames,
                    int inchannels,
                    float gain) noexcept {
    const std::size_t count = std::min(frames, mixBufferFrames);
    if (inchannels == 2) {
        addSumsToEven(in, count, gain, mix.data());
    } else if (inchannels == 1) {
        addToEven(in, count, gain, mix.data());
    }
}

}  // namespace tessaly
