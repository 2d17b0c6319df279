// Impulses, third-octave decay, envelope.
#include "data/tail_synthesis.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "base/precision.h"
#include "data/data_error.h"
#include "data/tail_envelope.h"
#include "data/tail_random.h"
#include "data/thread_transform.h"

namespace tessaly::data {

namespace {

constexpr double fullRate = 16000.0;  // impulses a second in the diffuse field
constexpr std::uint64_t firstSeed = 1000;

// Density of the outdoor place: single echoes first, closing in later.
constexpr double outdoorFloor = 0.03;
constexpr double outdoorRise = 0.6;
constexpr double outdoorSeconds = 0.6;

// Third-octave bands around 1000 * 2^(b / 3) Hz, 25 Hz to 20 kHz.
constexpr int lowestTailBand = -16;
constexpr int highestTailBand = 13;
constexpr std::size_t transformMargin = 2048;
constexpr double amplitudeDecay = 6.9078;  // ln 1000

// Bending waves in a plate: high frequencies arrive first.
constexpr double plateDelay = 10e-3;
constexpr double plateDelayHertz = 200.0;
constexpr double plateLowestHertz = 63.0;

using Ears = std::vector<double>[earCount];

/// Share of the full rate at a time from the start on.
double density(const TailDesign& design, double seconds) noexcept {
    if (design.shape == TailShape::outdoor) {
        const double place = seconds / outdoorSeconds;
        return std::min(1.0, outdoorFloor + outdoorRise * place * place);
    }
    if (seconds >= design.onsetSeconds) {
        return 1.0;
    }
    const double square = seconds / design.onsetSeconds * (seconds / design.onsetSeconds);
    return square * square;
}

/// Draws directions by weight.
class DirectionDraw {
public:
    explicit DirectionDraw(const TailDesign& design) : sums_(directionWeights(design)) {
        double sum = 0.0;
        for (double& value : sums_) {
            sum += value;
            value = sum;
        }
    }
    std::size_t draw(double uniform) const {
        const double wanted = uniform * sums_.back();
        const auto found = std::upper_bound(sums_.begin(), sums_.end(), wanted);
        return std::min(static_cast<std::size_t>(found - sums_.begin()), sums_.size() - 1);
    }

private:
    std::vector<double> sums_;
};

/// Impulses of variance 1 a sample, each through the pair of its direction.
void rain(const TailDesign& design, const HrirSet& hrirs, Ears& ears) {
    TailRandom random(firstSeed + static_cast<std::uint64_t>(design.preset));
    const DirectionDraw directions(design);
    const double rate = hrirs.sampleRate;
    double seconds = design.startSeconds;
    for (;;) {
        seconds += random.exponential() / fullRate;
        const auto frame = static_cast<std::size_t>(seconds * rate);
        if (frame >= design.frames48000) {
            return;
        }
        const double share = density(design, seconds);
        if (random.uniform() >= share) {
            continue;
        }
        const std::size_t entry = directions.draw(random.uniform());
        const double gain = random.sign() / std::sqrt(fullRate * share / rate);
        const float* pair = hrirs.pairs.data() + entry * hrirs.taps * earCount;
        double* left = ears[leftEar].data() + frame;
        double* right = ears[rightEar].data() + frame;
        for (std::size_t i = 0; i < hrirs.taps; ++i) {
            right[i] += gain * wide(pair[earCount * i]);
            left[i] += gain * wide(pair[earCount * i + 1]);
        }
    }
}

/// Share of a band at a frequency; all bands sum to 1 from the lowest centre up.
double bandShare(int band, double hertz) noexcept {
    const double off = 3.0 * std::log2(hertz / 1000.0) - band;
    if (band == highestTailBand && off > 0.0) {
        return 1.0;
    }
    return std::abs(off) < 1.0 ? 0.5 + 0.5 * std::cos(std::numbers::pi * off) : 0.0;
}

/// Splits into bands and lets each decay in its own time.
class BandDecay {
public:
    BandDecay(const TailDesign& design, double rate, std::size_t length)
        : design_(design),
          rate_(rate),
          transform_(threadTransform(length)),
          spectrum_(transform_.bins()),
          part_(transform_.bins()),
          time_(length) {}

    void run(std::vector<double>& samples) {
        transform_.forward(samples.data(), spectrum_.data());
        std::fill(samples.begin(), samples.end(), 0.0);
        for (int band = lowestTailBand; band <= highestTailBand; ++band) {
            addBand(band, samples);
        }
    }

private:
    void addBand(int band, std::vector<double>& samples) {
        const double centre = 1000.0 * std::exp2(band / 3.0);
        const double binHertz = rate_ / static_cast<double>(transform_.length());
        const double delay =
            design_.shape == TailShape::plate
                ? plateDelay * std::sqrt(plateDelayHertz / std::max(centre, plateLowestHertz))
                : 0.0;
        std::fill(part_.begin(), part_.end(), Complex());
        const double lowest = centre * std::exp2(-1.0 / 3.0) / binHertz;
        const double highest = centre * std::exp2(1.0 / 3.0) / binHertz;
        const auto first = static_cast<std::size_t>(std::max(1.0, lowest));
        const std::size_t last =
            band == highestTailBand
                ? part_.size() - 1
                : std::min(part_.size() - 1, static_cast<std::size_t>(highest) + 1);
        for (std::size_t k = first; k <= last; ++k) {
            const double hertz = static_cast<double>(k) * binHertz;
            const Complex value = spectrum_[k] * bandShare(band, hertz);
            const double turn = -2.0 * std::numbers::pi * hertz * delay;
            part_[k] = delay > 0.0 ? times(value, {std::cos(turn), std::sin(turn)}) : value;
        }
        transform_.inverse(part_.data(), time_.data());
        const double step = std::exp(-amplitudeDecay / (design_.decay.at(centre) * rate_));
        double gain = 1.0;
        for (std::size_t i = 0; i < samples.size() && i < design_.frames48000; ++i) {
            samples[i] += gain * time_[i];
            gain *= step;
        }
    }

    const TailDesign& design_;
    double rate_;
    RealTransform& transform_;
    std::vector<Complex> spectrum_;
    std::vector<Complex> part_;
    std::vector<double> time_;
};

}  // namespace

std::vector<double> synthesiseTail(const TailDesign& design, const HrirSet& hrirs) {
    if (hrirs.sampleRate != tailDesignRate || hrirs.taps > transformMargin) {
        throw DataError("tails are made from a set of {} Hz, found {} Hz", tailDesignRate,
                        hrirs.sampleRate);
    }
    const std::size_t length = nextPowerOfTwo(design.frames48000 + transformMargin);
    Ears ears;
    for (std::vector<double>& ear : ears) {
        ear.assign(length, 0.0);
    }
    rain(design, hrirs, ears);
    BandDecay decay(design, hrirs.sampleRate, length);
    std::vector<double> pairs(design.frames48000 * earCount);
    for (std::size_t ear = 0; ear < earCount; ++ear) {
        decay.run(ears[ear]);
        for (std::size_t i = 0; i < design.frames48000; ++i) {
            pairs[earCount * i + ear] = ears[ear][i];
        }
    }
    const TailEnvelope envelope(design, tailDesignRate);
    envelope.apply(pairs, earCount);
    envelope.removeSum(pairs, earCount);
    return pairs;
}

}  // namespace tessaly::data
