// Delay line and filters of the mono input, and the laws of their cut-offs.
#include "engine/input_front_end.h"

#include <cmath>
#include <cstddef>
#include <cstring>

#include "base/log.h"
#include "base/precision.h"

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

/// As one pass of each over the block; interleaved, their recursions overlap in time.
void runInSeries(Biquad& first, Biquad& second, float* samples, int count) noexcept {
    Biquad a = first;
    Biquad b = second;
    for (int i = 0; i < count; ++i) {
        samples[i] = b.process(a.process(samples[i]));
    }
    first = a;
    second = b;
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
    std::memcpy(inputHistory, block, static_cast<std::size_t>(B) * sizeof(float));

    inputGain = 1.0f;
    const float* const channel = input + inputChannel;
    if (dopplerOn) {
        doppler.process(channel, inputGain, distance, distanceOld, block);
    } else {
        for (int i = 0; i < B; ++i) {
            block[i] = channel[std::ptrdiff_t{2} * i] * inputGain;
        }
    }

    if (bassBoost) {
        bassShelveFilter.processInPlace(block, B);
    }
    if (inputLowPassLevel > 0.0f) {
        inputLowPass.processInPlace(block, B);
    }
    // In this order: it can be heard while the distance moves both cut-offs.
    runInSeries(highCutFilter, lowCutFilter, block, B);
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
