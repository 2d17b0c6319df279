// Places each reflection by the rules of the engine's composition, with its own filters.
#include "data/room_composition.h"

#include <algorithm>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "engine/biquad.h"
#include "engine/ear_mix.h"

namespace tessaly::data {

namespace {

constexpr double samplesPerMetrePerHertz = 0.0029118863199580685;
constexpr float presetDelayRate = 44100.0f;  // Hz
constexpr double recordGain = 0.55;
constexpr float sourceDistance = 1.0f;  // metres
constexpr int steepestTheta = 75;       // degrees
constexpr EndFade reflectionFade{15, 0.06666667f};
constexpr EndFade tailFadeOfEngine{60, 0.016666668f};
constexpr float unfilteredCutOff = 20000.0f;  // Hz
constexpr int blockFrames = 1024;

int responseFrames(const TailDesign& design, std::size_t tailFrames) {
    const int frames = std::max(static_cast<int>(tailFrames), design.room.earlyFlexFirSize);
    return (frames + blockFrames - 1) / blockFrames * blockFrames;
}

class RoomComposer {
public:
    RoomComposer(const TailDesign& design, const HrirSet& hrirs, int frames)
        : design_(design),
          hrirs_(hrirs),
          left_(static_cast<std::size_t>(frames)),
          right_(left_.size()),
          ears_{left_.data(), right_.data(), frames} {}

    void addReflections() {
        for (int k = 0; k < design_.room.flexReflectionCount; ++k) {
            addReflection(static_cast<std::size_t>(k));
        }
    }

    void addTail(const std::vector<float>& tail) {
        const EarPairs pairs{tail.data(), tail.data() + 1, static_cast<int>(tail.size() / 2)};
        if (!design_.room.hasReverbLowPass || design_.room.reverbLP_Fc >= unfilteredCutOff) {
            addPairs(ears_, 0, pairs, design_.presetGain);
            return;
        }
        Biquad filter = lowPass(design_.room.reverbLP_Fc);
        addFilteredPairs(ears_, 0, pairs, design_.presetGain, filter, tailFadeOfEngine);
    }

    std::vector<double> pairs() const {
        std::vector<double> result;
        for (std::size_t i = 0; i < left_.size(); ++i) {
            result.push_back(wide(left_[i]));
            result.push_back(wide(right_[i]));
        }
        return result;
    }

private:
    Biquad lowPass(float cutOff) const {
        return {Biquad::lowPass, 0.0, Biquad::normalise(cutOff, hrirs_.sampleRate)};
    }

    void addReflection(std::size_t k) {
        const RoomPreset& room = design_.room;
        const float ratio = static_cast<float>(hrirs_.sampleRate) / presetDelayRate;
        const int delay = truncateToInt16(static_cast<float>(room.presetDelay[k]) * ratio);
        const int taps = static_cast<int>(hrirs_.taps);
        if (delay + taps >= ears_.size) {
            return;
        }
        const float perMetre = single(hrirs_.sampleRate * samplesPerMetrePerHertz);
        const float distanceGain =
            std::min(perMetre / (static_cast<float>(delay) + perMetre * sourceDistance), 1.0f);
        const float gain =
            single(wide(room.presetGain[k]) * recordGain) * distanceGain * room.earlyPresetGain;
        const int theta = std::clamp(room.presetTheta[k], -steepestTheta, steepestTheta);
        const auto entry = static_cast<std::size_t>(packedIndex(room.presetPhi[k], theta));
        const float* pair = hrirs_.pairs.data() + entry * hrirs_.taps * earCount;
        const EarPairs pairs{pair + 1, pair, taps};
        if (!room.presetUsesFilters) {
            addPairs(ears_, delay, pairs, gain);
            return;
        }
        // The host's value drives both classes, the second one at half the first.
        const float cutOff =
            room.presetFilterClass[k] == 0 ? room.reflectionLP_Fc : 0.5f * room.reflectionLP_Fc;
        Biquad filter = lowPass(cutOff);
        addFilteredPairs(ears_, delay, pairs, gain, filter, reflectionFade);
    }

    const TailDesign& design_;
    const HrirSet& hrirs_;
    std::vector<float> left_;
    std::vector<float> right_;
    EarBuffers ears_;
};

}  // namespace

std::vector<double> composeRoom(const TailDesign& design,
                                const HrirSet& hrirs,
                                const std::vector<float>& tail) {
    RoomComposer composer(design, hrirs, responseFrames(design, tail.size() / earCount));
    composer.addReflections();
    composer.addTail(tail);
    return composer.pairs();
}

}  // namespace tessaly::data
