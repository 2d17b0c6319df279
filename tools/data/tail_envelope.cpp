// Ramp, echoes, fade, and the removal of the sum.
#include "data/tail_envelope.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace tessaly::data {

namespace {

constexpr double fadeShare = 0.05;
constexpr std::size_t shortestFade = 60;
constexpr double amplitudeDecay = 6.9;  // near ln 1000: the decay's own digits do not matter here

// Single echoes of a place without a diffuse field.
struct Echo {
    double seconds;
    double gain;
};
constexpr Echo echoes[] = {{0.038, 1.0},  {0.072, 0.8},  {0.086, 0.7}, {0.124, 0.5},
                           {0.165, 0.38}, {0.215, 0.28}, {0.290, 0.18}};
constexpr double echoLevel = 2.2;
constexpr double echoSeconds = 3e-3;
constexpr double echoFloor = 0.15;

double onsetRamp(const TailDesign& design, double seconds) noexcept {
    const double place =
        (seconds - design.startSeconds) / (design.onsetSeconds - design.startSeconds);
    double ramp = 1.0;
    if (place < 1.0) {
        ramp = place > 0.0 ? std::sin(0.5 * std::numbers::pi * place) : 0.0;
    }
    if (design.shape != TailShape::echoes || place <= 0.0) {
        return ramp;
    }
    double gain = echoFloor * ramp;
    for (const Echo& echo : echoes) {
        const double off = (seconds - echo.seconds) / echoSeconds;
        gain = std::max(gain, echoLevel * echo.gain * std::exp(-0.5 * off * off));
    }
    return gain;
}

}  // namespace

double tailFade(std::size_t position, std::size_t frames) noexcept {
    const auto share = static_cast<std::size_t>(fadeShare * static_cast<double>(frames));
    const std::size_t length = std::min(frames, std::max(shortestFade, share));
    const std::size_t fadeStart = frames - length;
    if (position < fadeStart) {
        return 1.0;
    }
    if (position + 1 >= frames) {
        return 0.0;
    }
    const double place =
        static_cast<double>(position - fadeStart + 1) / static_cast<double>(length);
    return 0.5 + 0.5 * std::cos(std::numbers::pi * place);
}

TailEnvelope::TailEnvelope(const TailDesign& design, int sampleRate)
    : startFrame_(static_cast<std::size_t>(std::ceil(design.startSeconds * sampleRate))),
      gain_(storedTailFrames(design, sampleRate)),
      decay_(gain_.size()) {
    for (std::size_t i = 0; i < gain_.size(); ++i) {
        const double seconds = static_cast<double>(i) / sampleRate;
        const double fade = tailFade(i, gain_.size());
        gain_[i] = onsetRamp(design, seconds) * fade;
        decay_[i] = gain_[i] * std::exp(-amplitudeDecay * seconds / design.decay.mid());
    }
}

void TailEnvelope::apply(std::vector<double>& samples, std::size_t channels) const {
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] *= gain_[i / channels];
    }
}

void TailEnvelope::silenceEnds(std::vector<double>& samples, std::size_t channels) const {
    const std::size_t start = std::min(samples.size(), startFrame_ * channels);
    std::fill(samples.begin(), samples.begin() + static_cast<std::ptrdiff_t>(start), 0.0);
    std::fill(samples.end() - static_cast<std::ptrdiff_t>(channels), samples.end(), 0.0);
}

double TailEnvelope::removeSum(std::vector<double>& samples, std::size_t channels) const {
    double shape = 0.0;
    for (const double value : decay_) {
        shape += value;
    }
    double before = 0.0;
    double taken = 0.0;
    for (std::size_t channel = 0; channel < channels; ++channel) {
        double sum = 0.0;
        for (std::size_t i = channel; i < samples.size(); i += channels) {
            sum += samples[i];
            before += samples[i] * samples[i];
        }
        const double scale = sum / shape;
        for (std::size_t i = channel, frame = 0; i < samples.size(); i += channels, ++frame) {
            const double part = scale * decay_[frame];
            samples[i] -= part;
            taken += part * part;
        }
    }
    return before > 0.0 ? taken / before : 0.0;
}

}  // namespace tessaly::data
