// Cookbook coefficients on the unit circle, and the parser.
#include "data/eq_filter.h"

#include <cmath>
#include <numbers>
#include <sstream>

#include "data/attribution.h"
#include "data/data_error.h"
#include "data/fft.h"

namespace tessaly::data {

namespace {

constexpr double designRate = 48000.0;
constexpr double lowestHertz = 1.0;
constexpr double highestHertz = 23900.0;
constexpr double largestGainDb = 40.0;
constexpr double smallestQ = 0.01;
constexpr double largestQ = 100.0;

struct Coefficients {
    double b0, b1, b2, a0, a1, a2;
};

Coefficients coefficients(const EqFilter& filter) noexcept {
    const double a = std::pow(10.0, filter.gainDb / 40.0);
    const double w = 2.0 * std::numbers::pi * filter.hertz / designRate;
    const double c = std::cos(w);
    const double alpha = std::sin(w) / (2.0 * filter.q);
    if (filter.type == EqType::peaking) {
        return {1.0 + alpha * a, -2.0 * c, 1.0 - alpha * a,
                1.0 + alpha / a, -2.0 * c, 1.0 - alpha / a};
    }
    const double root = 2.0 * std::sqrt(a) * alpha;
    // A high shelf is the low one with the axis turned round.
    const double s = filter.type == EqType::lowShelf ? 1.0 : -1.0;
    return {
        a * ((a + 1.0) - s * (a - 1.0) * c + root), s * 2.0 * a * ((a - 1.0) - s * (a + 1.0) * c),
        a * ((a + 1.0) - s * (a - 1.0) * c - root), (a + 1.0) + s * (a - 1.0) * c + root,
        s * -2.0 * ((a - 1.0) + s * (a + 1.0) * c), (a + 1.0) + s * (a - 1.0) * c - root};
}

double polynomial(double c0, double c1, double c2, Complex z1, Complex z2) noexcept {
    return std::norm(c0 + c1 * z1 + c2 * z2);
}

EqFilter parseFilter(const std::string& line, const std::string& place) {
    std::istringstream words(line.substr(line.find(':') + 1));
    std::string state;
    std::string type;
    std::string labels[5];
    EqFilter filter;
    words >> state >> type >> labels[0] >> filter.hertz >> labels[1] >> labels[2] >>
        filter.gainDb >> labels[3] >> labels[4] >> filter.q;
    std::string rest;
    if (!words || words >> rest || labels[0] != "Fc" || labels[1] != "Hz" || labels[2] != "Gain" ||
        labels[3] != "dB" || labels[4] != "Q") {
        throw DataError(
            "{}: found \"{}\", expected \"Filter n: ON PK Fc 105 Hz Gain 1.0 dB Q 0.70\"", place,
            line);
    }
    if (type != "PK" && type != "LSC" && type != "HSC") {
        throw DataError("{}: filter type \"{}\" is unknown, expected PK, LSC or HSC", place, type);
    }
    if (type != "PK") {
        filter.type = type == "LSC" ? EqType::lowShelf : EqType::highShelf;
    }
    if (!(filter.hertz >= lowestHertz && filter.hertz <= highestHertz)) {
        throw DataError("{}: frequency is {} Hz, expected {} to {}", place, filter.hertz,
                        lowestHertz, highestHertz);
    }
    if (!(std::abs(filter.gainDb) <= largestGainDb)) {
        throw DataError("{}: gain is {} dB, expected -{} to {}", place, filter.gainDb,
                        largestGainDb, largestGainDb);
    }
    if (!(filter.q >= smallestQ && filter.q <= largestQ)) {
        throw DataError("{}: Q is {}, expected {} to {}", place, filter.q, smallestQ, largestQ);
    }
    return filter;
}

}  // namespace

double eqLevel(const std::vector<EqFilter>& filters, double hertz) noexcept {
    const double w = 2.0 * std::numbers::pi * hertz / designRate;
    const Complex z1(std::cos(w), -std::sin(w));
    const Complex z2(std::cos(2.0 * w), -std::sin(2.0 * w));
    double decibels = 0.0;
    for (const EqFilter& filter : filters) {
        const Coefficients k = coefficients(filter);
        decibels += 10.0 * std::log10(polynomial(k.b0, k.b1, k.b2, z1, z2) /
                                      polynomial(k.a0, k.a1, k.a2, z1, z2));
    }
    return decibels;
}

std::vector<EqFilter> parseEqText(const std::string& text, const std::string& name) {
    std::vector<EqFilter> filters;
    std::istringstream lines(text);
    std::string raw;
    for (int number = 1; std::getline(lines, raw); ++number) {
        const std::size_t start = raw.find_first_not_of(" \t\r");
        if (start == std::string::npos || raw[start] == '#') {
            continue;
        }
        const std::string line = firstLine(raw.substr(start));
        const std::string place = fmt::format("{} line {}", name, number);
        std::istringstream words(line);
        std::string first;
        std::string second;
        std::string state;
        words >> first >> second >> state;
        if (first == "Preamp:") {
            continue;
        }
        if (first != "Filter" || line.find(':') == std::string::npos ||
            (state != "ON" && state != "OFF")) {
            throw DataError(
                "{}: found \"{}\", expected \"Filter n: ON PK Fc 105 Hz Gain 1.0 dB Q 0.70\"",
                place, line);
        }
        if (state == "ON") {
            filters.push_back(parseFilter(line, place));
        }
    }
    if (filters.empty()) {
        throw DataError("{} has no filter that is ON", name);
    }
    return filters;
}

}  // namespace tessaly::data
