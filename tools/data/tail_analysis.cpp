// Coherence, decay, density.
#include "data/tail_analysis.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "base/precision.h"
#include "data/thread_transform.h"

namespace tessaly::data {

namespace {

constexpr std::size_t frameLength = 512;
constexpr double energyDecay = 13.8155;  // 6 ln 10
constexpr double fitFrom = -5.0;         // dB
constexpr double fitTo = -25.0;          // dB
constexpr double densityWindow = 20e-3;  // s
constexpr double gaussianShare = 0.3173;
constexpr std::size_t lastFrames = 60;

/// Sums of auto and cross spectra in octaves.
class CoherenceSums {
public:
    explicit CoherenceSums(double rate) : rate_(rate) {}

    void add(const std::vector<Complex>& left, const std::vector<Complex>& right, double weight) {
        const double binHertz = rate_ / static_cast<double>(frameLength);
        for (std::size_t band = 0; band < coherenceBands; ++band) {
            const double low = lowestCoherenceHertz * std::exp2(static_cast<double>(band));
            const auto first = static_cast<std::size_t>(std::ceil(low / binHertz));
            const auto end = static_cast<std::size_t>(std::ceil(2.0 * low / binHertz));
            for (std::size_t k = first; k < std::min(end, left.size()); ++k) {
                cross_[band] += weight * (left[k] * std::conj(right[k])).real();
                left_[band] += weight * std::norm(left[k]);
                right_[band] += weight * std::norm(right[k]);
            }
        }
    }
    Coherence result() const {
        Coherence values{};
        for (std::size_t band = 0; band < coherenceBands; ++band) {
            const double energy = std::sqrt(left_[band] * right_[band]);
            values[band] = energy > 0.0 ? cross_[band] / energy : 0.0;
        }
        return values;
    }

private:
    double rate_;
    std::array<double, coherenceBands> cross_{};
    std::array<double, coherenceBands> left_{};
    std::array<double, coherenceBands> right_{};
};

std::size_t frameAt(double seconds, int sampleRate) noexcept {
    return static_cast<std::size_t>(std::lround(seconds * sampleRate));
}

/// Points of a backward integral from the onset to the end.
std::size_t curveStep(std::size_t frames) noexcept {
    return std::max<std::size_t>(1, frames / 2000);
}

}  // namespace

Coherence diffuseCoherence(const HrirSet& hrirs, const std::vector<double>& weights) {
    RealTransform& transform = threadTransform(frameLength);
    CoherenceSums sums(hrirs.sampleRate);
    std::vector<Complex> spectra[earCount];
    for (std::size_t entry = 0; entry < weights.size(); ++entry) {
        if (weights[entry] == 0.0) {
            continue;
        }
        for (int ear = 0; ear < earCount; ++ear) {
            std::vector<double> time = hrirs.response(entry, ear);
            time.resize(frameLength);
            spectra[ear].resize(transform.bins());
            transform.forward(time.data(), spectra[ear].data());
        }
        sums.add(spectra[leftEar], spectra[rightEar], weights[entry]);
    }
    return sums.result();
}

Coherence tailCoherence(const std::vector<float>& tail, int sampleRate, double fromSeconds) {
    RealTransform& transform = threadTransform(frameLength);
    CoherenceSums sums(sampleRate);
    std::vector<Complex> spectra[earCount];
    std::vector<double> time(frameLength);
    const std::size_t frames = tail.size() / earCount;
    for (std::size_t start = frameAt(fromSeconds, sampleRate); start + frameLength <= frames;
         start += frameLength / 2) {
        double energy = 0.0;
        for (std::size_t ear = 0; ear < earCount; ++ear) {
            for (std::size_t i = 0; i < frameLength; ++i) {
                const double place = (static_cast<double>(i) + 0.5) / frameLength;
                const double window = 0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * place);
                time[i] = window * wide(tail[(start + i) * earCount + ear]);
                energy += time[i] * time[i];
            }
            spectra[ear].resize(transform.bins());
            transform.forward(time.data(), spectra[ear].data());
        }
        if (energy > 0.0) {
            sums.add(spectra[leftEar], spectra[rightEar], 1.0 / energy);
        }
    }
    return sums.result();
}

OctaveTimes measuredTimes(const std::vector<float>& tail,
                          int sampleRate,
                          const TailDesign& design) {
    const std::size_t frames = tail.size() / earCount;
    const std::size_t onset = frameAt(design.onsetSeconds, sampleRate);
    const std::size_t step = curveStep(frames);
    std::vector<double> response(frames);
    std::array<std::vector<double>, decayOctaves> energies;
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        for (std::size_t i = 0; i < frames; ++i) {
            response[i] = wide(tail[earCount * i + ear]);
        }
        addOctaveEnergies(response, sampleRate, energies);
    }
    OctaveTimes times{};
    for (std::size_t octave = 0; octave < decayOctaves; ++octave) {
        std::vector<double>& energy = energies[octave];
        integrateBackwards(energy, onset);
        std::vector<double> curve;
        for (std::size_t i = onset; i < frames; i += step) {
            curve.push_back(energy[i]);
        }
        times[octave] = fittedTime(curve, static_cast<double>(step) / sampleRate, fitFrom, fitTo);
    }
    return times;
}

