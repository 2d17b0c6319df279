// When an engine has nothing to do: silence in, silence out, and all it reads as it was.
#pragma once

#include <cstdint>

#include "engine/engine_settings.h"
#include "engine/live_controls.h"

namespace tessaly {

/// All that a block reads beside its samples.
struct BlockInputs {
    std::int16_t phi = 0;
    std::int16_t theta = 0;
    float distance = 0.0f;
    float gainDb = 0.0f;
    float inputLowPassLevel = 0.0f;
    std::int16_t headphoneSelection = 0;      ///< of the process
    std::int16_t liveHeadphoneSelection = 0;  ///< of the handler's record
    std::uint32_t hrirStream = 0;
    std::uint32_t hrirTables = 0;  ///< their version
    MixParameters mix;
    LiveControls controls;

    bool operator==(const BlockInputs&) const = default;
};

/// Two silent blocks in a row that were made from the same, in full, leave an engine that takes no
/// steps of its own as it was, but for counters: what follows need not be made until something
/// changes.
class RestState {
public:
    /// After a block in full. Block time.
    /// @param quiet      silence in and out, and nothing but silence in all memory of sound
    /// @param inputs     read only if quiet
    /// @param crossfade  two convolvers took part
    void blockMade(bool quiet, const BlockInputs& inputs, bool crossfade) noexcept {
        settled_ = quiet && lastWasQuiet_ && inputs == inputs_;
        lastWasQuiet_ = quiet;
        crossfade_ = crossfade;
        if (quiet) {
            inputs_ = inputs;
        }
    }
    bool settled() const noexcept { return settled_; }
    /// Of the blocks that settled.
    const BlockInputs& inputs() const noexcept { return inputs_; }
    /// Likewise.
    bool crossfade() const noexcept { return crossfade_; }
    void forget() noexcept { settled_ = lastWasQuiet_ = false; }

    /// A block was not made. Block time.
    void blockLeft() noexcept { ++blocksLeft_; }
    /// Blocks that were not made since the engine was built.
    std::uint64_t blocksLeft() const noexcept { return blocksLeft_; }

private:
    BlockInputs inputs_;
    bool settled_ = false;
    bool lastWasQuiet_ = false;
    bool crossfade_ = false;
    std::uint64_t blocksLeft_ = 0;
};

}  // namespace tessaly
