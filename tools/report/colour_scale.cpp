// A straight rise of lightness and an even turn of hue in a perceptual space.
#include "report/colour_scale.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

namespace tessaly {

namespace {

constexpr double darkest = 0.16;
constexpr double brightest = 0.97;
constexpr double firstHue = 280.0;  // degrees; violet
constexpr double hueTurn = 185.0;   // degrees, over red to yellow
constexpr double mostChroma = 0.20;
constexpr int stops = 16;

using Linear = std::array<double, 3>;

// Ottosson's Oklab to linear light of the display's primaries.
Linear linearOf(double lightness, double chroma, double hue) {
    const double a = chroma * std::cos(hue * std::numbers::pi / 180.0);
    const double b = chroma * std::sin(hue * std::numbers::pi / 180.0);
    const double l = std::pow(lightness + 0.3963377774 * a + 0.2158037573 * b, 3.0);
    const double m = std::pow(lightness - 0.1055613458 * a - 0.0638541728 * b, 3.0);
    const double s = std::pow(lightness - 0.0894841775 * a - 1.2914855480 * b, 3.0);
    return {4.0767416621 * l - 3.3077115913 * m + 0.2309699292 * s,
            -1.2684380046 * l + 2.6097574011 * m - 0.3413193965 * s,
            -0.0041960863 * l - 0.7034186147 * m + 1.7076147010 * s};
}

bool shown(const Linear& light) {
    return std::all_of(light.begin(), light.end(),
                       [](double part) { return part >= 0.0 && part <= 1.0; });
}

std::uint8_t stored(double light) {
    const double part = std::clamp(light, 0.0, 1.0);
    const double value =
        part <= 0.0031308 ? 12.92 * part : 1.055 * std::pow(part, 1.0 / 2.4) - 0.055;
    return static_cast<std::uint8_t>(std::lround(255.0 * value));
}

// As colourful as wanted, or as the display can at this lightness and hue.
Rgb colourAt(double place) {
    const double lightness = darkest + (brightest - darkest) * place;
    const double hue = firstHue + hueTurn * place;
    double chroma = mostChroma * std::sqrt(std::sin(std::numbers::pi * (0.06 + 0.88 * place)));
    Linear light = linearOf(lightness, chroma, hue);
    while (!shown(light) && chroma > 0.0) {
        chroma = std::max(0.0, chroma - 0.002);
        light = linearOf(lightness, chroma, hue);
    }
    return {stored(light[0]), stored(light[1]), stored(light[2])};
}

}  // namespace

const ColourScale& levelColours() {
    static const ColourScale scale = [] {
        ColourScale colours;
        for (std::size_t i = 0; i < colours.size(); ++i) {
            colours[i] = colourAt(static_cast<double>(i) / (colours.size() - 1));
        }
        return colours;
    }();
    return scale;
}

std::string levelGradient() {
    const ColourScale& scale = levelColours();
    std::string text = "linear-gradient(90deg";
    for (std::size_t i = 0; i <= stops; ++i) {
        const Rgb& colour = scale[i * (scale.size() - 1) / stops];
        text += fmt::format(",#{:02x}{:02x}{:02x}", colour.red, colour.green, colour.blue);
    }
    return text + ")";
}

}  // namespace tessaly
