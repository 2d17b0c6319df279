// Order of a block in the reference engine: direction, response, front end, convolution, output.
#include "support/reference/reference_engine.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "support/reference/reference_rooms.h"

namespace tessaly::reference {

namespace {

constexpr int crossfadeSamples = 64;
constexpr int ambienceFrames = 1064960;
constexpr double ambienceGain = 1.45;

/// Ramp of the crossfade, 0 to 1 over 64 samples, with the system's rounded step.
double ramp(int i) { return wide(static_cast<float>(i) * 0.01587301678955555f); }

/// Into -limit..limit; the upper end gives way up to three degrees above.
std::int16_t clamped(int angle, int limit) {
    if (angle <= -limit) {
        return wrapToInt16(-limit);
    }
    if (angle >= limit + 4) {
        return wrapToInt16(limit);
    }
    return wrapToInt16(angle);
}

bool axisChanged(int angleNew, int angle, int limit) {
    return angleNew != angle && (std::abs(angleNew) <= limit || std::abs(angle) < limit);
}

}  // namespace

void Engine::process(std::span<const float> input, std::vector<double>& output) {
    const std::vector<double> widened(input.begin(), input.end());
    process(std::span<const double>(widened), output);
}

void Engine::process(std::span<const double> input, std::vector<double>& output) {
    output.assign(static_cast<std::size_t>(2 * blockLength_), 0.0);
    if (!built_) {
        return;
    }
    if (!options_.alwaysUpdateFilter) {
        if (!(mix_ == mixOld_)) {
            mixChanged_ = true;
        }
        mixOld_ = mix_;
    }
    const int interval = qvUpdateInterval_ > 0 ? qvUpdateInterval_ : 1;
    const bool tick = process_.blockCounter % static_cast<std::uint32_t>(interval) == 0;
    if (tick) {
        distanceNew_ = inputs_.distance;
        if (distanceNew_ != distance_) {
            distanceUpdate();
        }
    }
    if (tick || process_.forceUpdateAll) {
        directionStage();
    }
    refreshFilter();
    inputFrontEnd(input);
    ringPosition_ = (ringPosition_ + 1) % partitions_;
    convolve();
    process_.filterChangeAll = false;
    process_.forceUpdateAll = false;
    writeOutput(output);
    if (instanceNumber_ >= process_.engineCount - 1) {
        ++process_.blockCounter;
    }
    if (interpolateAngles_) {
        filterUpdatePending_ = false;
    }
    crossfadeBlock_ = false;
    distanceOld_ = distance_;
    mixChanged_ = false;
}

bool Engine::directionChanged() const {
    return axisChanged(phiNew_, phi_, limitPhi_) ||
           (useElevation_ && axisChanged(thetaNew_, theta_, limitTheta_));
}

void Engine::directionStage() {
    phiNew_ = wrapToInt16(-inputs_.azimuth);
    thetaNew_ = inputs_.elevation;
    if (directionChanged() || options_.alwaysUpdateFilter || mixChanged_) {
        directionUpdate();
        if (interpolateAngles_) {
            if (options_.alwaysUpdateFilter) {
                filterUpdatePending_ = true;
            }
            stepBookkeeping();
            if (filterUpdatePending_) {
                indexPhiOld_ = indexPhi_;
                indexThetaOld_ = indexTheta_;
            }
        }
    } else if (process_.forceUpdateAll) {
        if (interpolateAngles_) {
            interpAngleOffset_ = 2.5f;
            filterUpdatePending_ = true;
        }
        if (qvFlexReflections_ && qvTrackDirection_) {
            process_.filterChangeAll = true;
            updateReflections();
        }
    }
}

void Engine::directionUpdate() {
    phi_ = clamped(phiNew_, limitPhi_);
    phiStep_ = static_cast<float>(phi_ - phiOld_);
    if (qvSmoothSteps_ && std::abs(phiStep_) < 270.0f) {
        const float limit = static_cast<float>(angleStep_);
        if (std::abs(phiStep_) > limit) {
            phiStep_ = std::copysign(limit, phiStep_);
            phi_ = wrapToInt16(phiOld_ + static_cast<int>(phiStep_));
        }
    }
    process_.filterChangeAll = true;
    phiOld_ = phi_;
    indexPhi_ = wrapToInt16((phi_ + 180) / 5);
    if (useElevation_) {
        theta_ = clamped(thetaNew_, limitTheta_);
        thetaStep_ = static_cast<float>(theta_ - thetaOld_);
        const float limit = static_cast<float>(angleStep_);
        if (qvSmoothSteps_ && std::abs(thetaStep_) > limit) {
            thetaStep_ = std::copysign(limit, thetaStep_);
            theta_ = wrapToInt16(thetaOld_ + static_cast<int>(thetaStep_));
        }
        thetaOld_ = theta_;
        indexTheta_ = wrapToInt16((theta_ + 90) / 5);
    }
    if (qvFlexReflections_ && qvTrackDirection_) {
        updateReflections();
    }
}

void Engine::stepAxis(float step, float& moved, std::int16_t& index, std::int16_t& indexOld) {
    if (step == 0.0f) {
        return;
    }
    const float one = static_cast<float>(angleStep_);
    bool newPair = true;
    if (moved == -one && step < 0.0f) {
        // one degree back: the pair is the one that was just left
    } else if (moved == one && step > 0.0f) {
        index = wrapToInt16(indexOld + 1);
    } else if (std::abs(moved) >= 5.0f) {
        indexOld = index;
        moved = 0.0f;
    } else if (moved == 0.0f) {
        indexOld = index;
        holdInterpPair_ = true;
    } else {
        newPair = false;
    }
    if (newPair) {
        filterUpdatePending_ = true;
        process_.filterChangeAll = true;
    }
}

void Engine::stepBookkeeping() {
    phiMoved_ += phiStep_;
    phiStepMoved_ = phiStep_;
    thetaStepMoved_ = thetaStep_;
    const bool phiStepped = phiStep_ != 0.0f;
    const bool thetaStepped = thetaStep_ != 0.0f;
    stepAxis(phiStep_, phiMoved_, indexPhi_, indexPhiOld_);
    if (useElevation_ && thetaStepped) {
        thetaMoved_ += thetaStep_;
        stepAxis(thetaStep_, thetaMoved_, indexTheta_, indexThetaOld_);
        thetaStep_ = 0.0f;
    }
    if (phiStepped && thetaStepped) {
        interpAngleOffset_ =
            single(wide(std::sqrt(thetaMoved_ * thetaMoved_ + phiMoved_ * phiMoved_)) *
                   0.7071067811865475);
    } else {
        interpAngleOffset_ = thetaStepped ? thetaMoved_ : phiMoved_;
    }
    phiStep_ = 0.0f;
}

void Engine::updateReflections() {
    constexpr int wallCount = 6;
    const WallScene scene{phi_,
                          theta_,
                          distance_,
                          samplesPerMetre_,
                          controls.roomSizeFactor,
                          earlyFlexRefPreset_,
                          controls.roomDistances};
    int k = -1;
    for (ReflectionRecord& record : records) {
        ++k;
        const bool wall = options_.auralisation && k < wallCount;
        if (wall && !reflectAtWall(record, k, scene)) {
            continue;
        }
        if (!wall || k < 2) {
            record.phi = wrapToInt16(record.relativePhi + phi_);
        }
        if (!options_.auralisation && earlyFlexRefPreset_ >= 13) {
            const float gain = samplesPerMetre_ / (static_cast<float>(record.delaySamples) +
                                                   samplesPerMetre_ * distance_);
            record.distanceGain = gain > 1.0f ? 1.0f : gain;
        }
        if (limitPhi_ == 180 && record.phi <= -180) {
            record.phi = wrapToInt16(record.phi + 360);
        } else if (limitPhi_ == 180 && record.phi > 180) {
            record.phi = wrapToInt16(record.phi - 360);
        } else {
            record.phi = clamped(record.phi, limitPhi_);
        }
        record.indexPhi = wrapToInt16((record.phi + 180) / 5);
        record.theta = wrapToInt16(record.relativeTheta + theta_);
        if (limitTheta_ == 90 && std::abs(record.theta) > 75) {
            record.theta = record.theta < 0 ? std::int16_t{-75} : std::int16_t{75};
        } else {
            record.theta = clamped(record.theta, limitTheta_);
        }
        record.indexTheta = wrapToInt16((record.theta + 90) / 5);
    }
}

void Engine::convolve() {
    if (process_.essError != 1) {
        return;
    }
    const auto updateResponse = [&] {
        if (!process_.filterChangeAll && !process_.forceUpdateAll) {
            return;
        }
        if (qvInterpolateSpectra_) {
            response_[0].feedDirectly(filter_.left, filter_.right);
        } else {
            response_[0].cut(filter_.left, filter_.right);
        }
    };
    if (fading_ && process_.filterChangeAll && process_.blockCounter != 0) {
        // The window goes into the second ring only, which answers with the old response and
        // then with the new one. The first ring's own slot keeps what it held N blocks ago.
        crossfadeBlock_ = true;
        rings_[1].write(ringPosition_, inputHistory_);
        secondOut_ = convolveBlock(rings_[1], ringPosition_, response_[0], options_.arithmetic);
        updateResponse();
        firstOut_ = convolveBlock(rings_[1], ringPosition_, response_[0], options_.arithmetic);
        return;
    }
    rings_[0].write(ringPosition_, inputHistory_);
    updateResponse();
    firstOut_ = convolveBlock(rings_[0], ringPosition_, response_[0], options_.arithmetic);
}

void Engine::writeOutput(std::vector<double>& output) {
    if (crossfadeBlock_) {
        for (int i = 0; i < std::min(crossfadeSamples, blockLength_); ++i) {
            firstOut_[i] = ramp(crossfadeSamples - 1 - i) * secondOut_[i] + ramp(i) * firstOut_[i];
        }
    }
    const double gain = std::pow(10.0, wide(inputs_.gainDb) * 0.05);
    for (int i = 0; i < blockLength_; ++i) {
        output[2 * i] = firstOut_[i].real() * gain;
        output[2 * i + 1] = firstOut_[i].imag() * gain;
    }
    if (atmoSelect_ > 0) {
        const auto blocks = static_cast<std::uint32_t>(ambienceFrames / blockLength_);
        const std::size_t start = static_cast<std::size_t>(process_.blockCounter % blocks) *
                                  static_cast<std::size_t>(2 * blockLength_);
        for (std::size_t i = 0; i < output.size(); ++i) {
            if (start + i < options_.ambience.size()) {
                output[i] += options_.ambience[start + i] * ambienceGain;
            }
        }
    }
    holdInterpPair_ = false;  // a hold lasts one block
}

}  // namespace tessaly::reference
