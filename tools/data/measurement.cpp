// Plausibility of a measured set, judged by its time and level differences.
#include "data/measurement.h"

#include <algorithm>
#include <cmath>

#include "data/data_error.h"
#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr std::size_t fewestDirections = 100;
constexpr double lowestSampleRate = 44100.0;  // the level curve is needed up to 20.5 kHz
constexpr std::size_t fewestTaps = 32;
constexpr double samePlaceDegrees = 0.01;
constexpr double orientationElevation = 40.0;  // judged near the horizontal plane
constexpr double orientationSine = 0.5;        // and well to the sides
constexpr std::size_t fewestSideDirections = 4;
constexpr double widestItdSeconds = 1e-3;
constexpr double clearCorrelation = 0.7;

void removeRepeated(Measurement& measurement) {
    std::vector<Vector3> kept;
    Measurement result;
    for (std::size_t i = 0; i < measurement.count(); ++i) {
        const Vector3 direction = toVector(measurement.directions[i]);
        const bool repeated = std::any_of(kept.begin(), kept.end(), [&](const Vector3& other) {
            return angleBetween(direction, other) < samePlaceDegrees;
        });
        if (repeated) {
            continue;
        }
        kept.push_back(direction);
        result.directions.push_back(measurement.directions[i]);
        result.extraSeconds.push_back(measurement.extraSeconds[i]);
        const double* first = measurement.response(i, leftEar);
        result.samples.insert(result.samples.end(), first, first + earCount * measurement.taps);
    }
    measurement.directions = std::move(result.directions);
    measurement.extraSeconds = std::move(result.extraSeconds);
    measurement.samples = std::move(result.samples);
}

void checkSamples(const Measurement& measurement) {
    for (std::size_t i = 0; i < measurement.count(); ++i) {
        const Direction& direction = measurement.directions[i];
        if (!(std::abs(direction.elevation) <= 90.0 + 1e-6) || !std::isfinite(direction.azimuth)) {
            throw DataError(
                "direction {} has azimuth {}, elevation {}; expected degrees with an "
                "elevation from -90 to 90",
                i, direction.azimuth, direction.elevation);
        }
        for (int ear = 0; ear < earCount; ++ear) {
            double energy = 0.0;
            for (std::size_t n = 0; n < measurement.taps; ++n) {
                energy += measurement.response(i, ear)[n] * measurement.response(i, ear)[n];
            }
            if (!std::isfinite(energy) || !(energy > 0.0)) {
                throw DataError(
                    "the {} ear at azimuth {:.1f}, elevation {:.1f} is {}; expected "
                    "a measured response",
                    ear == leftEar ? "left" : "right", direction.azimuth, direction.elevation,
                    std::isfinite(energy) ? "silent" : "not a number");
            }
        }
    }
}

double levelDifference(const Measurement& measurement, std::size_t direction) {
    double energy[earCount] = {};
    for (int ear = 0; ear < earCount; ++ear) {
        // The first difference weighs high frequencies, where the head's shadow is deep.
        const double* response = measurement.response(direction, ear);
        for (std::size_t n = 1; n < measurement.taps; ++n) {
            const double slope = response[n] - response[n - 1];
            energy[ear] += slope * slope;
        }
    }
    constexpr double floor = 1e-30;
    return 10.0 * std::log10((energy[leftEar] + floor) / (energy[rightEar] + floor));
}

double correlation(const std::vector<double>& a, const std::vector<double>& b) {
    double ab = 0.0;
    double aa = 0.0;
    double bb = 0.0;
    for (std::size_t i = 0; i < a.size(); ++i) {
        ab += a[i] * b[i];
        aa += a[i] * a[i];
        bb += b[i] * b[i];
    }
    return aa > 0.0 && bb > 0.0 ? ab / std::sqrt(aa * bb) : 0.0;
}

/// Mean at the left side and, with the sign turned, at the right side.
double sideMean(const std::vector<double>& values, const std::vector<double>& expected) {
    double sum = 0.0;
    for (std::size_t i = 0; i < values.size(); ++i) {
        sum += expected[i] > 0.0 ? values[i] : -values[i];
    }
    return sum / static_cast<double>(values.size());
}

void checkOrientation(const Measurement& measurement) {
    ItdEstimator estimator(measurement.sampleRate, measurement.taps);
    std::vector<double> expected;
    std::vector<double> times;
    std::vector<double> levels;
    bool leftSeen = false;
    bool rightSeen = false;
    for (std::size_t i = 0; i < measurement.count(); ++i) {
        const Direction& direction = measurement.directions[i];
        const double sphere = woodworth(direction);
        const double sine = toVector(direction)[1];
        if (std::abs(direction.elevation) > orientationElevation ||
            std::abs(sine) < orientationSine) {
            continue;
        }
        expected.push_back(sphere);
        times.push_back(estimator
                            .estimate(measurement.response(i, leftEar),
                                      measurement.response(i, rightEar), 0.0, widestItdSeconds,
                                      measurement.extraSeconds[i])
                            .value_or(0.0));
        levels.push_back(levelDifference(measurement, i));
        leftSeen = leftSeen || sine > 0.0;
        rightSeen = rightSeen || sine < 0.0;
    }
    if (expected.size() < fewestSideDirections || !leftSeen || !rightSeen) {
        throw DataError(
            "too few directions at the sides: found {} within {:.0f} degrees of the "
            "horizontal plane, expected some on both sides",
            expected.size(), orientationElevation);
    }
    const double timeMatch = correlation(times, expected);
    const double levelMatch = correlation(levels, expected);
    if (timeMatch > clearCorrelation && levelMatch > clearCorrelation) {
        return;
    }
    const double sideMicroseconds = 1e6 * sideMean(times, expected);
    const double sideDecibels = sideMean(levels, expected);
    const auto found = fmt::format(
        "for sources at the left the left ear is {:.0f} us {} and {:.1f} dB {} (mean, right side "
        "likewise)",
        std::abs(sideMicroseconds), sideMicroseconds > 0.0 ? "earlier" : "later",
        std::abs(sideDecibels), sideDecibels > 0.0 ? "louder" : "softer");
    if (timeMatch < -clearCorrelation && levelMatch < -clearCorrelation) {
        throw DataError(
            "ears swapped or azimuth mirrored: {}; expected the left ear first and "
            "louder, with the left receiver first and azimuth counter-clockwise",
            found);
    }
    throw DataError(
        "time and level differences do not follow the azimuths (correlation {:.2f} and "
        "{:.2f}): {}; expected the left ear earlier and louder at azimuth 90, "
        "correlations above {:.1f}",
        timeMatch, levelMatch, found, clearCorrelation);
}

}  // namespace

void checkMeasurement(Measurement& measurement) {
    if (!(measurement.sampleRate >= lowestSampleRate) || !(measurement.sampleRate <= 400000.0)) {
        throw DataError("sample rate is {} Hz, expected {} Hz or more", measurement.sampleRate,
                        lowestSampleRate);
    }
    if (measurement.taps < fewestTaps || measurement.taps > 65536) {
        throw DataError("responses are {} samples long, expected {} to 65536", measurement.taps,
                        fewestTaps);
    }
    if (measurement.count() < fewestDirections) {
        throw DataError("too few directions: found {}, expected {} or more all round the head",
                        measurement.count(), fewestDirections);
    }
    checkSamples(measurement);
    removeRepeated(measurement);
    if (measurement.count() < fewestDirections) {
        throw DataError(
            "too few directions: found {} different ones, expected {} or more all "
            "round the head",
            measurement.count(), fewestDirections);
    }
    checkOrientation(measurement);
}

}  // namespace tessaly::data
