// Colours for levels: dark to bright in even steps for the eye, also without colour.
#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace tessaly {

struct Rgb {
    std::uint8_t red = 0;
    std::uint8_t green = 0;
    std::uint8_t blue = 0;
};

using ColourScale = std::array<Rgb, 256>;

/// From almost black over violet and red to pale yellow. Lightness rises evenly, so the order of
/// levels is read off without telling hues apart.
const ColourScale& levelColours();

/// The scale as stops of a CSS gradient from left to right.
std::string levelGradient();

}  // namespace tessaly