OctaveTimes designedTimes(std::size_t frames, int sampleRate, const TailDesign& design) {
    constexpr int points = 24;  // an octave, on a linear axis
    const double end = static_cast<double>(frames) / sampleRate;
    const std::size_t step = curveStep(frames);
    OctaveTimes times{};
    for (std::size_t octave = 0; octave < decayOctaves; ++octave) {
        const double centre = octaveCentre(octave);
        std::vector<double> curve;
        for (std::size_t i = frameAt(design.onsetSeconds, sampleRate); i < frames; i += step) {
            curve.push_back(0.0);
        }
        const double low = centre * lowestInOctave;
        const double high = std::min(centre / lowestInOctave, 0.5 * sampleRate);
        for (int point = 0; point < points; ++point) {
            const double hertz = low + (high - low) * (point + 0.5) / points;
            const double weight = octaveWeight(std::log2(hertz / centre));
            const double decay = energyDecay / design.decay.at(hertz);
            const double cutOff = std::exp(-decay * end);
            for (std::size_t i = 0; i < curve.size(); ++i) {
                const double seconds =
                    design.onsetSeconds + static_cast<double>(i * step) / sampleRate;
                curve[i] += weight * weight * (std::exp(-decay * seconds) - cutOff) / decay;
            }
        }
        times[octave] = fittedTime(curve, static_cast<double>(step) / sampleRate, fitFrom, fitTo);
    }
    return times;
}

EchoDensity echoDensity(const std::vector<float>& tail, int sampleRate, const TailDesign& design) {
    const std::size_t length = frameAt(densityWindow, sampleRate);
    std::vector<double> window(length);
    double sum = 0.0;
    for (std::size_t i = 0; i < length; ++i) {
        const double place = (static_cast<double>(i) + 0.5) / static_cast<double>(length);
        window[i] = 0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * place);
        sum += window[i];
    }
    const std::size_t frames = tail.size() / earCount;
    /// Both ears of the window that starts at a frame.
    const auto densityAt = [&](std::size_t start) {
        double share = 0.0;
        for (std::size_t ear = 0; ear < earCount; ++ear) {
            double variance = 0.0;
            for (std::size_t i = 0; i < length; ++i) {
                const double sample = wide(tail[(start + i) * earCount + ear]);
                variance += window[i] * sample * sample;
            }
            const double deviation = std::sqrt(variance / sum);
            for (std::size_t i = 0; i < length; ++i) {
                if (std::abs(wide(tail[(start + i) * earCount + ear])) > deviation) {
                    share += window[i] / sum;
                }
            }
        }
        return share / (earCount * gaussianShare);
    };
    EchoDensity density;
    const std::size_t last = std::min(frames, frameAt(design.decay.mid(), sampleRate) + length / 2);
    int count = 0;
    for (std::size_t centre = std::max(frameAt(2.0 * design.onsetSeconds, sampleRate), length / 2);
         centre - length / 2 + length <= last; centre += length / 2) {
        density.late += densityAt(centre - length / 2);
        ++count;
    }
    density.late = count > 0 ? density.late / count : 0.0;
    const std::size_t early = frameAt(0.5 * design.onsetSeconds, sampleRate);
    density.early = densityAt(early > length / 2 ? early - length / 2 : 0);
    return density;
}

TailSamplesCheck checkTailSamples(const std::vector<float>& tail,
                                  int sampleRate,
                                  const TailDesign& design) {
    TailSamplesCheck check;
    check.notFinite = static_cast<int>(std::count_if(
        tail.begin(), tail.end(), [](float sample) { return !std::isfinite(sample); }));
    const std::size_t frames = tail.size() / earCount;
    const auto start = static_cast<std::size_t>(std::ceil(design.startSeconds * sampleRate));
    check.soundingBefore = static_cast<int>(std::count_if(
        tail.begin(),
        tail.begin() + static_cast<std::ptrdiff_t>(std::min(frames, start) * earCount),
        [](float sample) { return sample != 0.0f; }));
    double worst = 0.0;
    double jump = 0.0;
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        double sum = 0.0;
        double energy = 0.0;
        double previous = 0.0;
        for (std::size_t i = 0; i < frames; ++i) {
            const double sample = wide(tail[earCount * i + ear]);
            sum += sample;
            energy += sample * sample;
            check.peak = std::max(check.peak, std::abs(sample));
            if (i + lastFrames >= frames) {
                jump = std::max(jump, std::abs(sample - previous));
            }
            previous = sample;
        }
        check.last = std::max(check.last, std::abs(previous));
        worst = std::max(worst, energy > 0.0 ? std::abs(sum) / std::sqrt(energy) : 0.0);
    }
    check.lastJump = check.peak > 0.0 ? jump / check.peak : 0.0;
    check.sumDecibels = 20.0 * std::log10(std::max(worst, 1e-15));
    return check;
}

}  // namespace tessaly::data
