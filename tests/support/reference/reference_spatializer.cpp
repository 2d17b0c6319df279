// The spatializer effect of the reference.
#include "support/reference/reference_spatializer.h"

#include <algorithm>
#include <cmath>

#include "base/numeric_conversion.h"
#include "base/precision.h"

namespace tessaly::reference {

HostDirection directionOf(std::span<const float, 16> listener, std::span<const float, 16> source) {
    // Single precision throughout, sums from left to right: whole degrees are cut from this.
    const float s0 = source[12];
    const float s1 = source[13];
    const float s2 = source[14];
    const auto row = [&](int r) {
        return listener[r] * s0 + listener[4 + r] * s1 + listener[8 + r] * s2 + listener[12 + r];
    };
    const float x = row(0);
    const float y = row(1);
    const float z = row(2);
    float turn = 0.0f;
    if (std::abs(z) < 0.001f) {
        turn = x < 0.0f ? -1.5707964f : 1.5707964f;
    } else {
        turn = std::atan2(x, z);
    }
    if (turn < 0.0f) {
        turn += 6.2831855f;
    }
    const float degrees = turn * 57.295776f;
    HostDirection direction;
    direction.azimuth = (std::abs(degrees) - std::abs(degrees - 360.0f)) * 0.5f + 180.0f;
    if (direction.azimuth > 180.0f) {
        direction.azimuth -= 360.0f;
    }
    direction.elevation = std::atan2(y, std::sqrt(z * z + x * x) + 0.001f) * 57.295776f;
    return direction;
}

bool Spatializer::setParameter(int index, float value) {
    const bool on = value >= 1.0f;
    switch (index) {
        case 0:
            handler.masterGainDb = value;
            return true;
        case 1:
            handler.directGainDb = value;
            return true;
        case 2:
            handler.earlyGainDb = value;
            return true;
        case 3:
            handler.reverbGainDb = value;
            return true;
        case 4:
            handler.angleExponent = value;
            return true;
        case 5:
            handler.distanceScale = value;
            return true;
        case 6:
            handler.unityDistance = on;
            return true;
        case 7:
            handler.auralisation = on;
            return true;
        case 8:
            handler.roomPreset = truncateToInt32(value);
            return true;
        case 9:
            handler.occlusionTarget = value;
            return true;
        case 10:
            handler.reverbActive = value < 1.0f;
            return true;
        case 11:
            handler.inputChannel = value;
            return true;
        case 12:
            handler.reflectionLP = value < 20000.0f ? value : handler.reflectionLP;
            return true;
        case 13:
            handler.reverbLP = value < 20000.0f ? value : handler.reverbLP;
            return true;
        case 14:
            handler.roomSize = single((wide(value) - 50.0) * 0.02);
            return true;
        case 15:
            handler.bassBoost = value < 1.0f;
            return true;
        case 16:
            handler.bypassExternal = on;
            return true;
        case 17:
            sendPosition_ = 0;
            sendCount_ = truncateToInt32(value);
            return true;
        case 18:
            if (sendPosition_ < mostSends) {
                sends_[sendPosition_].first = truncateToInt32(value);
            }
            return true;
        case 19:
            if (sendPosition_ < mostSends) {
                sends_[sendPosition_].second = truncateToInt32(value);
                ++sendPosition_;
            }
            return true;
        default:
            return false;
    }
}

void Spatializer::setDistance(float distance, float attenuation, float reverbZoneMix) {
    handler.unityAttenuation = attenuation;
    handler.unityReverbMix = reverbZoneMix;
    handler.distance = distance;
    handler.unityDistanceMute = attenuation <= 0.0f && handler.unityDistance;
}

void Spatializer::process(std::span<const float, 16> listener,
                          std::span<const float, 16> source,
                          std::span<const float> input,
                          int frames,
                          int inputChannels,
                          int sampleRate,
                          int hostBlockSize,
                          std::vector<double>& output) {
    if (hostBlockSize != 0) {
        process_.buffersizeSpat = hostBlockSize;
    }
    handler.checkForChanges(sampleRate, process_.buffersizeSpat);
    const HostDirection direction = directionOf(listener, source);
    handler.azimuth = direction.azimuth;
    handler.elevation = direction.elevation;
    if (handler.isLoaded()) {
        handler.processBlock(input, frames, inputChannels, output);
    } else {
        output.assign(static_cast<std::size_t>(2 * frames), 0.0);
    }
    send(input, frames, inputChannels);
}

void Spatializer::send(std::span<const float> input, int frames, int inputChannels) {
    if (handler.reverbActive || handler.bypassExternal ||
        (inputChannels != 1 && inputChannels != 2)) {
        return;
    }
    const auto linear = [](double levelDb) { return std::pow(10.0, levelDb * 0.05); };
    double distanceGain = 1.0;
    if (handler.unityDistance) {
        distanceGain = wide(handler.unityReverbMix);
    } else if (handler.isLoaded()) {
        distanceGain = handler.engine()->reverbDistanceGain();
    }
    for (int n = 0; n < std::min(sendCount_, mostSends); ++n) {
        const auto target = process_.mixBuffers.find(sends_[n].first);
        if (target == process_.mixBuffers.end()) {
            continue;
        }
        const double gain = linear(sends_[n].second) * linear(wide(handler.reverbGainDb)) *
                            linear(wide(handler.masterGainDb)) * distanceGain;
        std::vector<double>& mix = target->second;
        for (int i = 0; i < frames && 2 * i < static_cast<int>(mix.size()); ++i) {
            const double x =
                inputChannels == 1 ? wide(input[i]) : wide(input[2 * i]) + wide(input[2 * i + 1]);
            mix[2 * i] += x * gain;
        }
    }
}

}  // namespace tessaly::reference
