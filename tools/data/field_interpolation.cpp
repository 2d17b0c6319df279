// Grid interpolation of level curves and time differences.
#include "data/field_interpolation.h"

#include <algorithm>
#include <cmath>
#include <optional>

#include "data/data_error.h"
#include "data/interaural_time.h"

namespace tessaly::data {

namespace {

constexpr std::size_t analysisLength = 4096;  // at 44100 and 48000 Hz
constexpr double analysisRate = 50000.0;
constexpr double highestHertz = 24000.0;     // nothing above reaches the engine
constexpr double smallestMagnitude = 1e-10;  // -200 dB
constexpr double shadowHertz = 1500.0;       // the torso takes up to 4 dB above this
constexpr double shadowDecibels = 4.0;
constexpr double smoothingDegrees = 6.0;
constexpr double smoothingReachDegrees = 40.0;  // the bell is below 3e-10 there
constexpr double nearlySymmetricDecibels = 1.0;
constexpr int horizontalNeeds = 30;  // degrees either side that must be measured

using Weights = std::vector<std::optional<InterpolationWeights>>;

Direction directionOf(const GridEntry& entry) {
    return {static_cast<double>(entry.phi), static_cast<double>(entry.theta)};
}

std::size_t at(int phi, int theta) { return static_cast<std::size_t>(packedIndex(phi, theta)); }

bool ringIsCovered(const Weights& weights, int theta) {
    for (int phi = -175; phi <= 180; phi += gridStepDegrees) {
        if (!weights[at(phi, theta)]) {
            return false;
        }
    }
    return true;
}

/// Lowest (step -5) or highest (step 5) elevation to which rings are covered without a gap, not
/// beyond the measured elevations: a wide triangle can reach past an outermost ring.
int closedLimit(const Weights& weights, int step, double measuredLimit) {
    int limit = 0;
    for (int theta = step; std::abs(theta) <= 90; theta += step) {
        const bool beyond = step > 0 ? theta > measuredLimit + 1e-6 : theta < measuredLimit - 1e-6;
        if (beyond || !ringIsCovered(weights, theta)) {
            break;
        }
        limit = theta;
    }
    return limit;
}

void checkCoverage(const Weights& weights, int lowest, int highest) {
    if (!ringIsCovered(weights, 0) || lowest > -gridStepDegrees || highest < horizontalNeeds) {
        throw DataError(
            "the directions do not close around the head: closed from elevation {} to "
            "{}, expected {} or lower to {} or higher at every azimuth",
            ringIsCovered(weights, 0) ? lowest : 90, highest, -gridStepDegrees, horizontalNeeds);
    }
}

void interpolateEntry(const MeasuredField& measured,
                      const std::vector<Direction>& directions,
                      const InterpolationWeights& weights,
                      std::size_t entry,
                      ResponseField& field) {
    double deviation = 0.0;
    for (int i = 0; i < weights.count; ++i) {
        const auto source = static_cast<std::size_t>(weights.index[static_cast<std::size_t>(i)]);
        const double weight = weights.weight[static_cast<std::size_t>(i)];
        deviation += weight * (measured.itdSeconds[source] - woodworth(directions[source]));
        for (int ear = 0; ear < earCount; ++ear) {
            const double* from = measured.levels.curve(source, ear);
            double* to = field.levels.curve(entry, ear);
            for (std::size_t k = 0; k < field.levels.bins; ++k) {
                to[k] = (i == 0 ? 0.0 : to[k]) + weight * from[k];
            }
        }
    }
    field.itdSeconds[entry] = woodworth(directionOf(packedOrder()[entry])) + deviation;
}

/// Levels towards an unmeasured pole: the power mean of the outermost ring, darker below.
std::vector<double> poleLevel(const ResponseField& field, int ring, double shadow) {
    std::vector<double> level(field.levels.bins, 0.0);
    double count = 0.0;
    for (int phi = -175; phi <= 180; phi += gridStepDegrees) {
        for (int ear = 0; ear < earCount; ++ear) {
            const double* curve = field.levels.curve(at(phi, ring), ear);
            for (std::size_t k = 0; k < level.size(); ++k) {
                level[k] += powerOf(curve[k]);
            }
            count += 1.0;
        }
    }
    for (std::size_t k = 0; k < level.size(); ++k) {
        const double square = std::pow(static_cast<double>(k) * field.levels.binHertz, 2.0);
        level[k] = 10.0 * std::log10(level[k] / count) -
                   shadow * square / (square + shadowHertz * shadowHertz);
    }
    return level;
}

/// Blends from the outermost ring to the pole, levels and time differences.
void fillCap(ResponseField& field, int ring, bool below) {
    const std::vector<double> pole = poleLevel(field, ring, below ? shadowDecibels : 0.0);
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const GridEntry& direction = packedOrder()[entry];
        const int beyond = below ? ring - direction.theta : direction.theta - ring;
        if (beyond <= 0) {
            continue;
        }
        const double u = static_cast<double>(beyond) / (below ? 90 + ring : 90 - ring);
        const double v = u * u * (3.0 - 2.0 * u);
        const std::size_t edge = at(direction.phi, ring);
        for (int ear = 0; ear < earCount; ++ear) {
            const double* from = field.levels.curve(edge, ear);
            double* to = field.levels.curve(entry, ear);
            for (std::size_t k = 0; k < field.levels.bins; ++k) {
                to[k] = (1.0 - v) * from[k] + v * pole[k];
            }
        }
        // In the median plane both values are 0; their ratio tends to that of the cosines.
        const double edgeTime = woodworth(directionOf(packedOrder()[edge]));
        const double ratio = direction.phi % 180 == 0
                                 ? std::cos(radians(direction.theta)) / std::cos(radians(ring))
                                 : woodworth(directionOf(direction)) / edgeTime;
        field.itdSeconds[entry] = field.itdSeconds[edge] * ratio;
    }
}

void smoothTimes(std::vector<double>& itdSeconds, Progress& progress) {
    const std::size_t count = packedOrder().size();
    std::vector<Vector3> vectors(count);
    std::vector<double> deviations(count);
    for (std::size_t i = 0; i < count; ++i) {
        const Direction direction = directionOf(packedOrder()[i]);
        vectors[i] = toVector(direction);
        deviations[i] = itdSeconds[i] - woodworth(direction);
    }
    const double reach = std::cos(radians(smoothingReachDegrees));
    progress.stage("smoothing time differences", count);
    for (std::size_t i = 0; i < count; ++i) {
        double sum = 0.0;
        double total = 0.0;
        for (std::size_t j = 0; j < count; ++j) {
            if (dot(vectors[i], vectors[j]) < reach) {
                continue;
            }
            const double angle = angleBetween(vectors[i], vectors[j]) / smoothingDegrees;
            const double weight = areaWeights()[j] * std::exp(-0.5 * angle * angle);
            sum += weight * deviations[j];
            total += weight;
        }
        itdSeconds[i] = woodworth(directionOf(packedOrder()[i])) + sum / total;
        progress.step();
    }
}

double mirrorDifference(const LevelCurves& levels) {
    constexpr int points = 100;
    double sum = 0.0;
    double total = 0.0;
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const auto mirror = static_cast<std::size_t>(mirrorIndex(static_cast<int>(entry)));
        const double* left = levels.curve(entry, leftEar);
        const double* right = levels.curve(mirror, rightEar);
        for (int i = 0; i < points; ++i) {
            const double hertz = 200.0 * std::pow(80.0, static_cast<double>(i) / (points - 1));
            const double difference = levelAt(left, levels.bins, levels.binHertz, hertz) -
                                      levelAt(right, levels.bins, levels.binHertz, hertz);
            sum += areaWeights()[entry] * difference * difference;
            total += areaWeights()[entry];
        }
    }
    return std::sqrt(sum / total);
}

