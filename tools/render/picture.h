// The picture beside a rendered sound: where the source went and what reached the ears.
#pragma once

#include <string>
#include <vector>

#include "render/binaural_measures.h"
#include "render/source_path.h"

namespace tessaly {

struct PictureContent {
    std::string title;     ///< what is heard
    std::string subtitle;  ///< how it was rendered
    SourcePath path;
    double duration = 0.0;  ///< seconds, above 0
    std::vector<BinauralPoint> points;
};

/// Draws top and side view of the path, level per ear, time and level difference over time.
/// @returns an SVG document
std::string drawPicture(const PictureContent& content);

/// Time difference of a rigid sphere with the ears at its sides, positive toward the right.
/// @returns milliseconds
double sphereTimeDifference(const Spherical& direction) noexcept;

}  // namespace tessaly
