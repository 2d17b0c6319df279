// Layout of the picture: two views of the path on the left, three charts on the right.
#include "render/picture.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <functional>
#include <numbers>
#include <optional>
#include <span>

#include "render/chart_axis.h"
#include "render/svg_canvas.h"

namespace tessaly {

namespace {

constexpr double headRadius = 0.0875;   // metres
constexpr double speedOfSound = 343.0;  // metres a second

constexpr double pictureWidth = 1040.0;
constexpr double pictureHeight = 850.0;
constexpr Box topView{62.0, 100.0, 310.0, 310.0};
constexpr Box sideView{62.0, 482.0, 310.0, 310.0};
constexpr std::array<Box, 3> charts = {
    {{462.0, 100.0, 548.0, 196.0}, {462.0, 348.0, 548.0, 196.0}, {462.0, 596.0, 548.0, 196.0}}};

constexpr std::string_view leftColour = "#1f6fb4";
constexpr std::string_view rightColour = "#d1432f";
constexpr std::string_view measuredColour = "#5b2a86";
constexpr std::string_view modelColour = "#8a8a8a";
constexpr std::string_view gridColour = "#e4e4e4";
constexpr std::string_view frameColour = "#9a9a9a";
constexpr std::string_view quietColour = "#666666";

constexpr int pathSteps = 240;

// Colour of the path at a moment: from orange at the start to violet at the end.
std::string pathColour(double fraction) {
    constexpr std::array<double, 3> start = {243.0, 156.0, 18.0};
    constexpr std::array<double, 3> end = {91.0, 42.0, 134.0};
    std::array<int, 3> mixed{};
    for (std::size_t i = 0; i < mixed.size(); ++i) {
        mixed[i] = static_cast<int>(std::lround(start[i] + (end[i] - start[i]) * fraction));
    }
    return fmt::format("#{:02x}{:02x}{:02x}", mixed[0], mixed[1], mixed[2]);
}

// One plane of the path: which coordinates run to the right and upwards.
struct View {
    Box box;
    double span = 1.0;  // metres from the middle to the right edge
    std::function<Point(const Vector3&)> flat;