void averageSides(ResponseField& field) {
    for (std::size_t entry = 0; entry < packedOrder().size(); ++entry) {
        const auto mirror = static_cast<std::size_t>(mirrorIndex(static_cast<int>(entry)));
        double* left = field.levels.curve(entry, leftEar);
        double* right = field.levels.curve(mirror, rightEar);
        for (std::size_t k = 0; k < field.levels.bins; ++k) {
            left[k] = right[k] = 0.5 * (left[k] + right[k]);
        }
        if (entry <= mirror) {
            const double time = 0.5 * (field.itdSeconds[entry] - field.itdSeconds[mirror]);
            field.itdSeconds[entry] = time;
            field.itdSeconds[mirror] = -time;
        }
    }
}

}  // namespace

MeasuredField analyse(const Measurement& measurement, Progress& progress) {
    std::size_t length = std::max(analysisLength, nextPowerOfTwo(measurement.taps));
    while (measurement.sampleRate > analysisRate * static_cast<double>(length) / analysisLength) {
        length *= 2;
    }
    RealTransform transform(length);
    ItdEstimator estimator(measurement.sampleRate, measurement.taps);

    MeasuredField field;
    field.levels.binHertz = measurement.sampleRate / static_cast<double>(length);
    field.levels.bins = std::min(
        transform.bins(), static_cast<std::size_t>(highestHertz / field.levels.binHertz) + 2);
    field.levels.resize(measurement.count());
    std::vector<double> time(length);
    std::vector<Complex> spectrum(transform.bins());
    progress.stage("analysing responses", measurement.count());
    for (std::size_t i = 0; i < measurement.count(); ++i) {
        for (int ear = 0; ear < earCount; ++ear) {
            std::fill(time.begin(), time.end(), 0.0);
            std::copy_n(measurement.response(i, ear), measurement.taps, time.begin());
            transform.forward(time.data(), spectrum.data());
            double* curve = field.levels.curve(i, ear);
            for (std::size_t k = 0; k < field.levels.bins; ++k) {
                curve[k] = 20.0 * std::log10(std::max(std::abs(spectrum[k]), smallestMagnitude));
            }
        }
        const double expected = woodworth(measurement.directions[i]);
        field.itdSeconds.push_back(estimator
                                       .estimate(measurement.response(i, leftEar),
                                                 measurement.response(i, rightEar), expected,
                                                 itdSearchSeconds, measurement.extraSeconds[i])
                                       .value_or(expected));
        progress.step();
    }
    return field;
}

