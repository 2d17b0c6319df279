// Octave filters in the spectrum, backward integration, the fitted line.
#include "data/octave_decay.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "data/thread_transform.h"

namespace tessaly::data {

namespace {

constexpr std::size_t ringingFrames = 4096;  // room for the filters' ringing behind the response

}  // namespace

double octaveCentre(std::size_t octave) noexcept {
    return lowestDecayHertz * std::exp2(static_cast<double>(octave));
}

double octaveWeight(double octaves) noexcept {
    const double place = (std::abs(octaves) - 0.25) / 0.5;
    if (place <= 0.0) {
        return 1.0;
    }
    return place < 1.0 ? std::cos(0.5 * std::numbers::pi * place) : 0.0;
}

void addOctaveEnergies(std::span<const double> response,
                       int sampleRate,
                       std::span<std::vector<double>> energies) {
    const std::size_t frames = response.size();
    RealTransform& transform = threadTransform(nextPowerOfTwo(frames + ringingFrames));
    const double binHertz = sampleRate / static_cast<double>(transform.length());
    std::vector<double> time(transform.length());
    std::vector<Complex> spectrum(transform.bins());
    std::vector<Complex> part(transform.bins());
    std::copy(response.begin(), response.end(), time.begin());
    transform.forward(time.data(), spectrum.data());
    for (std::size_t octave = 0; octave < energies.size(); ++octave) {
        const double centre = octaveCentre(octave);
        std::fill(part.begin(), part.end(), Complex());
        const auto first = static_cast<std::size_t>(centre * lowestInOctave / binHertz) + 1;
        const auto last = static_cast<std::size_t>(centre / lowestInOctave / binHertz);
        for (std::size_t k = first; k <= std::min(last, part.size() - 1); ++k) {
            const double hertz = static_cast<double>(k) * binHertz;
            part[k] = spectrum[k] * octaveWeight(std::log2(hertz / centre));
        }
        transform.inverse(part.data(), time.data());
        energies[octave].resize(frames);
        for (std::size_t i = 0; i < frames; ++i) {
            energies[octave][i] += time[i] * time[i];
        }
    }
}

void integrateBackwards(std::vector<double>& energy, std::size_t from) noexcept {
    for (std::size_t i = energy.size(); i > from + 1; --i) {
        energy[i - 2] += energy[i - 1];
    }
}

double fittedTime(std::span<const double> energy,
                  double spacingSeconds,
                  double fitFrom,
                  double fitTo) noexcept {
    double n = 0.0;
    double sumX = 0.0;
    double sumY = 0.0;
    double sumXX = 0.0;
    double sumXY = 0.0;
    bool reached = false;
    for (std::size_t i = 0; i < energy.size() && !reached; ++i) {
        const double level = 10.0 * std::log10(energy[i] / energy[0]);
        reached = !(level >= fitTo);
        if (!reached && level <= fitFrom) {
            const double x = static_cast<double>(i) * spacingSeconds;
            n += 1.0;
            sumX += x;
            sumY += level;
            sumXX += x * x;
            sumXY += x * level;
        }
    }
    const double slope = (n * sumXY - sumX * sumY) / (n * sumXX - sumX * sumX);
    return reached && n > 2.0 && slope < 0.0 ? -60.0 / slope : 0.0;
}

}  // namespace tessaly::data