    double pixelsPerMetre() const { return 0.5 * box.width / span; }
    Point middle() const { return {box.x + 0.5 * box.width, box.y + 0.5 * box.height}; }
    Point place(const Vector3& position) const {
        const Point metres = flat(position);
        return {middle().x + metres.x * pixelsPerMetre(), middle().y - metres.y * pixelsPerMetre()};
    }
};

double farthestOf(const SourcePath& path) {
    double farthest = 0.0;
    for (int i = 0; i <= pathSteps; ++i) {
        farthest = std::max(
            farthest,
            distanceBetween(positionAt(path, static_cast<double>(i) / pathSteps), Vector3{}));
    }
    return farthest;
}

void drawViewFrame(SvgCanvas& canvas,
                   const View& view,
                   std::string_view xName,
                   std::string_view yName) {
    const Box& box = view.box;
    const double step = niceStep(-view.span, view.span, 6);
    const double spanY = view.span * box.height / box.width;
    forEachTick({-view.span, view.span}, step, [&](double metres) {
        const double x = view.middle().x + metres * view.pixelsPerMetre();
        canvas.line({x, box.y}, {x, box.bottom()}, {.colour = gridColour});
        canvas.text({x, box.bottom() + 16.0}, tickLabel(metres, step),
                    {.size = 11.0, .anchor = Anchor::Middle, .colour = quietColour});
    });
    forEachTick({-spanY, spanY}, step, [&](double metres) {
        const double y = view.middle().y - metres * view.pixelsPerMetre();
        canvas.line({box.x, y}, {box.right(), y}, {.colour = gridColour});
        canvas.text({box.x - 6.0, y + 4.0}, tickLabel(metres, step),
                    {.size = 11.0, .anchor = Anchor::End, .colour = quietColour});
    });
    canvas.rectangle(box, "none", {.colour = frameColour});
    canvas.text({box.x + 0.5 * box.width, box.bottom() + 34.0}, xName, {.anchor = Anchor::Middle});
    canvas.text({box.x - 42.0, box.y + 0.5 * box.height}, yName,
                {.anchor = Anchor::Middle, .turned = -90.0});
}

// The head from above, nose up, ears in their colours. It is to scale unless it would be a speck.
double shownHeadRadius(const View& view) {
    return std::max(headRadius * view.pixelsPerMetre(), 13.0);
}

void drawHeadFromAbove(SvgCanvas& canvas, const View& view) {
    const double r = shownHeadRadius(view);
    const Point c = view.middle();
    const LineStyle edge{.colour = "#555555", .width = 1.2};
    const std::array<Point, 3> nose = {
        {{c.x - 0.28 * r, c.y - 0.9 * r}, {c.x, c.y - 1.35 * r}, {c.x + 0.28 * r, c.y - 0.9 * r}}};
    canvas.polygon(nose, "#555555");
    canvas.ellipse({c.x - r, c.y}, 0.2 * r, 0.36 * r, leftColour, {.width = 0.0});
    canvas.ellipse({c.x + r, c.y}, 0.2 * r, 0.36 * r, rightColour, {.width = 0.0});
    canvas.circle(c, r, "#f1ede6", edge);
}

// The head from its right side, nose to the right.
void drawHeadFromTheSide(SvgCanvas& canvas, const View& view) {
    const double r = shownHeadRadius(view);
    const Point c = view.middle();
    const std::array<Point, 3> nose = {{{c.x + 0.9 * r, c.y - 0.28 * r},
                                        {c.x + 1.35 * r, c.y + 0.1 * r},
                                        {c.x + 0.9 * r, c.y + 0.34 * r}}};
    canvas.polygon(nose, "#555555");
    canvas.circle(c, r, "#f1ede6", {.colour = "#555555", .width = 1.2});
    canvas.ellipse(c, 0.2 * r, 0.34 * r, rightColour, {.width = 0.0});
}

void drawPath(SvgCanvas& canvas, const View& view, const SourcePath& path) {
    // One line below in a middle colour hides the seams between the coloured pieces.
    std::vector<Point> whole;
    for (int i = 0; i <= pathSteps; ++i) {
        whole.push_back(view.place(positionAt(path, static_cast<double>(i) / pathSteps)));
    }
    canvas.polyline(whole, {.colour = pathColour(0.5), .width = 2.5});
    constexpr int piece = 4;
    for (int start = 0; start < pathSteps; start += piece) {
        const std::string colour = pathColour((start + 0.5 * piece) / pathSteps);
        canvas.polyline(std::span(whole).subspan(start, piece + 1),
                        {.colour = colour, .width = 3.0});
    }
}

struct Moment {
    Point dot;
    Point aside;  // unit vector toward the place of the label
    std::string words;
};

// Where the label of a dot stands: outwards from the head; beside a path that runs outwards itself;
// above the head where the dot lies on it.
Point labelDirection(const View& view, const Point& dot, const Point& next) {
    const Point c = view.middle();
    const double distance = std::hypot(dot.x - c.x, dot.y - c.y);
    if (distance < shownHeadRadius(view)) {
        return {0.0, -1.0};
    }
    const Point outward{(dot.x - c.x) / distance, (dot.y - c.y) / distance};
    const double step = std::hypot(next.x - dot.x, next.y - dot.y);
    if (step < 1e-6) {
        return outward;
    }
    const Point along{(next.x - dot.x) / step, (next.y - dot.y) / step};
    if (std::abs(along.x * outward.x + along.y * outward.y) < 0.7) {
        return outward;
    }
    const double side = along.y > 0.0 ? 1.0 : -1.0;
    return {along.y * side, -along.x * side};
}

// Dots on the path at round times; the labels of dots that share a place are joined.
void drawMoments(SvgCanvas& canvas, const View& view, const SourcePath& path, double duration) {
    const double step = niceStep(0.0, duration, 4);
    std::vector<Moment> moments;
    forEachTick({0.0, duration}, step, [&](double time) {
        const double fraction = std::min(time / duration, 1.0);
        const Point dot = view.place(positionAt(path, fraction));
        const Point next = view.place(positionAt(path, fraction + 1e-4));
        canvas.circle(dot, 4.5, pathColour(fraction), {.colour = "#ffffff", .width = 1.5});
        const auto near = std::find_if(moments.begin(), moments.end(), [&](const Moment& one) {
            return std::hypot(one.dot.x - dot.x, one.dot.y - dot.y) < 14.0;
        });
        const std::string words = tickLabel(time, step);
        if (near == moments.end()) {
            moments.push_back({dot, labelDirection(view, dot, next), words});
        } else {
            near->words += ", " + words;
        }
    });
    for (const Moment& moment : moments) {
        const Point& aside = moment.aside;
        const Point c = view.middle();
        const bool onHead =
            std::hypot(moment.dot.x - c.x, moment.dot.y - c.y) < shownHeadRadius(view);
        const double gap = onHead ? shownHeadRadius(view) + 8.0 : 15.0;
        const Anchor anchor = aside.x > 0.3    ? Anchor::Start
                              : aside.x < -0.3 ? Anchor::End
                                               : Anchor::Middle;
        canvas.text({moment.dot.x + 11.0 * aside.x, moment.dot.y + gap * aside.y + 4.0},
                    moment.words + " s", {.size = 11.0, .anchor = anchor});
    }
}

void drawViews(SvgCanvas& canvas, const PictureContent& content) {
    const double span = std::max(1.35 * farthestOf(content.path), 0.4);
    const View top{topView, span, [](const Vector3& p) { return Point{p.x, p.z}; }};
    const View side{sideView, span, [](const Vector3& p) { return Point{p.z, p.y}; }};
    const TextStyle heading{.size = 14.0, .bold = true};
    const TextStyle hint{.size = 11.0, .anchor = Anchor::End, .colour = quietColour};

    canvas.text({topView.x, topView.y - 10.0}, "Path from above", heading);
    canvas.text({topView.right(), topView.y - 10.0}, "the listener faces up", hint);
    drawViewFrame(canvas, top, "left – right, m", "back – front, m");
    drawHeadFromAbove(canvas, top);
    drawPath(canvas, top, content.path);
    drawMoments(canvas, top, content.path, content.duration);

    canvas.text({sideView.x, sideView.y - 10.0}, "Path from the right side", heading);
    canvas.text({sideView.right(), sideView.y - 10.0}, "front is to the right", hint);
    drawViewFrame(canvas, side, "back – front, m", "down – up, m");
    drawHeadFromTheSide(canvas, side);
    drawPath(canvas, side, content.path);
    drawMoments(canvas, side, content.path, content.duration);
}

struct Curve {
    std::string_view name;
    LineStyle style;
    std::function<std::optional<double>(const BinauralPoint&)> value;
};

// Points without a value, or below the chart, break the curve; a lone point becomes a dot.
void drawCurve(SvgCanvas& canvas,
               const Box& box,
               const AxisRange& times,
               const AxisRange& values,
               const Curve& curve,
               const std::vector<BinauralPoint>& points) {
    std::vector<Point> run;
    const auto flush = [&] {
        if (run.size() == 1) {
            canvas.circle(run.front(), 0.5 * curve.style.width, curve.style.colour, {.width = 0.0});
        }
        canvas.polyline(run, curve.style);
        run.clear();
    };
    for (const BinauralPoint& point : points) {
        const std::optional<double> value = curve.value(point);
        if (!value || *value < values.low) {
            flush();
            continue;
        }
        run.push_back({times.place(point.time, box.x, box.right()),
                       values.place(*value, box.bottom(), box.y)});
    }
    flush();
}

// Right-aligned above the chart: a short stroke and a name for each curve.
void drawLegend(SvgCanvas& canvas, const Box& box, const std::vector<Curve>& curves) {
    constexpr double letterWidth = 6.6;  // about, at this size
    constexpr double strokeLength = 22.0;
    const double y = box.y - 14.0;
    double right = box.right();
    for (auto curve = curves.rbegin(); curve != curves.rend(); ++curve) {
        const double words = right - letterWidth * static_cast<double>(curve->name.size());
        canvas.text({words, y + 4.0}, curve->name, {.size = 11.0});
        canvas.line({words - strokeLength - 5.0, y}, {words - 5.0, y}, curve->style);
        right = words - strokeLength - 22.0;
    }
}

void drawChart(SvgCanvas& canvas,
               const Box& box,
               std::string_view title,
               std::string_view unit,
               double duration,
               const AxisRange& values,
               const std::vector<Curve>& curves,
               const std::vector<BinauralPoint>& points) {
    const AxisRange times{0.0, duration};
    const double timeStep = niceStep(0.0, duration, 8);
    const double valueStep = niceStep(values.low, values.high, 5);
    canvas.text({box.x, box.y - 10.0}, title, {.size = 14.0, .bold = true});
    forEachTick(times, timeStep, [&](double time) {
        const double x = times.place(time, box.x, box.right());
        canvas.line({x, box.y}, {x, box.bottom()}, {.colour = gridColour});
        canvas.text({x, box.bottom() + 16.0}, tickLabel(time, timeStep),
                    {.size = 11.0, .anchor = Anchor::Middle, .colour = quietColour});
    });
    forEachTick(values, valueStep, [&](double value) {
        const double y = values.place(value, box.bottom(), box.y);
        const bool zero = std::abs(value) < 1e-9;
        canvas.line({box.x, y}, {box.right(), y}, {.colour = zero ? "#bdbdbd" : gridColour});
        canvas.text({box.x - 6.0, y + 4.0}, tickLabel(value, valueStep),
                    {.size = 11.0, .anchor = Anchor::End, .colour = quietColour});
    });
    canvas.rectangle(box, "none", {.colour = frameColour});
    canvas.text({box.x - 46.0, box.y + 0.5 * box.height}, unit,
                {.anchor = Anchor::Middle, .turned = -90.0});
    drawLegend(canvas, box, curves);
    canvas.beginClip(box);
    for (const Curve& curve : curves) {
        drawCurve(canvas, box, times, values, curve, points);
    }
    canvas.endClip();
}

AxisRange levelRange(const std::vector<BinauralPoint>& points) {
    double loudest = silenceDb;
    for (const BinauralPoint& point : points) {
        loudest = std::max({loudest, point.leftDb, point.rightDb});
    }
    const double top = 10.0 * std::ceil((loudest + 2.0) / 10.0);
    return {top - 60.0, top};
}

AxisRange differenceRange(const std::vector<BinauralPoint>& points) {
    double largest = 0.0;
    for (const BinauralPoint& point : points) {
        largest = std::max(largest, std::abs(point.levelDifference.value_or(0.0)));
    }
    const double edge = std::clamp(10.0 * std::ceil((largest + 1.0) / 10.0), 10.0, 40.0);
    return {-edge, edge};
}

void drawCharts(SvgCanvas& canvas, const PictureContent& content) {
    const std::vector<BinauralPoint>& points = content.points;
    const LineStyle measured{.colour = measuredColour, .width = 2.0};
    const std::vector<Curve> levels = {
        {"left ear",
         {.colour = leftColour, .width = 1.8},
         [](const BinauralPoint& p) { return std::optional(p.leftDb); }},
        {"right ear", {.colour = rightColour, .width = 1.8}, [](const BinauralPoint& p) {
             return std::optional(p.rightDb);
         }}};
    const auto model = [&](const BinauralPoint& p) {
        const double fraction = std::min(p.time / content.duration, 1.0);
        return std::optional(sphereTimeDifference(sphericalOf(positionAt(content.path, fraction))));
    };
    const std::vector<Curve> times = {
        {"rigid sphere", {.colour = modelColour, .width = 1.4, .dashes = "5 4"}, model},
        {"measured", measured, [](const BinauralPoint& p) { return p.timeDifference; }}};
    const std::vector<Curve> differences = {
        {"measured", measured, [](const BinauralPoint& p) { return p.levelDifference; }}};

    const double duration = content.duration;
    drawChart(canvas, charts[0], "Level at the ears", "dBFS rms", duration, levelRange(points),
              levels, points);
    drawChart(canvas, charts[1], "Time difference, + right ear first", "ms", duration,
              {-longestTimeDifference, longestTimeDifference}, times, points);
    drawChart(canvas, charts[2], "Level difference, + right ear louder", "dB", duration,
              differenceRange(points), differences, points);
    canvas.text({charts[2].x + 0.5 * charts[2].width, charts[2].bottom() + 34.0}, "time, s",
                {.anchor = Anchor::Middle});
}

}  // namespace

std::string drawPicture(const PictureContent& content) {
    SvgCanvas canvas(pictureWidth, pictureHeight);
    canvas.text({topView.x - 42.0, 34.0}, content.title, {.size = 20.0, .bold = true});
    canvas.text({topView.x - 42.0, 56.0}, content.subtitle, {.size = 13.0, .colour = quietColour});
    drawViews(canvas, content);
    drawCharts(canvas, content);
    return canvas.document();
}

double sphereTimeDifference(const Spherical& direction) noexcept {
    constexpr double radians = std::numbers::pi / 180.0;
    const double side =
        std::sin(direction.azimuth * radians) * std::cos(direction.elevation * radians);
    const double lateral = std::asin(std::clamp(side, -1.0, 1.0));
    return 1000.0 * headRadius / speedOfSound * (lateral + std::sin(lateral));
}

}  // namespace tessaly
