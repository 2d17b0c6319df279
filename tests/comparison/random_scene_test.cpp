// Scenes drawn at random from all that engines can be asked for; the seed is the test's number.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <memory>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "base/numeric_conversion.h"
#include "comparison/comparison_fixture.h"
#include "engine/shared_state.h"

namespace tessaly::test {
namespace {

using reference::EngineOptions;

class Dice {
public:
    explicit Dice(unsigned seed) : random_(seed) {}
    int between(int low, int high) {
        return std::uniform_int_distribution<int>(low, high)(random_);
    }
    bool one(int in) { return between(1, in) == 1; }
    float real(float low, float high) {
        return std::uniform_real_distribution<float>(low, high)(random_);
    }
    template <typename T, std::size_t n>
    T of(const std::array<T, n>& list) {
        return list[static_cast<std::size_t>(between(0, static_cast<int>(n) - 1))];
    }

private:
    std::mt19937 random_;
};

EngineOptions anyOptions(Dice& dice, int sampleRate, int blockLength) {
    constexpr std::array<int, 6> rooms = {1, 15, 5, 11, 20, 7};
    EngineOptions options;
    options.sampleRate = sampleRate;
    options.blockLength = blockLength;
    options.alwaysUpdateFilter = !dice.one(3);
    options.fading = !dice.one(5);
    options.doppler = dice.one(3);
    options.qvSmoothSteps = dice.one(4);
    options.qvUpdateInterval = dice.one(3) ? dice.between(2, 5) : 1;
    options.qvInterpolateFilters = dice.one(4);
    options.qvInterpolateSpectra = dice.one(8);
    options.qvEarlyReflections = dice.one(3);
    options.bypass3DAudio = dice.one(8);
    options.earlyFlexRefPreset = dice.one(2) ? dice.of(rooms) : 0;
    options.presetRow.earlyPresetGain = dice.real(0.5f, 1.5f);
    if (dice.one(8)) {
        options.qualityValue = dice.between(4, 10);
    } else if (dice.one(4)) {
        // Tails decide the length, which has to cover that of any room chosen above.
        options.qvReverb = dice.one(2) ? 1 : 30;
        options.defaultFirSize = 8192;
        options.tail = tailOf(dice.between(8000, 9000), 0.05f, 61);
        options.presetRow.hasReverbLowPass = dice.one(2);
    }
    return options;
}

void change(SourceValues& values, Dice& dice) {
    values.azimuth = wrapToInt16(values.azimuth + dice.between(-4, 4));
    values.elevation = wrapToInt16(std::clamp(values.elevation + dice.between(-3, 3), -90, 90));
    if (dice.one(6)) {
        values.azimuth = wrapToInt16(dice.between(-180, 180));
    }
    values.azimuth = wrapToInt16(std::clamp<int>(values.azimuth, -180, 180));
    if (dice.one(3)) {
        values.distance = std::max(0.05f, values.distance + dice.real(-0.5f, 0.5f));
    }
    if (dice.one(20)) {
        values.distance = dice.one(2) ? dice.real(0.05f, 2.0f) : dice.real(2.0f, 45.0f);
    }
    if (dice.one(10)) {
        values.gainDb = dice.real(-12.0f, 0.0f);
        values.directGain = dice.real(0.2f, 1.0f);
        values.earlyGain = dice.real(0.0f, 1.0f);
        values.reverbGain = dice.real(0.0f, 1.0f);
    }
    if (dice.one(10)) {
        values.occlusion = dice.real(0.0f, 1.0f);
        values.bassBoost = dice.one(2);
        values.unityDistance = dice.one(5);
        values.directGain = values.unityDistance ? 0.5f : values.directGain;
    }
    if (dice.one(15)) {
        values.reflectionLP = dice.real(500.0f, 20000.0f);
        values.reflectionLP2 = 0.5f * values.reflectionLP;
        values.reverbLP = dice.real(500.0f, 24000.0f);
        values.roomSize = dice.one(2) ? 1.0f : dice.real(0.0f, 1.0f);
    }
}

/// For a failure's message.
std::string textOf(const EngineOptions& options) {
    std::ostringstream text;
    text << "quality " << options.qualityValue << " always " << options.alwaysUpdateFilter
         << " fading " << options.fading << " doppler " << options.doppler << " smooth "
         << options.qvSmoothSteps << " interval " << options.qvUpdateInterval << " filters "
         << options.qvInterpolateFilters << " spectra " << options.qvInterpolateSpectra << " pair "
         << options.qvEarlyReflections << " pan " << options.bypass3DAudio << " room "
         << options.earlyFlexRefPreset << " tail " << options.qvReverb << " of "
         << options.tail.pairs.size() / 2;
    return text.str();
}

class RandomScene : public ComparisonFixture, public ::testing::WithParamInterface<unsigned> {};
INSTANTIATE_TEST_SUITE_P(Comparison,
                         RandomScene,
                         ::testing::Range(100u, 124u),
                         ::testing::PrintToStringParamName());

TEST_P(RandomScene, SourcesComeMoveAndGo) {
    constexpr std::array<int, 7> blockLengths = {32, 64, 128, 256, 512, 1024, 2048};
    Dice dice(GetParam());
    const int sampleRate = dice.of(sampleRates);
    const int blockLength = dice.of(blockLengths);
    std::vector<std::unique_ptr<ComparedSource>> sources;
    std::vector<std::string> texts;
    const auto add = [&] {
        const EngineOptions options = anyOptions(dice, sampleRate, blockLength);
        SourceValues start;
        start.azimuth = wrapToInt16(dice.between(-180, 180));
        start.elevation = wrapToInt16(dice.between(-90, 90));
        start.distance = dice.real(0.1f, 8.0f);
        sources.push_back(source(options, start));
        texts.push_back(textOf(options));
        if (options.earlyFlexRefPreset > 0) {
            const int last = sources.back()->plain().firSize();
            sources.back()->setRecords(
                roomRecords(dice.between(1, 20), last, static_cast<unsigned>(dice.between(1, 99))));
        }
    };
    add();
    const int rounds = blocksOf(0.6, sampleRate, blockLength, 40);
    for (int turn = 0; turn < std::min(rounds, 120); ++turn) {
        if (sources.size() < 3 && dice.one(25)) {
            add();
        } else if (sources.size() > 1 && dice.one(40)) {
            const int gone = dice.between(0, static_cast<int>(sources.size()) - 1);
            sources.erase(sources.begin() + gone);
            texts.erase(texts.begin() + gone);
        }
        for (std::size_t k = 0; k < sources.size(); ++k) {
            change(sources[k]->values, dice);
            ASSERT_TRUE(sources[k]->play(deviation))
                << "source " << k << " round " << turn << ", " << texts[k];
            ASSERT_EQ(blockCounter, process.blockCounter);
        }
    }
}

}  // namespace
}  // namespace tessaly::test
