// Pictures made of levels, packed for the page.
#pragma once

#include <cstdint>
#include <vector>

#include "report/colour_scale.h"

namespace tessaly {

/// One index into the colour scale a pixel, rows from above.
struct IndexedImage {
    int width = 0;
    int height = 0;
    std::vector<std::uint8_t> pixels;  ///< width * height
};

/// @returns a PNG file
/// @throws std::runtime_error with one line if the encoder refuses
std::vector<unsigned char> encodePng(const IndexedImage& image, const ColourScale& colours);

}  // namespace tessaly
