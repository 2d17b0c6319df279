// Defines SpatialEngine by a recorder.
#include "handler/fake_engine.h"

#include <algorithm>
#include <utility>

#include "engine/spatial_engine.h"

namespace tessaly::test {

FakeEngines& fakeEngines() {
    static FakeEngines engines;
    return engines;
}

std::size_t FakeEngines::aliveCount() const {
    return static_cast<std::size_t>(
        std::count_if(built.begin(), built.end(), [](const auto& e) { return e->alive; }));
}

}  // namespace tessaly::test

namespace tessaly {

struct EngineState {
    std::shared_ptr<test::FakeEngine> record;
    std::int16_t** phiIn;
    std::int16_t** thetaIn;
    float** distanceIn;
    float** gainDb;
    LiveControls controls;
};

SpatialEngine::SpatialEngine(std::string instanceName,
                             std::string bundleBasePath,
                             int blocklenght,
                             std::int16_t** phiIn,
                             std::int16_t** thetaIn,
                             float** distanceIn,
                             float** gainDb,
                             std::int16_t qualityValue,
                             EngineSettings* settings,
                             MixParameters* mixParameters,
                             std::int16_t handlerSlot)
    : state_(std::make_unique<EngineState>()) {
    auto record = std::make_shared<test::FakeEngine>();
    record->instanceName = std::move(instanceName);
    record->bundleBasePath = std::move(bundleBasePath);
    record->blocklenght = blocklenght;
    record->qualityValue = qualityValue;
    record->settings = *settings;
    record->mixAtConstruction = *mixParameters;
    record->settingsPointer = settings;
    record->mixPointer = mixParameters;
    record->handlerSlot = handlerSlot;
    record->phiAtConstruction = **phiIn;
    record->thetaAtConstruction = **thetaIn;
    record->distanceAtConstruction = **distanceIn;
    record->gainDbAtConstruction = **gainDb;
    record->aliveBefore = test::fakeEngines().aliveCount();
    record->alive = true;
    *state_ = {record, phiIn, thetaIn, distanceIn, gainDb, {}};
    test::fakeEngines().built.push_back(record);
    if (test::fakeEngines().atConstruction) {
        test::fakeEngines().atConstruction(*record, state_->controls);
    }
}

SpatialEngine::~SpatialEngine() {
    state_->record->alive = false;
    test::fakeEngines().destroyed.push_back(state_->record.get());
}

bool SpatialEngine::comProcessing(float*& input, float*& output, std::int16_t slot) {
    test::FakeEngine& record = *state_->record;
    const auto floats = 2 * static_cast<std::size_t>(record.blocklenght);
    record.blocks.push_back({**state_->phiIn, **state_->thetaIn, **state_->distanceIn,
                             **state_->gainDb, *record.mixPointer, state_->controls,
                             std::vector<float>(input, input + floats), slot,
                             std::exchange(record.silenceExpected, false)});
    if (test::fakeEngines().render) {
        test::fakeEngines().render(input, output, record.blocklenght);
    } else {
        std::copy_n(input, floats, output);
    }
    return true;
}

void SpatialEngine::expectSilence() noexcept { state_->record->silenceExpected = true; }

float SpatialEngine::setInputLowPass(float level) noexcept {
    auto& levels = state_->record->occlusionLevels;
    const float former = levels.empty() ? 0.0f : levels.back();
    levels.push_back(level);
    return former;
}

float SpatialEngine::getReverbDistanceGain() const noexcept {
    return test::fakeEngines().reverbDistanceGain;
}

int SpatialEngine::Stop() { return 1; }

LiveControls& SpatialEngine::controls() noexcept { return state_->controls; }

const LiveControls& SpatialEngine::controls() const noexcept { return state_->controls; }

}  // namespace tessaly
