// An engine under test: its inputs' cells, its records and a fresh process-wide state.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "base/ess_error.h"
#include "convolution/conv_class.h"
#include "engine/engine_state.h"
#include "engine/shared_state.h"
#include "engine/spatial_engine.h"
#include "resources/hrir_tables.h"

namespace tessaly::test {

/// Puts every process-wide value of the engine and below back to its start.
inline void resetProcess() {
    essError = essErrorNone;
    resetSharedEngineState();
    resetConvolutionState();
    resetHrirTables();
}

/// One sample of the composed response, as it counts.
/// @param ear  0 left, 1 right
inline float composedSample(const FirComposer& composer, int ear, int i) {
    const float stored = ear == 0 ? composer.filterLeft[i] : composer.filterRight[i];
    const ScaledEnd& end = composer.notes.scaledEnd;
    return i >= end.begin ? stored * end.gain : stored;
}

/// A fixture whose cases each start like a new process, with no engine alive.
class EngineFixture : public ::testing::Test {
protected:
    EngineFixture() { resetProcess(); }
    ~EngineFixture() override { resetProcess(); }
    EngineFixture(const EngineFixture&) = delete;
    EngineFixture& operator=(const EngineFixture&) = delete;
};

/// One engine with everything a handler would lend it.
class EngineRig {
public:
    EngineRig(std::string directory, int sampleRate, int blocklenght)
        : directory_(std::move(directory)), blocklenght_(blocklenght) {
        settings.sampleRate = sampleRate;
    }
    EngineRig(const EngineRig&) = delete;
    EngineRig& operator=(const EngineRig&) = delete;

    /// Constructs the engine from the fields below.
    SpatialEngine& build() {
        engine.reset();
        const auto length = static_cast<std::size_t>(blocklenght_ > 0 ? 2 * blocklenght_ : 2);
        input.assign(length, 0.0f);
        output.assign(length, 0.0f);
        engine = std::make_unique<SpatialEngine>(
            "essCore_InstanceForUnity", directory_, blocklenght_, &phiCell_, &thetaCell_,
            &distanceCell_, &gainCell_, qualityValue, &settings, &mix, std::int16_t{1});
        return *engine;
    }

    /// Runs one block of `input` into `output`.
    void run() {
        float* in = input.data();
        float* out = output.data();
        engine->comProcessing(in, out, 1);
    }

    EngineState& state() { return engine->state(); }
    int blocklenght() const { return blocklenght_; }

    EngineSettings settings;
    MixParameters mix;
    std::int16_t qualityValue = 0;
    std::int16_t azimuth = 0;    ///< degrees, host sign: positive to the right
    std::int16_t elevation = 0;  ///< degrees
    float distance = 1.0f;       ///< metres
    float gainDb = 0.0f;
    std::vector<float> input;   ///< interleaved stereo, one block; the even slots are heard
    std::vector<float> output;  ///< interleaved stereo, one block
    std::unique_ptr<SpatialEngine> engine;

private:
    std::string directory_;
    int blocklenght_;
    std::int16_t* phiCell_ = &azimuth;
    std::int16_t* thetaCell_ = &elevation;
    float* distanceCell_ = &distance;
    float* gainCell_ = &gainDb;
};

}  // namespace tessaly::test
