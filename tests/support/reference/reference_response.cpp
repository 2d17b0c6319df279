// The impulse response of the reference engine: direct sound, reflections and tails in one.
#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "support/reference/reference_engine.h"

namespace tessaly::reference {

namespace {

constexpr int leftEar = 1;  // place of an ear within a stored pair
constexpr int rightEar = 0;
constexpr int recordFadeFrames = 15;
constexpr int tailFadeFrames = 60;
constexpr int shortestFirWithTail = 4096;
constexpr std::array<double, 2> fixedPairGain{0.1, 0.11};

/// Place of the largest of the first 100 values, by value and not by magnitude. In single
/// precision, in which the system compares: near ties are then decided as it does.
int peakIndex(const std::vector<double>& ear) {
    int best = 0;
    for (int i = 1; i < std::min<int>(100, static_cast<int>(ear.size())); ++i) {
        if (single(ear[i]) > single(ear[best])) {
            best = i;
        }
    }
    return best;
}

int alignShift(int peakShift, float fraction) {
    const float v = static_cast<float>(peakShift) * fraction;
    return truncateToInt16(v < 0.0f ? v - 0.55f : v + 0.55f);
}

}  // namespace

void Engine::Response::add(std::vector<double>& ear, int tap, double value) {
    if (tap >= 0 && tap < static_cast<int>(ear.size())) {
        ear[tap] += value;
    }
}

double Engine::Response::get(const std::vector<double>& ear, int tap) {
    return tap >= 0 && tap < static_cast<int>(ear.size()) ? ear[tap] : 0.0;
}

void Engine::addHrir(Response& response, int hrir, int firstTap, int frames, double gain) {
    for (int i = 0; i < frames; ++i) {
        Response::add(response.left, firstTap + i, process_.hrirs.sample(hrir, i, leftEar) * gain);
        Response::add(response.right, firstTap + i,
                      process_.hrirs.sample(hrir, i, rightEar) * gain);
    }
}

void Engine::redesignDistanceFilters() {
    const double d = wide(distance_);
    double high = 7000.0 - (d - 20.0) * 3000.0 * 0.1;
    if (d < 10.0) {
        high = 20000.0 - d * 9000.0 * 0.1;
    } else if (d < 20.0) {
        high = 11000.0 - (d - 10.0) * 4000.0 * 0.1;
    }
    high = std::max(high, 3000.0);
    const double low = d < 30.0 ? d * 170.0 / 30.0 + 10.0 : 180.0;
    highCutFilter_.design(0, 0.0, high / options_.sampleRate);
    lowCutFilter_.design(1, 0.0, low / options_.sampleRate);
}

void Engine::addFixedPair(Response& response) {
    const double earlyGain = mix_.early * earlyDistanceGain_ * wide(earlyPresetGain_);
    for (int n = 0; n < 2; ++n) {
        const int hrir =
            fixedHrirCell_[n] != noHrir ? process_.hrirs.cells[fixedHrirCell_[n]] : fixedHrir_[n];
        addHrir(response, hrir, fixedDelay_[n], fixedLength_[n], fixedPairGain[n] * earlyGain);
    }
}

void Engine::addFilteredHrir(Response& response, const ReflectionRecord& record, double gain) {
    const float cutoff =
        record.filterClass == 0 ? controls.reflectionLP_Fc : controls.reflectionLP2_Fc;
    const int hrir = process_.hrirs.at(record.indexPhi, record.indexTheta);
    for (const int ear : {leftEar, rightEar}) {
        Filter filter(0, 0.0, frequency(cutoff));
        std::vector<double>& taps = ear == leftEar ? response.left : response.right;
        for (int i = 0; i < hrirLength_; ++i) {
            double y = filter.run(process_.hrirs.sample(hrir, i, ear) * gain);
            const int fading = i - (hrirLength_ - recordFadeFrames) + 1;
            if (fading > 0) {
                y *= 1.0 - static_cast<double>(fading) / recordFadeFrames;
            }
            Response::add(taps, record.delaySamples + i, y);
        }
    }
}

void Engine::addRecords(Response& response) {
    const double earlyGain = mix_.early * earlyDistanceGain_ * wide(earlyPresetGain_);
    for (std::size_t k = 0; k < records.size(); ++k) {
        const ReflectionRecord& record = records[k];
        const int end = record.delaySamples + hrirLength_;
        if ((k <= 5 && record.wallDistance < 0.0f) || end >= firSize_) {
            continue;
        }
        const double gain = wide(record.gain) * wide(record.distanceGain) * earlyGain;
        if (record.filterClass < 0) {
            addHrir(response, process_.hrirs.at(record.indexPhi, record.indexTheta),
                    record.delaySamples, hrirLength_, gain);
        } else if (end >= 0) {
            addFilteredHrir(response, record, gain);
        }
    }
}

void Engine::addSyntheticTail(Response& response) {
    for (int k = 0; k < 26; ++k) {
        const double gain = (1.0 - k / 26.0) * 0.05 * mix_.reverb;
        const int indexPhi = 55 * k % 360 / 5;
        const int angle = std::clamp(35 * k % 180, 90 - limitTheta_, 90 + limitTheta_);
        addHrir(response, process_.hrirs.at(indexPhi, angle / 5), 2048 + k * 209, hrirLength_,
                gain);
    }
}

void Engine::addMeasuredTail(Response& response) {
    const double gain = wide(options_.tail.presetGain) * mix_.reverb * reverbDistanceGain_;
    const bool filtered = hasReverbLowPass_ && controls.reverbLP_Fc < 20000.0f;
    for (int ear = 0; ear < 2; ++ear) {
        std::vector<double>& taps = ear == 0 ? response.left : response.right;
        Filter filter(0, 0.0, frequency(controls.reverbLP_Fc));
        for (int i = 0; i < reverbLength_; ++i) {
            double y =
                wide(options_.tail
                         .pairs[2 * static_cast<std::size_t>(i) + static_cast<std::size_t>(ear)]) *
                gain;
            if (filtered) {
                y = filter.run(y);
                const int fading = i - (reverbLength_ - tailFadeFrames) + 1;
                if (fading > 0) {
                    y *= 1.0 - static_cast<double>(fading) / tailFadeFrames;
                }
            }
            Response::add(taps, i, y);
        }
        if (controls.roomSizeFactor < 1.0f) {
            const double size = wide(controls.roomSizeFactor);
            const int start = truncateToInt32(reverbLength_ * 0.99 * size + reverbLength_ * 0.01);
            const int stop = truncateToInt32((size + 1.0) * (reverbLength_ * 0.5));
            for (int i = std::max(start, 0); i < stop; ++i) {
                taps.at(i) *= 1.0 - static_cast<double>(i - start + 1) / (stop - start);
            }
            for (int i = std::max(stop, 0); i < reverbLength_; ++i) {
                taps.at(i) = 0.0;
            }
        }
    }
}

void Engine::composeFir(Response& response) {
    response.resize(firBufferSize_);
    // A source with a fixed direction is not scaled by the level of the direct sound.
    if (qvTrackDirection_) {
        addHrir(response, process_.hrirs.at(indexPhi_, indexTheta_), 0, hrirLength_,
                directGain_ * mix_.direct);
    } else {
        addHrir(response, staticFilter_, 0, hrirLength_, directGain_);
    }
    if (process_.forceUpdateAll) {
        redesignDistanceFilters();
    }
    if (qvEarlyReflections_) {
        addFixedPair(response);
    }
    if (qvFlexReflections_) {
        addRecords(response);
    }
    if (qvReverb_ > 0 && firSize_ >= shortestFirWithTail) {
        if (qvReverb_ == 1) {
            addSyntheticTail(response);
        } else {
            addMeasuredTail(response);
        }
    }
}

void Engine::fadeFilterTail() {
    for (int j = 0; j < 15; ++j) {
        const int tap = firSize_ - 15 + j;
        if (tap >= 0) {
            filter_.left[tap] *= 1.0 / (4.0 * (j + 1));
            filter_.right[tap] *= 1.0 / (4.0 * (j + 1));
        }
    }
}

void Engine::refreshFilter() {
    const bool due = process_.forceUpdateAll || (process_.filterChangeAll && filterUpdatePending_);
    if (due && (!qvInterpolateFilters_ || !filterUpdatePending_)) {
        composeFir(filter_);
        fadeFilterTail();
    } else if (due) {
        if (process_.blockCounter == 0 || std::abs(phiStepMoved_) > 5.0f ||
            std::abs(thetaStepMoved_) > 5.0f) {
            composeFir(interpFilter_[interpOld_]);
        }
        if (!holdInterpPair_) {
            interpOld_ = interpNew_;
            interpNew_ = 1 - interpNew_;
        }
        composeFir(interpFilter_[interpNew_]);
    }
    if (process_.filterChangeAll && qvInterpolateFilters_) {
        interpolateFir();
    }
}

void Engine::interpolateFir() {
    const Response& fresh = interpFilter_[interpNew_];
    const Response& old = interpFilter_[interpOld_];
    if (filterUpdatePending_) {
        peakShiftLeft_ = peakIndex(fresh.left) - peakIndex(old.left);
        peakShiftRight_ = peakIndex(fresh.right) - peakIndex(old.right);
    }
    const float fraction = std::abs(interpAngleOffset_ * 0.2f);
    const double weightNew = wide(fraction);
    const double weightOld = 1.0 - weightNew;
    const int shiftLeft = alignShift(peakShiftLeft_, fraction);
    const int shiftRight = alignShift(peakShiftRight_, fraction);
    // Both ears go by the left ear's count. Reads outside a buffer give 0, writes outside it are
    // dropped, and taps that this stretch does not reach keep what they held.
    const auto put = [](std::vector<double>& ear, int tap, double value) {
        if (tap >= 0 && tap < static_cast<int>(ear.size())) {
            ear[tap] = value;
        }
    };
    for (int i = 0; i < std::abs(peakShiftLeft_) + hrirLength_; ++i) {
        put(filter_.left, shiftLeft + i,
            Response::get(fresh.left, peakShiftLeft_ + i) * weightNew +
                Response::get(old.left, i) * weightOld);
        put(filter_.right, shiftRight + i,
            Response::get(fresh.right, peakShiftRight_ + i) * weightNew +
                Response::get(old.right, i) * weightOld);
    }
}

}  // namespace tessaly::reference
