// The plan: grid, paths, marks, and their legend.
#include "report/top_view.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <vector>

#include "render/svg_canvas.h"
#include "report/plot.h"

namespace tessaly {

namespace {

// Text of 14 in a drawing of 380 is 11 pixels on the narrowest phone, where 300 are left for it.
constexpr double drawingSize = 380.0;
constexpr Box field{40.0, 8.0, 332.0, 332.0};
constexpr double textSize = 14.0;
constexpr double markRadius = 10.0;
constexpr double headRadius = 12.0;
constexpr double leastSpan = 2.0;        // metres from edge to edge
constexpr double farthest = 1e6;         // metres; what is beyond is left out
constexpr double standing = 1e-3;        // metres; what moves less stands
constexpr std::size_t mostStops = 200;   // of one track
constexpr std::size_t colourSteps = 40;  // of one path

// One moment of a track.
struct Stop {
    double time = 0.0;
    Vector3 position;
    double heading = 0.0;
};
using Track = std::vector<Stop>;

bool usable(const Stop& stop) {
    const Vector3& p = stop.position;
    return std::isfinite(stop.time) && std::isfinite(stop.heading) && std::abs(p.x) < farthest &&
           std::abs(p.z) < farthest;
}

Track trackOf(const ReportPath& path) {
    const std::size_t count = std::min(path.times.size(), path.positions.size());
    const std::size_t step = std::max<std::size_t>(1, (count + mostStops - 1) / mostStops);
    Track track;
    const auto add = [&](std::size_t i) {
        const double heading = i < path.headings.size() ? path.headings[i] : 0.0;
        const Stop stop{path.times[i], path.positions[i], heading};
        if (usable(stop)) {
            track.push_back(stop);
        }
    };
    for (std::size_t i = 0; i < count; i += step) {
        add(i);
    }
    if (count > 0 && (count - 1) % step != 0) {
        add(count - 1);
    }
    return track;
}

bool stands(const Track& track) {
    return std::all_of(track.begin(), track.end(), [&](const Stop& stop) {
        return std::hypot(stop.position.x - track.front().position.x,
                          stop.position.z - track.front().position.z) < standing;
    });
}

// Metres to places in the drawing: x to the right, z upwards.
struct Plan {
    AxisRange x;
    AxisRange z;

