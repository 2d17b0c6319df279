// SOFA import through libmysofa's plain loader.
#include "data/import_sofa.h"

#include <mysofa.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <fstream>
#include <memory>
#include <numeric>
#include <string_view>

#include "data/attribution.h"
#include "data/data_error.h"
#include "data/sha256.h"

namespace tessaly::data {

namespace {

constexpr const char* wantedConvention = "SimpleFreeFieldHRIR";
constexpr double wantedDistance = 1.4;  // m
constexpr double distanceGap = 0.03;    // m: a wider gap separates two distances

struct FreeSofa {
    void operator()(MYSOFA_HRTF* file) const { mysofa_free(file); }
};
using SofaFile = std::unique_ptr<MYSOFA_HRTF, FreeSofa>;

std::string attribute(const MYSOFA_ATTRIBUTE* list, std::string_view name) {
    for (; list != nullptr; list = list->next) {
        if (list->name != nullptr && name == list->name) {
            return list->value != nullptr ? list->value : "";
        }
    }
    return "";
}

SofaFile open(const std::filesystem::path& path) {
    std::error_code ignored;
    if (!std::filesystem::exists(path, ignored)) {
        if (path == defaultSofaPath) {
            throw DataError(
                "{} not found; install the package libmysofa1 or name a file with "
                "--sofa",
                path.string());
        }
        throw DataError("{} not found; expected a SOFA file", path.string());
    }
    if (!std::filesystem::is_regular_file(path, ignored)) {
        throw DataError("{} is not a file; expected a SOFA file", path.string());
    }
    int error = MYSOFA_OK;
    SofaFile file(mysofa_load(path.c_str(), &error));
    if (file == nullptr) {
        const char* reason = "damaged or cut short";
        if (error == MYSOFA_UNSUPPORTED_FORMAT) {
            reason = "of an unsupported format variant";
        } else if (error == MYSOFA_NO_MEMORY) {
            reason = "too large for the memory";
        }
        throw DataError("{} is no readable SOFA file: found {}; expected {}", path.string(),
                        describeContent(path, reason), wantedConvention);
    }
    return file;
}

void checkShape(const MYSOFA_HRTF& file, const std::string& name) {
    const std::string convention = attribute(file.attributes, "SOFAConventions");
    if (convention != wantedConvention) {
        throw DataError("{} has the convention \"{}\", expected \"{}\"", name, convention,
                        wantedConvention);
    }
    if (file.R != earCount) {
        throw DataError("{} has {} receivers, expected {}", name, file.R, earCount);
    }
    const std::size_t pairs = std::size_t{file.M} * earCount;
    if (file.M == 0 || file.N == 0 || file.DataIR.values == nullptr ||
        file.DataIR.elements != pairs * file.N || file.SourcePosition.values == nullptr ||
        file.SourcePosition.elements != std::size_t{file.M} * 3) {
        throw DataError(
            "{} has {} samples and {} coordinates for {} directions of {} taps; "
            "expected {} and {}",
            name, file.DataIR.elements, file.SourcePosition.elements, file.M, file.N,
            pairs * file.N, std::size_t{file.M} * 3);
    }
    if (file.DataSamplingRate.values == nullptr || file.DataSamplingRate.elements < 1) {
        throw DataError("{} states no sample rate", name);
    }
    const std::size_t delays = file.DataDelay.values != nullptr ? file.DataDelay.elements : 0;
    if (delays != 0 && delays != earCount && delays != pairs) {
        throw DataError("{} has {} delays, expected none, {} or {}", name, delays, earCount, pairs);
    }
}

/// Direction and distance of one source position.
std::pair<Direction, double> position(const float* values, bool cartesian) {
    const double a = static_cast<double>(values[0]);
    const double b = static_cast<double>(values[1]);
    const double c = static_cast<double>(values[2]);
    if (!cartesian) {
        return {{a, b}, c};
    }
    constexpr double degrees = 57.29577951308232;  // 180 / pi
    const double distance = std::sqrt(a * a + b * b + c * c);
    return {{std::atan2(b, a) * degrees, std::atan2(c, std::hypot(a, b)) * degrees}, distance};
}

}  // namespace

std::vector<std::size_t> nearestDistanceGroup(const std::vector<double>& distances) {
    std::vector<std::size_t> order(distances.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::stable_sort(order.begin(), order.end(), [&distances](std::size_t a, std::size_t b) {
        return distances[a] < distances[b];
    });
    std::vector<std::size_t> best;
    double bestOffset = 0.0;
    for (std::size_t first = 0; first < order.size();) {
        std::size_t last = first;
        double sum = distances[order[first]];
        while (last + 1 < order.size() &&
               distances[order[last + 1]] - distances[order[last]] < distanceGap) {
            ++last;
            sum += distances[order[last]];
        }
        const double offset =
            std::abs(sum / static_cast<double>(last - first + 1) - wantedDistance);
        if (best.empty() || offset < bestOffset) {
            bestOffset = offset;
            best.assign(order.begin() + static_cast<std::ptrdiff_t>(first),
                        order.begin() + static_cast<std::ptrdiff_t>(last + 1));
        }
        first = last + 1;
    }
    std::sort(best.begin(), best.end());
    return best;
}

bool isHdf5(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    char start[4] = {};
    return file.read(start, sizeof(start)) && std::memcmp(start, "\x89HDF", sizeof(start)) == 0;
}

Measurement convertSofa(const MYSOFA_HRTF& file, const std::string& name) {
    checkShape(file, name);
    const std::string type = attribute(file.SourcePosition.attributes, "Type");
    if (type != "spherical" && type != "cartesian") {
        throw DataError("{} has source positions of type \"{}\", expected spherical or cartesian",
                        name, type);
    }
    std::vector<Direction> directions;
    std::vector<double> distances;
    for (std::size_t m = 0; m < file.M; ++m) {
        const auto [direction, distance] =
            position(file.SourcePosition.values + 3 * m, type == "cartesian");
        if (!std::isfinite(distance)) {
            throw DataError("{}: direction {} has a distance that is not a number", name, m);
        }
        directions.push_back(direction);
        distances.push_back(distance);
    }

    Measurement measurement;
    measurement.sampleRate = static_cast<double>(file.DataSamplingRate.values[0]);
    measurement.taps = file.N;
    const std::size_t delayRows =
        file.DataDelay.values != nullptr ? file.DataDelay.elements / earCount : 0;
    for (const std::size_t m : nearestDistanceGroup(distances)) {
        measurement.directions.push_back(directions[m]);
        const float* first = file.DataIR.values + m * earCount * file.N;
        measurement.samples.insert(measurement.samples.end(), first,
                                   first + std::size_t{earCount} * file.N);
        double extra = 0.0;
        if (delayRows > 0) {
            const float* delay = file.DataDelay.values + (delayRows == 1 ? 0 : m) * earCount;
            extra = static_cast<double>(delay[rightEar]) - static_cast<double>(delay[leftEar]);
        }
        measurement.extraSeconds.push_back(extra / measurement.sampleRate);
    }
    return measurement;
}

Measurement importSofa(const std::filesystem::path& path) {
    const SofaFile file = open(path);
    Measurement measurement = convertSofa(*file, path.filename().string());
    measurement.provenance.path = std::filesystem::absolute(path);
    measurement.provenance.sha256 = sha256OfFile(path);
    if (measurement.provenance.sha256 == kemarSha256) {
        measurement.provenance.licence = kemarLicence();
        measurement.provenance.attribution = kemarAttribution();
    } else {
        const std::string licence = attribute(file->attributes, "License");
        measurement.provenance.licence =
            licence.empty() ? "not stated in the file; ask the author" : firstLine(licence);
        for (const char* field : {"Title", "DatabaseName", "ListenerShortName", "AuthorContact",
                                  "Organization", "License", "References", "Origin"}) {
            const std::string value = attribute(file->attributes, field);
            if (!value.empty()) {
                measurement.provenance.attribution += fmt::format("{}: {}\n", field, value);
            }
        }
    }
    return measurement;
}

}  // namespace tessaly::data
