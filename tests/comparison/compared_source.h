// One source rendered twice: by an engine of the library and by one of the reference.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "comparison/deviation.h"
#include "support/engine_rig.h"
#include "support/reference/reference_engine.h"

namespace tessaly::test {

/// Everything that may change from block to block.
struct SourceValues {
    std::int16_t azimuth = 0;    ///< degrees, positive to the right
    std::int16_t elevation = 0;  ///< degrees
    float distance = 1.0f;       ///< metres
    float gainDb = 0.0f;
    float directGain = 1.0f;
    float earlyGain = 1.0f;
    float reverbGain = 1.0f;
    bool unityDistance = false;
    float unityAttenuation = 1.0f;
    float occlusion = 0.0f;  ///< given to the engine while above 0
    float reflectionLP = 20000.0f;
    float reflectionLP2 = 20000.0f;
    float reverbLP = 20000.0f;
    float roomSize = 1.0f;
    bool bassBoost = false;
};

/// A record as a test wants it; both engines get the same.
struct RecordValues {
    int relativePhi = 0;
    int relativeTheta = 0;
    int delay = 0;  ///< samples, negative too
    float gain = 0.1f;
    int filterClass = -1;  ///< -1 none, 0 or 1
    float wallDistance = 1.0f;
};

/// A pair of engines that are built alike, told the same and heard together.
class ComparedSource {
public:
    /// Builds both. A measured tail (`options.qvReverb` above 1) is put in afterwards, since no
    /// room brings one: the library's engine is built with the synthetic tail, for the same length.
    /// The bed of `options.ambience` is put in the same way.
    ComparedSource(reference::Process& process,
                   const std::string& directory,
                   const reference::EngineOptions& options,
                   const SourceValues& values);
    ComparedSource(const ComparedSource&) = delete;
    ComparedSource& operator=(const ComparedSource&) = delete;

    /// Replaces the records of both.
    void setRecords(const std::vector<RecordValues>& records);
    const reference::Engine& plain() const { return *reference_; }
    EngineRig& rig() { return rig_; }
    int blockLength() const { return options_.blockLength; }

    /// Renders one block of this source's own noise with `values` and compares.
    ::testing::AssertionResult play(Deviation& deviation);
    /// Renders one block of a given mono signal; shorter ones are padded with silence.
    ::testing::AssertionResult play(Deviation& deviation, const std::vector<float>& signal);

    SourceValues values;

private:
    void pass();
    void injectTail();
    void injectAmbience();

    reference::EngineOptions options_;
    EngineRig rig_;
    reference::SourceInputs inputs_;
    reference::MixLevels mix_;
    std::unique_ptr<reference::Engine> reference_;
    std::mt19937 noise_{1};
    std::vector<double> expected_;
    int block_ = 0;
};

/// A tail of noise: stereo pairs, decaying, never zero.
reference::Tail tailOf(int frames, float presetGain, unsigned seed);

/// Records drawn by `seed`: any direction and class, delays from -20 to `lastDelay` samples, a
/// quarter of the walls missing.
std::vector<RecordValues> roomRecords(int count, int lastDelay, unsigned seed);

}  // namespace tessaly::test