GridField interpolateField(const Measurement& measurement,
                           const MeasuredField& measured,
                           const HrirOptions& options,
                           Progress& progress) {
    const std::vector<GridEntry>& order = packedOrder();
    std::vector<Vector3> vectors;
    double lowestMeasured = 90.0;
    double highestMeasured = -90.0;
    for (const Direction& direction : measurement.directions) {
        vectors.push_back(toVector(direction));
        lowestMeasured = std::min(lowestMeasured, direction.elevation);
        highestMeasured = std::max(highestMeasured, direction.elevation);
    }
    Weights weights(order.size());
    progress.stage("interpolating directions", order.size());
    for (std::size_t entry = 0; entry < order.size(); ++entry) {
        weights[entry] = interpolationWeights(vectors, toVector(directionOf(order[entry])));
        progress.step();
    }

    GridField grid;
    grid.lowestElevation = closedLimit(weights, -gridStepDegrees, lowestMeasured);
    grid.highestElevation = closedLimit(weights, gridStepDegrees, highestMeasured);
    checkCoverage(weights, grid.lowestElevation, grid.highestElevation);
    if (options.lowestElevation) {
        const double wanted = *options.lowestElevation;
        if (!(wanted >= grid.lowestElevation) || !(wanted <= 0.0)) {
            throw DataError(
                "lowest elevation {} is outside the measurement, which is closed from "
                "{}; expected {} to 0",
                wanted, grid.lowestElevation, grid.lowestElevation);
        }
        grid.lowestElevation =
            gridStepDegrees * static_cast<int>(std::ceil(wanted / gridStepDegrees));
    }

    ResponseField& field = grid.field;
    field.levels.binHertz = measured.levels.binHertz;
    field.levels.bins = measured.levels.bins;
    field.levels.resize(order.size());
    field.itdSeconds.resize(order.size());
    grid.measuredAt.assign(order.size(), -1);
    for (std::size_t entry = 0; entry < order.size(); ++entry) {
        if (order[entry].theta < grid.lowestElevation ||
            order[entry].theta > grid.highestElevation) {
            continue;
        }
        interpolateEntry(measured, measurement.directions, *weights[entry], entry, field);
        if (weights[entry]->count == 1) {
            grid.measuredAt[entry] = weights[entry]->index[0];
        }
    }
    if (grid.lowestElevation > -90) {
        fillCap(field, grid.lowestElevation, true);
    }
    if (grid.highestElevation < 90) {
        fillCap(field, grid.highestElevation, false);
    }
    smoothTimes(field.itdSeconds, progress);
    grid.mirrorDecibels = mirrorDifference(field.levels);
    grid.symmetric =
        options.symmetry == Symmetry::on ||
        (options.symmetry == Symmetry::automatic && grid.mirrorDecibels < nearlySymmetricDecibels);
    if (grid.symmetric) {
        averageSides(field);
    }
    return grid;
}

}  // namespace tessaly::data
