// An engine that renders nothing of its own and remembers what it was asked.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/engine_settings.h"
#include "engine/live_controls.h"

namespace tessaly::test {

/// What one block saw.
struct FakeBlock {
    int phiIn = 0;
    int thetaIn = 0;
    float distanceIn = 0.0f;
    float gainDb = 0.0f;
    MixParameters mix;
    LiveControls controls;
    std::vector<float> input;  ///< 2 * block length
    int slot = 0;
    bool silenceExpected = false;  ///< the handler had said that the input is zeros
};

/// Life of one engine, kept after its end.
struct FakeEngine {
    std::string instanceName;
    std::string bundleBasePath;
    int blocklenght = 0;
    int qualityValue = 0;
    EngineSettings settings;  ///< as it stood in construction
    MixParameters mixAtConstruction;
    const EngineSettings* settingsPointer = nullptr;
    MixParameters* mixPointer = nullptr;
    int handlerSlot = 0;
    int phiAtConstruction = 0;
    int thetaAtConstruction = 0;
    float distanceAtConstruction = 0.0f;
    float gainDbAtConstruction = 0.0f;
    std::size_t aliveBefore = 0;  ///< engines alive when this one was built
    bool alive = false;
    std::vector<float> occlusionLevels;
    bool silenceExpected = false;  ///< of the block to come
    std::vector<FakeBlock> blocks;
};

/// All engines of the process and what the next ones shall be like.
struct FakeEngines {
    std::vector<std::shared_ptr<FakeEngine>> built;
    std::vector<const FakeEngine*> destroyed;  ///< in order
    /// Runs at the end of each construction, with the engine's live values.
    std::function<void(FakeEngine&, LiveControls&)> atConstruction;
    /// Called in place of the copy from input to output.
    std::function<void(const float* input, float* output, int blocklenght)> render;
    float reverbDistanceGain = 1.0f;

    FakeEngine& last() const { return *built.back(); }
    std::size_t aliveCount() const;
};

/// The one record; a fixture empties it.
FakeEngines& fakeEngines();

}  // namespace tessaly::test
