// The buffers in which sources meet on their way to a shared reverb.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <map>

#include "base/audio_thread.h"

namespace tessaly {

/// Frames that a mix buffer holds; the largest block that a reverb can take.
inline constexpr std::size_t mixBufferFrames = 4096;

/// Stereo-shaped and interleaved; sources write the left slots only, the right ones stay 0.
using ReverbMixBuffer = std::array<float, 2 * mixBufferFrames>;

/// Mix buffers by reverb ID. Entries are made, moved and erased by the reverbs' "ReverbID" and
/// release, on the host's calling thread; sources add and reverbs take on the mixer's thread.
/// Not guarded: the host's scheduling keeps them apart. A node stays where it is for life.
extern std::map<std::int32_t, ReverbMixBuffer>& reverbmixbuffermap;

/// Looks an ID up without creating it. Block time. @return null if no reverb has taken the ID
ReverbMixBuffer* findMixBuffer(std::int32_t id) noexcept TESSALY_NONBLOCKING;

/// Moves a reverb from one ID to another, 0 meaning none. A reverb's first ID gets a zeroed
/// buffer, also where another reverb had it already; a change takes along what is in flight.
/// Allocates.
void changeReverbId(std::int32_t oldId, std::int32_t newId);

/// Adds a source's dry block. Block time.
/// @param in          frames * inchannels floats, interleaved; not null
/// @param frames      what lies beyond the buffer is dropped
/// @param inchannels  2: both channels are summed without halving; 1; any other adds nothing
/// @param gain        linear
void addToMixBuffer(ReverbMixBuffer& mix,
                    const float* in,
                    std::size_t frames,
                    int inchannels,
                    float gain) noexcept TESSALY_NONBLOCKING;

}  // namespace tessaly
