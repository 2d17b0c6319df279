// Input side of the reference engine: distance gains, delay line, the four input filters.
#include <algorithm>
#include <cmath>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "base/units.h"
#include "support/reference/reference_engine.h"

namespace tessaly::reference {

namespace {

constexpr double farthestDelay = 25.0;  // metres; the delay grows no further

int delayInSamples(int sampleRate, float distance) {
    return truncateToInt32(sampleRate * samplesPerMetrePerHertz *
                           std::min(wide(distance), farthestDelay));
}

}  // namespace

void Engine::distanceUpdate() {
    distance_ = 0.1 > wide(distanceNew_) ? 0.1f : distanceNew_;
    if (distanceOld_ > 0.11f) {
        process_.forceUpdateAll = true;
        process_.filterChangeAll = true;
    }
    if (qvSmoothSteps_) {
        // Kept in single precision: the distance decides delays and laws from here on.
        const float most = distanceOld_ > 1.0f ? 0.4f : 0.01f;
        const float change = distance_ - distanceOld_;
        if (change > most) {
            distance_ = distanceOld_ + most;
        } else if (change < -most) {
            distance_ = distanceOld_ - most;
        }
    }
    if (mix_.unityDistance) {
        directGain_ = 1.0;
        earlyDistanceGain_ = 1.0;
        reverbDistanceGain_ = 1.0;
        distanceFade_ = 1.0;
        return;
    }
    const double d = wide(distance_);
    directGain_ =
        d > 1.0 ? 1.0 / (std::pow(d + 0.7, 0.75) + 0.3265) : 1.0 / (std::pow(d + 0.4, 0.75) + 0.22);
    if (qvEarlyReflections_ || qvFlexReflections_) {
        earlyDistanceGain_ = 1.0;
        reverbDistanceGain_ = 1.0;
        if (d > 13.7) {
            const double x = d * 0.07299270072992702;
            reverbDistanceGain_ = 1.0 / (x * x);
            if (d > 30.0) {
                reverbDistanceGain_ *= 1.0 - (d - 30.0) * 0.1;
            }
            reverbDistanceGain_ = std::max(reverbDistanceGain_, 0.0);
        }
    }
    if (d > 7.0) {
        distanceFade_ = std::max(1.0 - (d - 7.0) * 0.047619047619047616, 0.0);
        directGain_ *= distanceFade_;
        earlyDistanceGain_ *= distanceFade_;
    }
}

void Engine::runDelayLine(std::span<const double> input) {
    const int b = blockLength_;
    const int length = static_cast<int>(dopplerLine_.size());
    const int delayNew = delayInSamples(options_.sampleRate, distance_);
    const int delayOld = delayInSamples(options_.sampleRate, distanceOld_);
    // Position and fraction of each read are taken in single precision: between two samples of
    // full scale a rounded fraction is heard long before a rounded sum.
    const float rate = static_cast<float>(delayOld - delayNew) / static_cast<float>(b) + 1.0f;
    std::copy(dopplerLine_.begin() + b, dopplerLine_.end(), dopplerLine_.begin());
    for (int i = 0; i < b; ++i) {
        dopplerLine_[length - b + i] = input[2 * i];
    }
    const auto at = [&](int j) { return j >= 0 && j < length ? dopplerLine_[j] : 0.0; };
    for (int i = 0; i < b; ++i) {
        const float t = static_cast<float>(i) * rate;
        const float position = static_cast<float>(length - b - delayOld) + t;
        const int j = truncateToInt32(position);
        const double fraction = wide(std::fmod(t, 1.0f));
        inputHistory_[b + i] = fraction * (at(j + 1) - at(j)) + at(j);
    }
}

void Engine::inputFrontEnd(std::span<const double> input) {
    const int b = blockLength_;
    std::copy(inputHistory_.begin() + b, inputHistory_.end(), inputHistory_.begin());
    if (doppler_) {
        runDelayLine(input);
    } else {
        for (int i = 0; i < b; ++i) {
            inputHistory_[b + i] = input[2 * i];
        }
    }
    for (int i = b; i < 2 * b; ++i) {
        double x = inputHistory_[i];
        if (controls.bassBoost) {
            x = bassShelveFilter_.run(x);
        }
        if (inputLowPassLevel_ > 0.0f) {
            x = inputLowPass_.run(x);
        }
        inputHistory_[i] = lowCutFilter_.run(highCutFilter_.run(x));
    }
}

void Engine::setInputLowPass(float level) {
    if (level == inputLowPassLevel_) {
        return;
    }
    inputLowPassLevel_ = level;
    const double cutoff = std::pow(100.0, 1.0 - wide(level)) * 20000.0 * 0.01;
    inputLowPass_.design(0, 0.0, cutoff / options_.sampleRate);
}

}  // namespace tessaly::reference
