// Curve, minimum phase, fade.
#include "data/headphone_design.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "base/precision.h"
#include "data/minimum_phase.h"
#include "data/set_analysis.h"
#include "data/synthesis.h"
#include "data/thread_transform.h"

namespace tessaly::data {

namespace {

constexpr std::size_t transformLength = 16384;
constexpr double middleLow = 300.0;    // Hz
constexpr double middleHigh = 3000.0;  // Hz
constexpr int middlePoints = 200;
constexpr double lowestDb = -12.0;
constexpr double highestDb = 10.0;
constexpr double holdHertz = 16000.0;

// Inverse of the frontal direction.
constexpr std::size_t frontalTaps = 256;
constexpr double smoothingOctaves = 1.0 / 6.0;
constexpr double regularisation = 0.02;
constexpr double referenceHertz = 1000.0;
constexpr double lowFadeEnd = 100.0;    // Hz: nothing below
constexpr double lowFadeStart = 200.0;  // Hz
constexpr double highFadeStart = 12000.0;
constexpr double highFadeEnd = 16000.0;  // Hz: nothing above

constexpr std::size_t smallTaps = 128;
constexpr std::size_t smallFade = 32;

/// Share of the inverse at a frequency, along a logarithmic axis.
double inverseShare(double hertz) noexcept {
    const double low = std::log2(hertz / lowFadeEnd) / std::log2(lowFadeStart / lowFadeEnd);
    const double high = std::log2(highFadeEnd / hertz) / std::log2(highFadeEnd / highFadeStart);
    const double place = std::clamp(std::min(low, high), 0.0, 1.0);
    return 0.5 - 0.5 * std::cos(std::numbers::pi * place);
}

/// Power of a direction, mean of both ears and smoothed, a value a bin.
std::vector<double> smoothedPower(const ResponseField& field, int sampleRate) {
    RealTransform& transform = threadTransform(transformLength);
    const auto front = static_cast<std::size_t>(packedIndex(0, 0));
    std::vector<double> sums(transform.bins() + 1);  // of all bins below
    std::vector<double> power(transform.bins());
    std::vector<Complex> spectrum(transform.bins());
    for (int ear = 0; ear < earCount; ++ear) {
        std::vector<double> time = synthesiseResponse(field, sampleRate, frontalTaps, front, ear);
        time.resize(transformLength);
        transform.forward(time.data(), spectrum.data());
        for (std::size_t k = 0; k < power.size(); ++k) {
            power[k] += std::norm(spectrum[k]) / earCount;
        }
    }
    for (std::size_t k = 0; k < power.size(); ++k) {
        sums[k + 1] = sums[k] + power[k];
    }
    const double half = std::exp2(0.5 * smoothingOctaves);
    for (std::size_t k = 0; k < power.size(); ++k) {
        const auto low = static_cast<std::size_t>(std::lround(static_cast<double>(k) / half));
        const auto high = std::min(
            power.size(), static_cast<std::size_t>(std::lround(static_cast<double>(k) * half)) + 1);
        power[k] = (sums[high] - sums[low]) / static_cast<double>(high - low);
    }
    return power;
}

}  // namespace

double HeadphoneCurve::at(double hertz) const noexcept {
    return levelAt(decibels.data(), decibels.size(),
                   sampleRate / static_cast<double>(transformLength), hertz);
}

double middleLevel(const std::function<double(double hertz)>& level) {
    double sum = 0.0;
    for (const double hertz : logSpaced(middleLow, middleHigh, middlePoints)) {
        sum += level(hertz);
    }
    return sum / middlePoints;
}

HeadphoneCurve headphoneCurve(const std::function<double(double hertz)>& level, int sampleRate) {
    const double middle = middleLevel(level);
    HeadphoneCurve curve;
    curve.sampleRate = sampleRate;
    curve.decibels.resize(transformLength / 2 + 1);
    const double binHertz = sampleRate / static_cast<double>(transformLength);
    for (std::size_t k = 0; k < curve.decibels.size(); ++k) {
        const double hertz = std::min(static_cast<double>(k) * binHertz, holdHertz);
        curve.decibels[k] =
            std::clamp(level(hertz) - middle, lowestDb, highestDb) + headphoneMiddleDb;
    }
    return curve;
}

std::function<double(double hertz)> frontalInverse(const ResponseField& field, int sampleRate) {
    std::vector<double> decibels = smoothedPower(field, sampleRate);
    for (double& value : decibels) {
        value = 10.0 * std::log10(std::max(value, 1e-12));
    }
    const double binHertz = sampleRate / static_cast<double>(transformLength);
    const auto levelOf = [binHertz](const std::vector<double>& curve, double hertz) {
        return levelAt(curve.data(), curve.size(), binHertz, hertz);
    };
    const double middle = middleLevel([&](double hertz) { return levelOf(decibels, hertz); });
    for (double& value : decibels) {
        const double x = std::pow(10.0, (value - middle) / 20.0);
        value = 20.0 * std::log10(x / (x * x + regularisation));
    }
    const double reference = levelOf(decibels, referenceHertz);
    for (std::size_t k = 0; k < decibels.size(); ++k) {
        const double hertz = std::max(static_cast<double>(k), 0.5) * binHertz;
        decibels[k] =
            inverseShare(hertz) * std::clamp(decibels[k] - reference, lowestDb, highestDb);
    }
    return [decibels = std::move(decibels), levelOf](double hertz) {
        return levelOf(decibels, hertz);
    };
}

std::vector<float> headphoneFilter(const HeadphoneCurve& curve,
                                   std::size_t taps,
                                   std::size_t fade) {
    RealTransform& transform = threadTransform(transformLength);
    MinimumPhase minimumPhase(transform);
    std::vector<double> logMagnitude(transform.bins());
    for (std::size_t k = 0; k < logMagnitude.size(); ++k) {
        logMagnitude[k] = neperPerDecibel * curve.decibels[k];
    }
    std::vector<Complex> spectrum(transform.bins());
    minimumPhase.logSpectrum(logMagnitude.data(), spectrum.data());
    for (Complex& bin : spectrum) {
        const double magnitude = std::exp(bin.real());
        bin = {magnitude * std::cos(bin.imag()), magnitude * std::sin(bin.imag())};
    }
    std::vector<double> time(transformLength);
    transform.inverse(spectrum.data(), time.data());
    std::vector<float> filter(taps);
    for (std::size_t i = 0; i < taps; ++i) {
        double weight = 1.0;
        if (i + fade >= taps) {
            const double place =
                (static_cast<double>(i + fade - taps) + 0.5) / static_cast<double>(fade);
            weight = 0.5 + 0.5 * std::cos(std::numbers::pi * place);
        }
        filter[i] = single(weight * time[i]);
    }
    return filter;
}

std::vector<float> smallHeadphoneFilter(const HeadphoneCurve& curve) {
    const std::vector<float> taps = headphoneFilter(curve, smallTaps, smallFade);
    std::vector<float> filter(headphoneTaps - smallTaps);
    filter.insert(filter.end(), taps.begin(), taps.end());
    return filter;
}

std::function<double(double hertz)> responseLevel(const std::vector<double>& response,
                                                  int sampleRate) {
    RealTransform& transform =
        threadTransform(std::max(transformLength, nextPowerOfTwo(response.size())));
    std::vector<double> time = response;
    time.resize(transform.length());
    std::vector<Complex> spectrum(transform.bins());
    transform.forward(time.data(), spectrum.data());
    std::vector<double> decibels(spectrum.size());
    for (std::size_t k = 0; k < spectrum.size(); ++k) {
        decibels[k] = 10.0 * std::log10(std::max(std::norm(spectrum[k]), 1e-24));
    }
    const double binHertz = sampleRate / static_cast<double>(transform.length());
    return [decibels = std::move(decibels), binHertz](double hertz) {
        return levelAt(decibels.data(), decibels.size(), binHertz, hertz);
    };
}

}  // namespace tessaly::data
