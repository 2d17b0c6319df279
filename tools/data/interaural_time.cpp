// Woodworth's formula, its inverse, and the excess-phase correlation.
#include "data/interaural_time.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace tessaly::data {

namespace {

constexpr double lowestHertz = 500.0;
constexpr double highestHertz = 3000.0;
constexpr std::size_t smallestTransform = 2048;
constexpr int oversampling = 32;
constexpr double smallestMagnitude = 1e-12;

}  // namespace

double woodworth(Direction direction) noexcept {
    const double sine =
        std::sin(radians(direction.azimuth)) * std::cos(radians(direction.elevation));
    const double lateral = std::asin(std::clamp(sine, -1.0, 1.0));
    return headSeconds * (lateral + std::sin(lateral));
}

double woodworthInverse(double seconds) noexcept {
    constexpr double quarterTurn = 0.5 * std::numbers::pi;
    const double wanted = seconds / headSeconds;
    if (wanted >= quarterTurn + 1.0) {
        return quarterTurn;
    }
    double lateral = std::max(0.0, 0.5 * wanted);
    for (int i = 0; i < 30; ++i) {
        const double step = (lateral + std::sin(lateral) - wanted) / (1.0 + std::cos(lateral));
        lateral = std::clamp(lateral - step, 0.0, quarterTurn);
        if (std::abs(step) < 1e-15) {
            break;
        }
    }
    return lateral;
}

EarDelays earDelays(double itdSeconds) noexcept {
    const double near = -headSeconds * std::sin(woodworthInverse(std::abs(itdSeconds)));
    const double far = near + std::abs(itdSeconds);
    return itdSeconds >= 0.0 ? EarDelays{near, far} : EarDelays{far, near};
}

ItdEstimator::ItdEstimator(double sampleRate, std::size_t taps)
    : sampleRate_(sampleRate),
      taps_(taps),
      transform_(std::max(smallestTransform, nextPowerOfTwo(taps))),
      minimumPhase_(transform_),
      time_(transform_.length()),
      spectrum_(transform_.bins()),
      logSpectrum_(transform_.bins()),
      logMagnitude_(transform_.bins()) {
    const double binHertz = sampleRate / static_cast<double>(transform_.length());
    firstBin_ = static_cast<std::size_t>(std::ceil(lowestHertz / binHertz));
    lastBin_ = static_cast<std::size_t>(std::floor(highestHertz / binHertz));
    left_.resize(lastBin_ - firstBin_ + 1);
    right_.resize(left_.size());
    cross_.resize(left_.size());
}

void ItdEstimator::excessPhase(const double* response, std::vector<Complex>& excess) {
    std::fill(time_.begin(), time_.end(), 0.0);
    std::copy(response, response + taps_, time_.begin());
    transform_.forward(time_.data(), spectrum_.data());
    for (std::size_t k = 0; k < spectrum_.size(); ++k) {
        logMagnitude_[k] = std::log(std::max(std::abs(spectrum_[k]), smallestMagnitude));
    }
    minimumPhase_.logSpectrum(logMagnitude_.data(), logSpectrum_.data());
    for (std::size_t k = firstBin_; k <= lastBin_; ++k) {
        const double phase = std::arg(spectrum_[k]) - logSpectrum_[k].imag();
        excess[k - firstBin_] = {std::cos(phase), std::sin(phase)};
    }
}

double ItdEstimator::correlation(double lagSamples) const {
    const double anglePerBin =
        2.0 * std::numbers::pi * lagSamples / static_cast<double>(transform_.length());
    const Complex step(std::cos(anglePerBin), std::sin(anglePerBin));
    const double first = anglePerBin * static_cast<double>(firstBin_);
    Complex phasor(std::cos(first), std::sin(first));
    double sum = 0.0;
    for (const Complex& value : cross_) {
        sum += value.real() * phasor.real() - value.imag() * phasor.imag();
        phasor = times(phasor, step);
    }
    return sum;
}

std::optional<double> ItdEstimator::estimate(const double* left,
                                             const double* right,
                                             double centreSeconds,
                                             double halfWidth,
                                             double extraSeconds) {
    excessPhase(left, left_);
    excessPhase(right, right_);
    for (std::size_t i = 0; i < cross_.size(); ++i) {
        cross_[i] = times(right_[i], std::conj(left_[i]));
    }
    // Lags count in 1 / 32 sample. The band is narrow: one sample is fine enough to find the peak.
    const double centre = (centreSeconds - extraSeconds) * sampleRate_ * oversampling;
    const double width = halfWidth * sampleRate_ * oversampling;
    const int lowest = static_cast<int>(std::ceil(centre - width));
    const int highest = static_cast<int>(std::floor(centre + width));
    const auto at = [this](int lag) {
        return correlation(static_cast<double>(lag) / oversampling);
    };
    int best = lowest;
    double bestValue = at(lowest);
    const auto consider = [&](int lag) {
        const double value = at(lag);
        if (value > bestValue) {
            bestValue = value;
            best = lag;
        }
    };
    for (int lag = lowest; lag <= highest; lag += oversampling) {
        consider(lag);
    }
    consider(highest);
    for (int stride = oversampling / 2; stride >= 1; stride /= 2) {
        const int middle = best;
        if (middle - stride >= lowest) {
            consider(middle - stride);
        }
        if (middle + stride <= highest) {
            consider(middle + stride);
        }
    }
    if (!(bestValue > 0.0)) {
        return std::nullopt;
    }
    double lag = best;
    const double before = at(best - 1);
    const double after = at(best + 1);
    const double curvature = before - 2.0 * bestValue + after;
    if (before <= bestValue && after <= bestValue && curvature < 0.0) {
        lag += 0.5 * (before - after) / curvature;
    }
    return lag / (oversampling * sampleRate_) + extraSeconds;
}

}  // namespace tessaly::data
