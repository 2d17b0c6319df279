// Values that all engines of the process share.
#pragma once

#include <cstdint>

namespace tessaly {

// Plain values without guards: engines run one after another on the mixer's thread. `essError`
// stands in base/, the HRIR tables in resources/, the convolver's two values in convolution/.

/// Engines alive; +1 in construction, -1 in destruction.
extern constinit int engineCount;
/// Blocks processed: 0 after every construction, stepped by the last engine created only.
extern constinit std::uint32_t blockCounter;
/// The response must be rebuilt in this block. Set from the start, cleared by every block.
extern constinit bool filterChangeAll;
/// Everything that depends on distance must be redone in this block. As above.
extern constinit bool forceUpdateAll;
/// Headphone compensation in force. Written by engine construction and by engine 0's blocks.
extern constinit bool hpTFactive;
/// Selected headphone filter, 0 none.
extern constinit std::int16_t qvHpTFcompSelect;
/// Impulse response of the headphone filter, zero-padded to the length of a transform of the
/// engine that loaded it; null before the first load.
extern constinit float* hpTFfilter;

/// Makes a zeroed `hpTFfilter` of `length` floats. The one before stays allocated, for an engine
/// of another handler may still be reading it. Load time, or the block that changes the selection.
void allocateHpTFfilter(int length);

/// Restores the start values and frees all headphone filters. Only for tests, no engine alive.
void resetSharedEngineState();

}  // namespace tessaly
