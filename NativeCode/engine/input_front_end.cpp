// Delay line and filters of the mono input, and the laws of their cut-offs.
#include "engine/input_front_end.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "base/log.h"
#include "base/precision.h"
#include "base/silence.h"

namespace tessaly {

namespace {

constexpr double bassShelveGain = -4.67;  // dB

/// Air absorption: 20 kHz at the source, 11 kHz at 10 m, 7 kHz at 20 m, 3 kHz from 33.3 m on.
float highCutAt(float distance) noexcept {
    constexpr float lowest = 3000.0f;  // Hz
    float frequency = 0.0f;
    if (distance < 10.0f) {
        frequency = 20000.0f - distance * 9000.0f * 0.1f;
    } else if (distance < 20.0f) {
        frequency = single(11000.0 - (wide(distance) - 10.0) * 4000.0 * 0.1);
    } else {
        frequency = single(7000.0 - wide((distance - 20.0f) * 3000.0f * 0.1f));
    }
    return frequency < lowest ? lowest : frequency;
}

/// Near-field bass: 10 Hz at the source, 180 Hz from 30 m on.
float lowCutAt(float distance) noexcept {
    constexpr double perThirty = 0.03333333333333333;
    return distance < 30.0f ? single(wide(distance * 170.0f) * perThirty + 10.0) : 180.0f;
}

/// Below this, 400 dB under full scale, a filter is taken to be at rest. What its state would still
/// put out is at most a thousand times larger, at the lowest cut-off; a cut-off of zero, out of
/// every law's range, lets it grow by as much again in each 20 ms.
constexpr double restingState = 1e-20;

bool isAtRest(const Biquad& filter) noexcept {
    return std::fabs(filter.z1) < restingState && std::fabs(filter.z2) < restingState;
}

/// As allZero, for one channel of stereo frames.
bool channelSilent(const SignalKernels& kernels, const float* channel, int frames) noexcept {
    // Both channels mostly are, and side by side they are looked through faster.
    if (frames > 0 && kernels.isSilent(2 * static_cast<std::size_t>(frames) - 1, channel)) {
        return true;
    }
    constexpr int together = 16;  // frames between two looks at the result
    int i = 0;
    for (; i + together <= frames; i += together) {
        std::uint32_t any = 0;
        for (int k = 0; k < together; ++k) {
            any |= std::bit_cast<std::uint32_t>(channel[std::ptrdiff_t{2} * (i + k)]);
        }
        if ((any << 1) != 0) {  // all but the sign
            return false;
        }
    }
    for (; i < frames; ++i) {
        if (channel[std::ptrdiff_t{2} * i] != 0.0f) {
            return false;
        }
    }
    return true;
}

/// The filters that run in a block, in series.
class FilterChain {
public:
    void add(Biquad& filter) noexcept { filters_[count_++] = &filter; }
    bool isAtRest() const noexcept {
        return std::all_of(filters_.begin(), filters_.begin() + count_,
                           [](const Biquad* filter) { return tessaly::isAtRest(*filter); });
    }
    void clear() noexcept {
        for (std::size_t k = 0; k < count_; ++k) {
            filters_[k]->clear();
        }
    }
    void run(const SignalKernels& kernels, float* samples, int count) noexcept {
        std::array<RunningSection, capacity> series;
        for (std::size_t k = 0; k < count_; ++k) {
            const Biquad& f = *filters_[k];
            series[k] = {{f.b0, f.b1, f.b2, f.a1, f.a2}, f.z1, f.z2};
        }
        kernels.filterSeries(static_cast<std::size_t>(count), samples, count_, series.data());
        for (std::size_t k = 0; k < count_; ++k) {
            filters_[k]->z1 = series[k].z1;
            filters_[k]->z2 = series[k].z2;
        }
    }

private:
    static constexpr std::size_t capacity = 4;
    std::array<Biquad*, capacity> filters_{};
    std::size_t count_ = 0;
};

/// In this order: it can be heard while the distance moves both cut-offs.
FilterChain chainOf(InputFrontEnd& frontEnd, bool bassBoost) noexcept {
    FilterChain chain;
    if (bassBoost) {
        chain.add(frontEnd.bassShelveFilter);
    }
    if (frontEnd.inputLowPassLevel > 0.0f) {
        chain.add(frontEnd.inputLowPass);
    }
    chain.add(frontEnd.highCutFilter);
    chain.add(frontEnd.lowCutFilter);
    return chain;
}

}  // namespace

void InputFrontEnd::prepareFilters(int sampleRate) {
    sampleRate_ = sampleRate;
    highCutFilter = Biquad(Biquad::lowPass, 0.0, Biquad::normalise(highCut_Fc, sampleRate));
    lowCutFilter = Biquad(Biquad::highPass, 0.0, Biquad::normalise(lowCut_Fc, sampleRate));
    const double shelveFrequency = Biquad::normalise(bassShelveFilter_Fc, sampleRate);
    logOutput("bassShelveFilter_Fc / sampleRate = ", shelveFrequency);
    bassShelveFilter = Biquad(Biquad::lowShelf, bassShelveGain, shelveFrequency);
    inputLowPass = Biquad(Biquad::lowPass, 0.0, Biquad::normalise(inputLowPass_Fc, sampleRate));
}

void InputFrontEnd::prepareWindow(int blocklenght) {
    blocklenght_ = blocklenght;
    inputHistoryBuffer = AlignedArray<float>(2 * static_cast<std::size_t>(blocklenght));
    inputHistory = inputHistoryBuffer.data();
    silentBlocks_ = 0;
}

bool InputFrontEnd::staysAtRest(const float* channel, bool bassBoost, bool dopplerOn) noexcept {
    return !dopplerOn && chainOf(*this, bassBoost).isAtRest() &&
           (expectsSilence_ || channelSilent(*kernels_, channel, blocklenght_));
}

bool InputFrontEnd::seesSilence(const float* input,
                                int inputChannel,
                                bool bassBoost,
                                bool dopplerOn) noexcept {
    const bool silence = staysAtRest(input + inputChannel, bassBoost, dopplerOn);
    ahead_ = silence ? Ahead::Silence : Ahead::Sound;
    return silence && silentBlocks_ > 0;
}

void InputFrontEnd::process(const float* input,
                            int inputChannel,
                            bool bassBoost,
                            bool dopplerOn,
                            float distance,
                            float distanceOld) noexcept {
    if (inputHistory == nullptr) {
        return;
    }
    const int B = blocklenght_;
    float* const block = inputHistory + B;
    const float* const channel = input + inputChannel;
    inputGain = 1.0f;

    FilterChain chain = chainOf(*this, bassBoost);
    const bool silence = ahead_ == Ahead::Unknown ? staysAtRest(channel, bassBoost, dopplerOn)
                                                  : ahead_ == Ahead::Silence;
    ahead_ = Ahead::Unknown;
    expectsSilence_ = false;
    if (silence) {
        chain.clear();
        keepSilence();
        return;
    }
    std::memcpy(inputHistory, block, static_cast<std::size_t>(B) * sizeof(float));
    silentBlocks_ = 0;
    if (dopplerOn) {
        doppler.process(channel, inputGain, distance, distanceOld, block);
        if (chain.isAtRest() && allZero(block, static_cast<std::size_t>(B))) {
            chain.clear();
            std::memset(block, 0, static_cast<std::size_t>(B) * sizeof(float));
            return;
        }
    } else {
        for (int i = 0; i < B; ++i) {
            block[i] = channel[std::ptrdiff_t{2} * i] * inputGain;
        }
    }
    chain.run(*kernels_, block, B);
}

/// Moves the window on by a block of zeros, as far as it does not hold them already.
void InputFrontEnd::keepSilence() noexcept {
    const std::size_t bytes = static_cast<std::size_t>(blocklenght_) * sizeof(float);
    float* const block = inputHistory + blocklenght_;
    if (silentBlocks_ == 0) {
        std::memcpy(inputHistory, block, bytes);
        std::memset(block, 0, bytes);
    } else if (silentBlocks_ == 1) {
        std::memset(inputHistory, 0, bytes);
    }
    silentBlocks_ = std::min(silentBlocks_ + 1, 2);
}

void InputFrontEnd::followDistance(float distance) noexcept {
    highCut_Fc = highCutAt(distance);
    highCutFilter.redesign(Biquad::lowPass, Biquad::normalise(highCut_Fc, sampleRate_));
    lowCut_Fc = lowCutAt(distance);
    lowCutFilter.redesign(Biquad::highPass, Biquad::normalise(lowCut_Fc, sampleRate_));
}

float InputFrontEnd::setInputLowPass(float level) noexcept {
    const float former = inputLowPassLevel;
    if (level != former) {
        inputLowPassLevel = level;
        inputLowPass_Fc = single(wide(std::pow(100.0f, 1.0f - level) * 20000.0f) * 0.01);
        inputLowPass.redesign(Biquad::lowPass, Biquad::normalise(inputLowPass_Fc, sampleRate_));
    }
    return former;
}

}  // namespace tessaly
