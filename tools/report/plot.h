// The frame of every graph: title, legend, ticks around a box that takes the width it is given.
#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "render/chart_axis.h"
#include "render/svg_canvas.h"

namespace tessaly {

/// Colours that the page's style sets for both schemes.
inline constexpr std::string_view leftColour = "var(--left)";
inline constexpr std::string_view rightColour = "var(--right)";

struct Tick {
    double place = 0.0;  ///< 0 left or below, 1 right or above
    std::string label;   ///< plain text
};

/// Words outside the box are text of the page, so that they keep their size on a small display
/// while the box is stretched.
struct Plot {
    std::string title;              ///< plain text
    std::string unit;               ///< plain text, behind the title
    bool ears = false;              ///< the legend names both ears' colours
    std::string label;              ///< what the picture says, for readers who do not see it
    std::string body;               ///< markup that fills the box
    std::string below;              ///< markup under the ticks, e.g. a colour bar
    std::vector<Tick> across;       ///< along the lower edge
    std::vector<Tick> upright;      ///< along the left edge
    std::string kind;               ///< class of the style that sets its height
    std::optional<double> seconds;  ///< a time axis of the sound from 0 to here
};

/// The graph as a figure.
std::string plotMarkup(const Plot& plot);

/// Ticks of a range in the unit given behind each number, e.g. "2 s".
std::vector<Tick> ticksOf(const AxisRange& range, int wanted, std::string_view unit);

/// One line of a chart; places without a value break it.
struct Curve {
    LineStyle style;
    std::vector<Point> run;  ///< rising x in the units of the axes; a y that is no number is a gap
};

/// Grid at the ticks, a stronger line at zero, and the curves cut to the box: an svg that is
/// stretched over its box.
std::string curvesMarkup(const AxisRange& across,
                         const AxisRange& upright,
                         std::span<const Tick> acrossTicks,
                         std::span<const Tick> uprightTicks,
                         std::span<const Curve> curves);

/// Label of a tick with a true minus sign.
std::string shownTick(double value, double step);

/// A number for readers: so many decimals and a true minus sign, never "-0".
std::string shownNumber(double value, int decimals);

}  // namespace tessaly