    Point place(const Vector3& position) const {
        return {x.place(position.x, field.x, field.right()),
                z.place(position.z, field.bottom(), field.y)};
    }
};

Plan planOf(const std::vector<Track>& tracks) {
    double left = farthest;
    double right = -farthest;
    double back = farthest;
    double front = -farthest;
    for (const Track& track : tracks) {
        for (const Stop& stop : track) {
            left = std::min(left, stop.position.x);
            right = std::max(right, stop.position.x);
            back = std::min(back, stop.position.z);
            front = std::max(front, stop.position.z);
        }
    }
    if (left > right) {
        left = right = back = front = 0.0;
    }
    const double half = 0.5 * std::max(1.25 * std::max(right - left, front - back), leastSpan);
    const double middleX = 0.5 * (left + right);
    const double middleZ = 0.5 * (back + front);
    return {{middleX - half, middleX + half}, {middleZ - half, middleZ + half}};
}

void drawGrid(SvgCanvas& canvas, const Plan& plan) {
    constexpr std::string_view quiet = "var(--quiet)";
    const double step = niceStep(plan.x.low, plan.x.high, 5);
    canvas.rectangle(field, "var(--field)", {.colour = "var(--axis)"});
    forEachTick(plan.x, step, [&](double metres) {
        const double x = plan.x.place(metres, field.x, field.right());
        canvas.line({x, field.y}, {x, field.bottom()}, {.colour = "var(--grid)"});
        canvas.text({x, field.bottom() + 18.0}, shownTick(metres, step),
                    {.size = textSize, .anchor = Anchor::Middle, .colour = quiet});
    });
    forEachTick(plan.z, step, [&](double metres) {
        const double y = plan.z.place(metres, field.bottom(), field.y);
        canvas.line({field.x, y}, {field.right(), y}, {.colour = "var(--grid)"});
        canvas.text({field.x - 6.0, y + 4.5}, shownTick(metres, step),
                    {.size = textSize, .anchor = Anchor::End, .colour = quiet});
    });
    canvas.text({field.right(), drawingSize - 4.0}, "metres",
                {.size = textSize, .anchor = Anchor::End, .colour = quiet});
}

// From the early colour to the late one.
std::string colourAt(double fraction) {
    return fmt::format("color-mix(in oklab,var(--late) {:.0f}%,var(--early))",
                       100.0 * std::clamp(fraction, 0.0, 1.0));
}

void drawPath(SvgCanvas& canvas, const Plan& plan, const Track& track, double duration) {
    std::vector<Point> whole;
    for (const Stop& stop : track) {
        whole.push_back(plan.place(stop.position));
    }
    // The line below hides the seams of the pieces.
    canvas.polyline(whole, {.colour = "var(--early)", .width = 2.0});
    const std::size_t piece = std::max<std::size_t>(1, whole.size() / colourSteps);
    for (std::size_t start = 0; start + 1 < whole.size(); start += piece) {
        const std::size_t count = std::min(piece + 1, whole.size() - start);
        const std::string colour = colourAt(track[start].time / duration);
        canvas.polyline(std::span(whole).subspan(start, count), {.colour = colour, .width = 3.5});
    }
}

// Places of a mark over time for the page's script: seconds, x, y, degrees.
std::string trackAttribute(const Plan& plan, const Track& track) {
    std::string text;
    const std::size_t count = stands(track) ? 1 : track.size();
    const bool turning = std::any_of(track.begin(), track.end(), [&](const Stop& stop) {
        return stop.heading != track.front().heading;
    });
    for (std::size_t i = 0; i < (turning ? track.size() : count); ++i) {
        const Point place = plan.place(track[i].position);
        text += fmt::format("{}{:.3f} {:.1f} {:.1f} {:.1f}", i == 0 ? "" : " ", track[i].time,
                            place.x, place.y, track[i].heading);
    }
    return text;
}

std::string markMarkup(const Plan& plan, const Track& track, const std::string& shape) {
    const Point place = plan.place(track.front().position);
    return fmt::format(
        "<g class=\"mark\" data-track=\"{}\" transform=\"translate({:.1f} {:.1f}) "
        "rotate({:.1f})\">{}</g>\n",
        trackAttribute(plan, track), place.x, place.y, track.front().heading, shape);
}

std::string headShape() {
    const double r = headRadius;
    return fmt::format(
        "<path class=\"nose\" d=\"M{:.1f} {:.1f}L0 {:.1f}L{:.1f} {:.1f}Z\"/>"
        "<ellipse class=\"left\" cx=\"{:.1f}\" rx=\"3\" ry=\"5\"/>"
        "<ellipse class=\"right\" cx=\"{:.1f}\" rx=\"3\" ry=\"5\"/>"
        "<circle class=\"head\" r=\"{:.1f}\"/>",
        -0.4 * r, -0.85 * r, -1.5 * r, 0.4 * r, -0.85 * r, -r, r, r);
}

std::string sourceShape(std::size_t number) {
    return fmt::format(
        "<circle class=\"source\" r=\"{:.1f}\"/><text y=\"4.5\" text-anchor=\"middle\" "
        "font-size=\"{:.0f}\">{}</text>",
        markRadius, textSize, number);
}

std::string placeWords(const std::string& name, const Track& track) {
    const auto words = [](const Vector3& p) {
        return fmt::format("{} metres {}, {} metres {}", shownNumber(std::abs(p.x), 1),
                           p.x < 0.0 ? "left" : "right", shownNumber(std::abs(p.z), 1),
                           p.z < 0.0 ? "back" : "ahead");
    };
    if (stands(track)) {
        return fmt::format("{} stands {}.", name, words(track.front().position));
    }
    return fmt::format("{} moves from {} to {}.", name, words(track.front().position),
                       words(track.back().position));
}

}  // namespace

std::string topViewMarkup(const ReportEntry& entry, double duration) {
    Track listener = trackOf(entry.listener);
    if (listener.empty()) {
        listener.push_back({});
    }
    std::vector<Track> tracks = {listener};
    std::vector<std::string> names;
    for (const ReportPath& source : entry.sources) {
        if (Track track = trackOf(source); !track.empty()) {
            tracks.push_back(std::move(track));
            names.push_back(source.name);
        }
    }
    const Plan plan = planOf(tracks);
    SvgCanvas canvas(drawingSize, drawingSize, "");
    drawGrid(canvas, plan);
    std::string words = "Top view. " + placeWords("The listener", listener);
    std::string marks = markMarkup(plan, listener, headShape());
    std::string legend;
    bool moving = false;
    for (std::size_t i = 0; i < tracks.size(); ++i) {
        if (!stands(tracks[i])) {
            moving = true;
            drawPath(canvas, plan, tracks[i], duration);
        }
        if (i > 0) {
            words += " " + placeWords(names[i - 1], tracks[i]);
            marks += markMarkup(plan, tracks[i], sourceShape(i));
            legend += fmt::format("<li>{}</li>", escapedXml(names[i - 1]));
        }
    }
    const std::string colours =
        moving ? fmt::format(
                     "<div class=\"scale\" aria-hidden=\"true\"><span>0 s</span>"
                     "<span class=\"bar path\"></span><span>{} s</span></div>\n",
                     shownNumber(duration, 1))
               : std::string();
    return fmt::format(
        "<figure class=\"graph plan\">\n<figcaption><span class=\"title\">From above"
        "</span></figcaption>\n"
        "<div class=\"map\" role=\"img\" aria-label=\"{}\">\n{}"
        "<svg class=\"marks\" viewBox=\"0 0 {} {}\" aria-hidden=\"true\">\n{}</svg>\n</div>\n{}"
        "{}</figure>\n",
        escapedXml(words), canvas.pageElement("aria-hidden=\"true\""), drawingSize, drawingSize,
        marks, colours, legend.empty() ? "" : "<ol class=\"sources\">" + legend + "</ol>\n");
}

}  // namespace tessaly
