// Windowed transforms, gathered into bands of even width on a logarithmic axis.
#include "report/spectrogram.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

#include "data/thread_transform.h"
#include "render/binaural_measures.h"

namespace tessaly {

namespace {

constexpr int mostColumns = 720;
constexpr std::ptrdiff_t hopsPerWindow = 32;  // at most; more would show nothing more
constexpr int rowCount = 208;                 // 24 an octave
constexpr double windowSeconds = 0.085;       // 4096 frames at 48 kHz
constexpr double leastBins = 2.0;
constexpr double noiseBandwidth = 1.5;  // bins, of the raised cosine

std::vector<double> windowOf(std::size_t length) {
    std::vector<double> window(length);
    for (std::size_t i = 0; i < length; ++i) {
        const double place = (static_cast<double>(i) + 0.5) / static_cast<double>(length);
        window[i] = 0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * place);
    }
    return window;
}

// Power between two places on the axis of bins, bins being boxes one wide about their numbers. A
// narrow band takes two bins' width: less would lose a part of a line.
double powerBetween(const std::vector<double>& sums, double low, double high) {
    const double middle = 0.5 * (low + high);
    const double width = std::max(high - low, leastBins);
    const auto sumTo = [&](double place) {
        const double bounded = std::clamp(place, 0.0, static_cast<double>(sums.size() - 1));
        const auto whole = std::min(static_cast<std::size_t>(bounded), sums.size() - 2);
        return sums[whole] +
               (bounded - static_cast<double>(whole)) * (sums[whole + 1] - sums[whole]);
    };
    return sumTo(middle + 0.5 * width + 0.5) - sumTo(middle - 0.5 * width + 0.5);
}

float decibelsOf(double power) {
    return static_cast<float>(power > 0.0 ? std::max(10.0 * std::log10(power), silenceDb)
                                          : silenceDb);
}

}  // namespace

Spectrogram spectrogramOf(std::span<const float> stereo, int ear, int sampleRate) {
    const auto frames = static_cast<std::ptrdiff_t>(stereo.size() / 2);
    const std::size_t length = data::nextPowerOfTwo(
        std::max<std::size_t>(4, static_cast<std::size_t>(windowSeconds * sampleRate)));
    data::RealTransform& transform = data::threadTransform(length);
    const std::vector<double> window = windowOf(length);
    const double binHertz = sampleRate / static_cast<double>(length);
    // A sine at full scale has the amplitude length / 4 in its bin under this window.
    const double scale = 16.0 / (noiseBandwidth * static_cast<double>(length * length));

    Spectrogram result;
    const auto leastHop =
        std::max<std::ptrdiff_t>(1, static_cast<std::ptrdiff_t>(length) / hopsPerWindow);
    result.columns =
        static_cast<int>(std::clamp<std::ptrdiff_t>(frames / leastHop, 1, mostColumns));
    result.rows = rowCount;
    result.decibels.resize(static_cast<std::size_t>(result.columns) * rowCount);
    std::vector<double> time(length);
    std::vector<data::Complex> spectrum(transform.bins());
    std::vector<double> sums(transform.bins() + 1);
    const double octaves = std::log2(highestShownHertz / lowestShownHertz);
    for (int column = 0; column < result.columns; ++column) {
        const auto middle = static_cast<std::ptrdiff_t>(
            (column + 0.5) * static_cast<double>(frames) / result.columns);
        const std::ptrdiff_t begin = middle - static_cast<std::ptrdiff_t>(length / 2);
        for (std::size_t i = 0; i < length; ++i) {
            const std::ptrdiff_t frame = begin + static_cast<std::ptrdiff_t>(i);
            const bool inside = frame >= 0 && frame < frames;
            time[i] = inside ? window[i] * static_cast<double>(stereo[2 * frame + ear]) : 0.0;
        }
        transform.forward(time.data(), spectrum.data());
        for (std::size_t k = 0; k < spectrum.size(); ++k) {
            sums[k + 1] = sums[k] + std::norm(spectrum[k]) * scale;
        }
        for (int row = 0; row < rowCount; ++row) {
            const double top = octaves * (rowCount - row) / rowCount;
            const double high = lowestShownHertz * std::exp2(top) / binHertz;
            const double low = high * std::exp2(-octaves / rowCount);
            result.decibels[static_cast<std::size_t>(row) * result.columns + column] =
                decibelsOf(powerBetween(sums, low, high));
        }
    }
    return result;
}

double loudestOf(const Spectrogram& spectrogram) noexcept {
    const auto loudest = std::max_element(spectrogram.decibels.begin(), spectrogram.decibels.end());
    return loudest == spectrogram.decibels.end() ? silenceDb : static_cast<double>(*loudest);
}

IndexedImage imageOf(const Spectrogram& spectrogram, double lowDb, double highDb) {
    IndexedImage image;
    image.width = spectrogram.columns;
    image.height = spectrogram.rows;
    image.pixels.resize(spectrogram.decibels.size());
    std::transform(
        spectrogram.decibels.begin(), spectrogram.decibels.end(), image.pixels.begin(),
        [&](float level) {
            const double place = (static_cast<double>(level) - lowDb) / (highDb - lowDb);
            return static_cast<std::uint8_t>(std::lround(255.0 * std::clamp(place, 0.0, 1.0)));
        });
    return image;
}

}  // namespace tessaly
