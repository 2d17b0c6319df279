// Minimum phase, delay, band limit, window.
#include "data/synthesis.h"

#include <fmt/format.h>

#include <cmath>
#include <numbers>

#include "base/precision.h"
#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr std::size_t transformLength = 2048;
constexpr double taperStart = 0.9;  // of half the sample rate
constexpr std::size_t fadeInSamples = 3;
constexpr double fadeOutSeconds = 0.36e-3;

class Synthesiser {
public:
    explicit Synthesiser(int sampleRate)
        : rate_(sampleRate),
          sampleRate_(sampleRate),
          transform_(transformLength),
          minimumPhase_(transform_),
          logMagnitude_(transform_.bins()),
          spectrum_(transform_.bins()),
          time_(transformLength),
          taper_(transform_.bins(), 1.0) {
        const double last = static_cast<double>(transform_.bins() - 1);
        for (std::size_t k = 0; k < taper_.size(); ++k) {
            const double place = (static_cast<double>(k) / last - taperStart) / (1.0 - taperStart);
            if (place > 0.0) {
                taper_[k] = 0.5 + 0.5 * std::cos(std::numbers::pi * place);
            }
        }
    }

    /// @return the response, `taps` of transformLength samples are windowed; valid until the next
    /// call
    double* response(const ResponseField& field, std::size_t taps, std::size_t entry, int ear) {
        const EarDelays delays = earDelays(field.itdSeconds[entry]);
        const double own = ear == leftEar ? delays.left : delays.right;
        double* samples = make(field.levels.curve(entry, ear), field.levels.bins,
                               field.levels.binHertz, own + headSeconds + preDelaySeconds);
        applyWindow(samples, taps, rate_);
        return samples;
    }

private:
    /// @return transformLength samples, not windowed yet; valid until the next call
    double* make(const double* curve, std::size_t bins, double binHertz, double delay) {
        const double stepHertz = sampleRate_ / static_cast<double>(transformLength);
        for (std::size_t k = 0; k < logMagnitude_.size(); ++k) {
            logMagnitude_[k] = neperPerDecibel *
                               levelAt(curve, bins, binHertz, static_cast<double>(k) * stepHertz);
        }
        minimumPhase_.logSpectrum(logMagnitude_.data(), spectrum_.data());
        for (std::size_t k = 0; k < spectrum_.size(); ++k) {
            const double magnitude = taper_[k] * std::exp(spectrum_[k].real());
            const double phase = spectrum_[k].imag() - 2.0 * std::numbers::pi *
                                                           static_cast<double>(k) * stepHertz *
                                                           delay;
            spectrum_[k] = {magnitude * std::cos(phase), magnitude * std::sin(phase)};
        }
        transform_.inverse(spectrum_.data(), time_.data());
        return time_.data();
    }

    int rate_;
    double sampleRate_;
    RealTransform transform_;
    MinimumPhase minimumPhase_;
    std::vector<double> logMagnitude_;
    std::vector<Complex> spectrum_;
    std::vector<double> time_;
    std::vector<double> taper_;
};

}  // namespace

void applyWindow(double* response, std::size_t taps, int sampleRate) noexcept {
    for (std::size_t i = 0; i < fadeInSamples && i < taps; ++i) {
        const double place = (static_cast<double>(i) + 0.5) / static_cast<double>(fadeInSamples);
        response[i] *= 0.5 - 0.5 * std::cos(std::numbers::pi * place);
    }
    const auto fadeOut = static_cast<std::size_t>(std::lround(fadeOutSeconds * sampleRate));
    for (std::size_t i = 0; i < fadeOut && i < taps; ++i) {
        const double place = (static_cast<double>(i) + 0.5) / static_cast<double>(fadeOut);
        response[taps - 1 - i] *= 0.5 - 0.5 * std::cos(std::numbers::pi * place);
    }
}

std::vector<double> synthesiseResponse(
    const ResponseField& field, int sampleRate, std::size_t taps, std::size_t entry, int ear) {
    Synthesiser synthesiser(sampleRate);
    const double* response = synthesiser.response(field, taps, entry, ear);
    return {response, response + taps};
}

HrirSet synthesise(const ResponseField& field,
                   int sampleRate,
                   std::size_t taps,
                   Progress& progress) {
    HrirSet set;
    set.sampleRate = sampleRate;
    set.taps = taps;
    set.pairs.resize(packedOrder().size() * taps * earCount);
    Synthesiser synthesiser(sampleRate);
    progress.stage(fmt::format("synthesising {} Hz", sampleRate), packedOrder().size());
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        for (int ear = 0; ear < earCount; ++ear) {
            const double* response = synthesiser.response(field, taps, entry, ear);
            float* frame = set.pairs.data() + entry * taps * earCount + (ear == rightEar ? 0 : 1);
            for (std::size_t i = 0; i < taps; ++i) {
                frame[i * earCount] = single(response[i]);
            }
        }
        progress.step();
    }
    return set;
}

}  // namespace tessaly::data
