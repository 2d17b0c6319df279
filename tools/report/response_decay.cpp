// Backward integrals, and the conditions for a line through them.
#include "report/response_decay.h"

#include <algorithm>
#include <cmath>
#include <numeric>

namespace tessaly {

namespace {

constexpr float onsetShare = 0.1f;     // of the peak: 20 dB
constexpr double inaudible = 1e-7;     // of the peak: a response ends where it stays below
constexpr double largestBias = 0.1;    // share of the end's energy in the curve at the fit's end
constexpr double leastRoom = 1e-4;     // an octave's energy behind the direct sound re all: -40 dB
constexpr double leastCycles = 8.0;    // bandwidth times decay time
constexpr double octaveWidth = 0.707;  // of the centre
constexpr double energyDecay60 = 13.8155;  // 6 ln 10
constexpr std::size_t curvePoints = 2000;

float peakOf(std::span<const float> response) noexcept {
    float peak = 0.0f;
    for (const float sample : response) {
        peak = std::max(peak, std::abs(sample));
    }
    return peak;
}

// Behind the last sample that counts.
std::size_t endOf(std::span<const float> response) noexcept {
    const double least = inaudible * static_cast<double>(peakOf(response));
    std::size_t end = response.size();
    while (end > 0 && !(std::abs(static_cast<double>(response[end - 1])) > least)) {
        --end;
    }
    return end;
}

// One octave of a response: its energy over time, and what remains of it at the end. That may be
// noise or a decay that was cut off; either bends the curve.
struct Band {
    std::vector<double> toCome;  // backward integral
    double rest = 0.0;           // mean energy a sample in the last tenth
};

Band bandOf(std::vector<double> energy) {
    Band band;
    const std::size_t tenth = std::max<std::size_t>(1, energy.size() / 10);
    for (std::size_t i = energy.size() - tenth; i < energy.size(); ++i) {
        band.rest += energy[i] / static_cast<double>(tenth);
    }
    band.toCome = std::move(energy);
    data::integrateBackwards(band.toCome, 0);
    return band;
}

std::optional<double> decayTime(const Band& band, double hertz, int sampleRate, double fitTo) {
    const std::size_t frames = band.toCome.size();
    const std::size_t step = std::max<std::size_t>(1, frames / curvePoints);
    std::vector<double> curve;
    for (std::size_t i = 0; i < frames; i += step) {
        curve.push_back(band.toCome[i]);
    }
    const double seconds =
        data::fittedTime(curve, static_cast<double>(step) / sampleRate, -5.0, fitTo);
    if (!(seconds * octaveWidth * hertz >= leastCycles)) {
        return std::nullopt;
    }
    // Where the fit ends, and what the curve misses or has too much from there on.
    const double level = band.toCome.front() * std::pow(10.0, fitTo / 10.0);
    const auto fitEnd =
        static_cast<double>(std::find_if(band.toCome.begin(), band.toCome.end(),
                                         [&](double energy) { return energy < level; }) -
                            band.toCome.begin());
    const double left = static_cast<double>(frames) - fitEnd;
    const double cutOff = seconds * sampleRate / energyDecay60;
    if (band.rest * std::max(left, cutOff) > largestBias * level) {
        return std::nullopt;
    }
    return seconds;
}

}  // namespace

std::size_t onsetOf(std::span<const float> response) noexcept {
    const float least = onsetShare * peakOf(response);
    const auto first = std::find_if(response.begin(), response.end(), [&](float sample) {
        return least > 0.0f && std::abs(sample) >= least;
    });
    return first == response.end() ? 0 : static_cast<std::size_t>(first - response.begin());
}

std::vector<double> energyDecay(std::span<const float> response) {
    std::vector<double> curve(response.size());
    std::transform(response.begin(), response.end(), curve.begin(), [](float sample) {
        return static_cast<double>(sample) * static_cast<double>(sample);
    });
    data::integrateBackwards(curve, 0);
    const double all = curve.empty() ? 0.0 : curve.front();
    for (double& energy : curve) {
        const double share = all > 0.0 ? energy / all : 0.0;
        energy = share > 0.0 ? std::max(10.0 * std::log10(share), decayFloorDb) : decayFloorDb;
    }
    return curve;
}

std::array<OctaveDecay, data::decayOctaves> octaveDecays(std::span<const float> response,
                                                         int sampleRate) {
    std::array<OctaveDecay, data::decayOctaves> decays;
    for (std::size_t octave = 0; octave < decays.size(); ++octave) {
        decays[octave].hertz = data::octaveCentre(octave);
    }
    const std::size_t end = endOf(response);
    const std::size_t start =
        onsetOf(response) + static_cast<std::size_t>(std::lround(directSeconds * sampleRate));
    if (start >= end) {
        return decays;
    }
    // What is left out goes before the filters, which would spread it.
    const std::vector<double> whole(response.begin(),
                                    response.begin() + static_cast<std::ptrdiff_t>(end));
    std::array<std::vector<double>, data::decayOctaves> all;
    std::array<std::vector<double>, data::decayOctaves> energies;
    data::addOctaveEnergies(whole, sampleRate, all);
    data::addOctaveEnergies(std::span(whole).subspan(start), sampleRate, energies);
    for (std::size_t octave = 0; octave < decays.size(); ++octave) {
        OctaveDecay& decay = decays[octave];
        if (decay.hertz * data::lowestInOctave >= 0.5 * sampleRate) {
            continue;
        }
        const Band band = bandOf(std::move(energies[octave]));
        const double sum = std::accumulate(all[octave].begin(), all[octave].end(), 0.0);
        if (!(band.toCome.front() >= leastRoom * sum)) {
            continue;
        }
        decay.t20 = decayTime(band, decay.hertz, sampleRate, -25.0);
        decay.t30 = decayTime(band, decay.hertz, sampleRate, -35.0);
    }
    return decays;
}

}  // namespace tessaly
