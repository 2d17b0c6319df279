// Instance handler of the reference.
#include "support/reference/reference_handler.h"

#include <algorithm>
#include <cmath>

#include "base/numeric_conversion.h"
#include "base/precision.h"

namespace tessaly::reference {

namespace {

constexpr float occlusionTime = 0.55f;
constexpr float occlusionAttenuationDb = 24.0f;
constexpr double earlyFadeThreshold = 0.15;
constexpr int presetWithoutTail = 11;

// clang-format off
constexpr std::array<int, 53> roomTable = {
     0,  0, 11,  0, 30, 16, 59, 60, 54, 25, 26, 47, 24, 17, 53,  0, 28, 57, 56, 55, 15, 21, 23, 58,
    27, 18, 51, 20, 52, 41, 19, 22, 29, 33,  0, 42, 49, 34, 40, 32, 43, 48, 38, 35, 44, 39, 36, 46,
    45, 31, 37, 50,  0};
// clang-format on

double linear(float levelDb) { return std::pow(10.0, wide(levelDb) * 0.05); }

/// Bends the front quadrants; 0 and 90 degrees stay where they are. Single precision, products
/// from left to right: the truncation to whole degrees follows.
std::int16_t bentAzimuth(float azimuth, float exponent) {
    const double e = wide(exponent);
    if (!(e >= 0.99 && e <= 1.01)) {
        if (azimuth > 0.0f && azimuth < 90.0f) {
            return truncateToInt16(std::pow(azimuth, exponent) * 90.0f / std::pow(90.0f, exponent));
        }
        if (azimuth < 0.0f && azimuth > -90.0f) {
            return truncateToInt16(std::pow(-azimuth, exponent) * -90.0f /
                                   std::pow(90.0f, exponent));
        }
    }
    return truncateToInt16(azimuth);
}

}  // namespace

int roomPresetOf(int roomSelection) {
    return roomSelection >= 0 && roomSelection < static_cast<int>(roomTable.size())
               ? roomTable[roomSelection]
               : 0;
}

bool Handler::checkForChanges(int sampleRate, int blockSize) {
    if (!process_.assetPathSet || roomPreset < 0 || sampleRate == 0 || blockSize == 0) {
        return false;
    }
    const bool same = sampleRate == sampleRate_ && blockSize == blockSize_ &&
                      roomPreset == roomPresetIn_ && fading == fadingIn_ &&
                      auralisation == auralisationIn_ && doppler == dopplerIn_ &&
                      reverbActive == reverbActiveIn_ && process_.bypass3DAudio == bypass3DAudioIn_;
    if (attempted_ && same) {
        return false;
    }
    attempted_ = true;
    load(sampleRate, blockSize);
    return true;
}

void Handler::load(int sampleRate, int blockSize) {
    roomPresetIn_ = wrapToInt16(roomPreset);
    sampleRate_ = sampleRate;
    blockSize_ = blockSize;
    fadingIn_ = fading;
    auralisationIn_ = auralisation;
    dopplerIn_ = doppler;
    reverbActiveIn_ = reverbActive;
    bypass3DAudioIn_ = process_.bypass3DAudio;

    // The new engine starts from unbent and unscaled values.
    inputs_.azimuth = truncateToInt16(azimuth);
    inputs_.elevation = truncateToInt16(elevation);
    inputs_.distance = distance;
    inputs_.gainDb = 0.0f;
    mix_.direct = 1.0;
    mix_.early = 1.0;
    mix_.reverb = 1.0;

    EngineOptions options;
    options.blockLength = wrapToInt16(blockSize);
    options.sampleRate = sampleRate;
    options.fading = fadingIn_;
    options.auralisation = auralisationIn_;
    options.doppler = dopplerIn_;
    options.bypass3DAudio = bypass3DAudioIn_;
    options.alwaysUpdateFilter = alwaysUpdateFilter;
    options.earlyFlexRefPreset = roomPresetOf(roomPresetIn_);
    options.qvReverb = options.earlyFlexRefPreset;
    if (options.qvReverb == presetWithoutTail || !reverbActiveIn_) {
        options.qvReverb = 0;
    }
    if (adjustOptions) {
        adjustOptions(options);
    }
    // The old engine lives until the new one stands, so the new one is never the first.
    auto fresh = std::make_unique<Engine>(process_, inputs_, mix_, options);
    if (process_.essError >= 0) {
        process_.essError = 1;
    }
    engine_ = std::move(fresh);
    isLoaded_ = true;
    reflectionLP = engine_->controls.reflectionLP_Fc;
    reverbLP = engine_->controls.reverbLP_Fc;
    inputBlock_.assign(static_cast<std::size_t>(2 * std::max(blockSize, 0)), 0.0);
}

void Handler::setAngleAndDistance() {
    inputs_.azimuth = bentAzimuth(azimuth, angleExponent);
    inputs_.distance = distanceScale * distance;
    inputs_.elevation = truncateToInt16(elevation);
}

void Handler::setMix() {
    if (occlusion != occlusionTarget) {
        const float step =
            static_cast<float>(blockSize_) / static_cast<float>(sampleRate_) / occlusionTime;
        const float remaining = std::abs(occlusionTarget - occlusion);
        if (remaining < step) {
            occlusion = occlusionTarget;
        } else {
            occlusion = occlusionTarget > occlusion ? occlusion + step : occlusion - step;
        }
    }
    inputs_.gainDb = masterGainDb;
    if (occlusion > 0.0f) {
        engine_->setInputLowPass(occlusion);
        inputs_.gainDb = masterGainDb - occlusionAttenuationDb * occlusion;
    }
    mix_.direct = linear(directGainDb);
    mix_.early = linear(earlyGainDb);
    mix_.reverb = linear(reverbGainDb);
    mix_.unityDistance = unityDistance;
    if (unityDistance) {
        mix_.unityAttenuation = wide(unityAttenuation);
        mix_.direct *= wide(unityAttenuation);
        mix_.reverb *= wide(unityReverbMix);
        if (wide(unityAttenuation) < earlyFadeThreshold) {
            mix_.early *= wide(unityAttenuation) / earlyFadeThreshold;
        }
    }
    engine_->controls.reflectionLP_Fc = reflectionLP;
    engine_->controls.reflectionLP2_Fc = reflectionLP * 0.5f;
    engine_->controls.bassBoost = bassBoost;
    engine_->controls.reverbLP_Fc = reverbLP;
    engine_->controls.roomSizeFactor = roomSize;
    if (!alwaysUpdateFilter) {
        mix_.reverbCutoff = wide(reverbLP);
        mix_.roomSize = wide(roomSize);
    }
    if (auralisation && process_.roomDistancesSet) {
        engine_->controls.roomDistances = process_.roomDistances;
    }
}

void Handler::fillInput(std::span<const double> input, int frames, int inputChannels) {
    // What a block shorter than the engine's does not reach keeps the samples of earlier blocks.
    if (inputChannels == 1) {
        for (int i = 0; i < frames; ++i) {
            inputBlock_[2 * i] = input[i];
        }
    } else if (inputChannel <= -1.0f) {
        std::copy_n(input.begin(), 2 * frames, inputBlock_.begin());
    } else {
        const double w = (wide(inputChannel) + 1.0) * 0.5;
        for (int i = 0; i < frames; ++i) {
            inputBlock_[2 * i] = input[2 * i] * (1.0 - w) + input[2 * i + 1] * w;
        }
    }
}

void Handler::processBlock(std::span<const float> input,
                           int frames,
                           int inputChannels,
                           std::vector<double>& output) {
    const std::vector<double> widened(input.begin(), input.end());
    processBlock(std::span<const double>(widened), frames, inputChannels, output);
}

void Handler::processBlock(std::span<const double> input,
                           int frames,
                           int inputChannels,
                           std::vector<double>& output) {
    output.assign(static_cast<std::size_t>(2 * frames), 0.0);
    setAngleAndDistance();
    if (!isLoaded_) {
        return;
    }
    setMix();
    if (unityDistanceMute || process_.essError != 1 || frames > blockSize_) {
        return;
    }
    if (bypassExternal) {
        for (int i = 0; i < 2 * frames; ++i) {
            output[i] = inputChannels == 1 ? input[i / 2] : input[i];
        }
        return;
    }
    fillInput(input, frames, inputChannels);
    std::vector<double> block;
    engine_->process(std::span<const double>(inputBlock_), block);
    std::copy_n(block.begin(), 2 * frames, output.begin());
}

}  // namespace tessaly::reference
