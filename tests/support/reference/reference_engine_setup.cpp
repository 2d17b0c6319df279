// Construction of a reference engine: switches, sizes, HRIR mapping, fixed and preset reflections.
#include <cmath>
#include <cstdlib>
#include <numbers>

#include "base/numeric_conversion.h"
#include "base/precision.h"
#include "base/units.h"
#include "support/reference/reference_engine.h"

namespace tessaly::reference {

namespace {

constexpr int errorBlockSize = -101;
constexpr int errorSampleRate = -102;
constexpr int errorMissing = -103;
constexpr int fixedPairDelay = 664;
constexpr std::array<std::int16_t, 2> fixedPairPhi{-90, 85};

constexpr int indexOfPhi(int phi) { return (phi + 180) / 5; }

constexpr int indexOfTheta(int theta) { return (theta + 90) / 5; }

}  // namespace

int hrirFrames(int sampleRate, bool use256) {
    if (use256) {
        return 256;
    }
    return truncateToInt32(static_cast<float>(sampleRate) * 128.0f * 2.2675737e-05f + 0.5f);
}

int tailFrames(int framesAt48000, int sampleRate) {
    return truncateToInt32(static_cast<float>(sampleRate) * static_cast<float>(framesAt48000) *
                           2.0833333e-05f);
}

int earlyFlexFirSizeOf(int preset) {
    switch (preset) {
        // clang-format off
        case 1: case 2: case 3: case 9: case 20: case 52:
            return 1024;
        case 4: case 11: case 15: case 17: case 18: case 23: case 28: case 41: case 51: case 53:
        case 55: case 56:
            return 2048;
        case 5: case 6: case 8: case 10: case 12: case 14: case 21: case 27: case 32: case 36:
        case 39: case 40: case 42: case 43: case 45: case 46: case 48: case 57: case 58:
            return 4096;
        case 25:
            return 16384;
        // clang-format on
        default:
            return preset >= 1 && preset <= 60 ? 8192 : 0;
    }
}

double Engine::frequency(float cutoff) const { return wide(cutoff) / options_.sampleRate; }

void Engine::Response::resize(int taps) {
    left.assign(static_cast<std::size_t>(taps), 0.0);
    right.assign(static_cast<std::size_t>(taps), 0.0);
}

void Engine::applyLadder() {
    // Doppler, the tail, and the 3D bypass are not on the ladder: they stay off.
    const int q = options_.qualityValue;
    qvEarlyReflections_ = q >= 1000 || q == 2 || q == 4;
    qvSmoothSteps_ = q >= 1000 || q == 4 || q == 5;
    qvFlexReflections_ = q >= 3 && q != 4;
    qvInterpolateSpectra_ = q >= 10;
    qvInterpolateFilters_ = q >= 8;
    fading_ = q >= 5;
    qvTrackDirection_ = q >= 4;
    qvUse256HRIR_ = q >= 2 && q != 6 && q != 8;
    limitTheta_ = q >= 6 ? 90 : 0;
    limitPhi_ = q >= 7 || q == 5 ? 180 : 90;
    qvUpdateInterval_ = q >= 7 ? 1 : q >= 5 ? 2 : 4;
}

void Engine::settingsStep() {
    const bool limitsGood = options_.limitPhi >= 0 && options_.limitPhi <= 180 &&
                            options_.limitTheta >= 0 && options_.limitTheta <= 90;
    if (options_.qualityValue > 0) {
        applyLadder();
    } else if (options_.qualityValue == 0) {
        qvEarlyReflections_ = options_.qvEarlyReflections;
        qvFlexReflections_ = options_.qvFlexReflections && earlyFlexRefPreset_ != 0;
        qvReverb_ = options_.qvReverb;
        qvSmoothSteps_ = options_.qvSmoothSteps;
        qvInterpolateSpectra_ = options_.qvInterpolateSpectra;
        qvInterpolateFilters_ = options_.qvInterpolateFilters;
        fading_ = options_.fading;
        qvTrackDirection_ = options_.qvTrackDirection;
        qvUpdateInterval_ = options_.qvUpdateInterval;
        qvUse256HRIR_ = options_.qvUse256HRIR;
        bypass3DAudio_ = options_.bypass3DAudio;
        limitPhi_ = limitsGood ? options_.limitPhi : 180;
        limitTheta_ = limitsGood ? options_.limitTheta : 90;
        doppler_ = options_.doppler;
    }
    atmoSelect_ = options_.atmoSelect < 1 ? 0 : options_.atmoSelect;
    hrirLength_ = hrirFrames(options_.sampleRate, qvUse256HRIR_);
    if (!qvTrackDirection_) {
        limitPhi_ = 0;
        limitTheta_ = 0;
    }
    limitPhi_ = limitPhi_ / 5 * 5;
    limitTheta_ = limitTheta_ / 5 * 5;
    useElevation_ = limitTheta_ > 0;
    interpolateAngles_ = qvInterpolateSpectra_ || qvInterpolateFilters_;
    if (interpolateAngles_) {
        angleStep_ = 1;
    }
    if (qvInterpolateSpectra_ && qvInterpolateFilters_) {
        qvInterpolateFilters_ = false;
    }
    if (instanceNumber_ > 0) {
        atmoSelect_ = 0;
    }
}

void Engine::deriveFirSize() {
    firSize_ = options_.defaultFirSize;
    if (qvReverb_ > 1) {
        firSize_ = (reverbLength_ + blockLength_ - 1) / blockLength_ * blockLength_;
    }
    if (qvReverb_ < 1) {
        if (earlyFlexRefPreset_ > 0) {
            firSize_ = earlyFlexFirSizeOf(earlyFlexRefPreset_);
            if (firSize_ == 0) {
                earlyFlexRefPreset_ = 0;
            }
        } else {
            firSize_ = blockLength_;
        }
    }
    if (firSize_ > blockLength_) {
        partitions_ = firSize_ / blockLength_;
    } else {
        firSize_ = blockLength_;
        partitions_ = 1;
    }
    firBufferSize_ = firSize_ + blockLength_;
}

bool Engine::loadFilter(int& cell) {
    const bool fixedSource = !qvTrackDirection_ && !mappingReflections_;
    const bool pan = bypass3DAudio_;
    if (fixedSource) {
        phi_ = inputs_.azimuth;
        phiNew_ = inputs_.azimuth;
        theta_ = inputs_.elevation;
    } else if (cell != noHrir && !mappingReflections_) {
        // A filled cell is kept, unless what fills it changes from or to the pan pair.
        if (!pan && !process_.hrirs.bypassMode) {
            return true;
        }
    }
    if (fileCount_ >= hrirCount || process_.hrirs.stream.empty()) {
        return false;
    }
    if (pan) {
        writePanPair(fileCount_);
    }
    cell = fileCount_;
    ++fileCount_;
    return true;
}

void Engine::writePanPair(int hrir) {
    constexpr double panGain = 1.65;
    const double half = hrirLength_ * 0.5;
    // Single precision decides the tap positions.
    const float s = std::sin(single(phi_ / 360.0 * 2.0 * std::numbers::pi)) + 1.0f;
    const int posFirst = truncateToInt32(wide(s) * half * 0.5);
    const int posSecond = truncateToInt32(half - posFirst);
    HrirTables& tables = process_.hrirs;
    const auto base = 2 * static_cast<std::size_t>(hrir) * static_cast<std::size_t>(tables.stride);
    for (std::size_t i = 0; i < static_cast<std::size_t>(2 * hrirLength_); ++i) {
        if (base + i < tables.stream.size()) {
            tables.stream[base + i] = 0.0;
        }
    }
    const auto put = [&](int frame, int ear, double value) {
        const std::size_t at = base + static_cast<std::size_t>(2 * frame + ear);
        if (at < tables.stream.size()) {
            tables.stream[at] = value;
        }
    };
    put(posFirst, 0, (2.0 - wide(s)) * panGain * 0.5 * 0.6 + 0.4);
    put(posSecond, 1, panGain * wide(s) * 0.5 * 0.6 + 0.4);
}

void Engine::mapPackedSet() {
    auto& cells = process_.hrirs.cells;
    const auto cell = [&](int row, int column) -> int& {
        return cells[row * elevationColumns + column];
    };
    phi_ = 0;
    theta_ = -90;
    loadFilter(cell(36, 0));
    if (phiSteps_ == 0) {
        return;  // no azimuths to turn through
    }
    for (int turn = phiSteps_ / 2;; ++turn) {
        const int i = phiSteps_ - turn % phiSteps_;
        phi_ = wrapToInt16((i - 36) * 5);
        for (int t = 1; t < thetaSteps_; ++t) {
            theta_ = wrapToInt16((t - 18) * 5);
            loadFilter(cell(i, t));
        }
        if (i == 36) {
            phi_ = 0;
            theta_ = 90;
            loadFilter(cell(36, 36));
            for (int row = 0; row <= phiSteps_; ++row) {
                cell(row, 0) = cell(36, 0);
                cell(row, 36) = cell(36, 36);
            }
        }
        if (i == phiSteps_ / 2 + 1) {
            break;
        }
    }
    for (int t = 0; t <= thetaSteps_; ++t) {
        cell(0, t) = cell(phiSteps_, t);
    }
}

bool Engine::loadDatabase() {
    HrirTables& tables = process_.hrirs;
    if (instanceNumber_ != 0 && tables.bypassMode == bypass3DAudio_) {
        return true;  // loaded already, whatever rate and length it was loaded for
    }
    fileCount_ = 0;
    HrirFile file;
    file.error = errorMissing;
    if (process_.hrirSource) {
        file = process_.hrirSource(options_.sampleRate, hrirLength_ * hrirCount);
    }
    tables.stream = std::move(file.samples);
    tables.stream.resize(static_cast<std::size_t>(hrirLength_) * hrirCount * 2, 0.0);
    tables.stride = hrirLength_;
    if (file.error != 1) {
        process_.essError = file.error;
        if (file.error == errorMissing) {
            return false;
        }
    }
    mappingReflections_ = false;
    if (qvTrackDirection_) {
        mapPackedSet();
    } else {
        loadFilter(staticFilter_);
    }
    tables.bypassMode = bypass3DAudio_;
    return true;
}

void Engine::loadFixedPair() {
    for (int n = 0; n < 2; ++n) {
        // A delay that the response is too short for moves forward, below 0 if need be.
        const int excess = hrirLength_ - firSize_ + fixedPairDelay;
        fixedDelay_[n] = wrapToInt16(excess > 0 ? fixedPairDelay - excess : fixedPairDelay);
        const int room = wrapToInt16(firSize_ - fixedDelay_[n]);
        fixedLength_[n] = room < hrirLength_ ? room : hrirLength_;
        const std::int16_t direction = fixedPairPhi[n];
        if (std::abs(direction) > limitPhi_) {
            phi_ = direction;
            theta_ = 0;
            loadFilter(fixedHrir_[n]);
        } else {
            indexPhi_ = wrapToInt16(indexOfPhi(direction));
            indexTheta_ = 18;
            fixedHrirCell_[n] = indexPhi_ * elevationColumns + indexTheta_;
        }
    }
}

void Engine::loadPresetRow() {
    phi_ = phiNew_;
    theta_ = inputs_.elevation;
    if (earlyFlexRefPreset_ <= 0) {
        return;
    }
    const PresetRow& row = options_.presetRow;
    earlyPresetGain_ = row.earlyPresetGain;
    controls.roomDistances = row.roomDistances;
    controls.reflectionLP_Fc = row.reflectionLP_Fc;
    controls.reflectionLP2_Fc = row.reflectionLP2_Fc;
    controls.reverbLP_Fc = row.reverbLP_Fc;
    hasReverbLowPass_ = row.hasReverbLowPass;
    if (firSize_ < row.earlyFlexFirSize) {
        firSize_ = row.earlyFlexFirSize;
        firBufferSize_ = firSize_ + blockLength_;
    }
    for (std::size_t k = 0; k < row.phi.size(); ++k) {
        ReflectionRecord record;
        record.relativePhi = wrapToInt16(row.phi[k]);
        record.phi = wrapToInt16(row.phi[k] + phi_);
        record.relativeTheta = wrapToInt16(row.theta[k]);
        record.theta = wrapToInt16(row.theta[k] + theta_);
        record.presetDelaySamples =
            truncateToInt16(static_cast<float>(row.delay[k]) * sampleRateRatio_);
        record.delaySamples = record.presetDelaySamples;
        record.gain = single(wide(row.gain[k]) * 0.55);
        if (row.presetUsesFilters) {
            record.filterClass =
                row.filterClass.empty() ? std::int16_t{0} : wrapToInt16(row.filterClass[k]);
        }
        if (earlyFlexRefPreset_ >= 13) {
            const float gain = samplesPerMetre_ / static_cast<float>(record.delaySamples);
            record.distanceGain = gain > 1.0f ? 1.0f : gain;
        }
        records.push_back(record);
    }
    if (qvTrackDirection_) {
        return;
    }
    for (ReflectionRecord& record : records) {
        if (record.phi <= -180) {
            record.phi = wrapToInt16(record.phi + 360);
        } else if (record.phi > 180) {
            record.phi = wrapToInt16(record.phi - 360);
        }
        record.indexPhi = wrapToInt16(indexOfPhi(record.phi));
        record.theta = record.theta < -75 ? std::int16_t{-75} : record.theta;
        record.theta = record.theta > 75 ? std::int16_t{75} : record.theta;
        record.indexTheta = wrapToInt16(indexOfTheta(record.theta));
        phi_ = record.phi;
        theta_ = record.theta;
        const int cell = record.indexPhi * elevationColumns + record.indexTheta;
        if (cell >= 0 && cell < static_cast<int>(process_.hrirs.cells.size())) {
            loadFilter(process_.hrirs.cells[cell]);
        }
    }
    phi_ = phiNew_;
    theta_ = inputs_.elevation;
}

Engine::Engine(Process& process,
               const SourceInputs& inputs,
               const MixLevels& mix,
               const EngineOptions& options)
    : process_(process), inputs_(inputs), mix_(mix), options_(options) {
    instanceNumber_ = process_.engineCount;
    ++process_.engineCount;
    process_.blockCounter = 0;
    blockLength_ = options_.blockLength;
    if (blockLength_ < 2 || (blockLength_ & (blockLength_ - 1)) != 0) {
        process_.essError = errorBlockSize;
        return;
    }
    switch (options_.sampleRate) {
        case 24000:
            sampleRateRatio_ = 0.5442177f;
            break;
        case 44100:
            sampleRateRatio_ = 1.0f;
            break;
        case 48000:
            sampleRateRatio_ = 1.0884354f;
            break;
        default:
            process_.essError = errorSampleRate;
            return;
    }
    earlyFlexRefPreset_ = options_.earlyFlexRefPreset;
    settingsStep();
    highCutFilter_ = Filter(0, 0.0, frequency(20000.0f));
    lowCutFilter_ = Filter(1, 0.0, frequency(10.0f));
    bassShelveFilter_ = Filter(5, -4.67, frequency(400.0f));
    inputLowPass_ = Filter(0, 0.0, frequency(20000.0f));
    if (qvReverb_ > 60) {
        qvReverb_ = 0;
    } else if (qvReverb_ > 1) {
        reverbLength_ = static_cast<int>(options_.tail.pairs.size() / 2);
    }
    deriveFirSize();
    samplesPerMetre_ = single(options_.sampleRate * samplesPerMetrePerHertz);
    phiSteps_ = 2 * limitPhi_ / 5;
    thetaSteps_ = useElevation_ ? 2 * limitTheta_ / 5 : 0;
    if (!loadDatabase()) {
        return;
    }
    mappingReflections_ = true;
    if (qvEarlyReflections_) {
        loadFixedPair();
    }
    if (doppler_) {
        const int length =
            truncateToInt32(options_.sampleRate * samplesPerMetrePerHertz * 25.0 + blockLength_);
        dopplerLine_.assign(static_cast<std::size_t>(length), 0.0);
    }
    // The start azimuth is taken with the host's sign, unlike in every block.
    phiOld_ = qvTrackDirection_ ? inputs_.azimuth : std::int16_t{0};
    thetaOld_ = qvTrackDirection_ ? inputs_.elevation : std::int16_t{0};
    indexPhiOld_ = wrapToInt16(indexOfPhi(phiOld_));
    indexThetaOld_ = wrapToInt16(indexOfTheta(thetaOld_));
    distance_ = single(wide(inputs_.distance) + 0.4);
    distanceOld_ = inputs_.distance;
    if (qvFlexReflections_) {
        loadPresetRow();
    }
    mappingReflections_ = false;

    const auto window = static_cast<std::size_t>(2 * blockLength_);
    inputHistory_.assign(window, 0.0);
    firstOut_.resize(static_cast<std::size_t>(blockLength_));
    secondOut_ = firstOut_;
    filter_.resize(firBufferSize_);
    if (qvInterpolateFilters_) {
        interpFilter_[0].resize(firBufferSize_);
        interpFilter_[1].resize(firBufferSize_);
    }
    if (interpolateAngles_) {
        interpAngleOffset_ = 5.0f;
    }
    rings_.assign(fading_ ? 2 : 1, WindowRing(blockLength_, partitions_));
    response_.emplace_back(blockLength_, partitions_);
    ringPosition_ = partitions_ - 1;
    phi_ = wrapToInt16(angleStep_ - inputs_.azimuth);
    theta_ = wrapToInt16(inputs_.elevation + angleStep_);
    built_ = true;
}

Engine::~Engine() { --process_.engineCount; }

}  // namespace tessaly::reference
